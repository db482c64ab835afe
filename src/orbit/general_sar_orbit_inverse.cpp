// Inverse geometry of the orbit: the azimuth time and range delay at which a
// ground point is seen.
#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/inv_grpt_opt.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSARorbit";

}  // namespace

int GeneralSAROrbit::linearEstimate(const double G[3], int k, const double v[3], const double R[9],
                                    double speed, double fdc, double* t, double* tau) const {
  VLR_SCOPE("GeneralSAROrbit::linearEstimate", kModule);
  const double* p = positions_.data() + 3 * k;
  const double d[3] = {G[0] - p[0], G[1] - p[1], G[2] - p[2]};
  // Coordinates in the track frame: x along the track.
  double x[3];
  for (int j = 0; j < 3; ++j) x[j] = R[j] * d[0] + R[3 + j] * d[1] + R[6 + j] * d[2];
  double along = 0.0;  // x - speed t: the along-track offset of G at the time
  if (fdc != 0.0) {
    // Straight-line Doppler: lambda fdc / 2 = speed (x - speed t) / range,
    // so (x - speed t)^2 (1 - beta^2) = beta^2 (y^2 + z^2).
    const double k2 = lambda_ * fdc * 0.5;
    const double beta2 = k2 * k2 / (speed * speed);
    if (!(beta2 < 1.0)) VLR_FAIL("Doppler beyond the orbit speed", 12);
    along = std::sqrt(beta2 * (x[1] * x[1] + x[2] * x[2]) / (1.0 - beta2));
    if (k2 * speed < 0.0) along = -along;
  }
  *t = (x[0] - along) / speed;
  const double s[3] = {p[0] + v[0] * *t, p[1] + v[1] * *t, p[2] + v[2] * *t};
  const double e[3] = {G[0] - s[0], G[1] - s[1], G[2] - s[2]};
  *tau = 2.0 * std::sqrt(e[0] * e[0] + e[1] * e[1] + e[2] * e[2]) / kSpeedOfLight;
  return 0;
}

int GeneralSAROrbit::earth2satLinear(const double G[3], double* t, double* tau, double fdc) {
  VLR_SCOPE("GeneralSAROrbit::earth2satLinear", kModule);
  *t = *tau = -1.0;
  if (!fitted_) return 1;
  // Mean track first, then the chord of the window found.
  double v[3];
  const double* p = positions_.data();
  for (int a = 0; a < 3; ++a) v[a] = (p[3 * (n_ - 1) + a] - p[a]) / ((n_ - 1) * dt_);
  double tl = 0.0, taul = 0.0, R[9], speed = 0.0;
  VLR_CALL(linearEstimate(G, 0, v, rotation_, trackSpeed_, fdc, &tl, &taul));
  if (!std::isfinite(tl)) VLR_FAIL("Point not seen within the orbit", 12);
  int k = static_cast<int>(std::fmax(-1e6, std::fmin(std::round(tl / dt_), 1e6))) - 2;
  if (k < 1) k = 0;
  if (k > n_ - 5) k = n_ - 5;
  for (int a = 0; a < 3; ++a) v[a] = (p[3 * (k + 4) + a] - p[3 * k + a]) / (4.0 * dt_);
  VLR_CALL(computeRotationMatrix(v, R, &speed));
  VLR_CALL(linearEstimate(G, k, v, R, speed, fdc, &tl, &taul));
  *t = t0_ + k * dt_ + tl;
  *tau = taul;
  return 0;
}

int GeneralSAROrbit::earth2sat(const double G[3], double* t, double* tau, double fdc) {
  VLR_SCOPE("GeneralSAROrbit::earth2sat", kModule);
  *t = *tau = -1.0;
  if (!fitted_) return 1;
  double tl = 0.0, taul = 0.0;
  VLR_CALL(earth2satLinear(G, &tl, &taul, fdc));
  updatePolys(tl);
  double u = 0.0, d = 0.0;
  const int rc = inv_grpt_opt(G, cx_, cy_, cz_, 4.0 * dt_, lambda_, fdc, &u, &d);
  if (rc != 0) VLR_CALL(rc);
  *t = tw_ + u;
  *tau = d;
  return 0;
}

int GeneralSAROrbit::earth2satPrecise(const double G[3], double* t, double* tau, double fdc) {
  VLR_SCOPE("GeneralSAROrbit::earth2satPrecise", kModule);
  *t = *tau = -1.0;
  if (!fitted_) return 1;
  double u = 0.0, d = 0.0;
  VLR_CALL(inv_grpt_opt(G, globalPolys_[0], globalPolys_[1], globalPolys_[2], 4.0 * dtA_, lambda_,
                        fdc, &u, &d));
  updatePolys(tA0_ + u);
  VLR_CALL(inv_grpt_opt(G, cx_, cy_, cz_, 4.0 * dt_, lambda_, fdc, &u, &d));
  *t = tw_ + u;
  *tau = d;
  return 0;
}

double GeneralSAROrbit::earth2satRange(const double G[3]) {
  double t = -1.0, tau = -1.0;
  return earth2sat(G, &t, &tau) == 0 ? tau : -1.0;
}

double GeneralSAROrbit::earth2satAzimuth(const double G[3]) {
  double t = -1.0, tau = -1.0;
  return earth2sat(G, &t, &tau) == 0 ? t : -1.0;
}

double GeneralSAROrbit::earth2satRange(double x, double y, double z) {
  const double G[3] = {x, y, z};
  return earth2satRange(G);
}

double GeneralSAROrbit::earth2satAzimuth(double x, double y, double z) {
  const double G[3] = {x, y, z};
  return earth2satAzimuth(G);
}
