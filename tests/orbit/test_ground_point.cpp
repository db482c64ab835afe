#include <gtest/gtest.h>

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/geodetic.h"
#include "orbit/gr_pt.h"
#include "orbit/gr_pt_lat_lon.h"

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

TEST(GroundPoint, SatisfiesRangeDopplerAndEllipsoid) {
  const double P[3] = {6494931.106, 578715.148, -2977719.455};
  const double V[3] = {3188.730641, -1416.295158, 6692.698996};
  const double lambda = 0.05623564240544047;
  for (double fdc : {0.0, 350.0, -1200.0}) {
    for (int sign : {1, -1}) {
      double G[3];
      const double tau = 5.9e-3;
      ASSERT_EQ(gr_pt(P, V, tau, fdc, lambda, 0.0, sign, kWgs84A, kWgs84B, G), 0);
      const double D[3] = {P[0] - G[0], P[1] - G[1], P[2] - G[2]};
      const double r = std::sqrt(Dot(D, D));
      EXPECT_NEAR(r, tau * kHalfSpeedOfLight, 1e-4);
      EXPECT_NEAR(-2.0 / lambda * Dot(V, D) / r, fdc, 1e-6);
      EXPECT_NEAR((G[0] * G[0] + G[1] * G[1]) / kWgs84A2 + G[2] * G[2] / kWgs84B2, 1.0, 1e-13);
    }
  }
  // A range that does not reach the Earth.
  double G[3];
  EXPECT_EQ(gr_pt(P, V, 1e-4, 0.0, lambda, 0.0, 1, kWgs84A, kWgs84B, G), 2);
  // No velocity: no Doppler plane.
  const double still[3] = {0.0, 0.0, 0.0};
  EXPECT_EQ(gr_pt(P, still, 5.9e-3, 0.0, lambda, 0.0, 1, kWgs84A, kWgs84B, G), 1);
}

TEST(Geodetic, RoundTripsAndPoles) {
  for (double lat = -90.0; lat <= 90.0; lat += 7.5) {
    for (double lon : {-179.9, -45.0, 0.0, 12.5, 180.0}) {
      const double llh[3] = {lat / kRadToDeg, lon / kRadToDeg, 0.0};
      double g[3], back[2], again[3];
      geo2cart(g, llh);
      xyz2geo(g, back, kWgs84A, kWgs84B);
      EXPECT_NEAR(back[0] * kRadToDeg, lat, 1e-9) << lat << " " << lon;
      if (std::fabs(lat) < 90.0) {
        EXPECT_NEAR(std::remainder(back[1] * kRadToDeg - lon, 360.0), 0.0, 1e-9);
      }
      const double llh2[3] = {back[0], back[1], 0.0};
      geo2cart(again, llh2);
      for (int a = 0; a < 3; ++a) EXPECT_NEAR(again[a], g[a], 1e-6);
    }
  }
  double out[2];
  const double north[3] = {0.0, 0.0, kWgs84B};
  const double south[3] = {0.0, 0.0, -kWgs84B};
  xyz2geo(north, out, kWgs84A, kWgs84B);
  EXPECT_EQ(out[0], kPi / 2.0);
  xyz2geo(south, out, kWgs84A, kWgs84B);
  EXPECT_EQ(out[0], -kPi / 2.0);
}

}  // namespace
