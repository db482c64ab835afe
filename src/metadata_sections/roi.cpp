#include "metadata_sections/roi.h"

#include <cfloat>
#include <climits>
#include <cmath>

#include "profile/profile_par.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "roi";
constexpr int kChannel = 1;
constexpr const char* kCoordinates = "Coordinates";

// Region edges are computed from times that carry rounding errors (a sec85
// azimuth time has a resolution of about 1e-7 s, a thousandth of a line at
// the usual PRFs).  A quotient that falls short of a whole number of steps by
// less than this is taken as that whole number, so that a span of n steps
// counts n and not n - 1.
constexpr double kStepTolerance = 1e-3;

int clampToInt(double v) {
  if (std::isnan(v)) return 0;
  if (v >= static_cast<double>(INT_MAX)) return INT_MAX;
  if (v <= static_cast<double>(INT_MIN)) return INT_MIN;
  return static_cast<int>(v);
}

// span / step rounded half away from zero.
int roundedSteps(double span, double step) {
  return clampToInt(std::round(span / step));
}

// Whole steps in span, truncated toward zero; 0 when the step is 0 or the
// quotient is not a number.
int wholeSteps(double span, double step) {
  const double q = span / step;
  if (!std::isfinite(q)) return 0;
  return clampToInt(std::trunc(q + std::copysign(kStepTolerance, q)));
}

}  // namespace

ROI_Obj::ROI_Obj() {
  createElementsVector(8);
}

void ROI_Obj::refreshParameters() {
  addElementDouble("SlowStartTime", &SlowStartTime, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("SlowTimeLength", &SlowTimeLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("SlowTimeDelta", &SlowTimeDelta, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("FastStartTime", &FastStartTime, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("FastTimeLength", &FastTimeLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("FastTimeDelta", &FastTimeDelta, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("Lines", &Lines, 1, 0, INT_MAX, true);
  addElementInt("Samples", &Samples, 1, 0, INT_MAX, true);
  setAllocationFlag(true);
}

int ROI_Obj::SetFastAxe(double start, double delta, int n) {
  FastStartTime = start;
  FastTimeDelta = delta;
  Samples = n;
  FastTimeLength = delta * n;
  return 0;
}

int ROI_Obj::SetSlowAxe(double start, double delta, int n) {
  SlowStartTime = start;
  SlowTimeDelta = delta;
  Lines = n;
  SlowTimeLength = delta * n;
  return 0;
}

int ROI_Obj::ResetROI() {
  Samples = 0;
  Lines = 0;
  return 0;
}

int ROI_Obj::isNULL() const {
  return (Samples < 1 || Lines < 1) ? 1 : 0;
}

int ROI_Obj::GetFastIndex(double t) const {
  return roundedSteps(t - FastStartTime, FastTimeDelta);
}
int ROI_Obj::GetSlowIndex(double t) const {
  return roundedSteps(t - SlowStartTime, SlowTimeDelta);
}
int ROI_Obj::GetFastRange(double length) const {
  return roundedSteps(length, FastTimeDelta);
}
int ROI_Obj::GetSlowRange(double length) const {
  return roundedSteps(length, SlowTimeDelta);
}

int ROI_Obj::GetUpLeft(double* fast, double* slow) const {
  *fast = FastStartTime;
  *slow = SlowStartTime;
  return 0;
}

int ROI_Obj::GetUpRight(double* fast, double* slow) const {
  *fast = FastStartTime;
  *slow = SlowStartTime + SlowTimeLength;
  return 0;
}

int ROI_Obj::GetDownLeft(double* fast, double* slow) const {
  *fast = FastStartTime + FastTimeLength;
  *slow = SlowStartTime;
  return 0;
}

int ROI_Obj::GetDownRight(double* fast, double* slow) const {
  *fast = FastStartTime + FastTimeLength;
  *slow = SlowStartTime + SlowTimeLength;
  return 0;
}

int ROI_Obj::GetCenter(double* fast, double* slow) const {
  *fast = FastStartTime + FastTimeLength / 2.0;
  *slow = SlowStartTime + SlowTimeLength / 2.0;
  return 0;
}

int ROI_Obj::read_roi(const char* file, const char* section) {
  VLR_SCOPE("read_roi", kModule);
  if (readAuxiliaryFile(file, kChannel, section)) return 0;
  // Older parameter-file form; keys that are missing leave their member as is.
  GetParDouble(file, "SlowStartTime", 1, &SlowStartTime, 1, section);
  GetParDouble(file, "FastStartTime", 1, &FastStartTime, 1, section);
  GetParDouble(file, "SlowTimeDelta", 1, &SlowTimeDelta, 1, section);
  GetParDouble(file, "FastTimeDelta", 1, &FastTimeDelta, 1, section);
  GetParDouble(file, "SlowTimeLength", 1, &SlowTimeLength, 1, section);
  GetParDouble(file, "FastTimeLength", 1, &FastTimeLength, 1, section);
  GetParInt(file, "Lines", 1, &Lines, 1, section);
  return GetParInt(file, "Samples", 1, &Samples, 1, section) == 0 ? 0 : 1;
}

int ROI_Obj::write_roi(const char* file, const char* section) {
  VLR_SCOPE("write_roi", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, section));
  return 0;
}

ROI_Coords::ROI_Coords() {
  createElementsVector(6);
}

void ROI_Coords::refreshParameters() {
  addElementDouble("LongitudeStart", &SlowStartTime, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("LongitudeLen", &SlowTimeLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("LongitudeStep", &SlowTimeDelta, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("LatitudeStart", &FastStartTime, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("LatitudeLen", &FastTimeLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("LatitudeStep", &FastTimeDelta, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int ROI_Coords::readhdr(const char* file) {
  VLR_SCOPE("ROI_Coords::readhdr", kModule);
  if (!readAuxiliaryFile(file, kChannel, kCoordinates)) {
    // Older parameter-file form: corner points as (longitude, latitude).
    double upLeft[2], upRight[2], downRight[2];
    double latStep = 0.0, lonStep = 0.0;
    if (GetParDouble(file, "UpLeft", 2, upLeft, 1, kCoordinates) != 0 ||
        GetParDouble(file, "UpRight", 2, upRight, 1, kCoordinates) != 0 ||
        GetParDouble(file, "DownRight", 2, downRight, 1, kCoordinates) != 0 ||
        GetParDouble(file, "Latitude_SamplingStep", 1, &latStep, 1, kCoordinates) != 0 ||
        GetParDouble(file, "Longitude_SamplingStep", 1, &lonStep, 1, kCoordinates) != 0)
      return 1;
    SlowStartTime = upLeft[0];
    FastStartTime = upLeft[1];
    SlowTimeLength = upRight[0] - SlowStartTime;
    FastTimeLength = downRight[1] - FastStartTime;
    FastTimeDelta = latStep;
    SlowTimeDelta = lonStep;
  }
  Samples = wholeSteps(FastTimeLength, FastTimeDelta);
  Lines = wholeSteps(SlowTimeLength, SlowTimeDelta);
  return 0;
}

int ROI_Coords::writehdr(const char* file) {
  VLR_SCOPE("ROI_Coords::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kCoordinates));
  return 0;
}

int IntersectROI(const ROI_Obj* a, const ROI_Obj* b, ROI_Obj* out) {
  const double fastDelta = a->FastTimeDelta;
  const double slowDelta = a->SlowTimeDelta;
  const double fastStart = std::fmax(a->FastStartTime, b->FastStartTime);
  const double slowStart = std::fmax(a->SlowStartTime, b->SlowStartTime);
  const double fastEnd =
      std::fmin(a->FastStartTime + a->FastTimeLength, b->FastStartTime + b->FastTimeLength);
  const double slowEnd =
      std::fmin(a->SlowStartTime + a->SlowTimeLength, b->SlowStartTime + b->SlowTimeLength);
  int samples = wholeSteps(fastEnd - fastStart, fastDelta);
  int lines = wholeSteps(slowEnd - slowStart, slowDelta);
  if (samples <= 0 || lines <= 0) {
    samples = 0;
    lines = 0;
  }
  // The lengths follow the final counts, so that an empty region also has
  // empty extents.
  out->SetFastAxe(fastStart, fastDelta, samples);
  out->SetSlowAxe(slowStart, slowDelta, lines);
  return 0;
}
