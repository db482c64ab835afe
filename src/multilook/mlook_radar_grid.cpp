// The radar geometry of a multilook image's pixels.
#include "multilook/mlook_radar_grid.h"

#include <algorithm>
#include <cmath>
#include <new>
#include <utility>

#include "multilook/mlook.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

// The line timing, size and look side that both geometries share.
void MlookRadarGrid::setTiming(double firstLineTime, double lineInterval, int lines, int samples,
                               int lookSign) {
  firstLineTime_ = firstLineTime;
  lineInterval_ = lineInterval;
  lines_ = lines;
  samples_ = samples;
  lookSign_ = lookSign < 0 ? -1 : 1;
}

MlookRadarGrid MlookRadarGrid::Slant(double firstLineTime, double lineInterval, int lines,
                                     int samples, double nearRangeTime, double rangeTimeSpacing,
                                     int lookSign) {
  MlookRadarGrid g;
  g.setTiming(firstLineTime, lineInterval, lines, samples, lookSign);
  g.nearRangeTime_ = nearRangeTime;
  g.rangeTimeSpacing_ = rangeTimeSpacing;
  return g;
}

MlookRadarGrid MlookRadarGrid::Ground(double firstLineTime, double lineInterval, int lines,
                                      int samples, double groundSpacing, int nodeStride,
                                      std::vector<GroundAxisRow> axis, int lookSign) {
  MlookRadarGrid g;
  g.setTiming(firstLineTime, lineInterval, lines, samples, lookSign);
  g.ground_ = true;
  g.groundSpacing_ = groundSpacing;
  g.nodeStride_ = std::max(1, nodeStride);
  g.axis_ = std::move(axis);
  if (!g.axis_.empty()) {
    g.nearRangeTime_ = g.axis_.front().rangeTimes.front();
    g.rangeTimeSpacing_ = 0.0;
  }
  return g;
}

void MlookRadarGrid::bracket(double time, int* first, double* weight) const {
  const int n = static_cast<int>(axis_.size());
  if (n == 1 || time <= axis_.front().time) {
    *first = 0;
    *weight = 0.0;
    return;
  }
  if (time >= axis_.back().time) {
    *first = n - 2;
    *weight = 1.0;
    return;
  }
  const auto it = std::upper_bound(axis_.begin(), axis_.end(), time,
                                   [](double t, const GroundAxisRow& r) { return t < r.time; });
  const int i = static_cast<int>(it - axis_.begin()) - 1;
  *first = i;
  *weight = (time - axis_[i].time) / (axis_[i + 1].time - axis_[i].time);
}

double MlookRadarGrid::rowColumn(const GroundAxisRow& row, double rangeTime) const {
  const std::vector<double>& r = row.rangeTimes;
  const int n = static_cast<int>(r.size());
  if (n < 2 || !std::isfinite(rangeTime)) return NAN;
  // Beyond the ends the end segments go on straight.
  const int i = std::min(
      n - 2,
      std::max(0,
               static_cast<int>(std::upper_bound(r.begin(), r.end(), rangeTime) - r.begin()) - 1));
  const double c0 = static_cast<double>(i) * nodeStride_;
  const double c1 = std::min(c0 + nodeStride_, samples_ - 1.0);
  const double span = r[i + 1] - r[i];
  return span > 0.0 ? c0 + (c1 - c0) * (rangeTime - r[i]) / span : c0;
}

double MlookRadarGrid::rowRangeTime(const GroundAxisRow& row, double column) const {
  const std::vector<double>& r = row.rangeTimes;
  const int n = static_cast<int>(r.size());
  if (n < 2 || !std::isfinite(column)) return NAN;
  const int i = std::min(n - 2, std::max(0, static_cast<int>(std::floor(column / nodeStride_))));
  const double c0 = static_cast<double>(i) * nodeStride_;
  const double c1 = std::min(c0 + nodeStride_, samples_ - 1.0);
  return c1 > c0 ? r[i] + (r[i + 1] - r[i]) * (column - c0) / (c1 - c0) : r[i];
}

double MlookRadarGrid::rangeTime(double column, double time) const {
  if (!ground_) return nearRangeTime_ + column * rangeTimeSpacing_;
  if (axis_.empty()) return NAN;
  int i = 0;
  double w = 0.0;
  bracket(time, &i, &w);
  const double a = rowRangeTime(axis_[i], column);
  if (w == 0.0) return a;
  return (1.0 - w) * a + w * rowRangeTime(axis_[i + 1], column);
}

double MlookRadarGrid::column(double rangeTime, double time) const {
  if (!ground_) return (rangeTime - nearRangeTime_) / rangeTimeSpacing_;
  if (axis_.empty()) return NAN;
  int i = 0;
  double w = 0.0;
  bracket(time, &i, &w);
  const double a = rowColumn(axis_[i], rangeTime);
  if (w == 0.0) return a;
  return (1.0 - w) * a + w * rowColumn(axis_[i + 1], rangeTime);
}

int mlook::radarGrid(MlookRadarGrid* grid) {
  VLR_SCOPE("radarGrid", "mlook_v2");
  if (swath_[0].header == nullptr || !(fs > 0.0) || decimation_ < 1 || outputLines_ < 1 ||
      outputSamples_ < 1)
    VLR_FAIL("The output geometry is not known", vlr::kLibInconsistent);
  const int lookSign = swath_[0].header->orbit.lookSign();
  if (conf_->geometry() == OutputGeometry::kSlantRange) {
    *grid = MlookRadarGrid::Slant(outputStartTime_, lineInterval_, outputLines_, outputSamples_,
                                  swath_[0].rangeTime, decimation_ / fs, lookSign);
    return 0;
  }
  // The ground axis at a row every kAxisRowLines lines at most, on every
  // kNodeStride-th column: between them the axis is smooth to far below a
  // hundredth of a column.
  constexpr int kAxisRowLines = 512;
  constexpr int kNodeStride = 8;
  const int rows = std::min(outputLines_, std::max(2, outputLines_ / kAxisRowLines + 2));
  const int last = outputSamples_ - 1;
  const int nodes = last / kNodeStride + (last % kNodeStride != 0 ? 2 : 1);
  std::vector<MlookRadarGrid::GroundAxisRow> axis;
  try {
    axis.resize(static_cast<size_t>(rows));
    for (auto& r : axis) r.rangeTimes.resize(static_cast<size_t>(nodes));
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the ground axis", vlr::kLibAlloc);
  }
  for (int r = 0; r < rows; ++r) {
    const double line = rows == 1 ? 0.0 : std::floor((outputLines_ - 1.0) * r / (rows - 1) + 0.5);
    MlookRadarGrid::GroundAxisRow& row = axis[static_cast<size_t>(r)];
    row.time = outputStartTime_ + line * lineInterval_;
    for (int n = 0; n < nodes; ++n) {
      double az = 0.0;
      VLR_CALL(outputPixelTimes(std::min(n * kNodeStride, last), line, &az,
                                &row.rangeTimes[static_cast<size_t>(n)]));
    }
    if (!std::is_sorted(row.rangeTimes.begin(), row.rangeTimes.end()))
      VLR_FAIL("Ground axis not monotonic", vlr::kLibInconsistent);
  }
  *grid = MlookRadarGrid::Ground(outputStartTime_, lineInterval_, outputLines_, outputSamples_,
                                 conf_->GrSamplingStep, kNodeStride, std::move(axis), lookSign);
  return 0;
}
