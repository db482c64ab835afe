#include "drivers/find_aux.h"

#include <cstdio>
#include <string>

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
  const double productDate = ascii2sec85(start);

  const std::string list = NVLR_UTILITY_Format("%s%s", directory, kListName);
  VLR_REPORT(NVLR_UTILITY_Format("Searching %s", type).c_str(), 2);
  VLR_REPORT(NVLR_UTILITY_Format("WS0Date : %f", productDate).c_str(), 2);
  VLR_REPORT(NVLR_UTILITY_Format("ASA AUX file : %s", list.c_str()).c_str(), 2);

  for (int n = 0;; ++n) {
    const std::string section = NVLR_UTILITY_Format("%s_%d", type, n);
    char startText[kUtcTextLength + 1] = {};
    char stopText[kUtcTextLength + 1] = {};
    if (GetMyProfileString(section.c_str(), "StartDate", startText, sizeof startText,
                           list.c_str()) != 0) {
      VLR_FAIL(NVLR_UTILITY_Format("No %s file valid at the product date", type).c_str(), 10);
    }
    GetMyProfileString(section.c_str(), "StopDate", stopText, sizeof stopText, list.c_str());
    const double startDate = ascii2sec85(startText);
    const double stopDate = ascii2sec85(stopText);
    VLR_REPORT(NVLR_UTILITY_Format("StartDate : %f", startDate).c_str(), 2);
    VLR_REPORT(NVLR_UTILITY_Format("StopDate : %f", stopDate).c_str(), 2);
    if (!(startDate <= productDate && productDate < stopDate)) continue;

    char name[kProfileBufferSize] = {};
    GetMyProfileString(section.c_str(), "FileName", name, sizeof name, list.c_str());
    const std::string path = NVLR_UTILITY_Format("%s%s", directory, name);
    if (path.size() > kAuxPathMax) VLR_FAIL("Auxiliary file name too long", 10);
    VLR_REPORT(NVLR_UTILITY_Format("Auxiliary file : %s", path.c_str()).c_str(), 2);
    FILE* aux = std::fopen(path.c_str(), "rb");
    if (aux == nullptr) {
      VLR_FAIL(NVLR_UTILITY_Format("Auxiliary File %s not found", path.c_str()).c_str(), 10);
    }
    std::fclose(aux);
    VLR_REPORT(NVLR_UTILITY_Format("Auxiliary file %s found!", path.c_str()).c_str(), 2);
    result = path;
    return 0;
  }
}
