#include "extraction/elevation_pattern.h"

#include <algorithm>
#include <cmath>
#include <utility>
#include <vector>

#include "metadata_sections/antenna_pattern.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "images_v2";
constexpr int kPoints = asar::antenna::kPoints;
// Largest plausible span of one beam's elevation angles (degrees) and
// largest plausible two-way gain magnitude (dB).
constexpr double kMaxSpan = 90.0;
constexpr double kMaxGainDb = 200.0;
// Grid steps by which the outermost grid angles may pass the record's span:
// the record's single-precision angles (a few 1e-6 degrees apart at 20
// degrees) must not cost the grid a step at either end.
constexpr double kGridSlack = 1e-3;

// The parabola through (x[0], y[0]), (x[1], y[1]), (x[2], y[2]) at u.
double Parabola(const double* x, const double* y, double u) {
  double sum = 0.0;
  for (int i = 0; i < 3; ++i) {
    double term = y[i];
    for (int j = 0; j < 3; ++j) {
      if (j != i) term *= (u - x[j]) / (x[i] - x[j]);
    }
    sum += term;
  }
  return sum;
}

}  // namespace

int ElevationPatternOfRecord(const asar::Record& record, AntennaPattern_Obj* out,
                             std::string* problem) {
  VLR_SCOPE("ElevationPatternOfRecord", kModule);
  std::vector<std::pair<double, double>> points;  // angle, dB
  points.reserve(kPoints);
  for (int i = 0; i < kPoints; ++i) {
    const double angle = record.f32(asar::antenna::kElevationAngles + 4 * static_cast<size_t>(i));
    const double db = record.f32(asar::antenna::kPatternDb + 4 * static_cast<size_t>(i));
    if (!std::isfinite(angle) || !std::isfinite(db) || std::fabs(db) > kMaxGainDb) {
      *problem = "an elevation angle or gain is not a plausible number";
      return vlr::kLibInconsistent;
    }
    points.emplace_back(angle, db);
  }
  std::sort(points.begin(), points.end());
  double x[kPoints], y[kPoints];
  for (int i = 0; i < kPoints; ++i) {
    x[i] = points[static_cast<size_t>(i)].first;
    y[i] = points[static_cast<size_t>(i)].second;
    if (i > 0 && !(x[i] > x[i - 1])) {
      *problem = "two points share an elevation angle";
      return vlr::kLibInconsistent;
    }
  }
  const double span = x[kPoints - 1] - x[0];
  if (!(span <= kMaxSpan)) {
    *problem = "the elevation angles span more than 90 degrees";
    return vlr::kLibInconsistent;
  }

  const int half = static_cast<int>(std::floor(0.5 * span / kElevationPatternStep + kGridSlack));
  const int count = 2 * half + 1;
  const double centre = 0.5 * (x[0] + x[kPoints - 1]);
  std::vector<float> gains(static_cast<size_t>(count));
  int nearest = 0;
  for (int i = 0; i < count; ++i) {
    const double angle = centre + (i - half) * kElevationPatternStep;
    while (nearest + 1 < kPoints &&
           std::fabs(x[nearest + 1] - angle) <= std::fabs(x[nearest] - angle))
      ++nearest;
    const int first = std::min(std::max(nearest - 1, 0), kPoints - 3);
    const double db = Parabola(x + first, y + first, angle);
    gains[static_cast<size_t>(i)] = static_cast<float>(std::pow(10.0, db / 20.0));
  }
  VLR_CALL(out->setPattern(centre - half * kElevationPatternStep, kElevationPatternStep,
                           gains.data(), count));
  return 0;
}
