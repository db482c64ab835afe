// "main_multilook_WSS#": import, then multilook of the whole swath.
#include <string>
#include <vector>

#include "drivers/driver_arguments.h"
#include "drivers/drivers.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "main_multilook_wss";
constexpr const char* kTitle = "Multilooking ASA WSS";

enum MultilookArgument : size_t { kProduct = 0, kOutputRoot = 1, kDoris = 2 };

}  // namespace

int fvlr_main_multilook_wss(const char* argumentText) {
  using vlr::DriverArgument;
  const std::vector<std::string> args = vlr::ReadDriverArguments(argumentText, kTitle, kModule);
  const std::string parameters = NVLR_UTILITY_Format(
      "\nINPUT ASA_RS : [ %s ]\nOUTPUT ROOT NAME : [ %s ]\nINPUT DORIS : [ %s ]",
      DriverArgument(args, kProduct).c_str(), DriverArgument(args, kOutputRoot).c_str(),
      DriverArgument(args, kDoris).c_str());
  NVLR_UTILITY_WriteStart(args, kTitle, parameters.c_str());

  if (DriverArgument(args, kProduct) == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "WSS");
  }
  if (DriverArgument(args, kOutputRoot) == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "OUTNAME");
  }
  // The import and the multilook are not part of this build.
  NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__,
                          "multilook not available");
}
