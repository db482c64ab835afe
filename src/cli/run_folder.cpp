#include "cli/run_folder.h"

#include <limits.h>
#include <stdlib.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <vector>

namespace vlr::cli {

namespace {

namespace fs = std::filesystem;

constexpr const char* kDataFromExe = "../share/import_wss/";
constexpr const char* kHelpersFromExe = "../lib/import_wss/";
// A file every complete data folder holds.
constexpr const char* kDataProbe = "des/vlr_errors_catalog.des";
// Each configuration line is read into a buffer of 512 characters.
constexpr size_t kConfigurationLineMax = 500;

}  // namespace

std::string ExecutableDir() {
  std::vector<char> buffer(PATH_MAX + 1, '\0');
  const ssize_t n = readlink("/proc/self/exe", buffer.data(), PATH_MAX);
  if (n <= 0) return "./";
  const std::string exe(buffer.data(), static_cast<size_t>(n));
  return exe.substr(0, exe.rfind('/') + 1);
}

std::string HelperDir() {
  const std::string installed = ExecutableDir() + kHelpersFromExe;
  std::error_code ec;
  if (fs::is_regular_file(installed + "main_delete_file", ec)) return installed;
  return ExecutableDir();
}

std::string FindDataDir(std::string& error) {
  const std::string candidate = ExecutableDir() + kDataFromExe;
  std::error_code ec;
  const fs::path canonical = fs::weakly_canonical(candidate, ec);
  const std::string dir = ec ? candidate : canonical.string() + "/";
  if (!fs::is_regular_file(dir + kDataProbe, ec)) {
    error = "the installation data are missing: " + dir + kDataProbe +
            " not found (reinstall the tool)";
    return "";
  }
  return dir;
}

RunFolder::~RunFolder() {
  if (path_.empty()) return;
  std::error_code ec;
  fs::remove_all(path_, ec);
}

bool RunFolder::create(const std::string& parent, std::string& error) {
  std::string pattern = parent;
  if (pattern.empty() || pattern.back() != '/') pattern += '/';
  pattern += ".import_wss-run-XXXXXX";
  std::vector<char> name(pattern.begin(), pattern.end());
  name.push_back('\0');
  if (mkdtemp(name.data()) == nullptr) {
    error = "cannot create a working folder in " + parent + ": " + std::strerror(errno);
    return false;
  }
  path_ = std::string(name.data()) + "/";
  return true;
}

bool RunFolder::prepare(const std::string& dataDir, const std::string& desDir,
                        const std::string& exeDir, std::string& error) {
  const std::vector<std::string> lines = {dataDir + "keys/",
                                          dataDir + "mandatory/",
                                          path_,
                                          exeDir,
                                          dataDir + "maps/",
                                          desDir,
                                          path_,
                                          path_,
                                          path_,
                                          path_,
                                          "l",
                                          "INACTIVE",
                                          "0",
                                          "NaN"};
  std::string text;
  for (const std::string& line : lines) {
    if (line.size() > kConfigurationLineMax || line.find('\n') != std::string::npos) {
      error = "folder name too long or not usable for the configuration: " + line;
      return false;
    }
    text += line + "\n";
  }
  return WriteTextFile(path_ + "Veloran_configuration.ini", text, error) &&
         WriteTextFile(workingFile(), "0\nStarting\n", error) &&
         WriteTextFile(batchOk(), "", error);
}

bool WriteTextFile(const std::string& path, const std::string& text, std::string& error) {
  FILE* f = std::fopen(path.c_str(), "w");
  if (f == nullptr) {
    error = "cannot write " + path + ": " + std::strerror(errno);
    return false;
  }
  const bool written = std::fwrite(text.data(), 1, text.size(), f) == text.size();
  if (std::fclose(f) != 0 || !written) {
    error = "cannot write " + path + ": " + std::strerror(errno);
    return false;
  }
  return true;
}

}  // namespace vlr::cli
