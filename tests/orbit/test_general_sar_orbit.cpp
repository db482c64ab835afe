// GeneralSAROrbit on a closed-form circular orbit: the satellite's true
// position and velocity come from the formula, not from the orbit model.
#include <gtest/gtest.h>

#include <cmath>
#include <string>
#include <vector>

#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/poly_families.h"
#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/gr_pt.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

constexpr double kDt = 5.0;
constexpr int kN = 31;

double Dot(const double a[3], const double b[3]) {
  return a[0] * b[0] + a[1] * b[1] + a[2] * b[2];
}

class OrbitModel : public ::testing::Test {
 protected:
  void SetUp() override {
    t0_ = orbit_.tNode + 900.0;  // descending through mid latitudes
    Sample(orbit_, t0_, kDt, kN, &o_);
    ASSERT_EQ(o_.computeApproximateSV(), 0);
    // 0.3 ms (45 km of slant range) from a look angle of 30 degrees.
    roi_.SetFastAxe(6.2e-3, 1e-8, 30000);
    roi_.SetSlowAxe(t0_ + 50.0, 1e-3, 20000);
    dc_.pol[0] = 300.0;
    dc_.pol[1] = -2e5;
    dc_.trg0_s = 6.2e-3;
  }
  double last() const { return t0_ + (kN - 1) * kDt; }
  double az() const { return t0_ + 60.0; }
  double fdc(double rt) const { return 300.0 - 2e5 * (rt - 6.2e-3); }

  CircularOrbit orbit_;
  double t0_ = 0.0;
  GeneralSAROrbit o_;
  ROI_Obj roi_;
  polyDC dc_;
};

TEST_F(OrbitModel, ClosedFormOrbitWithinAMillimetre) {
  // Forward, backward and jumping queries, up to half a spacing beyond the
  // vectors at both ends.
  std::vector<double> times;
  for (double t = t0_ - 0.5 * kDt; t <= last() + 0.5 * kDt; t += 0.37) times.push_back(t);
  for (double t = last() + 0.5 * kDt; t >= t0_ - 0.5 * kDt; t -= 0.41) times.push_back(t);
  for (int i = 0; i < 200; ++i) times.push_back(t0_ + std::fmod(i * 53.17, 150.0));
  double worstP = 0.0, worstV = 0.0;
  WorstErrors(orbit_, &o_, times, &worstP, &worstV);
  EXPECT_LT(worstP, 1e-3);
  EXPECT_LT(worstV, 1e-3);
  // Sequential queries both ways keep the time within [0.6, 3.4] spacings
  // of the window start, where the five-vector polynomial is best, and
  // move the window by two spacings at a switch, not at every vector.
  for (double step : {0.05 * kDt, -0.05 * kDt}) {
    int switches = 0;
    for (int i = 0; i < 500; ++i) {
      const double t = (step > 0 ? t0_ + kDt : last() - kDt) + i * step, before = o_.windowStart();
      double p[3];
      o_.SVGetPos(t, p);
      ASSERT_GE(t - o_.windowStart(), 0.6 * kDt - 1e-9) << t;
      ASSERT_LE(t - o_.windowStart(), 3.4 * kDt + 1e-9) << t;
      switches += o_.windowStart() != before;
    }
    EXPECT_LE(switches, 14) << step;
  }
}

// The ground point lies on the range sphere, the ellipsoid and the Doppler
// cone of the true orbit, on the requested side; incidence and look angle
// are the angles of the triangle Earth centre, satellite, ground point.
TEST_F(OrbitModel, GroundPointAndAnglesOfTheTrueOrbit) {
  const double lambda = GeneralSAROrbit::kDefaultLambda;
  for (int side : {1, -1}) {
    o_.setLookSign(side);
    for (double t : {t0_ + 1.0, t0_ + 71.3, last() - 0.2}) {
      for (double tau : {5.6e-3, 6.1e-3, 6.8e-3}) {
        for (double fdc : {0.0, 420.0, -1300.0}) {
          double G[3], P[3], V[3];
          ASSERT_EQ(o_.sat2earth(t, tau, fdc, G), 0);
          orbit_.at(t, P, V);
          const double D[3] = {G[0] - P[0], G[1] - P[1], G[2] - P[2]};
          const double range = std::sqrt(Dot(D, D)), rs = std::sqrt(Dot(P, P)),
                       rg = std::sqrt(Dot(G, G));
          EXPECT_NEAR(range, tau * kHalfSpeedOfLight, 1e-4);
          EXPECT_NEAR((G[0] * G[0] + G[1] * G[1]) / kWgs84A2 + G[2] * G[2] / kWgs84B2, 1.0, 1e-12);
          EXPECT_NEAR(2.0 / lambda * Dot(V, D) / range, fdc, 1e-3);
          double right[3] = {V[1] * P[2] - V[2] * P[1], V[2] * P[0] - V[0] * P[2],
                             V[0] * P[1] - V[1] * P[0]};
          EXPECT_GT(Dot(D, right) * side, 0.0);
          double inc = 0.0, look = 0.0;
          ASSERT_EQ(o_.SVGetAngles(t, tau, fdc, &inc, &look), 0);
          const double lookTrue =
              std::acos((rs * rs + range * range - rg * rg) / (2.0 * rs * range)) * kRadToDeg;
          const double incTrue =
              std::acos((rs * rs - rg * rg - range * range) / (2.0 * rg * range)) * kRadToDeg;
          EXPECT_NEAR(look, lookTrue, 1e-4);
          EXPECT_NEAR(inc, incTrue, 1e-4);
        }
      }
    }
  }
}

TEST_F(OrbitModel, RoundTripThroughTheInverseSearch) {
  for (double fdc : {0.0, 350.0, -1200.0}) {
    for (double t : {t0_ + 0.3, t0_ + 64.4, last() - 0.1}) {
      for (double tau : {5.6e-3, 6.7e-3}) {
        double G[3];
        ASSERT_EQ(o_.sat2earth(t, tau, fdc, G), 0);
        double ta = 0.0, ra = 0.0;
        ASSERT_EQ(o_.earth2sat(G, &ta, &ra, fdc), 0) << t << " " << tau << " " << fdc;
        EXPECT_NEAR(ta, t, 1e-6);
        EXPECT_NEAR(ra, tau, 1e-10);
        // The first search of the precise form runs on the whole orbit and
        // may step beyond its ends for points seen at the very first or last
        // vector.
        if (t - t0_ > 1.0 && last() - t > 1.0) {
          ASSERT_EQ(o_.earth2satPrecise(G, &ta, &ra, fdc), 0);
          EXPECT_NEAR(ta, t, 1e-6);
          EXPECT_NEAR(ra, tau, 1e-10);
        }
        // The straight-line estimate is good enough to choose the window.
        ASSERT_EQ(o_.earth2satLinear(G, &ta, &ra, fdc), 0);
        EXPECT_NEAR(ta, t, 0.5 * kDt);
        EXPECT_NEAR(ra, tau, 1e-5);
        if (fdc == 0.0) {
          EXPECT_NEAR(o_.earth2satAzimuth(G[0], G[1], G[2]), t, 1e-6);
          EXPECT_NEAR(o_.earth2satRange(G), tau, 1e-10);
        }
      }
    }
  }
}

TEST_F(OrbitModel, PolynomialsFollowTheDirectGeometry) {
  polyFR fr, fr2;
  ASSERT_EQ(o_.SVGetFRpoly(&roi_, &dc_, &fr), 0);
  ASSERT_EQ(o_.SVGetFRpoly_v2(&roi_, &dc_, &fr2), 0);
  EXPECT_EQ(fr.trg0_s, 6.2e-3);
  EXPECT_EQ(fr.taz0_s, az());
  polySL2GR sl2gr;
  polyGR2SL gr2sl;
  ASSERT_EQ(o_.SVGetGroundToSlantPolys(&roi_, &dc_, &sl2gr, &gr2sl), 0);
  polySL2THETA theta;
  polySL2PHI phi;
  ASSERT_EQ(o_.SVGetSlantToAnglesPolys(&roi_, &dc_, &theta, &phi), 0);

  // Ground range from the near edge, by fine steps of the direct geometry.
  double previous[3];
  ASSERT_EQ(o_.sat2earth(az(), 6.2e-3, fdc(6.2e-3), previous), 0);
  double ground = 0.0;
  for (int i = 1; i <= 60; ++i) {
    const double rt = 6.2e-3 + i * 5e-6;
    double G[3];
    ASSERT_EQ(o_.sat2earth(az(), rt, fdc(rt), G), 0);
    const double d[3] = {G[0] - previous[0], G[1] - previous[1], G[2] - previous[2]};
    ground += std::sqrt(Dot(d, d));
    for (int a = 0; a < 3; ++a) previous[a] = G[a];
    if (i % 7 != 3) continue;
    double value = 0.0;
    sl2gr.EvaluatePoly(rt, az(), &value);
    // A parabola over 70 km of ground: within 3e-4 of the ground range.
    EXPECT_NEAR(value, ground, 25.0) << rt;
    gr2sl.EvaluatePoly(ground, az(), &value);
    EXPECT_NEAR(value, rt, 3e-8) << rt;  // 4.5 m of slant range
    const double rate = o_.SVGetFR(az(), rt, fdc(rt));
    fr.EvaluatePoly(rt, az(), &value);
    EXPECT_NEAR(value, rate, 1e-4 * std::fabs(rate)) << rt;
    fr2.EvaluatePoly(rt, az(), &value);
    EXPECT_NEAR(value, rate, 1e-4 * std::fabs(rate)) << rt;
    double inc = 0.0, look = 0.0;
    ASSERT_EQ(o_.SVGetAngles(az(), rt, fdc(rt), &inc, &look), 0);
    theta.EvaluatePoly(rt, az(), &value);
    EXPECT_NEAR(value, inc, 5e-4) << rt;
    phi.EvaluatePoly(rt, az(), &value);
    EXPECT_NEAR(value, look, 5e-4) << rt;
  }
}

// Points and times outside the orbit, ranges short of the Earth and empty
// regions.
TEST_F(OrbitModel, BadQueriesGiveTheirCodes) {
  double P[3], V[3], G[3], t = 0.0, tau = 0.0, lat = 0.0, lon = 0.0;
  // The end windows extrapolate half a spacing, no further.
  EXPECT_EQ(o_.SVGetPos(last() + 0.5 * kDt, P), 0);
  EXPECT_EQ(o_.SVGetPos(last() + 0.6 * kDt, P), -1);
  EXPECT_EQ(o_.SVGetPos(t0_ - 0.5 * kDt, P), 0);
  EXPECT_EQ(o_.SVGetPos(t0_ - 0.6 * kDt, P), -1);
  EXPECT_TRUE(std::isnan(o_.SVGetVel(t0_ - 3600.0)[0]));
  orbit_.at(last() + 120.0, P, V);  // seen two minutes after the last vector
  ASSERT_EQ(gr_pt(P, V, 5.6e-3, 0.0, 0.05, 0.0, 1, kWgs84A, kWgs84B, G), 0);
  EXPECT_EQ(o_.earth2sat(G, &t, &tau), 12);
  EXPECT_EQ(t, -1.0);
  EXPECT_EQ(tau, -1.0);
  EXPECT_EQ(o_.earth2satPrecise(G, &t, &tau), 12);
  EXPECT_EQ(o_.earth2satAzimuth(G), -1.0);
  const double bad[3] = {NAN, 0.0, 0.0};
  EXPECT_EQ(o_.earth2sat(bad, &t, &tau), 12);
  EXPECT_EQ(o_.SVGetLatLon(last() + 0.6 * kDt, 5.6e-3, &lat, &lon), -1);
  EXPECT_EQ(o_.SVGetLatLon(t0_ - 0.5 * kDt, 5.6e-3, &lat, &lon), 0);
  EXPECT_EQ(o_.sat2earth(t0_ - 100.0, 5.6e-3, G), -1);
  EXPECT_TRUE(std::isnan(o_.sat2earthX(t0_ - 100.0, 5.6e-3)));
  EXPECT_EQ(o_.sat2earth(t0_ + 50.0, 1e-3, G), 2);

  polyFR fr;
  ROI_Obj flat = roi_, late = roi_;
  flat.SetFastAxe(6.2e-3, 0.0, 100);
  EXPECT_EQ(o_.SVGetFRpoly(&flat, &dc_, &fr), 1);
  flat.FastTimeLength = NAN;
  EXPECT_EQ(o_.SVGetFRpoly_v2(&flat, &dc_, &fr), 1);
  late.SlowStartTime = last() + 100.0;
  EXPECT_EQ(o_.SVGetFRpoly(&late, &dc_, &fr), -1);
  geoCoords_Obj gc;
  GSRoi_Obj region;
  region.roi = roi_;
  region.roi.SlowTimeLength = -1.0;
  EXPECT_EQ(o_.SVGetGeoCoords(&gc, &region), 1);
  region.roi = roi_;
  region.roi.SlowStartTime = 0.0;  // relative times are not on the orbit
  EXPECT_EQ(o_.SVGetGeoCoords(&gc, &region), -1);
}

TEST(GeneralSAROrbit, TooFewVectorsOrNoneGiveTheirCodes) {
  GeneralSAROrbit o;
  double p[3], t = 0.0, tau = 0.0, lat = 0.0, lon = 0.0;
  EXPECT_EQ(o.SVCreate(7.3e8, kDt, 4), 1);
  EXPECT_EQ(o.SVCreate(7.3e8, 0.0, 5), 1);
  EXPECT_TRUE(o.positions() == nullptr);
  EXPECT_EQ(o.computeApproximateSV(), 1);
  EXPECT_EQ(o.SVGetSatSpeed(7.3e8, 5e-3), -1.0);
  EXPECT_TRUE(std::isnan(o.SVGetLat(7.3e8, 5e-3)));
  EXPECT_EQ(o.SVGetLatLon(7.3e8, 5e-3, &lat, &lon), 1);
  EXPECT_EQ(o.sat2earth(7.3e8, 5e-3, p), 1);
  const double G[3] = {6.4e6, 0.0, 0.0};
  EXPECT_EQ(o.earth2sat(G, &t, &tau), 1);
  // Vectors that are not finite are refused by the fit.
  Sample(CircularOrbit(), 7.3e8, kDt, 5, &o);
  o.positions()[7] = NAN;
  EXPECT_EQ(o.computeApproximateSV(), 1);
  EXPECT_EQ(o.SVGetPos(7.3e8, p), 1);
}

class OrbitHeaders : public ScratchTest {};

// The header and the clone give the same positions; a clone keeps the
// wavelength and the look side; a header of four vectors is refused.
TEST_F(OrbitHeaders, ReadWriteAndCloneKeepTheOrbit) {
  GeneralSAROrbit o(0.031);
  o.setLookSign(-1);
  Sample(CircularOrbit(), 7.3e8 + 100.25, kDt, 9, &o);
  ASSERT_EQ(o.computeApproximateSV(), 0);
  ASSERT_EQ(o.writehdr(path("orbit.xml").c_str()), 0);
  const double t = 7.3e8 + 117.55;
  double p[3], q[3], r[3];
  ASSERT_EQ(o.SVGetPos(t, p), 0);
  GeneralSAROrbit back, copy;
  ASSERT_EQ(back.readhdr(path("orbit.xml").c_str()), 0);  // fitted on reading
  ASSERT_EQ(back.SVGetPos(t, q), 0);
  ASSERT_EQ(o.clone(&copy), 0);
  o.SVDestroy();
  EXPECT_EQ(copy.lambda(), 0.031);
  EXPECT_EQ(copy.lookSign(), -1);
  ASSERT_EQ(copy.SVGetPos(t, r), 0);
  EXPECT_EQ(std::vector<double>(p, p + 3), std::vector<double>(q, q + 3));
  EXPECT_EQ(std::vector<double>(p, p + 3), std::vector<double>(r, r + 3));
  spit(path("four.hdr"),
       "[StateVectorData]\nTimeFirst = 1\nTimeDelta = 10\nnStateVectors = 4\n"
       "pos = {1 2 3 4 5 6 7 8 9 10 11 12}\nvel = {1 2 3 4 5 6 7 8 9 10 11 12}\n");
  EXPECT_EQ(back.readhdr(path("four.hdr").c_str()), 1);
  EXPECT_TRUE(back.positions() == nullptr);
}

TEST(GeneralSAROrbit, VectorsOfASceneFromTheOrbitFile) {
  const double start = truth::Sec85(2008, 3, 2, 10);
  GeneralSAROrbit o;
  ASSERT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start, 100.0), 0);
  double p[3];
  // Outside the file's validity (the old vectors are gone), a missing file,
  // a duration that is not a number.
  EXPECT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start + 864000.0, 100.0), 13);
  EXPECT_EQ(o.SVGetPos(start, p), 1);
  EXPECT_EQ(o.GetStateVectorsENVI("/nonexistent/orbit", start, 100.0), 9);
  EXPECT_EQ(o.GetStateVectorsENVI(kVor.c_str(), start, NAN), 1);
}

}  // namespace
