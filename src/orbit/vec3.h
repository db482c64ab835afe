// Small operations on Cartesian 3-vectors held in double[3].
#pragma once

#include <cmath>

namespace orbit_vec {

inline double dot(const double a[3], const double b[3]) {
  return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
}

inline double norm(const double a[3]) {
  return std::sqrt(dot(a, a));
}

// a x b into out (out may be a or b).
inline void cross(const double a[3], const double b[3], double out[3]) {
  const double x = a[1] * b[2] - a[2] * b[1];
  const double y = a[2] * b[0] - a[0] * b[2];
  const double z = a[0] * b[1] - a[1] * b[0];
  out[0] = x;
  out[1] = y;
  out[2] = z;
}

// a / |a| into out; the zero vector stays zero.
inline void unit(const double a[3], double out[3]) {
  const double n = norm(a);
  for (int i = 0; i < 3; ++i) out[i] = n > 0.0 ? a[i] / n : 0.0;
}

}  // namespace orbit_vec
