#include "synth_geometry.h"

#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>

#include "synth_time.h"

namespace synth {

double dot(Vec3 a, Vec3 b) {
  return a.x * b.x + a.y * b.y + a.z * b.z;
}
Vec3 cross(Vec3 a, Vec3 b) {
  return {a.y * b.z - a.z * b.y, a.z * b.x - a.x * b.z, a.x * b.y - a.y * b.x};
}
double norm(Vec3 a) {
  return std::sqrt(dot(a, a));
}

namespace {
constexpr double kDeg = M_PI / 180.0;
}

KeplerTrajectory::KeplerTrajectory(double t0, double radius, double incl_deg, double u0,
                                   double lon0_deg, int orbit0)
    : t0_(t0), a_(radius), incl_(incl_deg * kDeg), u0_(u0), orbit0_(orbit0) {
  n_ = std::sqrt(kGm / (a_ * a_ * a_));
  // Longitude of the node (Earth-fixed at t0) that puts the satellite at lon0.
  node0_ = lon0_deg * kDeg - std::atan2(std::sin(u0_) * std::cos(incl_), std::cos(u0_));
}

double KeplerTrajectory::period() const {
  return 2.0 * M_PI / n_;
}

State KeplerTrajectory::at(double t) const {
  const double dt = t - t0_;
  const double u = u0_ + n_ * dt;
  const double node = node0_ - kEarthRate * dt;  // the node drifts west in the Earth frame
  const double cu = std::cos(u), su = std::sin(u), ci = std::cos(incl_), si = std::sin(incl_);
  const double cn = std::cos(node), sn = std::sin(node);
  // Position in the orbital plane rotated by the node: r = a (P cos u + Q sin u).
  const Vec3 P{cn, sn, 0.0};
  const Vec3 Q{-sn * ci, cn * ci, si};
  State s;
  s.t = t;
  s.p = a_ * (cu * P + su * Q);
  // Inertial velocity in the plane, then the frame rotation -w x r.
  const Vec3 v_in = (a_ * n_) * ((-su) * P + cu * Q);
  const Vec3 w{0.0, 0.0, kEarthRate};
  s.v = v_in - cross(w, s.p);
  // Point-mass gravity seen from the rotating frame: a = g - 2 w x v - w x (w x p).
  const double r = norm(s.p);
  s.a = (-kGm / (r * r * r)) * s.p - 2.0 * cross(w, s.v) - cross(w, cross(w, s.p));
  s.abs_orbit = orbit0_ + static_cast<int>(std::floor(u / (2.0 * M_PI)));
  return s;
}

bool DorisTrajectory::load(const std::string& path, std::string* error) {
  std::ifstream f(path, std::ios::binary);
  if (!f) {
    *error = "cannot open orbit file " + path;
    return false;
  }
  std::string head(1625, '\0');
  if (!f.read(&head[0], 1625) || head.compare(0, 9, "PRODUCT=\"") != 0 ||
      (head.compare(9, 7, "DOR_VOR") != 0 && head.compare(9, 7, "DOR_POR") != 0)) {
    *error = "not a DORIS orbit file: " + path;
    return false;
  }
  if (!parse_utc(head.substr(351, 27), &start_) || !parse_utc(head.substr(394, 27), &stop_)) {
    *error = "bad sensing start/stop in " + path;
    return false;
  }
  const long offset = std::atol(head.c_str() + 1247 + 231);
  const long count = std::atol(head.c_str() + 1247 + 305);
  if (offset < 1625 || count < 8 || count > 100000) {
    *error = "bad data set descriptor in " + path;
    return false;
  }
  f.seekg(offset);
  std::string rec(129, '\0');
  for (long i = 0; i < count; ++i) {
    if (!f.read(&rec[0], 129)) {
      *error = "orbit file shorter than its record count: " + path;
      return false;
    }
    State s;
    if (!parse_utc(rec.substr(0, 27), &s.t)) {
      *error = "bad record time in " + path;
      return false;
    }
    s.abs_orbit = std::atoi(rec.c_str() + 37);
    s.p = {std::atof(rec.c_str() + 44), std::atof(rec.c_str() + 57), std::atof(rec.c_str() + 70)};
    s.v = {std::atof(rec.c_str() + 83), std::atof(rec.c_str() + 96), std::atof(rec.c_str() + 109)};
    if (!recs_.empty() && s.t <= recs_.back().t) {
      *error = "orbit records out of order in " + path;
      return false;
    }
    recs_.push_back(s);
  }
  return true;
}

State DorisTrajectory::at(double t) const {
  // Eight records around t (clamped at the ends), general Lagrange weights.
  const int n = static_cast<int>(recs_.size());
  int k = 0;
  while (k < n && recs_[k].t < t) ++k;
  int first = k - 4;
  if (first < 0) first = 0;
  if (first > n - 8) first = n - 8;
  State s;
  s.t = t;
  for (int j = first; j < first + 8; ++j) {
    double w = 1.0;
    for (int m = first; m < first + 8; ++m)
      if (m != j) w *= (t - recs_[m].t) / (recs_[j].t - recs_[m].t);
    // Derivative of the Lagrange weight, written without division by (t - t_m)
    // so that it holds at the record times as well.
    double dw = 0.0;
    for (int i = first; i < first + 8; ++i) {
      if (i == j) continue;
      double term = 1.0 / (recs_[j].t - recs_[i].t);
      for (int m = first; m < first + 8; ++m)
        if (m != j && m != i) term *= (t - recs_[m].t) / (recs_[j].t - recs_[m].t);
      dw += term;
    }
    s.p = s.p + w * recs_[j].p;
    s.v = s.v + w * recs_[j].v;
    s.a = s.a + dw * recs_[j].v;
  }
  const State& nearer =
      (k > 0 && (k == n || t - recs_[k - 1].t < recs_[k].t - t)) ? recs_[k - 1] : recs_[k];
  s.abs_orbit = nearer.abs_orbit;
  return s;
}

Vec3 ellipsoid_normal(Vec3 x) {
  const Vec3 g{x.x / (kWgsA * kWgsA), x.y / (kWgsA * kWgsA), x.z / (kWgsB * kWgsB)};
  return (1.0 / norm(g)) * g;
}

Geodetic to_geodetic(Vec3 x) {
  // Bowring's iteration; converges to far below a millimetre in a few steps.
  const double e2 = 1.0 - (kWgsB * kWgsB) / (kWgsA * kWgsA);
  const double p = std::hypot(x.x, x.y);
  double lat = std::atan2(x.z, p * (1.0 - e2));
  double h = 0.0;
  for (int i = 0; i < 8; ++i) {
    const double sl = std::sin(lat);
    const double nrad = kWgsA / std::sqrt(1.0 - e2 * sl * sl);
    h = p / std::cos(lat) - nrad;
    lat = std::atan2(x.z, p * (1.0 - e2 * nrad / (nrad + h)));
  }
  Geodetic g;
  g.lat_deg = lat / kDeg;
  g.lon_deg = std::atan2(x.y, x.x) / kDeg;
  g.h = h;
  return g;
}

bool zero_doppler_point(const State& s, double tau, GroundPoint* out) {
  const double range = tau * kLightSpeed / 2.0;
  const double r = norm(s.p);
  // Start: a point of the sphere of mean radius at the right distance, to the right.
  const Vec3 up = (1.0 / r) * s.p;
  Vec3 right = cross(s.v, s.p);
  right = (1.0 / norm(right)) * right;
  const double re = 6371000.0;
  double cosg = (r * r + re * re - range * range) / (2.0 * r * re);
  if (cosg > 1.0) cosg = 1.0;
  if (cosg < -1.0) return false;
  const double gamma = std::acos(cosg);
  Vec3 x = (re * std::cos(gamma)) * up + (re * std::sin(gamma)) * right;
  // Newton on: |x-p|^2 = R^2, (x-p).v = 0, x on the ellipsoid.
  const double a2 = kWgsA * kWgsA, b2 = kWgsB * kWgsB;
  for (int it = 0; it < 30; ++it) {
    const Vec3 d = x - s.p;
    const double f[3] = {dot(d, d) - range * range, dot(d, s.v),
                         (x.x * x.x + x.y * x.y) / a2 + x.z * x.z / b2 - 1.0};
    const double J[3][3] = {{2 * d.x, 2 * d.y, 2 * d.z},
                            {s.v.x, s.v.y, s.v.z},
                            {2 * x.x / a2, 2 * x.y / a2, 2 * x.z / b2}};
    const double det = J[0][0] * (J[1][1] * J[2][2] - J[1][2] * J[2][1]) -
                       J[0][1] * (J[1][0] * J[2][2] - J[1][2] * J[2][0]) +
                       J[0][2] * (J[1][0] * J[2][1] - J[1][1] * J[2][0]);
    if (det == 0.0) return false;
    // Cramer's rule for J dx = -f.
    double dx[3];
    for (int c = 0; c < 3; ++c) {
      double M[3][3];
      std::memcpy(M, J, sizeof M);
      for (int row = 0; row < 3; ++row) M[row][c] = -f[row];
      dx[c] = (M[0][0] * (M[1][1] * M[2][2] - M[1][2] * M[2][1]) -
               M[0][1] * (M[1][0] * M[2][2] - M[1][2] * M[2][0]) +
               M[0][2] * (M[1][0] * M[2][1] - M[1][1] * M[2][0])) /
              det;
    }
    x = x + Vec3{dx[0], dx[1], dx[2]};
    if (std::fabs(dx[0]) + std::fabs(dx[1]) + std::fabs(dx[2]) < 1e-7) break;
  }
  const Vec3 los = s.p - x;
  if (std::fabs(norm(los) - range) > 1e-3 || dot(x - s.p, right) <= 0.0) return false;
  out->x = x;
  out->geo = to_geodetic(x);
  out->incidence_deg = std::acos(dot(ellipsoid_normal(x), (1.0 / norm(los)) * los)) / kDeg;
  out->look_deg = std::acos(dot((1.0 / norm(los)) * (x - s.p), (-1.0) * up)) / kDeg;
  return true;
}

}  // namespace synth
