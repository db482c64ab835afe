#include "drivers/driver_arguments.h"

#include <cerrno>
#include <cstdio>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/list_file.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"

namespace vlr {

std::vector<std::string> ReadDriverArguments(const char* argumentText, const char* title,
                                             const char* module) {
  std::vector<std::string> arguments = NVLR_UTILITY_SplitCommand(argumentText);
  if (arguments.size() < kDriverMinArguments) {
    NVLR_UTILITY_WriteStart(arguments, title, nullptr);
    NVLR_UTILITY_RaiseError(kCodeBadArgument, module, __LINE__, argumentText);
  }
  return arguments;
}

const std::string& DriverArgument(const std::vector<std::string>& arguments, size_t position) {
  static const std::string kEmpty;
  return position < arguments.size() ? arguments[position] : kEmpty;
}

int CheckOrbitFile(const std::string& path) {
  VLR_SCOPE("CheckOrbitFile", "main_import_esa");
  FILE* f = std::fopen(path.c_str(), "rb");
  if (f == nullptr) {
    VLR_REPORT(NVLR_UTILITY_Format("Orbit file %s: File not opened!", path.c_str()).c_str(),
               ARE_ERROR);
    return kLibOpen;
  }
  const bool readable = std::fgetc(f) != EOF || std::ferror(f) == 0;
  std::fclose(f);
  errno = 0;
  if (!readable) {
    VLR_REPORT(NVLR_UTILITY_Format("Orbit file %s: File reading failed!", path.c_str()).c_str(),
               ARE_ERROR);
    return kLibRead;
  }
  return 0;
}

int WriteImportListFile(const std::string& root) {
  VLR_SCOPE("WriteImportListFile", "main_import_esa");
  constexpr int kSubSwaths = 5;
  const std::string temporary = root + ".list_tmp";
  FILE* f = std::fopen(temporary.c_str(), "w");
  if (f == nullptr) VLR_FAIL("File not opened!", kLibOpen);
  VlrRunOutputBegun(temporary.c_str());
  bool written = true;
  for (int k = 1; k <= kSubSwaths; ++k)
    written = std::fprintf(f, "%s%d_slc\n", root.c_str(), k) > 0 && written;
  written = std::fclose(f) == 0 && written;
  if (!written || std::rename(temporary.c_str(), root.c_str()) != 0) {
    std::remove(temporary.c_str());
    VlrRunOutputRemoved(temporary.c_str());
    VLR_FAIL("File writing failed!", kLibWrite);
  }
  VlrRunOutputMoved(temporary.c_str(), root.c_str());
  return 0;
}

}  // namespace vlr
