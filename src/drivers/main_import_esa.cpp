// "main_import_ESA#": ASAR wide-swath product to five sub-swath rasters.
#include <string>
#include <vector>

#include "drivers/driver_arguments.h"
#include "drivers/drivers.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "main_import_esa";
constexpr const char* kTitle = "Import ESA Products";

enum ImportArgument : size_t { kProduct = 0, kDoris = 1, kXca = 2, kOutputRoot = 3, kIns = 4 };

}  // namespace

int fvlr_main_import_esa(const char* argumentText) {
  using vlr::DriverArgument;
  const std::vector<std::string> args = vlr::ReadDriverArguments(argumentText, kTitle, kModule);
  const std::string parameters = NVLR_UTILITY_Format(
      "\nINPUT ASA : [ %s ]\nINPUT DORIS : [ %s ]\nINPUT ASA_XCA : [ %s ]\nOUTPUT ROOT NAME : [ %s "
      "]",
      DriverArgument(args, kProduct).c_str(), DriverArgument(args, kDoris).c_str(),
      DriverArgument(args, kXca).c_str(), DriverArgument(args, kOutputRoot).c_str());
  NVLR_UTILITY_WriteStart(args, kTitle, parameters.c_str());

  if (DriverArgument(args, kProduct) == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "ASA_XXX");
  }
  // The extraction is not part of this build.
  NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__,
                          "extraction not available");
}
