#include "orbit/gr_pt_lat_lon.h"

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/geodetic.h"
#include "orbit/gr_pt.h"
#include "orbit/orbit_fit.h"
#include "orbit/orbit_poly.h"
#include "orbit/vec3.h"
#include "runtime/call_scope.h"

namespace {

using orbit_vec::cross;
using orbit_vec::dot;
using orbit_vec::norm;
using orbit_vec::unit;

constexpr const char* kModule = "gr_pt";

// Angle between two unit vectors in degrees (the cosine clamped to [-1, 1]).
double angle_deg(const double u[3], const double v[3]) {
  return std::acos(std::fmax(-1.0, std::fmin(1.0, dot(u, v)))) * kRadToDeg;
}

// Signed heading of the track direction vi at the ground point G: the angle
// between the horizontal track direction and north, negative when the track
// points along E (see below).
double heading_deg(const double G[3], const double vi[3]) {
  double N[3] = {2.0 * G[0] / kWgs84A2, 2.0 * G[1] / kWgs84A2, 2.0 * G[2] / kWgs84B2};
  unit(N, N);
  const double nv = dot(N, vi);
  double T[3] = {vi[0] - N[0] * nv, vi[1] - N[1] * nv, vi[2] - N[2] * nv};
  unit(T, T);
  // E = (1, -Gx/Gy, 0) normalised: horizontal, along the parallel.  On the
  // plane Gy = 0 the ratio is infinite; the limit from Gy > 0 is taken there.
  double E[3];
  if (G[1] != 0.0) {
    const double r = G[0] / G[1];
    const double s = std::sqrt(1.0 + r * r);
    E[0] = 1.0 / s;
    E[1] = -r / s;
  } else if (G[0] != 0.0) {
    E[0] = 0.0;
    E[1] = G[0] > 0.0 ? -1.0 : 1.0;
  } else {
    E[0] = 1.0;
    E[1] = 0.0;
  }
  E[2] = 0.0;
  const double te = dot(T, E);
  double M[3] = {T[0] - E[0] * te, T[1] - E[1] * te, T[2] - E[2] * te};
  unit(M, M);
  if (M[2] < 0.0)
    for (double& m : M) m = -m;
  const double sign = te < 0.0 ? -1.0 : 1.0;
  return sign * std::acos(std::fmax(-1.0, std::fmin(1.0, dot(M, T)))) * kRadToDeg;
}

}  // namespace

int gr_pt_lat_lon_s_osculated(gr_pt_record* rec, const double P[3], const double V[3],
                              const double A[3], double a, double b) {
  VLR_SCOPE("gr_pt_lat_lon_s_osculated", kModule);
  const double w = kEarthRotation;
  const int lookSign = rec->lookSign < 0.0 ? -1 : 1;
  const double vi[3] = {V[0] - w * P[1], V[1] + w * P[0], V[2]};
  double* G = rec->ground;
  VLR_CALL(gr_pt(P, vi, rec->tau, rec->fdc, rec->lambda, w, lookSign, a, b, G));
  double ah = a, bh = b, r = norm(G);
  if (rec->height != 0.0) {
    r = norm(G) + rec->height;
    ah = std::sqrt(r * r + (a * a / (b * b) - 1.0) * G[2] * G[2]);
    bh = ah * b / a;
    VLR_CALL(gr_pt(P, vi, rec->tau, rec->fdc, rec->lambda, w, lookSign, ah, bh, G));
  }
  rec->heading = heading_deg(G, vi);
  double geo[2];
  xyz2geo(G, geo, ah, bh);
  rec->lat = geo[0] * kRadToDeg;
  rec->lon = geo[1] * kRadToDeg;
  // Angles of the line of sight at the ground and at the satellite.
  double D[3] = {P[0] - G[0], P[1] - G[1], P[2] - G[2]};
  double los[3], gu[3], pu[3];
  unit(D, los);
  unit(G, gu);
  unit(P, pu);
  rec->incidence = angle_deg(los, gu);
  rec->look = angle_deg(los, pu);
  // Doppler rate from the local curvature of the orbit.
  const double range = norm(D);
  const double speed = norm(V), accel = norm(A);
  double vu[3], au[3], vxa[3], vxvxa[3];
  unit(V, vu);
  unit(A, au);
  cross(vu, au, vxa);
  cross(vu, vxa, vxvxa);
  const double rc = speed * speed / accel;
  const double cs = std::sin(std::acos(std::fmax(-1.0, std::fmin(1.0, dot(D, vu) / range))));
  const double phi = std::atan2(dot(D, vxa), dot(D, vxvxa));
  const double k = 1.0 - std::cos(phi) * (range * cs / rc) / (cs * cs);
  rec->dopplerRate = cs * cs * cs * (k * speed * speed * (-2.0 / rec->lambda)) / (range * cs);
  rec->groundSpeed = speed * r / norm(P);
  return 0;
}

int gr_pt_lat_lon(gr_pt_record* rec, double a, double b) {
  VLR_SCOPE("gr_pt_lat_lon", kModule);
  for (double& g : rec->ground) g = 0.0;
  rec->lat = rec->lon = rec->heading = rec->incidence = rec->look = 0.0;
  rec->groundSpeed = rec->effectiveSpeed = rec->dopplerRate = 0.0;
  double cx[5], cy[5], cz[5];
  VLR_CALL(orb_interp(0.0, rec->positions, rec->dt, cx, cy, cz, 5));
  const double u = rec->t - rec->tw;
  if (!(u >= -0.5 * rec->dt && u <= 4.5 * rec->dt)) return -1;
  double P[3], V[3], A[3];
  POSVELACC_5(u, cx, cy, cz, P, V, A);
  VLR_CALL(gr_pt_lat_lon_s_osculated(rec, P, V, A, a, b));
  // Effective speed from the radius of curvature at the window start.
  const double a0[3] = {2.0 * cx[2], 2.0 * cy[2], 2.0 * cz[2]};
  const double speed = norm(V);
  const double rho = speed * speed / norm(a0);
  const double range = rec->tau * kHalfSpeedOfLight;
  rec->effectiveSpeed = (1.0 - range * std::cos(rec->look / kRadToDeg) / rho) * speed;
  return 0;
}
