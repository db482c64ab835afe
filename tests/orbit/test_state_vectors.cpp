#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "orbit/earth_constants.h"
#include "orbit/state_vectors.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

// One polynomial through all vectors: within a millimetre up to 11 vectors
// 5 s apart (beyond that rounding grows: 2 mm with 13, 0.15 m with 31).
TEST(StateVectors, ClosedFormOrbitWithinAMillimetre) {
  CircularOrbit orbit;
  const struct {
    int n;
    double dt;
  } grids[] = {{5, 5.0}, {11, 5.0}, {5, 10.0}};
  for (const auto& g : grids) {
    for (double start : {orbit.tNode - 300.0, orbit.tNode + 1500.0}) {
      SAROrbitStateVectors_Obj sv;
      Sample(orbit, start, g.dt, g.n, &sv);
      double p[3];
      EXPECT_EQ(sv.SVGetPos(start, p), 1);  // not fitted yet
      ASSERT_EQ(sv.SVPolyCompute(), 0);
      std::vector<double> times;
      const double span = (g.n - 1) * g.dt;
      for (double s = 0.0; s <= span; s += span / 97.0) times.push_back(start + s);
      double worstP = 0.0, worstV = 0.0;
      WorstErrors(orbit, &sv, times, &worstP, &worstV);
      EXPECT_LT(worstP, 1e-3) << g.n << " vectors " << g.dt << " s apart";
      EXPECT_LT(worstV, 1e-3) << g.n << " vectors " << g.dt << " s apart";
    }
  }
}

// The ground point lies at the slant range, at zero Doppler, on the side of
// the look sign; the reach is half a spacing beyond the first five vectors.
TEST(StateVectors, GroundPointOfTheFirstFiveVectors) {
  CircularOrbit orbit;
  const double t0 = orbit.tNode + 800.0, dt = 5.0;
  SAROrbitStateVectors_Obj sv;
  Sample(orbit, t0, dt, 9, &sv);
  const double tau = 850000.0 / kHalfSpeedOfLight;
  const double lambda = 0.05623564240544047;
  double lat = 0, lon = 0;
  for (int sign : {1, -1}) {
    sv.setLookSign(sign);
    for (double t : {t0 - 0.5 * dt, t0 + 7.3, t0 + 4.5 * dt}) {
      ASSERT_EQ(sv.SVGetLatLon(t, tau, lambda, &lat, &lon), 0);
      const truth::Vec3 g = truth::EarthFixed(lat, lon);
      double p[3], v[3];
      orbit.at(t, p, v);
      const double d[3] = {p[0] - g[0], p[1] - g[1], p[2] - g[2]};
      const double r = std::sqrt(d[0] * d[0] + d[1] * d[1] + d[2] * d[2]);
      EXPECT_NEAR(r, 850000.0, 1e-3);
      EXPECT_LT(std::fabs((v[0] * d[0] + v[1] * d[1] + v[2] * d[2]) / r), 1e-5);  // m/s
      // Left of the track is along P x V.
      const double left[3] = {p[1] * v[2] - p[2] * v[1], p[2] * v[0] - p[0] * v[2],
                              p[0] * v[1] - p[1] * v[0]};
      EXPECT_LT(-(d[0] * left[0] + d[1] * left[1] + d[2] * left[2]) * sign, 0.0) << sign;
      double inc = 0, look = 0;
      ASSERT_EQ(sv.SVGetAngles(t, tau, lambda, &inc, &look), 0);
      EXPECT_GT(inc, look);
    }
  }
  EXPECT_EQ(sv.SVGetLatLon(t0 - 0.51 * dt, tau, lambda, &lat, &lon), -1);
  EXPECT_EQ(sv.SVGetLatLon(t0 + 4.51 * dt, tau, lambda, &lat, &lon), -1);
  SAROrbitStateVectors_Obj few;
  Sample(orbit, t0, dt, 4, &few);
  EXPECT_EQ(few.SVGetLatLon(t0, tau, lambda, &lat, &lon), 1);
}

class StateVectorHeaders : public ScratchTest {};

TEST_F(StateVectorHeaders, XmlRoundTripAndClone) {
  SAROrbitStateVectors_Obj sv;
  Sample(CircularOrbit(), 7.3e8 + 0.123456, 5.0, 7, &sv);
  const std::string file = path("sv.xml");
  ASSERT_EQ(sv.writehdr(file.c_str()), 0);
  const std::string text = Slurp(file);
  for (const char* name : {"StateVectorData", "pSV_m", "vSV_mOs", "t0SV_s", "dtSV_s", "nSV_n"})
    EXPECT_NE(text.find(name), std::string::npos) << name;

  SAROrbitStateVectors_Obj back;
  ASSERT_EQ(back.readhdr(file.c_str()), 0);
  ASSERT_EQ(back.n(), 7);
  EXPECT_EQ(back.t0(), sv.t0());
  EXPECT_EQ(back.dt(), 5.0);
  for (int i = 0; i < 21; ++i) {
    EXPECT_EQ(back.positions()[i], sv.positions()[i]);
    EXPECT_EQ(back.velocities()[i], sv.velocities()[i]);
  }
  EXPECT_FALSE(back.isFitted());  // reading does not fit

  // A clone is fitted and independent of its source.
  back.setLookSign(-1);
  SAROrbitStateVectors_Obj copy;
  ASSERT_EQ(back.clone(&copy), 0);
  EXPECT_TRUE(copy.isFitted());
  EXPECT_EQ(copy.lookSign(), -1);
  back.SVDestroy();
  double p[3];
  ASSERT_EQ(copy.SVGetPos(sv.t0() + 30.0, p), 0);
  EXPECT_NEAR(p[0], sv.positions()[18], 1e-3);
}

// A header may hold far more vectors than one polynomial can follow (a long
// scene's orbit, or any count up to the largest a header may declare).  They
// are read and copied exactly; the polynomial is refused with a code rather
// than fitted at a degree where it is kilometres off, takes minutes or
// exhausts memory.
TEST_F(StateVectorHeaders, LongOrbitsAreKeptButNotFittedByOnePolynomial) {
  const CircularOrbit orbit;
  const double t0 = orbit.tNode + 200.0, dt = 5.0;
  for (int n : {kMaxFitStateVectors + 1, kMaxStateVectors}) {
    SAROrbitStateVectors_Obj written;
    Sample(orbit, t0, dt, n, &written);
    // The longest is built in memory only: its header would be large.
    SAROrbitStateVectors_Obj read;
    SAROrbitStateVectors_Obj* sv = &written;
    if (n < kMaxStateVectors) {
      const std::string file = path("long" + std::to_string(n) + ".xml");
      ASSERT_EQ(written.writehdr(file.c_str()), 0);
      ASSERT_EQ(read.readhdr(file.c_str()), 0) << n;
      sv = &read;
    }
    ASSERT_EQ(sv->n(), n);
    const size_t bytes = 3 * static_cast<size_t>(n) * sizeof(double);
    EXPECT_EQ(std::memcmp(sv->positions(), written.positions(), bytes), 0) << n;
    EXPECT_EQ(std::memcmp(sv->velocities(), written.velocities(), bytes), 0) << n;
    EXPECT_EQ(sv->SVPolyCompute(), 1) << n;
    double p[3];
    EXPECT_EQ(sv->SVGetPos(t0, p), 1) << n;
    SAROrbitStateVectors_Obj copy;
    ASSERT_EQ(sv->clone(&copy), 0) << n;
    ASSERT_EQ(copy.n(), n);
    EXPECT_FALSE(copy.isFitted()) << n;
    EXPECT_EQ(std::memcmp(copy.velocities(), written.velocities(), bytes), 0) << n;
  }
}

// Legacy keys read as they stand; incomplete sections and counts that no
// allocation should follow are refused.
TEST_F(StateVectorHeaders, LegacyAndInvalidHeaders) {
  const std::string head = "[StateVectorData]\nTimeFirst = 730000000.5\nTimeDelta = 10\n";
  const struct {
    std::string text;
    int code;
  } cases[] = {
      {head + "nStateVectors = 2\npos = {1 2 3 4 5 6}\nvel = {-1 -2 -3 -4 -5 -6}\n", 0},
      {"[StateVectorData]\nTimeFirst = 1\nnStateVectors = 1\npos = {1 2 3}\nvel = {1 2 3}\n", 4},
      {head + "nStateVectors = 2\npos = {1 2 3}\nvel = {1 2 3 4 5 6}\n", 4},
      {head + "nStateVectors = 1\npos = {1 2 3}\n", 4},
      {head + "nStateVectors = 2000000000\n", 1},
      {head + "nStateVectors = -3\n", 1},
      {"no section at all\n", 4},
  };
  int i = 0;
  for (const auto& c : cases) {
    // A file of its own each: headers are cached by name.
    const std::string file = path("sv" + std::to_string(i++) + ".hdr");
    spit(file, c.text);
    SAROrbitStateVectors_Obj sv;
    EXPECT_EQ(sv.readhdr(file.c_str()), c.code) << c.text;
    if (c.code != 0) {
      EXPECT_TRUE(sv.positions() == nullptr) << c.text;
      continue;
    }
    EXPECT_EQ(sv.t0(), 730000000.5);
    EXPECT_EQ(sv.dt(), 10.0);
    ASSERT_EQ(sv.n(), 2);
    EXPECT_EQ(sv.positions()[5], 6.0);
    EXPECT_EQ(sv.velocities()[4], -5.0);
  }
  // An XML section with a huge count.
  SAROrbitStateVectors_Obj sv;
  Sample(CircularOrbit(), 0.0, 1.0, 1, &sv);
  const std::string xml = path("huge.xml");
  ASSERT_EQ(sv.writehdr(xml.c_str()), 0);
  std::string text = Slurp(xml);
  const size_t at = text.find("<nSV_n>1<");
  ASSERT_NE(at, std::string::npos);
  text.replace(at, 9, "<nSV_n>999999999<");
  spit(xml, text);
  SAROrbitStateVectors_Obj back;
  EXPECT_NE(back.readhdr(xml.c_str()), 0);
  EXPECT_TRUE(back.positions() == nullptr);
  EXPECT_EQ(back.SVCreate(0.0, 1.0, -1), 1);
}

}  // namespace
