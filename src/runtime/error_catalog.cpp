// Error and warning catalogs and the text lookup.
#include "runtime/error_catalog.h"

#include <cstdlib>
#include <cstring>

#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/list_file.h"
#include "runtime/process_log.h"
#include "runtime/suite_state.h"

namespace {

// Longest catalog text that is kept, in characters.
constexpr size_t kCatalogTextMax = 1025;

const char* const kInitErrorTitle = "AN ERROR OCCUR DURING Veloran INIT";
const char* const kGenericError = "GENERIC ERROR WRONG CODE";

std::string firstToken(const std::string& line) {
  const char* seps = " \n\t,";
  const size_t b = line.find_first_not_of(seps);
  if (b == std::string::npos) return "";
  const size_t e = line.find_first_of(seps, b);
  return line.substr(b, e == std::string::npos ? std::string::npos : e - b);
}

// The key of a "[key]" line, empty when the line is not one.
std::string bracketKey(const std::string& line) {
  const std::string t = firstToken(line);
  if (t.size() < 2 || t.front() != '[') return "";
  const size_t close = t.find(']');
  if (close == std::string::npos) return "";
  return t.substr(1, close - 1);
}

long parseCount(const std::string& line) {
  char* end = nullptr;
  const long v = std::strtol(line.c_str(), &end, 10);
  if (end == line.c_str() || v < 0) return 0;
  return v;
}

struct Split {
  int group;
  int index;
};

Split split(int code) {
  return {code / vlr::kGroupSize, code % vlr::kGroupSize - 1};
}

}  // namespace

ErrorCatalog ParseErrorCatalog(const std::vector<std::string>& lines) {
  ErrorCatalog c;
  if (lines.empty()) return c;
  const long total = static_cast<long>(lines.size());
  long n = parseCount(lines[0]);
  // Every group needs its key line and its title line.
  if (n > (total - 3) / 2) n = total > 3 ? (total - 3) / 2 : 0;
  c.groups.resize(static_cast<size_t>(n));
  for (long g = 0; g < n; ++g) {
    c.groups[g].key = firstToken(lines[2 + g]);
    c.groups[g].title = lines[n + 3 + g].substr(0, kCatalogTextMax);
  }
  for (auto& group : c.groups) {
    const std::string wanted = "ErrorCodeInfo_" + group.key;
    for (long i = 2 * n + 3; i < total; ++i) {
      if (bracketKey(lines[i]) != wanted) continue;
      if (i + 1 >= total) break;
      long m = parseCount(lines[i + 1]);
      if (m > total - (i + 2)) m = total - (i + 2);
      for (long k = 0; k < m; ++k)
        group.texts.push_back(lines[i + 2 + k].substr(0, kCatalogTextMax));
      break;
    }
  }
  return c;
}

ErrorCatalog LoadErrorCatalog(const std::string& path) {
  return ParseErrorCatalog(NVLR_UTILITY_ReadListFile(path.c_str()));
}

ErrorCatalog& NVLR_UTILITY_Catalog(VlrCatalog which) {
  auto& s = vlr_detail::suite();
  return which == VlrCatalog::Errors ? s.errors : s.warnings;
}

void NVLR_UTILITY_GetErrorTexts(const ErrorCatalog& catalog, int code, std::string& title,
                                std::string& text) {
  const Split p = split(code);
  text.clear();
  if (catalog.empty()) {
    title = kInitErrorTitle;
    return;
  }
  if (p.group < 0 || p.group >= static_cast<int>(catalog.groups.size())) {
    title = kGenericError;
  } else {
    title = catalog.groups[p.group].title;
    if (p.index >= 0 && p.index < static_cast<int>(catalog.groups[p.group].texts.size())) {
      text = catalog.groups[p.group].texts[p.index];
      return;
    }
  }
  NVLR_UTILITY_TracePrint("  EC = %d  PEC = %d  SEC = %d\n", code, p.group, p.index);
  if (p.index >= 0) text = kGenericError;
}

std::string NVLR_UTILITY_ErrorTitleLine(const ErrorCatalog& catalog, int code) {
  const Split p = split(code);
  if (catalog.empty()) return NVLR_UTILITY_Format("%s  : [%d]", kInitErrorTitle, code);
  if (p.group < 0 || p.group >= static_cast<int>(catalog.groups.size())) {
    return NVLR_UTILITY_Format("%s  :  %d [PEC %d]", kGenericError, code, p.group);
  }
  return catalog.groups[p.group].title;
}

std::string NVLR_UTILITY_ErrorTextLine(const ErrorCatalog& catalog, int code) {
  const Split p = split(code);
  if (p.index < 0) return "";
  if (!catalog.empty() && p.group >= 0 && p.group < static_cast<int>(catalog.groups.size()) &&
      p.index < static_cast<int>(catalog.groups[p.group].texts.size())) {
    return catalog.groups[p.group].texts[p.index];
  }
  return NVLR_UTILITY_Format("%s  :  %d [%d : %d]", kGenericError, code, p.group, p.index);
}
