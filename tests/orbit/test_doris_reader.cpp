#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <utility>
#include <vector>

#include "orbit/general_sar_orbit.h"
#include "orbit/get_state_vectors_envi.h"
#include "orbit/interp_orb_l.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

// Value and derivative at t of the Hermite polynomial through values f and
// derivatives d at the nodes x (divided differences on doubled nodes).
void Hermite(const std::vector<double>& x, const std::vector<double>& f,
             const std::vector<double>& d, double t, double* value, double* deriv) {
  const size_t m = 2 * x.size();
  std::vector<double> z(m);
  std::vector<std::vector<double>> q(m, std::vector<double>(m, 0.0));
  for (size_t i = 0; i < m; ++i) {
    z[i] = x[i / 2];
    q[i][0] = f[i / 2];
  }
  for (size_t i = 1; i < m; ++i)
    q[i][1] = i % 2 == 1 ? d[i / 2] : (q[i][0] - q[i - 1][0]) / (z[i] - z[i - 1]);
  for (size_t j = 2; j < m; ++j)
    for (size_t i = j; i < m; ++i) q[i][j] = (q[i][j - 1] - q[i - 1][j - 1]) / (z[i] - z[i - j]);
  double p = q[m - 1][m - 1], dp = 0.0;
  for (size_t j = m - 1; j-- > 0;) {
    dp = dp * (t - z[j]) + p;
    p = p * (t - z[j]) + q[j][j];
  }
  *value = p;
  *deriv = dp;
}

class RealOrbit : public ::testing::Test {
 protected:
  // The records of the real file, read once.
  static const std::vector<Record>& records() {
    static const std::vector<Record> all = [] {
      std::vector<Record> r;
      for (const std::string& text : SplitDoris(kVor).records) r.push_back(ParseRecord(text));
      return r;
    }();
    return all;
  }

  // Independent reference: Hermite on positions and velocities of the two
  // records on each side of t.
  static void Reference(double t, double p[3], double v[3]) {
    const std::vector<Record>& r = records();
    size_t j = 0;
    while (j + 1 < r.size() && r[j + 1].t <= t) ++j;
    size_t first = j >= 1 ? j - 1 : 0;
    if (first + 4 > r.size()) first = r.size() - 4;
    const double base = r[first].t;
    std::vector<double> x, f(4), d(4);
    for (size_t i = 0; i < 4; ++i) x.push_back(r[first + i].t - base);
    for (int a = 0; a < 3; ++a) {
      for (size_t i = 0; i < 4; ++i) {
        f[i] = r[first + i].p[a];
        d[i] = r[first + i].v[a];
      }
      Hermite(x, f, d, t - base, &p[a], &v[a]);
    }
  }
};

TEST_F(RealOrbit, RecordTimesGiveTheRecordsUnchanged) {
  for (size_t i : {size_t(0), size_t(3), size_t(700), records().size() - 3, records().size() - 1}) {
    const Record& r = records()[i];
    double p[3], v[3];
    int orbit = 0;
    ASSERT_EQ(interp_orb_l(kVor.c_str(), r.t, 1, 60.0, p, v, &orbit, 0, nullptr), 0) << i;
    for (int a = 0; a < 3; ++a) {
      EXPECT_EQ(p[a], r.p[a]) << i;
      EXPECT_EQ(v[a], r.v[a]) << i;
    }
    EXPECT_EQ(orbit, r.orbit);
  }
  // The preliminary orbit file of the samples.
  const Record por = ParseRecord(SplitDoris(kPor).records[5]);
  double p[3];
  ASSERT_EQ(interp_orb_l(kPor.c_str(), por.t, 1, 0.0, p, nullptr, nullptr, 0, nullptr), 0);
  EXPECT_EQ(p[2], por.p[2]);
}

TEST_F(RealOrbit, BetweenRecordsAgreesWithHermiteInterpolation) {
  const double start = records().front().t, stop = records().back().t;
  double worstP = 0.0, worstV = 0.0;
  // Near both ends the window is not centred on the request.
  std::vector<double> times;
  for (double s = 0.5; s < 600.0; s += 37.3) times.push_back(start + s);
  for (double s = 0.5; s < 600.0; s += 37.3) times.push_back(stop - s);
  for (double s = 0.0; s < 86400.0; s += 997.7) times.push_back(start + 3000.0 + s);
  for (double t : times) {
    double p[3], v[3], rp[3], rv[3];
    ASSERT_EQ(interp_orb_l(kVor.c_str(), t, 1, 0.0, p, v, nullptr, 0, nullptr), 0);
    Reference(t, rp, rv);
    for (int a = 0; a < 3; ++a) {
      worstP = std::fmax(worstP, std::fabs(p[a] - rp[a]));
      worstV = std::fmax(worstV, std::fabs(v[a] - rv[a]));
    }
  }
  EXPECT_LT(worstP, 0.01);
  // The reference velocity is the derivative of positions given to the
  // millimetre, good to a few 1e-4 m/s.
  EXPECT_LT(worstV, 1e-3);
}

TEST_F(RealOrbit, OrbitNumberOfTheNearerRecord) {
  size_t j = 1;
  while (records()[j].orbit == records()[j - 1].orbit) ++j;
  const Record& before = records()[j - 1];
  const Record& after = records()[j];
  ASSERT_EQ(after.orbit, before.orbit + 1);
  // Half way (30 s) counts as the later record.
  for (double s : {29.9, 30.0, 30.1}) {
    double p[3];
    int orbit = 0;
    ASSERT_EQ(interp_orb_l(kVor.c_str(), before.t + s, 1, 0.0, p, nullptr, &orbit, 0, nullptr), 0);
    EXPECT_EQ(orbit, s < 30.0 ? before.orbit : after.orbit) << s;
  }
}

TEST_F(RealOrbit, AscendingNodeLiesWhereZChangesSign) {
  const double tc = records()[1000].t + 10.0;
  size_t crossing = 0;
  for (size_t j = 1; j <= 1001; ++j)
    if (records()[j - 1].p[2] <= 0.0 && records()[j].p[2] > 0.0) crossing = j;
  ASSERT_GT(crossing, 0u);
  double p[3], anx = -1.0;
  ASSERT_EQ(interp_orb_l(kVor.c_str(), tc, 1, 0.0, p, nullptr, nullptr, 1, &anx), 0);
  EXPECT_GT(anx, records()[crossing - 1].t);
  EXPECT_LE(anx, records()[crossing].t);
  double rp[3], rv[3];
  Reference(anx, rp, rv);
  EXPECT_LT(std::fabs(rp[2]), 0.5);
  // Before the first crossing of the file there is no node: code 1, but the
  // vectors are there.
  const Record& early = records()[3];
  anx = -1.0;
  EXPECT_EQ(interp_orb_l(kVor.c_str(), early.t, 1, 0.0, p, nullptr, nullptr, 1, &anx), 1);
  EXPECT_EQ(anx, 0.0);
  EXPECT_EQ(p[0], early.p[0]);
}

TEST_F(RealOrbit, TimesOutsideTheValidityGive13) {
  const double start = ascii2sec85("01-MAR-2008 21:55:27.000000");
  const double stop = ascii2sec85("03-MAR-2008 00:23:27.000000");
  double p[3];
  EXPECT_EQ(interp_orb_l(kVor.c_str(), start, 1, 0.0, p, nullptr, nullptr, 0, nullptr), 0);
  EXPECT_EQ(interp_orb_l(kVor.c_str(), stop, 1, 0.0, p, nullptr, nullptr, 0, nullptr), 0);
  EXPECT_EQ(p[0], records().back().p[0]);
  EXPECT_EQ(interp_orb_l(kVor.c_str(), start - 0.001, 1, 0.0, p, nullptr, nullptr, 0, nullptr), 13);
  EXPECT_EQ(interp_orb_l(kVor.c_str(), stop + 0.001, 1, 0.0, p, nullptr, nullptr, 0, nullptr), 13);
  EXPECT_EQ(interp_orb_l(kVor.c_str(), std::numeric_limits<double>::quiet_NaN(), 1, 0.0, p, nullptr,
                         nullptr, 0, nullptr),
            13);
}

TEST_F(RealOrbit, StateVectorObjectFromTheOrbitFile) {
  // Early in the file, before its first ascending node: the vectors do not
  // depend on the node.
  const double t0 = records().front().t + 60.0;
  SAROrbitStateVectors_Obj sv;
  ASSERT_EQ(GetStateVectorsENVI(kVor.c_str(), t0, 5.0, 9, &sv), 0);
  ASSERT_EQ(sv.n(), 9);
  EXPECT_EQ(sv.t0(), t0);
  EXPECT_TRUE(sv.isFitted());
  for (int i = 0; i < 9; ++i) {
    double rp[3], rv[3];
    Reference(t0 + 5.0 * i, rp, rv);
    for (int a = 0; a < 3; ++a) EXPECT_NEAR(sv.positions()[3 * i + a], rp[a], 0.01);
  }
  EXPECT_EQ(GetStateVectorsENVI(kVor.c_str(), records().front().t - 100.0, 5.0, 9, &sv), 13);
}

// The vectors of a scene's grid, 5 s apart, each come from the records
// around their own time: a vector at a record's time is that record, the
// others agree with the independent interpolation, over scenes of a minute
// to half an hour and where the grid reaches the first or last record.
TEST_F(RealOrbit, SceneGridsFollowTheRecordsOverTheirWholeLength) {
  const double first = records().front().t, last = records().back().t;
  const double middle = records()[700].t;
  const struct {
    const char* what;
    double duration;
    double t0;     // first vector of the grid, or
    double tLast;  // last vector of the grid when t0 is 0
  } scenes[] = {
      {"one minute", 60.0, middle, 0.0},
      {"ten minutes", 600.0, middle, 0.0},
      {"half an hour", 1800.0, middle, 0.0},
      {"half an hour from the first record", 1800.0, first, 0.0},
      {"half an hour up to the last record", 1800.0, 0.0, last},
  };
  for (const auto& s : scenes) {
    double unused = 0.0, dt = 0.0;
    int n = 0;
    ASSERT_EQ(StateVectorGridENVI(0.0, s.duration, &unused, &dt, &n), 0);
    // The grid starts 0.2 duration before the scene.
    const double t0 = s.t0 != 0.0 ? s.t0 : s.tLast - (n - 1) * dt;
    GeneralSAROrbit o;
    ASSERT_EQ(o.GetStateVectorsENVI(kVor.c_str(), t0 + 0.2 * s.duration, s.duration), 0) << s.what;
    ASSERT_EQ(o.n(), n) << s.what;
    ASSERT_EQ(o.t0(), t0) << s.what;
    double worstP = 0.0, worstV = 0.0;
    int onRecords = 0;
    for (int i = 0; i < n; ++i) {
      const double t = t0 + i * dt;
      const double* p = o.positions() + 3 * i;
      const double* v = o.velocities() + 3 * i;
      const Record* on = nullptr;
      for (const Record& r : records())
        if (r.t == t) on = &r;
      if (on != nullptr) {
        ++onRecords;
        for (int a = 0; a < 3; ++a) {
          EXPECT_EQ(p[a], on->p[a]) << s.what << ", vector " << i;
          EXPECT_EQ(v[a], on->v[a]) << s.what << ", vector " << i;
        }
        continue;
      }
      double rp[3], rv[3];
      Reference(t, rp, rv);
      for (int a = 0; a < 3; ++a) {
        worstP = std::fmax(worstP, std::fabs(p[a] - rp[a]));
        worstV = std::fmax(worstV, std::fabs(v[a] - rv[a]));
      }
    }
    EXPECT_GE(onRecords, (n - 1) / 12) << s.what;
    EXPECT_LT(worstP, 0.01) << s.what;
    EXPECT_LT(worstV, 1e-3) << s.what;
  }
}

// DORIS files written from the closed-form orbit with records at chosen
// times.
class ClosedFormDoris : public ScratchTest {
 protected:
  void SetUp() override {
    ScratchTest::SetUp();
    real_ = SplitDoris(kVor);
    const size_t at = real_.header.find("SENSING_START=\"");
    ASSERT_NE(at, std::string::npos);
    start_ = ascii2sec85(real_.header.substr(at + 15, 27).c_str());
    orbit_.tNode = start_ - 1000.0;
  }

  // Record i of 40, 60 s apart from the sensing start, `late` seconds off
  // its nominal time; its state vector is the orbit's at the time it
  // states (positions to the millimetre, velocities to the micrometre per
  // second, as the real records).
  std::string WriteRecords(const std::string& name, const std::vector<double>& late) {
    std::vector<std::string> records;
    for (int i = 0; i < 40; ++i) {
      const double t = start_ + 60.0 * i + late[i];
      std::string r = real_.records[0];
      char text[32];
      EXPECT_EQ(sec852myascii(t, text), 0);
      r.replace(0, 27, text);
      double p[3], v[3];
      orbit_.at(t, p, v);
      for (int a = 0; a < 3; ++a) {
        std::snprintf(text, sizeof text, "%+012.3f", p[a]);
        r.replace(44 + 13 * a, 12, text);
        std::snprintf(text, sizeof text, "%+012.6f", v[a]);
        r.replace(83 + 13 * a, 12, text);
      }
      EXPECT_EQ(ParseRecord(r).t, t);
      records.push_back(r);
    }
    return WriteDoris(name, real_.header, records);
  }

  DorisText real_;
  double start_ = 0.0;
  CircularOrbit orbit_;
};

// The nine-point formula weights each record for the time it states: a
// record early or late (within the 5 % the reader accepts) moves nothing
// off the orbit.
TEST_F(ClosedFormDoris, RecordsOffTheirNominalTimesAreWeightedWhereTheyLie) {
  const struct {
    const char* what;
    std::vector<std::pair<int, double>> late;  // record, seconds late
  } files[] = {
      {"equally spaced", {}},
      {"one record a second late", {{20, 1.0}}},
      {"one record half a millisecond early", {{20, -0.0005}}},
      {"two records two seconds off", {{18, 2.0}, {21, -2.0}}},
  };
  for (const auto& f : files) {
    std::vector<double> late(40, 0.0);
    for (const auto& l : f.late) late[l.first] = l.second;
    const std::string file = WriteRecords("closed_form", late);
    double worstP = 0.0, worstV = 0.0;
    std::vector<double> times = {start_ + 60.0 * 20 + late[20]};
    for (double t = start_ + 60.0 * 14; t <= start_ + 60.0 * 26; t += 6.1) times.push_back(t);
    for (double t : times) {
      double p[3], v[3], rp[3], rv[3];
      ASSERT_EQ(interp_orb_l(file.c_str(), t, 1, 0.0, p, v, nullptr, 0, nullptr), 0) << f.what;
      orbit_.at(t, rp, rv);
      for (int a = 0; a < 3; ++a) {
        worstP = std::fmax(worstP, std::fabs(p[a] - rp[a]));
        worstV = std::fmax(worstV, std::fabs(v[a] - rv[a]));
      }
    }
    // The records' rounding (0.5 mm, 0.5 um/s) bounds the agreement.
    EXPECT_LT(worstP, 3e-3) << f.what;
    EXPECT_LT(worstV, 3e-6) << f.what;
  }
}

// Scenes shorter than three spacings get the five vectors centred on them.
TEST(StateVectorGrid, ShortAndLongScenes) {
  double t0 = 0, dt = 0;
  int n = 0;
  ASSERT_EQ(StateVectorGridENVI(1000.0, 14.9, &t0, &dt, &n), 0);
  EXPECT_EQ(n, 5);
  EXPECT_EQ(dt, 5.0);
  EXPECT_DOUBLE_EQ(t0, 1000.0 + 7.45 - 10.0);
  ASSERT_EQ(StateVectorGridENVI(1000.0, 15.0, &t0, &dt, &n), 0);
  EXPECT_EQ(n, 7);
  EXPECT_DOUBLE_EQ(t0, 997.0);
  EXPECT_EQ(StateVectorGridENVI(1000.0, std::numeric_limits<double>::quiet_NaN(), &t0, &dt, &n), 1);
  EXPECT_EQ(StateVectorGridENVI(1000.0, 1e12, &t0, &dt, &n), 1);
}

}  // namespace
