// "main_multilook_WSS#": import, then multilook of the whole swath.
#include <string>
#include <vector>

#include "drivers/driver_arguments.h"
#include "drivers/drivers.h"
#include "drivers/find_aux.h"
#include "envisat/envisat_types.h"
#include "extraction/images.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "main_multilook_wss";
constexpr const char* kTitle = "Multilooking ASA WSS";

enum MultilookArgument : size_t { kProduct = 0, kOutputRoot = 1, kDoris = 2 };

[[noreturn]] void stepFailed(int line, const char* step) {
  NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, line, step);
}

}  // namespace

int fvlr_main_multilook_wss(const char* argumentText) {
  using vlr::DriverArgument;
  const std::vector<std::string> args = vlr::ReadDriverArguments(argumentText, kTitle, kModule);
  const std::string parameters = NVLR_UTILITY_Format(
      "\nINPUT ASA_RS : [ %s ]\nOUTPUT ROOT NAME : [ %s ]\nINPUT DORIS : [ %s ]",
      DriverArgument(args, kProduct).c_str(), DriverArgument(args, kOutputRoot).c_str(),
      DriverArgument(args, kDoris).c_str());
  NVLR_UTILITY_WriteStart(args, kTitle, parameters.c_str());

  std::string directory;
  NVLR_UTILITY_GetEnvCode(directory, "VELORAN_CEOS_DES_FILES_DIR");

  const std::string& product = DriverArgument(args, kProduct);
  if (product == vlr::kNotOK || !EnvisatTypes::is_wss(product.c_str())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "WSS");
  }
  if (DriverArgument(args, kOutputRoot) == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "OUTNAME");
  }
  std::string xcaPath, insPath;
  if (find_aux(product.c_str(), directory.c_str(), "ASA_XCA", xcaPath) != 0 ||
      find_aux(product.c_str(), directory.c_str(), "ASA_INS", insPath) != 0) {
    stepFailed(__LINE__, "findaux()");
  }
  const std::string& orbit = DriverArgument(args, kDoris);
  if (orbit == vlr::kNotOK ||
      (!EnvisatTypes::is_dorvor(orbit.c_str()) && !EnvisatTypes::is_dorpor(orbit.c_str()))) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "DOR_VOR");
  }
  images_conf conf;
  images extraction(conf);
  if (!vlr::CopyDriverName(product, extraction.input.ASA_level1_filename) ||
      !vlr::CopyDriverName(insPath, extraction.input.ASA_INS_Filename) ||
      !vlr::CopyDriverName(orbit, extraction.input.ASA_dor_vor) ||
      !vlr::CopyDriverName(DriverArgument(args, kOutputRoot), extraction.output.OutputFile)) {
    stepFailed(__LINE__, "images run()");
  }
  conf.Memory = 256;
  conf.ReportLevel = 1;
  conf.Incore = 0;
  conf.Verbose = 0;
  conf.ExtractData = 1;
  if (extraction.run() != 0) stepFailed(__LINE__, "images run()");
  // The conversion and the multilook are not part of this build.
  stepFailed(__LINE__, "tessal2kestova()");
}
