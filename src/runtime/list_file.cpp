// List files: one entry a line, "#" ends the list.
#include "runtime/list_file.h"

#include <cstdio>
#include <cstring>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "vlr_generic_utility";
constexpr const char* kMarker = "###Veloran###";

std::string trimBlanks(const std::string& s) {
  const size_t b = s.find_first_not_of(' ');
  if (b == std::string::npos) return "";
  const size_t e = s.find_last_not_of(' ');
  return s.substr(b, e - b + 1);
}

}  // namespace

std::vector<std::string> NVLR_UTILITY_ReadListFile(const char* path) {
  std::string name = path ? path : "";
  if (!NVLR_UTILITY_IsRegularFile(name.c_str())) {
    NVLR_UTILITY_TracePrint("Not found  : %s\n", name.c_str());
    name = NVLR_UTILITY_EnvValue("VELORAN_WORKING_DIR") + NVLR_UTILITY_BaseName(name);
    NVLR_UTILITY_TracePrint("aListName : %s\n", name.c_str());
    if (!NVLR_UTILITY_IsRegularFile(name.c_str())) {
      NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, name.c_str());
    }
  }
  FILE* f = std::fopen(name.c_str(), "r");
  if (f == nullptr)
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, name.c_str());
  std::vector<std::string> lines;
  std::string line;
  bool tooLong = false;
  for (;;) {
    line.clear();
    int c;
    while ((c = std::fgetc(f)) != EOF && c != '\n') {
      if (line.size() < static_cast<size_t>(kListFileMaxLine)) {
        line += static_cast<char>(c);
      } else {
        tooLong = true;
      }
    }
    if (c == EOF && line.empty()) break;
    // A line longer than the reader accepts is refused rather than cut into
    // a different name.
    if (tooLong) {
      std::fclose(f);
      NVLR_UTILITY_RaiseError(vlr::kCodeLineTooLong, kModule, __LINE__, name.c_str());
    }
    const size_t cr = line.find('\r');
    if (cr != std::string::npos) line.resize(cr);
    line = trimBlanks(line);
    if (!line.empty() && line[0] == '#') break;
    lines.push_back(line);
    if (c == EOF) break;
  }
  std::fclose(f);
  return lines;
}

std::vector<std::string> NVLR_UTILITY_SplitCommand(const char* text) {
  std::string path = text ? text : "";
  const size_t marker = path.find(kMarker);
  if (marker != std::string::npos) path.resize(marker);
  const std::string given = path;
  // The host separates the word from the path by nothing or by blanks.
  const size_t b = path.find_first_not_of(" \t");
  path = b == std::string::npos ? "" : path.substr(b, path.find_last_not_of(" \t\r\n") - b + 1);
  std::vector<std::string> lines = NVLR_UTILITY_ReadListFile(path.c_str());
  if (lines.size() < 2)
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, given.c_str());
  lines.erase(lines.begin());
  return lines;
}
