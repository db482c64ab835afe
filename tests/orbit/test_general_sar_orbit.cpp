#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "orbit/general_sar_orbit.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

constexpr double kDt = 5.0;

// n vectors of the closed-form orbit from t0, kDt apart, fitted.
void Fill(const CircularOrbit& orbit, double t0, int n, GeneralSAROrbit* o) {
  ASSERT_EQ(o->SVCreate(t0, kDt, n), 0);
  for (int i = 0; i < n; ++i)
    orbit.at(t0 + i * kDt, o->positions() + 3 * i, o->velocities() + 3 * i);
  ASSERT_EQ(o->computeApproximateSV(), 0);
}

class OrbitModel : public ::testing::Test {
 protected:
  void SetUp() override {
    orbit_.tNode = 7.3e8;
    Fill(orbit_, t0_, 31, &o_);
  }
  CircularOrbit orbit_;
  const double t0_ = 7.3e8 + 1234.5, last_ = t0_ + 30 * kDt;
  GeneralSAROrbit o_;
};

TEST_F(OrbitModel, ClosedFormOrbitWithinAMillimetre) {
  // Forward, backward and jumping queries, up to half a spacing beyond the
  // vectors at both ends.
  double worstP = 0.0, worstV = 0.0;
  auto compare = [&](double t) {
    double p[3], v[3], rp[3], rv[3];
    ASSERT_EQ(o_.SVGetPos(t, p), 0) << t;
    ASSERT_EQ(o_.SVGetVel(t, v), 0) << t;
    orbit_.at(t, rp, rv);
    for (int a = 0; a < 3; ++a) {
      worstP = std::fmax(worstP, std::fabs(p[a] - rp[a]));
      worstV = std::fmax(worstV, std::fabs(v[a] - rv[a]));
    }
  };
  for (double t = t0_ - 0.5 * kDt; t <= last_ + 0.5 * kDt; t += 0.37) compare(t);
  for (double t = last_ + 0.5 * kDt; t >= t0_ - 0.5 * kDt; t -= 0.41) compare(t);
  for (int i = 0; i < 200; ++i) compare(t0_ + std::fmod(i * 53.17, 150.0));
  EXPECT_LT(worstP, 1e-3);
  EXPECT_LT(worstV, 1e-3);
}

TEST_F(OrbitModel, WindowSwitchesOnlyOutsideItsMiddle) {
  double p[3];
  ASSERT_EQ(o_.SVGetPos(t0_ + 7.0 * kDt, p), 0);
  double tw = o_.windowStart();
  EXPECT_EQ(tw, t0_ + 6.0 * kDt);
  // Forward: kept up to tw + 3.4 dt, then a window with t 0.6..1.6 dt in.
  o_.SVGetPos(tw + 3.4 * kDt, p);
  EXPECT_EQ(o_.windowStart(), tw);
  o_.SVGetPos(tw + 3.41 * kDt, p);
  EXPECT_EQ(o_.windowStart(), tw + 2.0 * kDt);
  // Backward: kept down to tw + 0.6 dt, then a window with t 2.4..3.4 dt in.
  tw = o_.windowStart();
  o_.SVGetPos(tw + 0.6 * kDt, p);
  EXPECT_EQ(o_.windowStart(), tw);
  o_.SVGetPos(tw + 0.59 * kDt, p);
  EXPECT_EQ(o_.windowStart(), tw - 2.0 * kDt);
  // Sequential queries both ways stay within [0.6, 3.4] dt of the window
  // start and move two windows at a switch.
  for (double step : {0.05 * kDt, -0.05 * kDt}) {
    int switches = 0;
    for (int i = 0; i < 500; ++i) {
      const double t = (step > 0 ? t0_ + kDt : last_ - kDt) + i * step, before = o_.windowStart();
      o_.SVGetPos(t, p);
      ASSERT_GE(t - o_.windowStart(), 0.6 * kDt - 1e-9) << t;
      ASSERT_LE(t - o_.windowStart(), 3.4 * kDt + 1e-9) << t;
      switches += o_.windowStart() != before;
    }
    EXPECT_LE(switches, 14) << step;
  }
  // The end windows extrapolate half a spacing, no further.
  EXPECT_EQ(o_.SVGetPos(last_ + 0.5 * kDt, p), 0);
  EXPECT_EQ(o_.windowStart(), last_ - 4.0 * kDt);
  EXPECT_EQ(o_.SVGetPos(last_ + 0.6 * kDt, p), -1);
  EXPECT_EQ(o_.SVGetPos(t0_ - 0.5 * kDt, p), 0);
  EXPECT_EQ(o_.windowStart(), t0_);
  EXPECT_EQ(o_.SVGetPos(t0_ - 0.6 * kDt, p), -1);
  EXPECT_TRUE(std::isnan(o_.SVGetVel(t0_ - 3600.0)[0]));
}

TEST(GeneralSAROrbit, TooFewVectorsOrNoneGiveTheirCodes) {
  GeneralSAROrbit o;
  double p[3], t = 0.0, tau = 0.0, lat = 0.0, lon = 0.0, v = 0.0;
  EXPECT_EQ(o.SVCreate(7.3e8, kDt, 4), 1);
  EXPECT_EQ(o.SVCreate(7.3e8, 0.0, 5), 1);
  EXPECT_TRUE(o.positions() == nullptr);
  EXPECT_EQ(o.computeApproximateSV(), 1);
  EXPECT_EQ(o.SVGetPos(7.3e8, p), 1);
  EXPECT_EQ(o.SVGetFR(7.3e8, 5e-3, &v), 1);
  EXPECT_EQ(o.SVGetSatSpeed(7.3e8, 5e-3), -1.0);
  EXPECT_TRUE(std::isnan(o.SVGetLat(7.3e8, 5e-3)));
  EXPECT_EQ(o.SVGetLatLon(7.3e8, 5e-3, &lat, &lon), 1);
  EXPECT_EQ(o.sat2earth(7.3e8, 5e-3, p), 1);
  const double G[3] = {6.4e6, 0.0, 0.0};
  EXPECT_EQ(o.earth2sat(G, &t, &tau), 1);
  EXPECT_EQ(t, -1.0);
  EXPECT_EQ(tau, -1.0);
  // Vectors that are not finite are refused by the fit.
  Fill(CircularOrbit(), 7.3e8, 5, &o);
  o.positions()[7] = NAN;
  EXPECT_EQ(o.computeApproximateSV(), 1);
  EXPECT_EQ(o.SVGetPos(7.3e8, p), 1);
}

class OrbitHeaders : public ScratchTest {};

TEST_F(OrbitHeaders, ReadWriteAndCloneKeepTheOrbit) {
  GeneralSAROrbit o(0.031);
  o.setLookSign(-1);
  Fill(CircularOrbit(), 7.3e8 + 100.25, 9, &o);
  const std::string xml = path("orbit.xml"), four = path("four.hdr");
  ASSERT_EQ(o.writehdr(xml.c_str()), 0);
  const double t = 7.3e8 + 117.55;
  double p[3], q[3], r[3];
  ASSERT_EQ(o.SVGetPos(t, p), 0);
  GeneralSAROrbit back, copy;
  ASSERT_EQ(back.readhdr(xml.c_str()), 0);  // fitted on reading
  ASSERT_EQ(back.SVGetPos(t, q), 0);
  ASSERT_EQ(o.clone(&copy), 0);
  o.SVDestroy();
  EXPECT_EQ(copy.lambda(), 0.031);
  EXPECT_EQ(copy.lookSign(), -1);
  ASSERT_EQ(copy.SVGetPos(t, r), 0);
  for (int a = 0; a < 3; ++a) {
    EXPECT_EQ(p[a], q[a]);
    EXPECT_EQ(p[a], r[a]);
  }
  // Too few vectors for the model, a key missing.
  Spit(four,
       "[StateVectorData]\nTimeFirst = 1\nTimeDelta = 10\nnStateVectors = 4\n"
       "pos = {1 2 3 4 5 6 7 8 9 10 11 12}\nvel = {1 2 3 4 5 6 7 8 9 10 11 12}\n");
  EXPECT_EQ(back.readhdr(four.c_str()), 1);
  EXPECT_TRUE(back.positions() == nullptr);
  Spit(path("partial.hdr"), "[StateVectorData]\nTimeFirst = 1\nnStateVectors = 5\n");
  EXPECT_EQ(back.readhdr(path("partial.hdr").c_str()), 4);
}

TEST(GeneralSAROrbit, VectorsOfASceneFromTheOrbitFile) {
  const double start = ascii2sec85("02-MAR-2008 10:00:00.000000");
  GeneralSAROrbit o;
  ASSERT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start, 100.0), 0);
  EXPECT_EQ(o.n(), 31);
  EXPECT_EQ(o.t0(), start - 20.0);
  double p[3];
  ASSERT_EQ(o.SVGetPos(start + 50.0, p), 0);
  for (int a = 0; a < 3; ++a) EXPECT_NEAR(p[a], o.positions()[3 * 14 + a], 1e-6);
  // Outside the file's validity (the old vectors are gone), a missing file,
  // a duration that is not a number.
  EXPECT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start + 864000.0, 100.0), 13);
  EXPECT_EQ(o.SVGetPos(start, p), 1);
  EXPECT_EQ(o.GetStateVectorsENVI("/nonexistent/orbit", start, 100.0), 9);
  EXPECT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start, NAN), 1);
}

}  // namespace
