#include "metadata_sections/spectral_windows.h"

#include <cfloat>
#include <cstdio>

#include "metadata_sections/legacy_fields.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "spectral_windows";
constexpr int kChannel = 1;
constexpr const char* kSection = "SpectralWindows";
constexpr int kFields = 6;

}  // namespace

SpectralWindows_Obj::SpectralWindows_Obj() {
  std::snprintf(AzMatchedFilterType, sizeof AzMatchedFilterType, "%s", "NOT_AVAILABLE");
  std::snprintf(RgMatchedFilterType, sizeof RgMatchedFilterType, "%s", "NOT_AVAILABLE");
  createElementsVector(kFields);
}

void SpectralWindows_Obj::refreshParameters() {
  addElementString("AzMatchedFilterType", AzMatchedFilterType, true, sizeof AzMatchedFilterType);
  addElementString("RgMatchedFilterType", RgMatchedFilterType, true, sizeof RgMatchedFilterType);
  addElementDouble("RgMatchedFilterCoef", &RgMatchedFilterCoef, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("AzMatchedFilterCoef", &AzMatchedFilterCoef, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("RgLookBandwidth", &RgLookBandwidth, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("AzLookBandwidth", &AzLookBandwidth, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int SpectralWindows_Obj::readhdr(const char* file) {
  VLR_SCOPE("SpectralWindows_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  return readLegacyFields(*this, file, kSection);
}

int SpectralWindows_Obj::writehdr(const char* file) {
  VLR_SCOPE("SpectralWindows_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SpectralWindows_Obj::clone(SpectralWindows_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}
