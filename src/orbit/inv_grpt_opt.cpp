#include "orbit/inv_grpt_opt.h"

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/orbit_poly.h"
#include "orbit/vec3.h"
#include "runtime/call_scope.h"

namespace {

using orbit_vec::dot;
using orbit_vec::norm;

constexpr const char* kModule = "gr_pt";
constexpr int kMaxSteps = 8;
constexpr double kConverged = 1e-8;  // s
constexpr int kSearchFailed = 12;

}  // namespace

int inv_grpt_opt(const double G[3], const double* cx, const double* cy, const double* cz,
                 double span, double lambda, double fdc, double* t, double* tau) {
  VLR_SCOPE("inv_grpt_opt", kModule);
  const double w = kEarthRotation;
  const double k = lambda * fdc * 0.5;
  double u = 0.5 * span;
  for (int step = 0; step < kMaxSteps; ++step) {
    if (!(u >= 0.0 && u <= span)) VLR_FAIL("Point not seen within the orbit", kSearchFailed);
    double P[3], V[3], A[3];
    POSVELACC_5(u, cx, cy, cz, P, V, A);
    const double D[3] = {G[0] - P[0], G[1] - P[1], G[2] - P[2]};
    const double r = norm(D);
    // W = omega x G - (V + omega x P).
    const double W[3] = {-w * G[1] - (V[0] - w * P[1]), w * G[0] - (V[1] + w * P[0]), -V[2]};
    const double f = dot(W, D) + k * r;
    // The rotation terms cancel in the derivative: f' = V.V - A.D - k V.D / r.
    const double df = dot(V, V) - dot(A, D) - k * dot(V, D) / r;
    *tau = 2.0 * r / kSpeedOfLight;
    if (!(df != 0.0) || !std::isfinite(df))
      VLR_FAIL("Point not seen within the orbit", kSearchFailed);
    const double du = -f / df;
    u += du;
    *t = u;
    if (std::fabs(du) <= kConverged) return 0;
  }
  VLR_FAIL("Inverse geometry search did not converge", kSearchFailed);
}
