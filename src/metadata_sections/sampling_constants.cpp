#include "metadata_sections/sampling_constants.h"

#include <cfloat>

#include "metadata_sections/legacy_fields.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "sampling_constants";
constexpr int kChannel = 1;
constexpr const char* kSection = "SamplingConstants";
constexpr int kFields = 10;

// Keys of the parameter-file form, in the order of the fields.
constexpr const char* kLegacyKeys[kFields] = {
    "CarrierFrequency",   "SamplingRate", "RangeBandWidth",
    "RangeTSamplingStep", "PRF",          "PRI",
    "AzimuthBandwidth",   "BRF",          "BRI",
    "WaveLength"};

}  // namespace

SamplingConstants_Obj::SamplingConstants_Obj() {
  createElementsVector(kFields);
}

void SamplingConstants_Obj::refreshParameters() {
  addElementDouble("fc_hz", &fc_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("frg_hz", &frg_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Brg_hz", &Brg_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Trg_s", &Trg_s, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("prf_hz", &prf_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("pri_s", &pri_s, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Baz_hz", &Baz_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("brf_hz", &brf_hz, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("bri_s", &bri_s, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("lambda_m", &lambda_m, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int SamplingConstants_Obj::readhdr(const char* file) {
  VLR_SCOPE("SamplingConstants_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  return readLegacyFields(*this, file, kSection, kLegacyKeys);
}

int SamplingConstants_Obj::writehdr(const char* file) {
  VLR_SCOPE("SamplingConstants_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SamplingConstants_Obj::clone(SamplingConstants_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}
