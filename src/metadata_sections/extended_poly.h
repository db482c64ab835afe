// A higher-order SAR polynomial in range time and azimuth time (one data set
// of an extended family).
//
// With r = rt - trg0_s and a = az - taz0_s:
//   value = c0 + c1 r + c2 a + c3 r a + c4 a^2 + c5 r^2 + c6 r a^2
//         + c7 r^2 a + c8 r^3 + c9 r^4 + c10 r^5 + c11 a^3 + c12 a^4 + c13 a^5
//
// Stored like a poly, with "pol" holding the 14 coefficients.
#pragma once

#include "metadata_sections/poly.h"

class extended_poly : public poly {
 public:
  static constexpr int kExtendedCoefficients = 14;

  extended_poly();

  int EvaluatePoly(double rt, double az, double* out) const override;

  // Copies the 14 coefficients and the reference times into `other`.
  // Returns 0.
  int clone(extended_poly* other) const;

  // The coefficients c0..c13 (the 7 of the base class are not used).
  double extPol[kExtendedCoefficients] = {};

 protected:
  void refreshParameters() override;
};
