#include "orbit/gr_pt.h"

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/vec3.h"
#include "runtime/call_scope.h"

namespace {

using orbit_vec::cross;
using orbit_vec::dot;

constexpr const char* kModule = "gr_pt";
constexpr int kMaxNewtonSteps = 20;
constexpr double kConverged = 1e-10;  // squared step (m^2)
// The step before the first counts as this large (the largest float).
constexpr double kFirstPreviousStep = 3.4028234663852886e38;
constexpr double kDegenerate = 1e-21;

double det3(const double m[3][3]) {
  return m[0][0] * (m[1][1] * m[2][2] - m[1][2] * m[2][1]) -
         m[0][1] * (m[1][0] * m[2][2] - m[1][2] * m[2][0]) +
         m[0][2] * (m[1][0] * m[2][1] - m[1][1] * m[2][0]);
}

}  // namespace

int gr_pt0(const double P[3], const double V[3], double tau, double fdc, double lambda,
           double omega, int lookSign, double a, double b, double G[3]) {
  VLR_SCOPE("gr_pt0", kModule);
  const double range = tau * kHalfSpeedOfLight;
  // Sphere through the ellipsoid at the geocentric latitude of P.
  const double beta = std::atan2(P[2], std::sqrt(P[0] * P[0] + P[1] * P[1]));
  const double ra = a * std::cos(beta), rb = b * std::sin(beta);
  const double rs2 = ra * ra + rb * rb;
  // Velocity with the Earth's rotation added back.
  const double vi[3] = {V[0] - omega * P[1], V[1] + omega * P[0], V[2]};
  // The two planes: P.G = c1 (range sphere minus earth sphere) and
  // vi.G = c2 (Doppler).  Their line runs along d = P x vi through
  // g0 = alpha P + beta vi.
  const double pp = dot(P, P);
  const double c1 = 0.5 * (pp + rs2 - range * range);
  const double c2 = dot(vi, P) + 0.5 * fdc * lambda * range;
  double d[3];
  cross(P, vi, d);
  const double pivot = std::fmax(std::fabs(d[0]), std::fmax(std::fabs(d[1]), std::fabs(d[2])));
  if (!(pivot >= kDegenerate)) VLR_FAIL("Degenerate orbit geometry", 1);
  const double pv = dot(P, vi), vv = dot(vi, vi);
  const double gram = pp * vv - pv * pv;  // = |d|^2
  const double alpha = (c1 * vv - c2 * pv) / gram;
  const double betaCoef = (c2 * pp - c1 * pv) / gram;
  double g0[3];
  for (int i = 0; i < 3; ++i) g0[i] = alpha * P[i] + betaCoef * vi[i];
  // |g0 + s d|^2 = rs2, with g0 orthogonal to d.
  const double disc = gram * (rs2 - dot(g0, g0));
  if (disc < 0.0) VLR_FAIL("No intersection of range sphere and Earth", 2);
  const double s = std::sqrt(disc) / gram;
  double g1[3], g2[3];
  for (int i = 0; i < 3; ++i) {
    g1[i] = g0[i] - s * d[i];
    g2[i] = g0[i] + s * d[i];
  }
  // n points to the left of the track: unit(P) x (the part of vi normal to P).
  const double pn = std::sqrt(pp);
  const double up[3] = {P[0] / pn, P[1] / pn, P[2] / pn};
  const double along = dot(up, vi);
  const double track[3] = {vi[0] - up[0] * along, vi[1] - up[1] * along, vi[2] - up[2] * along};
  double n[3];
  cross(up, track, n);
  const double side[3] = {g1[0] - P[0], g1[1] - P[1], g1[2] - P[2]};
  const double* chosen = dot(side, n) * lookSign <= 0.0 ? g1 : g2;
  for (int i = 0; i < 3; ++i) G[i] = chosen[i];
  return 0;
}

int gr_pt(const double P[3], const double V[3], double tau, double fdc, double lambda, double omega,
          int lookSign, double a, double b, double G[3]) {
  VLR_SCOPE("gr_pt", kModule);
  VLR_CALL(gr_pt0(P, V, tau, fdc, lambda, omega, lookSign, a, b, G));
  const double range = tau * kHalfSpeedOfLight;
  const double a2 = a * a, b2 = b * b;
  double previous = kFirstPreviousStep;
  for (int step = 0; step < kMaxNewtonSteps; ++step) {
    const double D[3] = {P[0] - G[0], P[1] - G[1], P[2] - G[2]};
    const double W[3] = {V[0] + omega * G[1], V[1] - omega * G[0], V[2]};
    const double r = std::sqrt(dot(D, D));
    const double wd = dot(W, D);
    const double f[3] = {dot(D, D) - range * range, 2.0 / lambda * wd / r + fdc,
                         (G[0] * G[0] + G[1] * G[1]) / a2 + G[2] * G[2] / b2 - 1.0};
    double J[3][3];
    for (int i = 0; i < 3; ++i) {
      J[0][i] = -2.0 * D[i];
      J[1][i] = 2.0 / lambda * (D[i] * wd / (r * r * r) - W[i] / r);
    }
    J[2][0] = 2.0 * G[0] / a2;
    J[2][1] = 2.0 * G[1] / a2;
    J[2][2] = 2.0 * G[2] / b2;
    const double det = det3(J);
    if (det == 0.0 || !std::isfinite(det)) VLR_FAIL("Singular ground point system", 1);
    // Cramer's rule for J dG = -f.
    double dG[3];
    for (int c = 0; c < 3; ++c) {
      double m[3][3];
      for (int i = 0; i < 3; ++i)
        for (int j = 0; j < 3; ++j) m[i][j] = j == c ? -f[i] : J[i][j];
      dG[c] = det3(m) / det;
    }
    for (int i = 0; i < 3; ++i) G[i] += dG[i];
    const double size = dot(dG, dG);
    if (size <= kConverged || !(previous / size > 2.0)) break;
    previous = size;
  }
  return 0;
}
