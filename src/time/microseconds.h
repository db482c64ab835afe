// Truncation of a fraction of a second to whole microseconds, shared by the
// text and MJD writers.
#pragma once

#include <cmath>
#include <cstdint>

namespace vlr::timeconv {

constexpr int32_t kMicrosecondsPerSecond = 1000000;

// Whole microseconds in `fraction` (0 <= fraction < 1), truncated, never
// more than 999999.  A value just below a microsecond boundary, by less than
// one unit of double resolution of `reference` (the time the fraction came
// from, at most half a microsecond), counts as on it: that is what reading
// the text of the boundary back gives.
inline int32_t TruncateMicroseconds(double fraction, double reference) {
  const double magnitude = std::fabs(reference);
  const double resolution = std::nextafter(magnitude, INFINITY) - magnitude;
  const double tolerance = std::fmin(resolution * kMicrosecondsPerSecond, 0.5);
  const double micro = fraction * kMicrosecondsPerSecond + tolerance;
  if (!(micro > 0.0)) return 0;
  if (micro >= kMicrosecondsPerSecond - 1) return kMicrosecondsPerSecond - 1;
  return static_cast<int32_t>(micro);
}

}  // namespace vlr::timeconv
