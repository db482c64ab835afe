#include "orbit/geodetic.h"

#include <cmath>

#include "orbit/earth_constants.h"

void xyz2geo(const double g[3], double out[2], double a, double b) {
  const double p = std::sqrt(g[0] * g[0] + g[1] * g[1]);
  // On the polar axis the formula below leaves q a tiny negative number
  // instead of 0 (cos(pi/2) is not 0 in floating point) and would flip the
  // pole; decide it directly.
  if (p == 0.0) {
    out[0] = g[2] > 0.0 ? kPi / 2.0 : -kPi / 2.0;
    out[1] = std::atan2(g[1], g[0]);
    return;
  }
  const double theta = std::atan(g[2] * a / (p * b));
  const double c = std::cos(theta), s = std::sin(theta);
  const double q = p - (1.0 - b * b / (a * a)) * a * c * c * c;
  if (q == 0.0)
    out[0] = g[2] > 0.0 ? kPi / 2.0 : -kPi / 2.0;
  else
    out[0] = std::atan((g[2] + (a * a / (b * b) - 1.0) * b * s * s * s) / q);
  out[1] = std::atan2(g[1], g[0]);
}

void geo2cart(double out[3], const double llh[3]) {
  const double cl = std::cos(llh[0]);
  const double n =
      std::sqrt(1.0 + kWgs84SecondE2) * kWgs84A / std::sqrt(1.0 + kWgs84SecondE2 * cl * cl);
  out[0] = (n + llh[2]) * cl * std::cos(llh[1]);
  out[1] = (n + llh[2]) * cl * std::sin(llh[1]);
  out[2] = (n * kWgs84OneMinusE2 + llh[2]) * std::sin(llh[0]);
}
