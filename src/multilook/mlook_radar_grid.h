// Where the pixels of a multilook image lie in radar geometry: the azimuth
// time of every line and the two-way range time of every column.  Lines are
// equally spaced in time; columns are equally spaced in slant range time, or
// in ground range, in which case a table of range times along the ground
// axis (sampled at a few azimuth times, as the recomposition resampled it)
// stands for the chained slant-to-ground polynomials of the sub-swaths.
//
// A value: made once by the multilook after its run and passed by const
// reference to whatever needs the image's geometry.
#pragma once

#include <vector>

class MlookRadarGrid {
 public:
  // Range times of ground-range columns at one azimuth time: the columns
  // 0, stride, 2 stride, ... and the last column.
  struct GroundAxisRow {
    double time = 0.0;
    std::vector<double> rangeTimes;
  };

  MlookRadarGrid() = default;
  // Slant-range image: column k at nearRangeTime + k rangeTimeSpacing.
  static MlookRadarGrid Slant(double firstLineTime, double lineInterval, int lines, int samples,
                              double nearRangeTime, double rangeTimeSpacing, int lookSign);
  // Ground-range image, columns groundSpacing metres apart; rows sorted by
  // time, each with the range times of the node columns.
  static MlookRadarGrid Ground(double firstLineTime, double lineInterval, int lines, int samples,
                               double groundSpacing, int nodeStride,
                               std::vector<GroundAxisRow> axis, int lookSign);

  bool valid() const { return lines_ > 0 && samples_ > 0 && lineInterval_ > 0.0; }
  int lines() const { return lines_; }
  int samples() const { return samples_; }
  double firstLineTime() const { return firstLineTime_; }
  double lineInterval() const { return lineInterval_; }
  bool groundRange() const { return ground_; }
  double groundSpacing() const { return groundSpacing_; }
  double nearRangeTime() const { return nearRangeTime_; }
  double rangeTimeSpacing() const { return rangeTimeSpacing_; }
  // +1 when the radar looks right of the track, -1 left.
  int lookSign() const { return lookSign_; }

  // Azimuth time of a (fractional) line and the line of a time.
  double time(double line) const { return firstLineTime_ + line * lineInterval_; }
  double line(double time) const { return (time - firstLineTime_) / lineInterval_; }
  // Two-way range time of a (fractional) column on the line at `time`, and
  // the column of a range time there.  Beyond the ends of the ground axis
  // its end segments are continued.
  double rangeTime(double column, double time) const;
  double column(double rangeTime, double time) const;

 private:
  void setTiming(double firstLineTime, double lineInterval, int lines, int samples, int lookSign);

  double rowColumn(const GroundAxisRow& row, double rangeTime) const;
  double rowRangeTime(const GroundAxisRow& row, double column) const;
  // The axis rows around `time` and the weight of the second.
  void bracket(double time, int* first, double* weight) const;

  double firstLineTime_ = 0.0;
  double lineInterval_ = 0.0;
  int lines_ = 0;
  int samples_ = 0;
  double nearRangeTime_ = 0.0;
  double rangeTimeSpacing_ = 0.0;
  bool ground_ = false;
  double groundSpacing_ = 0.0;
  int nodeStride_ = 1;
  std::vector<GroundAxisRow> axis_;
  int lookSign_ = 1;
};
