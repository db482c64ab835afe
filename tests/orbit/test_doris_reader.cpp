// The DORIS reader on the real orbit files and on DORIS files written from a
// closed-form orbit.
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

// The records of the real file, read once.
const std::vector<Record>& RealRecords() {
  static const std::vector<Record> all = [] {
    std::vector<Record> r;
    for (const std::string& text : SplitDoris(kVor).records) r.push_back(ParseRecord(text));
    return r;
  }();
  return all;
}

TEST(RealOrbit, RecordTimesGiveTheRecordsUnchanged) {
  const std::vector<Record>& records = RealRecords();
  for (size_t i : {size_t(0), size_t(3), size_t(700), records.size() - 3, records.size() - 1}) {
    const Record& r = records[i];
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

TEST(RealOrbit, OrbitNumberOfTheNearerRecord) {
  const std::vector<Record>& records = RealRecords();
  size_t j = 1;
  while (records[j].orbit == records[j - 1].orbit) ++j;
  const Record& before = records[j - 1];
  ASSERT_EQ(records[j].orbit, before.orbit + 1);
  // Half way (30 s) counts as the later record.
  for (double s : {29.9, 30.0, 30.1}) {
    double p[3];
    int orbit = 0;
    ASSERT_EQ(interp_orb_l(kVor.c_str(), before.t + s, 1, 0.0, p, nullptr, &orbit, 0, nullptr), 0);
    EXPECT_EQ(orbit, s < 30.0 ? before.orbit : before.orbit + 1) << s;
  }
}

TEST(RealOrbit, TimesOutsideTheValidityGive13) {
  const double start = truth::Sec85(2008, 3, 1, 21, 55, 27),
               stop = truth::Sec85(2008, 3, 3, 0, 23, 27);
  double p[3];
  const auto read = [&p](double t) {
    return interp_orb_l(kVor.c_str(), t, 1, 0.0, p, nullptr, nullptr, 0, nullptr);
  };
  EXPECT_EQ(read(start), 0);
  EXPECT_EQ(read(stop), 0);
  EXPECT_EQ(p[0], RealRecords().back().p[0]);
  EXPECT_EQ(read(start - 0.001), 13);
  EXPECT_EQ(read(stop + 0.001), 13);
  EXPECT_EQ(read(std::numeric_limits<double>::quiet_NaN()), 13);
}

// DORIS files written from the closed-form orbit: 120 records 60 s apart
// from the sensing start of the real header, the ascending node after the
// 25th.
class ClosedFormDoris : public ScratchTest {
 protected:
  static constexpr int kRecords = 120;
  void SetUp() override {
    ScratchTest::SetUp();
    real_ = SplitDoris(kVor);
    const size_t at = real_.header.find("SENSING_START=\"");
    ASSERT_NE(at, std::string::npos);
    start_ = truth::Sec85(real_.header.substr(at + 15, 27));
    orbit_.tNode = start_ + 1510.0;
  }

  // Record i `late` seconds off its nominal time; its state vector is the
  // orbit's at the time it states (positions to the millimetre, velocities
  // to the micrometre per second, as the real records).
  std::string WriteRecords(const std::string& name, const std::vector<double>& late) {
    std::vector<std::string> texts;
    records_.clear();
    for (int i = 0; i < kRecords; ++i) {
      const double t = start_ + 60.0 * i + late[i];
      std::string r = real_.records[0];
      r.replace(0, 27, DateText(t));
      double p[3], v[3];
      orbit_.at(t, p, v);
      char text[32];
      for (int a = 0; a < 3; ++a) {
        std::snprintf(text, sizeof text, "%+012.3f", p[a]);
        r.replace(44 + 13 * a, 12, text);
        std::snprintf(text, sizeof text, "%+012.6f", v[a]);
        r.replace(83 + 13 * a, 12, text);
      }
      records_.push_back(ParseRecord(r));
      EXPECT_EQ(records_.back().t, t);
      texts.push_back(r);
    }
    return WriteDoris(name, real_.header, texts);
  }

  DorisText real_;
  std::vector<Record> records_;
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
    std::vector<double> late(kRecords, 0.0);
    for (const auto& l : f.late) late[l.first] = l.second;
    const std::string file = WriteRecords("closed_form", late);
    std::vector<double> times = {start_ + 60.0 * 20 + late[20]};
    for (double t = start_ + 60.0 * 14; t <= start_ + 60.0 * 26; t += 6.1) times.push_back(t);
    double worstP = 0.0, worstV = 0.0;
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

TEST_F(ClosedFormDoris, AscendingNodeOfTheOrbit) {
  const std::string file = WriteRecords("node", std::vector<double>(kRecords, 0.0));
  double p[3], anx = -1.0;
  ASSERT_EQ(interp_orb_l(file.c_str(), start_ + 3000.0, 1, 0.0, p, nullptr, nullptr, 1, &anx), 0);
  EXPECT_NEAR(anx, orbit_.tNode, 1e-3);
  // Before the first node of the file there is none: code 1, but the
  // vectors are there.
  anx = -1.0;
  EXPECT_EQ(interp_orb_l(file.c_str(), records_[3].t, 1, 0.0, p, nullptr, nullptr, 1, &anx), 1);
  EXPECT_EQ(anx, 0.0);
  EXPECT_EQ(p[0], records_[3].p[0]);
}

// The vectors of a scene's grid, 5 s apart, each come from the records
// around their own time and follow the orbit, over scenes of a minute to
// half an hour and where the grid reaches the first or last record.
TEST_F(ClosedFormDoris, SceneGridsFollowTheOrbitOverTheirWholeLength) {
  const std::string file = WriteRecords("grid", std::vector<double>(kRecords, 0.0));
  const double first = records_.front().t, last = records_.back().t, middle = records_[60].t;
  const struct {
    const char* what;
    double duration;
    double t0;     // first vector of the grid, or
    double tLast;  // last vector of the grid when t0 is 0
  } scenes[] = {
      {"one minute", 60.0, middle, 0.0},
      {"ten minutes", 600.0, middle, 0.0},
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
    ASSERT_EQ(o.GetStateVectorsENVI(file.c_str(), t0 + 0.2 * s.duration, s.duration), 0) << s.what;
    ASSERT_EQ(o.n(), n) << s.what;
    ASSERT_EQ(o.t0(), t0) << s.what;
    double worstP = 0.0, worstV = 0.0;
    for (int i = 0; i < n; ++i) {
      double rp[3], rv[3];
      orbit_.at(t0 + i * dt, rp, rv);
      for (int a = 0; a < 3; ++a) {
        worstP = std::fmax(worstP, std::fabs(o.positions()[3 * i + a] - rp[a]));
        worstV = std::fmax(worstV, std::fabs(o.velocities()[3 * i + a] - rv[a]));
      }
    }
    EXPECT_LT(worstP, 3e-3) << s.what;
    EXPECT_LT(worstV, 3e-6) << s.what;
  }
  // The state-vector object of nine vectors, and none before the file.
  SAROrbitStateVectors_Obj sv;
  ASSERT_EQ(GetStateVectorsENVI(file.c_str(), first + 62.5, 5.0, 9, &sv), 0);
  ASSERT_EQ(sv.n(), 9);
  EXPECT_TRUE(sv.isFitted());
  double rp[3], rv[3];
  orbit_.at(first + 62.5 + 5.0 * 8, rp, rv);
  EXPECT_NEAR(sv.positions()[3 * 8 + 2], rp[2], 3e-3);
  EXPECT_EQ(GetStateVectorsENVI(kVor.c_str(), RealRecords().front().t - 100.0, 5.0, 9, &sv), 13);
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
