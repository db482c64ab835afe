// "main_import_ESA#": ASAR wide-swath product to five sub-swath rasters.
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "drivers/driver_arguments.h"
#include "drivers/drivers.h"
#include "drivers/find_aux.h"
#include "extraction/images.h"
#include "profile/profile_par.h"
#include "runtime/call_scope.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "main_import_esa";
constexpr const char* kTitle = "Import ESA Products";
// The product-type characters of the MPH product name ("WSS" in ASA_WSS_1P...).
constexpr long kProductTypeOffset = 13;
constexpr size_t kProductTypeLength = 3;
constexpr const char* kParameterFile = "import_esa.hdr";
constexpr const char* kParameterSection = "GeneralProcessingConf";

enum ImportArgument : size_t { kProduct = 0, kDoris = 1, kXca = 2, kOutputRoot = 3, kIns = 4 };

// Reads the three product-type characters of the product.
int readProductType(const char* product, std::string& type) {
  VLR_SCOPE("readProductType", kModule);
  FILE* f = std::fopen(product, "rb");
  if (f == nullptr) VLR_FAIL("File not opened!", vlr::kLibOpen);
  char chars[kProductTypeLength + 1] = {};
  const bool read = std::fseek(f, kProductTypeOffset, SEEK_SET) == 0 &&
                    std::fread(chars, 1, kProductTypeLength, f) == kProductTypeLength;
  std::fclose(f);
  if (!read) VLR_FAIL("File reading failed!", vlr::kLibRead);
  type = chars;
  return 0;
}

}  // namespace

int fvlr_main_import_esa(const char* argumentText) {
  using vlr::DriverArgument;
  VLR_SCOPE("fvlr_main_import_esa", kModule);
  const std::vector<std::string> args = vlr::ReadDriverArguments(argumentText, kTitle, kModule);
  const std::string parameters = NVLR_UTILITY_Format(
      "\nINPUT ASA : [ %s ]\nINPUT DORIS : [ %s ]\nINPUT ASA_XCA : [ %s ]\nOUTPUT ROOT NAME : [ %s "
      "]",
      DriverArgument(args, kProduct).c_str(), DriverArgument(args, kDoris).c_str(),
      DriverArgument(args, kXca).c_str(), DriverArgument(args, kOutputRoot).c_str());
  NVLR_UTILITY_WriteStart(args, kTitle, parameters.c_str());

  std::string directory;
  NVLR_UTILITY_GetEnvCode(directory, "VELORAN_CEOS_DES_FILES_DIR");
  // The report level is handed to the conversion, which does not use it: a
  // parameter file without it keeps the default.
  int reportLevel = 1;
  const std::string parameterFile = directory + kParameterFile;
  if (GetParInt(parameterFile.c_str(), "ReportLevel", 1, &reportLevel, 1, kParameterSection) != 0)
    reportLevel = 1;
  const std::string& root = DriverArgument(args, kOutputRoot);

  const std::string& product = DriverArgument(args, kProduct);
  if (product == vlr::kNotOK) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "ASA_XXX");
  }
  std::string xcaPath = DriverArgument(args, kXca);
  if (xcaPath == vlr::kNotOK) {
    VLR_CALL(find_aux(product.c_str(), directory.c_str(), "ASA_XCA", xcaPath));
  }
  std::string insPath = DriverArgument(args, kIns);
  if (insPath == vlr::kNotOK) {
    VLR_CALL(find_aux(product.c_str(), directory.c_str(), "ASA_INS", insPath));
  }

  std::string orbit = DriverArgument(args, kDoris);
  if (orbit == vlr::kNotOK) orbit.clear();
  if (!orbit.empty()) VLR_CALL(vlr::CheckOrbitFile(orbit));

  std::string type;
  VLR_CALL(readProductType(product.c_str(), type));
  if (type != "WSS") {
    // The conversion and the list file need the five sub-swaths of a
    // wide-swath product: any other product ends the run here.
    VLR_REPORT("Input file is not a ASA_WSS dataset", 0);
    NVLR_UTILITY_RaiseError(vlr::kCodeBadArgument, kModule, __LINE__, "WSS");
  }
  images_conf conf;
  images extraction(conf);
  if (!vlr::CopyDriverName(product, extraction.input.ASA_level1_filename) ||
      !vlr::CopyDriverName(orbit, extraction.input.ASA_dor_vor) ||
      !vlr::CopyDriverName(insPath, extraction.input.ASA_INS_Filename) ||
      !vlr::CopyDriverName(root, extraction.output.OutputFile)) {
    VLR_FAIL("File name too long", vlr::kLibInconsistent);
  }
  conf.Memory = 256;
  conf.ReportLevel = 1;
  conf.Incore = 0;
  conf.Verbose = 0;
  // A list file of an earlier run over the same root would name rasters that
  // this run replaces: it goes first, and the new one is written only when
  // all five sub-swaths are complete.
  if (NVLR_UTILITY_FileExists(root.c_str()) && std::remove(root.c_str()) != 0)
    VLR_FAIL("File writing failed!", vlr::kLibWrite);
  errno = 0;
  VLR_CALL(extraction.run());
  VLR_CALL(tessal2kestova(root.c_str(), xcaPath.c_str(), reportLevel));
  VLR_CALL(vlr::WriteImportListFile(root));
  return 0;
}
