#include <gtest/gtest.h>

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/geodetic.h"
#include "orbit/gr_pt.h"
#include "orbit/gr_pt_lat_lon.h"
#include "orbit/orbit_fit.h"
#include "orbit/poly_fit.h"
#include "orbit/rtbis.h"
#include "truth_math.h"

namespace {

double Dot(const double a[3], const double b[3]) {
  return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
}

TEST(GroundPoint, SphericalCaseMatchesTheTriangle) {
  // A satellite over a spherical Earth, moving north; angles from the
  // triangle of Earth centre, satellite and ground point.
  const double re = 6371000.0, rs = 7150000.0;
  const double lambda = 0.0562356;
  for (double range : {830000.0, 900000.0, 1000000.0}) {
    gr_pt_record rec{};
    // Five positions 5 s apart on a circle in the x-z plane (no Earth
    // rotation is applied to an orbit given Earth-fixed).
    const double w = 7450.0 / rs;
    for (int i = 0; i < 5; ++i) {
      const double u = 0.2 + w * 5.0 * i;
      rec.positions[3 * i] = rs * std::cos(u);
      rec.positions[3 * i + 1] = 0.0;
      rec.positions[3 * i + 2] = rs * std::sin(u);
    }
    rec.tw = 1000.0;
    rec.dt = 5.0;
    rec.t = 1010.0;
    rec.tau = range / kHalfSpeedOfLight;
    rec.lambda = lambda;
    rec.lookSign = 1.0;
    ASSERT_EQ(gr_pt_lat_lon(&rec, re, re), 0);
    const double look = std::acos((rs * rs + range * range - re * re) / (2.0 * rs * range));
    const double inc = std::acos((rs * rs - re * re - range * range) / (2.0 * re * range));
    EXPECT_NEAR(rec.look, look * kRadToDeg, 1e-4) << range;
    EXPECT_NEAR(rec.incidence, inc * kRadToDeg, 1e-4) << range;
    // On the sphere, at the range.
    const double* g = rec.ground;
    EXPECT_NEAR(std::sqrt(Dot(g, g)), re, 1e-3);
    // Right of a northbound track at longitude 0 is east (y > 0).
    EXPECT_GT(g[1], 0.0);
    // Speeds and Doppler rate of a circular orbit over a sphere at zero
    // Doppler: with gamma the Earth-central angle between satellite and
    // ground point, R R'' = V^2 - w^2 P.(P - G) = w^2 rs re cos(gamma).
    const double v = w * rs;
    const double cosGamma = (rs * rs + re * re - range * range) / (2.0 * rs * re);
    EXPECT_NEAR(rec.groundSpeed, v * re / rs, 1e-6);
    EXPECT_NEAR(rec.effectiveSpeed, v * re * cosGamma / rs, 1e-3);
    EXPECT_NEAR(rec.dopplerRate, -2.0 / lambda * w * w * rs * re * cosGamma / range, 1e-3);
  }
}

// The satisfied equations are checked through the orbit's sat2earth.
TEST(GroundPoint, NoVelocityFails) {
  const double P[3] = {6494931.106, 578715.148, -2977719.455}, still[3] = {0.0, 0.0, 0.0};
  double G[3];
  EXPECT_EQ(gr_pt(P, still, 5.9e-3, 0.0, 0.0562, 0.0, 1, kWgs84A, kWgs84B, G), 1);
}

TEST(Geodetic, EllipsoidPointsBothWaysAndPoles) {
  for (double lat = -90.0; lat <= 90.0; lat += 7.5) {
    for (double lon : {-179.9, -45.0, 0.0, 12.5, 180.0}) {
      const double llh[3] = {lat / kRadToDeg, lon / kRadToDeg, 0.0};
      truth::Vec3 g;
      double back[2];
      geo2cart(g.data(), llh);
      EXPECT_LT(truth::Distance(g, truth::EarthFixed(lat, lon)), 1e-6) << lat << " " << lon;
      xyz2geo(g.data(), back, kWgs84A, kWgs84B);
      EXPECT_NEAR(back[0] * kRadToDeg, lat, 1e-9) << lat << " " << lon;
      if (std::fabs(lat) < 90.0) {
        EXPECT_NEAR(std::remainder(back[1] * kRadToDeg - lon, 360.0), 0.0, 1e-9);
      }
    }
  }
  double out[2];
  const double north[3] = {0.0, 0.0, kWgs84B}, south[3] = {0.0, 0.0, -kWgs84B};
  xyz2geo(north, out, kWgs84A, kWgs84B);
  EXPECT_EQ(out[0], kPi / 2.0);
  xyz2geo(south, out, kWgs84A, kWgs84B);
  EXPECT_EQ(out[0], -kPi / 2.0);
}

TEST(PolyFit, RecoversAPolynomialAndItsResidualOrFails) {
  // y = 2 - 3x + 0.5x^2 + 0.25x^3 at ten points.
  double x[10], y[10];
  for (int i = 0; i < 10; ++i) {
    x[i] = -2.0 + 0.7 * i;
    y[i] = 2.0 - 3.0 * x[i] + 0.5 * x[i] * x[i] + 0.25 * x[i] * x[i] * x[i];
  }
  const double want[4] = {2.0, -3.0, 0.5, 0.25};
  double c[4];
  ASSERT_EQ(dpolfit(x, y, 10, c, 3), 0);
  for (int k = 0; k < 4; ++k) EXPECT_NEAR(c[k], want[k], 1e-12) << k;
  // A line through (0,0), (1,1), (2,0): y = 1/3, residual 2/3.
  const double lx[3] = {0, 1, 2}, ly[3] = {0, 1, 0};
  double sse = -1.0;
  ASSERT_EQ(gen_polfit(2, lx, ly, 3, c, &sse), 0);
  EXPECT_NEAR(c[0], 1.0 / 3.0, 1e-14);
  EXPECT_NEAR(c[1], 0.0, 1e-14);
  EXPECT_NEAR(sse, 2.0 / 3.0, 1e-14);
  // Too few or coincident points.
  const double same[3] = {1, 1, 1};
  for (int degree : {3, 1, -1}) EXPECT_EQ(dpolfit(same, ly, 3, c, degree), 1) << degree;
  EXPECT_EQ(polfit(same, ly, 0, c, 0), 1);
}

TEST(OrbitFit, CoefficientLayouts) {
  // Axis a: y = (a + 1) + (a - 1) t + 0.01 a t^2, sampled at t = 10 + 2 i.
  const int m = 6;
  double pos[3 * m], vel[3 * m];
  for (int i = 0; i < m; ++i) {
    const double t = 10.0 + 2.0 * i;
    for (int a = 0; a < 3; ++a) {
      pos[3 * i + a] = (a + 1) + (a - 1) * t + 0.01 * a * t * t;
      vel[3 * i + a] = (a - 1) + 0.02 * a * t;
    }
  }
  double cpos[9], cvel[9], ssePos[3], sseVel[3];
  ASSERT_EQ(orbffit(pos, vel, 10.0, 2.0, m, cpos, cvel, 3, ssePos, sseVel), 0);
  for (int a = 0; a < 3; ++a) {
    EXPECT_NEAR(cpos[a], a + 1, 1e-9);
    EXPECT_NEAR(cpos[3 + a], a - 1, 1e-10);
    EXPECT_NEAR(cpos[6 + a], 0.01 * a, 1e-12);
    EXPECT_NEAR(cvel[a], a - 1, 1e-10);
    EXPECT_NEAR(cvel[3 + a], 0.02 * a, 1e-12);
    EXPECT_LT(ssePos[a], 1e-16);
    EXPECT_LT(sseVel[a], 1e-16);
  }
  // Velocities are optional.
  ASSERT_EQ(orbffit(pos, nullptr, 10.0, 2.0, m, cpos, nullptr, 3, nullptr, nullptr), 0);
  EXPECT_EQ(orbffit(pos, nullptr, 10.0, 2.0, m, cpos, nullptr, 7, nullptr, nullptr), 1);
}

double cosine(double x) {
  return std::cos(x);
}
double always_positive(double x) {
  return 1.0 + x * x;
}

TEST(Rtbis, RootEitherWayRoundOrAFailureCode) {
  double root = -1.0;
  EXPECT_EQ(rtbis(always_positive, -1.0, 1.0, 1e-6, &root), 1);
  EXPECT_EQ(root, -1.0);
  for (double a : {0.0, 3.0}) {
    ASSERT_EQ(rtbis(cosine, a, 3.0 - a, 1e-10, &root), 0);
    EXPECT_NEAR(root, M_PI / 2.0, 1e-10);
  }
  // An accuracy that halving never reaches.
  EXPECT_EQ(rtbis(cosine, 0.0, 3.0, 0.0, &root), 1);
}

}  // namespace
