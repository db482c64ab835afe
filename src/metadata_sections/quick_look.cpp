#include "metadata_sections/quick_look.h"

#include <climits>

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "quick_look";
constexpr int kChannel = 1;
constexpr const char* kSection = "QuickLook";
constexpr int kFields = 6;

}  // namespace

QuickLook_Obj::QuickLook_Obj() {
  createElementsVector(kFields);
}

void QuickLook_Obj::refreshParameters() {
  addElementInt("QL_FirstSample", &QL_FirstSample, 1, 0, INT_MAX, true);
  addElementInt("QL_Samples", &QL_Samples, 1, 0, INT_MAX, true);
  addElementInt("QL_FirstLine", &QL_FirstLine, 1, 0, INT_MAX, true);
  addElementInt("QL_Lines", &QL_Lines, 1, 0, INT_MAX, true);
  addElementInt("QL_AzimuthML", &QL_AzimuthML, 1, 0, INT_MAX, true);
  addElementInt("QL_RangeML", &QL_RangeML, 1, 0, INT_MAX, true);
  setAllocationFlag(true);
}

int QuickLook_Obj::readhdr(const char* file) {
  VLR_SCOPE("QuickLook_Obj::readhdr", kModule);
  readAuxiliaryFile(file, kChannel, kSection);
  return 0;
}

int QuickLook_Obj::writehdr(const char* file) {
  VLR_SCOPE("QuickLook_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int QuickLook_Obj::clone(QuickLook_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}
