// The polynomial families of a SAR image: Doppler centroid, Doppler rate,
// slant range to ground range and back, slant range to incidence angle and
// to look angle, and the extended Doppler centroid and Doppler rate.
//
// writepar(file, name) writes the data set as the block "PolySAR/<name>" of
// channel 1 of the XML auxiliary document; readpar(file, name) reads that
// block and, when it is missing or incomplete, the parameter-file section
// `name` with the family's keys (missing keys leave their values).  Both
// return 0; readpar returns 10 when the data set is not stored in either
// form, writepar the writer's code when the file cannot be written.
#pragma once

#include "metadata_sections/extended_poly.h"
#include "metadata_sections/poly.h"

// Doppler centroid, Hz.  Keys "DCpoly", "DCpoly_azt0", "DCpoly_rgt0".
class polyDC : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
  // The oldest form: "DopCenPol_nCoeff" range coefficients in
  // "DopCenRangeCoeffs" (5: c0 c1 c4 c5 c6; 7: c0..c6), "DopCenRgRefTimes"
  // and "DopCenAzRefSec85Times".  0, or 10 when the coefficients cannot be
  // read; other numbers of coefficients leave them unchanged (with a
  // warning).
  int readparold(const char* file, const char* section);
};

// Doppler rate, Hz/s.  Keys "FRpoly", "FRpoly_azt0", "FRPoly_rgt0".
class polyFR : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
  // The oldest form, by number of coefficients n: 5 values of
  // "AzimuthCoeff" as c0 c1 c4 c5 c6; 3 values of "AzimuthCoeff" as c0 c1
  // c3; 7 values of "DopRatRangeCoeff" as c0..c6.  0, or 10 when the
  // coefficients cannot be read; other n leave them unchanged (with a
  // warning).
  int readparold(const char* file, const char* section, int n);
};

// Slant-range time to ground range.  Keys "SL2GRpoly", "SL2GRpoly_azt0",
// "SL2GRpoly_rgt0".
class polySL2GR : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};

// Ground range to slant-range time.  Keys "GR2SLpoly", "GR2SLpoly_azt0",
// "GR2SLpoly_rgt0".
class polyGR2SL : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};

// Slant-range time to incidence angle.  Keys "SL2THETApoly",
// "SL2THETApoly_azt0", "SL2THETApoly_rgt0".
class polySL2THETA : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};

// Slant-range time to look angle.  Keys "SL2PHIpoly", "SL2PHIpoly_azt0",
// "SL2PHIpoly_rgt0".
class polySL2PHI : public poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};

// Extended Doppler centroid; XML form only.
class extended_polyDC : public extended_poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};

// Extended Doppler rate; XML form only.
class extended_polyFR : public extended_poly {
 public:
  int writepar(const char* file, const char* name);
  int readpar(const char* file, const char* name);
};
