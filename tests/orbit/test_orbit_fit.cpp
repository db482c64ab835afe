#include <gtest/gtest.h>

#include <cmath>

#include "orbit/orbit_fit.h"
#include "orbit/orbit_poly.h"
#include "orbit/poly_fit.h"
#include "orbit/rtbis.h"

namespace {

TEST(PolyFit, RecoversAPolynomialAndItsResidualOrFails) {
  // y = 2 - 3x + 0.5x^2 + 0.25x^3 at ten points.
  double x[10], y[10];
  for (int i = 0; i < 10; ++i) {
    x[i] = -2.0 + 0.7 * i;
    y[i] = 2.0 - 3.0 * x[i] + 0.5 * x[i] * x[i] + 0.25 * x[i] * x[i] * x[i];
  }
  double c[4];
  ASSERT_EQ(dpolfit(x, y, 10, c, 3), 0);
  EXPECT_NEAR(c[0], 2.0, 1e-12);
  EXPECT_NEAR(c[1], -3.0, 1e-12);
  EXPECT_NEAR(c[2], 0.5, 1e-12);
  EXPECT_NEAR(c[3], 0.25, 1e-12);
  ASSERT_EQ(polfit(x, y, 10, c, 3), 0);
  EXPECT_NEAR(c[3], 0.25, 1e-12);
  // A line through (0,0), (1,1), (2,0): y = 1/3, residual 2/3.
  const double lx[3] = {0, 1, 2}, ly[3] = {0, 1, 0};
  double sse = -1.0;
  ASSERT_EQ(gen_polfit(2, lx, ly, 3, c, &sse), 0);
  EXPECT_NEAR(c[0], 1.0 / 3.0, 1e-14);
  EXPECT_NEAR(c[1], 0.0, 1e-14);
  EXPECT_NEAR(sse, 2.0 / 3.0, 1e-14);
  // Too few or coincident points.
  const double same[3] = {1, 1, 1};
  EXPECT_EQ(dpolfit(same, ly, 3, c, 3), 1);
  EXPECT_EQ(dpolfit(same, ly, 3, c, 1), 1);
  EXPECT_EQ(dpolfit(same, ly, 3, c, -1), 1);
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

  // orb_interp: through every sample, descending order, time from t0.
  double cx[m], cy[m], cz[m];
  ASSERT_EQ(orb_interp(0.0, pos, 2.0, cx, cy, cz, m), 0);
  const double* c[3] = {cx, cy, cz};
  for (int a = 0; a < 3; ++a) {
    EXPECT_NEAR(c[a][m - 1], pos[a], 1e-9);
    EXPECT_NEAR(c[a][0], 0.0, 1e-9);  // no t^5 term
    for (int i = 0; i < m; ++i) EXPECT_NEAR(POSMACRO(2.0 * i, c[a], m), pos[3 * i + a], 1e-9);
  }
}

double shifted_cos(double x) {
  return std::cos(x);
}
double always_positive(double x) {
  return 1.0 + x * x;
}

TEST(Rtbis, RootOrAFailureCode) {
  double root = 0.0;
  ASSERT_EQ(rtbis(shifted_cos, 0.0, 3.0, 1e-10, &root), 0);
  EXPECT_NEAR(root, M_PI / 2.0, 1e-10);
  ASSERT_EQ(rtbis(shifted_cos, 3.0, 0.0, 1e-10, &root), 0);
  EXPECT_NEAR(root, M_PI / 2.0, 1e-10);
  root = -1.0;
  EXPECT_EQ(rtbis(always_positive, -1.0, 1.0, 1e-6, &root), 1);
  EXPECT_EQ(root, -1.0);
  // An accuracy that halving never reaches.
  EXPECT_EQ(rtbis(shifted_cos, 0.0, 3.0, 0.0, &root), 1);
}

}  // namespace
