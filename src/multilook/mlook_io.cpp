#include "multilook/mlook_io.h"

#include "profile/profile.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"

namespace {

constexpr const char* kModule = "mlook_io";
constexpr int kMaxLength = 1000;  // metres, samples

bool Outside(int value, int low, int high) {
  return value == kMlookUndefinedInt || value < low || value > high;
}

}  // namespace

int mlook_conf::readpar(const char* headername) {
  VLR_SCOPE("mlook_conf::readpar", kModule);
  constexpr const char* kSection = "mlookConfiguration";
  // Every key is read even after a missing one, so that the caller sees all
  // values the file holds.
  int missing = 0;
  auto integer = [&](const char* key, int* value) {
    if (GetParInt(headername, key, 1, value, 1, kSection) != 0) ++missing;
  };
  auto real = [&](const char* key, double* value) {
    if (GetParDouble(headername, key, 1, value, 1, kSection) != 0) ++missing;
  };
  integer("Sl2Gr", &Sl2Gr);
  integer("GrSamplingStep", &GrSamplingStep);
  integer("GrResolution", &GrResolution);
  integer("RgWinLen", &RgWinLen);
  real("W1", &W1);
  real("W2", &W2);
  integer("Memory", &Memory);
  integer("ReportLevel", &ReportLevel);
  if (GetParString(headername, "ReportFilename", 1, ReportFilename, 1, kSection) != 0) ++missing;
  integer("Incore", &Incore);
  integer("Verbose", &Verbose);
  GetParInt(headername, "RgAnt_flag", 1, &RgAnt_flag, 1, kSection);
  GetParInt(headername, "DeleteTempFile", 1, &DeleteTempFile, 1, kSection);
  if (missing != 0) VLR_FAIL("Missing key in section mlookConfiguration", vlr::kLibInconsistent);
  return 0;
}

int mlook_conf::writepar(const char*) {
  return 0;
}

int mlook_conf::checkpar() {
  VLR_SCOPE("mlook_conf::checkpar", kModule);
  // A ground resolution of 0 m would ask for an infinite bandwidth and
  // silently give one look: it has to be a positive length.
  const struct {
    const char* key;
    int value;
    int low;
    int high;
  } ranges[] = {{"Sl2Gr", Sl2Gr, 0, 1},
                {"GrSamplingStep", GrSamplingStep, 0, kMaxLength},
                {"GrResolution", GrResolution, 1, kMaxLength},
                {"RgWinLen", RgWinLen, 0, kMaxLength}};
  for (const auto& r : ranges) {
    if (r.value == kMlookUndefinedInt) {
      VLR_FAIL(NVLR_UTILITY_Format("%s is not set", r.key).c_str(), vlr::kLibInconsistent);
    }
    if (Outside(r.value, r.low, r.high)) {
      VLR_FAIL(
          NVLR_UTILITY_Format("%s = %d is outside %d to %d", r.key, r.value, r.low, r.high).c_str(),
          vlr::kLibInconsistent);
    }
  }
  return 0;
}

int mlook_input::readpar(const char* headername) {
  VLR_SCOPE("mlook_input::readpar", kModule);
  constexpr const char* kSection = "mlookInput";
  const bool complete =
      GetParString(headername, "Level1Filename", 1, Level1Filename, 1, kSection) == 0 &&
      GetParString(headername, "ASA_XCA_Filename", 1, ASA_XCA_Filename, 1, kSection) == 0;
  if (GetParInt(headername, "BurstsToSkip", 1, &BurstsToSkip, 1, kSection) != 0) BurstsToSkip = 0;
  if (GetParInt(headername, "BurstsToProcess", 1, &BurstsToProcess, 1, kSection) != 0)
    BurstsToProcess = 0;
  if (!complete) VLR_FAIL("Missing key in section mlookInput", vlr::kLibInconsistent);
  return 0;
}

int mlook_input::checkpar() {
  return 0;
}

int mlook_output::readpar(const char* headername) {
  VLR_SCOPE("mlook_output::readpar", kModule);
  if (GetParString(headername, "OutputFilename", 1, OutputFilename, 1, "mlookOutput") != 0) {
    VLR_FAIL("Missing key in section mlookOutput", vlr::kLibInconsistent);
  }
  return 0;
}
