#include "metadata_sections/gs_roi.h"

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "gs_roi";
constexpr const char* kSection = "ROI";

}  // namespace

int GSRoi_Obj::readhdr(const char* file) {
  VLR_SCOPE("GSRoi_Obj::readhdr", kModule);
  return roi.read_roi(file, kSection);
}

int GSRoi_Obj::writehdr(const char* file) {
  VLR_SCOPE("GSRoi_Obj::writehdr", kModule);
  VLR_CALL(roi.write_roi(file, kSection));
  return 0;
}

int GSRoi_Obj::clone(GSRoi_Obj* other) const {
  if (other == nullptr || other == this) return 0;
  ROI_Obj& r = other->roi;
  r.FastStartTime = roi.FastStartTime;
  r.SlowStartTime = roi.SlowStartTime;
  r.FastTimeLength = roi.FastTimeLength;
  r.SlowTimeLength = roi.SlowTimeLength;
  r.FastTimeDelta = roi.FastTimeDelta;
  r.SlowTimeDelta = roi.SlowTimeDelta;
  r.Samples = roi.Samples;
  r.Lines = roi.Lines;
  return 0;
}
