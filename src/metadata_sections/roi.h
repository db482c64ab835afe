// Rectangular region of a SAR raster on its two time axes: the fast axis
// (range time, samples) and the slow axis (azimuth time, lines).
#pragma once

#include "metadata_framework/general_sar_base.h"

class ROI_Obj : public GeneralSAR_Base {
 public:
  ROI_Obj();

  // Start, step and number of samples of an axis; the length follows as
  // step × number.  Return 0.
  int SetFastAxe(double start, double delta, int n);
  int SetSlowAxe(double start, double delta, int n);
  // Empties the region (no samples, no lines).  Returns 0.
  int ResetROI();
  // 1 when the region holds no sample or no line, else 0.
  int isNULL() const;

  // Index of a time and number of steps in a length, rounded half away from
  // zero.
  int GetFastIndex(double t) const;
  int GetSlowIndex(double t) const;
  int GetFastRange(double length) const;
  int GetSlowRange(double length) const;

  // Corners and centre as (fast, slow) times.  Return 0.
  int GetUpLeft(double* fast, double* slow) const;
  int GetUpRight(double* fast, double* slow) const;
  int GetDownLeft(double* fast, double* slow) const;
  int GetDownRight(double* fast, double* slow) const;
  int GetCenter(double* fast, double* slow) const;

  // The block `section` of channel 1 of the XML document `file`, or else the
  // parameter-file section of that name.  Read: 0, or 1 when neither form
  // gives the number of samples.  Write: 0 or the writer's code.
  int read_roi(const char* file, const char* section);
  int write_roi(const char* file, const char* section);

  double FastStartTime = 0.0;
  double SlowStartTime = 0.0;
  double FastTimeLength = 0.0;
  double SlowTimeLength = 0.0;
  double FastTimeDelta = 0.0;
  double SlowTimeDelta = 0.0;
  int Samples = 0;
  int Lines = 0;

 protected:
  void refreshParameters() override;
};

// The same region in geographic coordinates: the fast axis holds latitude,
// the slow axis longitude (degrees).  Stored as the block "Coordinates".
class ROI_Coords : public ROI_Obj {
 public:
  ROI_Coords();

  // Reads the block, or else the parameter section "Coordinates" (corner
  // points "UpLeft", "UpRight", "DownRight" as longitude and latitude, and
  // "Latitude_SamplingStep", "Longitude_SamplingStep"); then derives the
  // numbers of samples and lines.  0, or 1 when neither form is complete.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;

 protected:
  void refreshParameters() override;
};

// The overlap of two regions, on the steps of `a`; empty (no samples, no
// lines) when they do not overlap.  `out` may be `a` or `b`.  Returns 0.
int IntersectROI(const ROI_Obj* a, const ROI_Obj* b, ROI_Obj* out);
