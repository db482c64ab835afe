// Choice of the data set of a polynomial family for an azimuth time, and
// linear interpolation of coefficients between data sets.
//
// A family is a non-empty vector of polynomials (poly or a class derived from
// it) in ascending order of their reference azimuth time taz0_s; t(i) below
// is the reference time of data set i and n the number of data sets.  An
// azimuth time that is not a number selects data set 0 and gives coefficients
// that are not numbers; it never leads outside the family.
#pragma once

#include <vector>

#include "metadata_sections/poly.h"

// The data set of the plain evaluation: 0 when az <= t(0), else the first
// i >= 1 with az <= t(i), else n - 1.
template <class P>
int poly_select_set(const std::vector<P>& sets, double az) {
  const int n = static_cast<int>(sets.size());
  if (!(az > sets[0].taz0_s)) return 0;
  for (int i = 1; i < n; ++i)
    if (az <= sets[static_cast<size_t>(i)].taz0_s) return i;
  return n - 1;
}

// The interval of az: 0 when az <= t(0), n - 1 when az >= t(n-1), else i
// with t(i) < az <= t(i+1).
template <class P>
int poly_bracket_set(const std::vector<P>& sets, double az) {
  const int n = static_cast<int>(sets.size());
  if (!(az > sets[0].taz0_s)) return 0;
  if (!(az < sets.back().taz0_s)) return n - 1;
  for (int i = 0; i + 1 < n; ++i)
    if (az <= sets[static_cast<size_t>(i) + 1].taz0_s) return i;
  return n - 2;
}

// Coefficients at az, linear in azimuth between the two data sets around it
// and extrapolated linearly from the first two before the first data set and
// from the last two after the last one.  A family of one data set gives its
// coefficients; two data sets with the same reference time give those of the
// one nearer to az (no slope can be derived from them).
template <class P>
void poly_interp_coefficients(const std::vector<P>& sets, double az,
                              double coef[poly::kCoefficients]) {
  const size_t n = sets.size();
  size_t lo = 0;  // coef = c(lo) * (1 - w) + c(lo + 1) * w
  double w = 0.0;
  if (n > 1) {
    if (!(az > sets[0].taz0_s)) {
      lo = 0;
    } else if (!(az < sets[n - 1].taz0_s)) {
      lo = n - 2;
    } else {
      lo = static_cast<size_t>(poly_bracket_set(sets, az));
    }
    const double t0 = sets[lo].taz0_s;
    const double t1 = sets[lo + 1].taz0_s;
    if (t1 != t0) {
      w = (az - t0) / (t1 - t0);
    } else if (lo + 2 == n && !(az < t1)) {
      w = 1.0;  // after the last data set: keep the last one
    }
  }
  const double* a = sets[lo].pol;
  const double* b = n > 1 ? sets[lo + 1].pol : a;
  for (int k = 0; k < poly::kCoefficients; ++k) coef[k] = a[k] * (1.0 - w) + b[k] * w;
}
