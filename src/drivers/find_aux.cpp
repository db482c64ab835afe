#include "drivers/find_aux.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <string>

#include "envisat/product_header.h"
#include "profile/profile.h"
#include "runtime/call_scope.h"
#include "runtime/file_utility.h"
#include "time/date_text.h"

namespace {

constexpr const char* kModule = "find_aux";
// The sensing start of the main product header.
constexpr long kMphSensingStartOffset = 351;
constexpr size_t kUtcTextLength = 27;
constexpr const char* kListName = "ASA_AUX_list.dat";

}  // namespace

int find_aux(const char* product, const char* directory, const char* type, std::string& result) {
  VLR_SCOPE("find_aux", kModule);
  FILE* f = std::fopen(product, "rb");
  if (f == nullptr) VLR_FAIL("File not opened!", 9);
  char start[kUtcTextLength + 1] = {};
  const bool read = std::fseek(f, kMphSensingStartOffset, SEEK_SET) == 0 &&
                    std::fread(start, 1, kUtcTextLength, f) == kUtcTextLength;
  std::fclose(f);
  if (!read) VLR_FAIL("File reading failed!", 4);
  double productDate = 0.0;
  if (!parse_sec85(start, &productDate)) {
    VLR_FAIL(NVLR_UTILITY_Format("Sensing start of %s is not a date: \"%s\"", product,
                                 EnvisatPrintable(start).c_str())
                 .c_str(),
             4);
  }

  const std::string list = NVLR_UTILITY_Format("%s%s", directory, kListName);
  VLR_REPORT(NVLR_UTILITY_Format("Searching %s", type).c_str(), 2);
  VLR_REPORT(NVLR_UTILITY_Format("WS0Date : %f", productDate).c_str(), 2);
  VLR_REPORT(NVLR_UTILITY_Format("ASA AUX file : %s", list.c_str()).c_str(), 2);
  // The parameter-file reader takes a missing file for an empty one: a list
  // that cannot be opened is told apart here.
  if (FILE* l = std::fopen(list.c_str(), "r")) {
    std::fclose(l);
  } else {
    VLR_FAIL("File not opened!", 9);
  }

  for (int n = 0;; ++n) {
    const std::string section = NVLR_UTILITY_Format("%s_%d", type, n);
    char startText[kUtcTextLength + 1] = {};
    char stopText[kUtcTextLength + 1] = {};
    const int found =
        GetMyProfileString(section.c_str(), "StartDate", startText, sizeof startText, list.c_str());
    if (found == kProfileFileRefused) VLR_FAIL("File reading failed!", 4);
    if (found != 0) {
      VLR_FAIL(NVLR_UTILITY_Format("No %s file valid at the product date", type).c_str(), 10);
    }
    const bool hasStop = GetMyProfileString(section.c_str(), "StopDate", stopText, sizeof stopText,
                                            list.c_str()) == 0;
    double startDate = 0.0, stopDate = 0.0;
    if (!parse_sec85(startText, &startDate)) {
      VLR_FAIL(NVLR_UTILITY_Format("StartDate of [%s] in %s is not a date: \"%s\"", section.c_str(),
                                   list.c_str(), EnvisatPrintable(startText).c_str())
                   .c_str(),
               10);
    }
    if (!hasStop || !parse_sec85(stopText, &stopDate)) {
      VLR_FAIL(
          NVLR_UTILITY_Format("StopDate of [%s] in %s is missing or not a date: \"%s\"",
                              section.c_str(), list.c_str(), EnvisatPrintable(stopText).c_str())
              .c_str(),
          10);
    }
    VLR_REPORT(NVLR_UTILITY_Format("StartDate : %f", startDate).c_str(), 2);
    VLR_REPORT(NVLR_UTILITY_Format("StopDate : %f", stopDate).c_str(), 2);
    if (!(startDate <= productDate && productDate < stopDate)) continue;

    // One character more than a path may hold, so that a name cut short by
    // the buffer is refused below rather than taken for another file.
    char name[kAuxPathMax + 2] = {};
    GetMyProfileString(section.c_str(), "FileName", name, sizeof name, list.c_str());
    if (name[0] == '\0') {
      VLR_FAIL(NVLR_UTILITY_Format("[%s] in %s names no FileName", section.c_str(), list.c_str())
                   .c_str(),
               10);
    }
    const std::string path = NVLR_UTILITY_Format("%s%s", directory, name);
    if (path.size() > kAuxPathMax) VLR_FAIL("Auxiliary file name too long", 10);
    VLR_REPORT(NVLR_UTILITY_Format("Auxiliary file : %s", path.c_str()).c_str(), 2);
    // A folder or a device would open as well: only a regular file will do.
    struct stat st;
    if (::stat(path.c_str(), &st) != 0) {
      errno = 0;
      VLR_FAIL(NVLR_UTILITY_Format("Auxiliary File %s not found", path.c_str()).c_str(), 10);
    }
    if (!S_ISREG(st.st_mode)) {
      VLR_FAIL(NVLR_UTILITY_Format("Auxiliary file %s is not a regular file", path.c_str()).c_str(),
               10);
    }
    FILE* aux = std::fopen(path.c_str(), "rb");
    if (aux == nullptr) {
      errno = 0;
      VLR_FAIL(NVLR_UTILITY_Format("Auxiliary File %s not found", path.c_str()).c_str(), 10);
    }
    std::fclose(aux);
    VLR_REPORT(NVLR_UTILITY_Format("Auxiliary file %s found!", path.c_str()).c_str(), 2);
    result = path;
    return 0;
  }
}
