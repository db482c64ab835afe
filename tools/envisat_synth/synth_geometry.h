// The generator's own orbit and range-Doppler geometry: a circular Keplerian
// orbit or a trajectory interpolated from DORIS records, and the zero-Doppler
// intersection of a slant range with the WGS84 ellipsoid.
#pragma once

#include <memory>
#include <string>
#include <vector>

namespace synth {

constexpr double kLightSpeed = 299792458.0;
constexpr double kWgsA = 6378137.0;
constexpr double kWgsB = 6356752.314245;
constexpr double kEarthRate = 7.292115189334571e-5;  // rad/s
constexpr double kGm = 3.986004418e14;               // m^3/s^2

struct Vec3 {
  double x = 0, y = 0, z = 0;
};
inline Vec3 operator+(Vec3 a, Vec3 b) {
  return {a.x + b.x, a.y + b.y, a.z + b.z};
}
inline Vec3 operator-(Vec3 a, Vec3 b) {
  return {a.x - b.x, a.y - b.y, a.z - b.z};
}
inline Vec3 operator*(double s, Vec3 a) {
  return {s * a.x, s * a.y, s * a.z};
}
double dot(Vec3 a, Vec3 b);
Vec3 cross(Vec3 a, Vec3 b);
double norm(Vec3 a);

// Earth-fixed state at one time.  The acceleration is that of the Earth-fixed
// trajectory itself, Coriolis and centrifugal terms included.
struct State {
  double t = 0;  // seconds since 1985
  Vec3 p, v, a;
  int abs_orbit = 0;
};

class Trajectory {
 public:
  virtual ~Trajectory() = default;
  virtual State at(double t) const = 0;
  // Validity of the trajectory (seconds since 1985).
  virtual double first_time() const = 0;
  virtual double last_time() const = 0;
};

// Circular orbit, Earth-fixed: inclination i, radius a; at time t0 the
// argument of latitude is u0 and the Earth-fixed longitude lon0.  Orbit
// numbers count ascending nodes, orbit0 at t0.
class KeplerTrajectory : public Trajectory {
 public:
  KeplerTrajectory(double t0, double radius, double incl_deg, double u0, double lon0_deg,
                   int orbit0);
  State at(double t) const override;
  double first_time() const override { return -1e300; }
  double last_time() const override { return 1e300; }
  double period() const;

 private:
  double t0_, a_, incl_, u0_, node0_, n_;
  int orbit0_;
};

// Records of a DORIS orbit file, interpolated with eight-point Lagrange
// polynomials (positions and velocities each from their own samples; the
// acceleration is the derivative of the velocity polynomial).
class DorisTrajectory : public Trajectory {
 public:
  // Reads the records; false with a message on a malformed file.
  bool load(const std::string& path, std::string* error);
  State at(double t) const override;
  double first_time() const override { return recs_.front().t; }
  double last_time() const override { return recs_.back().t; }
  double start() const { return start_; }  // MPH sensing start/stop (validity)
  double stop() const { return stop_; }

 private:
  std::vector<State> recs_;
  double start_ = 0, stop_ = 0;
};

struct Geodetic {
  double lat_deg = 0, lon_deg = 0, h = 0;
};
Geodetic to_geodetic(Vec3 x);
Vec3 ellipsoid_normal(Vec3 x);

// Ground point of a zero-Doppler, right-looking line of sight: satellite state
// s, two-way range delay tau.  Returns false when no intersection exists.
struct GroundPoint {
  Vec3 x;
  Geodetic geo;
  double incidence_deg = 0;  // between the ellipsoid normal and the line of sight
  double look_deg = 0;       // off-nadir angle at the satellite (geocentric nadir)
};
bool zero_doppler_point(const State& s, double tau, GroundPoint* out);

}  // namespace synth
