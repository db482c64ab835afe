#include "extraction/images_io.h"

#include "profile/profile.h"
#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "images_io";

}  // namespace

int images_conf::readpar(const char* headername) {
  VLR_SCOPE("images_conf::readpar", kModule);
  constexpr const char* kSection = "imagesConfiguration";
  const bool complete =
      GetParInt(headername, "Memory", 1, &Memory, 1, kSection) == 0 &&
      GetParInt(headername, "ReportLevel", 1, &ReportLevel, 1, kSection) == 0 &&
      GetParString(headername, "ReportFilename", 1, ReportFilename, 1, kSection) == 0 &&
      GetParInt(headername, "Incore", 1, &Incore, 1, kSection) == 0 &&
      GetParInt(headername, "Verbose", 1, &Verbose, 1, kSection) == 0;
  // "ExtractData" is optional and keeps its default when absent.
  GetParInt(headername, "ExtractData", 1, &ExtractData, 1, kSection);
  if (!complete) VLR_FAIL("Missing key in section imagesConfiguration", vlr::kLibInconsistent);
  return 0;
}

int images_conf::writepar(const char*) {
  return 0;
}

int images_conf::checkpar() {
  return 0;
}

int images_input::readpar(const char* headername) {
  VLR_SCOPE("images_input::readpar", kModule);
  constexpr const char* kSection = "imagesInput";
  const bool complete =
      GetParString(headername, "ASA_level1_filename", 1, ASA_level1_filename, 1, kSection) == 0 &&
      GetParString(headername, "ASA_dor_vor", 1, ASA_dor_vor, 1, kSection) == 0 &&
      GetParString(headername, "ASA_INS_Filename", 1, ASA_INS_Filename, 1, kSection) == 0;
  if (!complete) VLR_FAIL("Missing key in section imagesInput", vlr::kLibInconsistent);
  return 0;
}

int images_input::checkpar() {
  VLR_SCOPE("images_input::checkpar", kModule);
  if (ASA_level1_filename[0] == '\0') {
    VLR_REPORT("ASA level 1 file not inserted", ARE_IMAGE_NOT_EXIST);
    return vlr::kLibMissing;
  }
  if (ASA_dor_vor[0] == '\0') {
    VLR_REPORT("DOR VOR not inserted", ARE_DORVOR_NOT_EXIST);
    return vlr::kLibMissing;
  }
  return 0;
}

int images_output::readpar(const char* headername) {
  VLR_SCOPE("images_output::readpar", kModule);
  if (GetParString(headername, "OutputFile", 1, OutputFile, 1, "imagesOutput") != 0) {
    VLR_FAIL("Missing key in section imagesOutput", vlr::kLibInconsistent);
  }
  return 0;
}
