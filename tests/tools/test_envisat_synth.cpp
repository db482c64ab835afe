// The generator is the reference for the import: its files must be
// self-consistent, reproducible, carry the defects asked for, and its truth
// must describe the data and the geometry it wrote.
#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>

#include "synth_run.h"

namespace synth_test {
namespace {

constexpr size_t kDsd0 = 1247 + 1059;

Dsd dsd(const std::vector<uint8_t>& f, int k) {
  return product_dsd(f, k);
}

double num(const Params& t, const char* s, const char* k) {
  return std::stod(t.at(s).at(k));
}

std::string swath(int k) {
  return "SubSwath" + std::to_string(k + 1);
}

class SynthTiny : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { run_ = new SynthRun(run_synth("--orbit kepler --pattern flat")); }
  static void TearDownTestSuite() {
    remove_run(*run_);
    delete run_;
  }
  static SynthRun* run_;
};
SynthRun* SynthTiny::run_ = nullptr;

TEST_F(SynthTiny, HeadersDescriptorsAndDataSetsAreConsistent) {
  ASSERT_EQ(run_->exit_code, 0);
  const std::vector<uint8_t> f = read_file(run_->product);
  ASSERT_GT(f.size(), 7346u);
  EXPECT_LT(f.size(), 1u << 20);
  EXPECT_EQ(header_number(f, 1075), static_cast<long long>(f.size()));  // TOT_SIZE
  EXPECT_EQ(header_number(f, 1113), 6099);                              // SPH_SIZE
  EXPECT_EQ(header_number(f, 1140), 18);                                // NUM_DSD
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(&f[9]), 62),
            std::filesystem::path(run_->product).filename().string());
  // Data sets follow each other in descriptor order, right after the headers.
  long long next = 7346;
  for (int k = 0; k < 18; ++k) {
    const Dsd d = dsd(f, k);
    EXPECT_EQ(f[kDsd0 + 280 * k + 279], '\n');
    if (d.size == 0) continue;
    EXPECT_EQ(d.offset, next) << "DSD " << k;
    EXPECT_EQ(d.size, d.num * d.dsr) << "DSD " << k;
    next = d.offset + d.size;
  }
  EXPECT_EQ(next, static_cast<long long>(f.size()));
  EXPECT_EQ(dsd(f, 1).dsr, 2009);
  EXPECT_EQ(dsd(f, 5).dsr, 521);
  // Per sub-swath processing record: swath name, lines and samples.
  for (int k = 0; k < 5; ++k) {
    const uint8_t* m = &f[dsd(f, 1).offset + 2009 * k];
    EXPECT_EQ(m[43], '1' + k);
    EXPECT_EQ(be32(m + 56),
              std::stoul(run_->truth.at("SubSwath" + std::to_string(k + 1)).at("Records")));
    EXPECT_EQ(dsd(f, 7 + k).dsr, 17 + 4 * static_cast<long long>(be32(m + 60)));
  }
  // The first geolocation record of each sub-swath (by its swath field) starts
  // at the sub-swath's first line: its near tie point is the first-near corner.
  const Dsd geo = dsd(f, 5);
  for (int k = 0; k < 5; ++k) {
    const uint8_t* g = nullptr;
    for (long long r = 0; r < geo.num && g == nullptr; ++r)
      if (f[geo.offset + 521 * r + 501] == '1' + k) g = &f[geo.offset + 521 * r];
    ASSERT_NE(g, nullptr) << swath(k);
    const std::string s = swath(k);
    EXPECT_NEAR(mjd_time(g), num(run_->truth, s.c_str(), "FirstLineTime"), 1e-6);
    EXPECT_EQ(be32(g + 25), 1u);
    EXPECT_EQ(static_cast<int32_t>(be32(g + 157)),
              std::lround(num(run_->truth, s.c_str(), "FirstNearLat") * 1e6));
    EXPECT_EQ(static_cast<int32_t>(be32(g + 201)),
              std::lround(num(run_->truth, s.c_str(), "FirstNearLon") * 1e6));
  }
}

TEST_F(SynthTiny, SamplePowerFollowsTaperAndScale) {
  ASSERT_EQ(run_->exit_code, 0);
  const std::vector<uint8_t> f = read_file(run_->product);
  const Dsd d = dsd(f, 7);
  const int lpb = std::stoi(run_->truth.at("SubSwath1").at("LinesPerBurst"));
  const double scale = num(run_->truth, "Pattern", "Scale");
  const long long n = (d.dsr - 17) / 4;
  // Power over lines near the burst centre against lines near its edges.
  double centre = 0, edge = 0, expect_centre = 0, expect_edge = 0;
  for (long long r = 0; r < d.num; ++r) {
    const int i = static_cast<int>(r % lpb);
    const double taper = std::pow(std::sin(M_PI * (i + 0.5) / lpb), 2);
    double p = 0;
    for (long long s = 0; s < n; ++s) {
      const uint8_t* q = &f[d.offset + r * d.dsr + 17 + 4 * s];
      p += double(be16(q)) * be16(q) + double(be16(q + 2)) * be16(q + 2);
    }
    (taper > 0.5 ? centre : edge) += p;
    (taper > 0.5 ? expect_centre : expect_edge) += 2 * scale * scale * taper * n;
  }
  EXPECT_NEAR(centre / expect_centre, 1.0, 0.03);
  EXPECT_NEAR(edge / expect_edge, 1.0, 0.05);
}

TEST_F(SynthTiny, CornersLieAtTheRangeAndZeroDopplerOfTheStateVector) {
  ASSERT_EQ(run_->exit_code, 0);
  // The first state vector of each processing record is at the sub-swath's
  // first line: the first-line corners must lie on the ellipsoid at the slant
  // range of their range time, at right angles to the velocity.
  const std::vector<uint8_t> f = read_file(run_->product);
  const double a = 6378137.0, b = 6356752.314245, e2 = 1 - b * b / (a * a);
  for (int k = 0; k < 5; ++k) {
    const std::string s = swath(k);
    const uint8_t* m = &f[dsd(f, 1).offset + 2009 * k];
    EXPECT_NEAR(mjd_time(m + 1765), num(run_->truth, s.c_str(), "FirstLineTime"), 1e-6);
    double p[3], v[3];
    for (int i = 0; i < 3; ++i) {
      p[i] = static_cast<int32_t>(be32(m + 1765 + 12 + 4 * i)) * 1e-2;
      v[i] = static_cast<int32_t>(be32(m + 1765 + 24 + 4 * i)) * 1e-5;
    }
    for (const char* c : {"FirstNear", "FirstFar"}) {
      const double lat = num(run_->truth, s.c_str(), (std::string(c) + "Lat").c_str()) * M_PI / 180;
      const double lon = num(run_->truth, s.c_str(), (std::string(c) + "Lon").c_str()) * M_PI / 180;
      const double nr = a / std::sqrt(1 - e2 * std::sin(lat) * std::sin(lat));
      const double x[3] = {nr * std::cos(lat) * std::cos(lon), nr * std::cos(lat) * std::sin(lon),
                           nr * (1 - e2) * std::sin(lat)};
      const double dx[3] = {x[0] - p[0], x[1] - p[1], x[2] - p[2]};
      const double range = std::sqrt(dx[0] * dx[0] + dx[1] * dx[1] + dx[2] * dx[2]);
      const double tau = num(run_->truth, s.c_str(),
                             c == std::string("FirstNear") ? "NearRangeTime" : "FarRangeTime");
      EXPECT_NEAR(range, tau * 299792458.0 / 2, 0.5) << s << c;
      const double speed = std::sqrt(v[0] * v[0] + v[1] * v[1] + v[2] * v[2]);
      EXPECT_NEAR((dx[0] * v[0] + dx[1] * v[1] + dx[2] * v[2]) / (range * speed), 0.0, 1e-6);
    }
    EXPECT_GT(num(run_->truth, s.c_str(), "FarIncidence"),
              num(run_->truth, s.c_str(), "NearIncidence"));
  }
}

TEST(Synth, CheckerboardPowerFollowsTheTruthDefinition) {
  const SynthRun r = run_synth("--orbit kepler --pattern checkerboard --seed 3");
  ASSERT_EQ(r.exit_code, 0);
  const std::vector<uint8_t> f = read_file(r.product);
  const Params& t = r.truth;
  const double start = num(t, "Scene", "SensingStart");
  const double fs = num(t, "Scene", "RangeSamplingRate");
  const double near1 = num(t, "SubSwath1", "NearRangeTime");
  const double az_cell = num(t, "Pattern", "AzCell"), rg_cell = num(t, "Pattern", "RgCell");
  const double scale = num(t, "Pattern", "Scale");
  double sum[2] = {0, 0}, count[2] = {0, 0};
  for (int k = 0; k < 5; ++k) {
    const Dsd d = dsd(f, 7 + k);
    const int lpb = std::stoi(t.at(swath(k)).at("LinesPerBurst"));
    const double near = num(t, ("SubSwath" + std::to_string(k + 1)).c_str(), "NearRangeTime");
    const long long n = (d.dsr - 17) / 4;
    for (long long r = 0; r < d.num; ++r) {
      const uint8_t* line = &f[d.offset + r * d.dsr];
      const int i = static_cast<int>(r % lpb);
      const double taper = std::pow(std::sin(M_PI * (i + 0.5) / lpb), 2);
      const long a = static_cast<long>(std::floor((mjd_time(line) - start) / az_cell));
      for (long long s = 0; s < n; ++s) {
        const long c = static_cast<long>(std::floor((near - near1 + s / fs) / rg_cell));
        const uint8_t* q = line + 17 + 4 * s;
        const double p = double(be16(q)) * be16(q) + double(be16(q + 2)) * be16(q + 2);
        const int high = (a + c) % 2 == 0;
        sum[high] += p / (2 * scale * scale * taper);
        count[high] += 1;
      }
    }
  }
  ASSERT_GT(count[0], 1000);
  ASSERT_GT(count[1], 1000);
  EXPECT_NEAR(sum[1] / count[1], num(t, "Pattern", "High"), 0.05);
  EXPECT_NEAR(sum[0] / count[0], num(t, "Pattern", "Low"), 0.0125);
  remove_run(r);
}

TEST(Synth, SameSeedSameBytesOtherSeedOtherSpeckle) {
  const SynthRun a = run_synth("--orbit kepler --seed 5");
  const SynthRun b = run_synth("--orbit kepler --seed 5");
  const SynthRun c = run_synth("--orbit kepler --seed 6");
  ASSERT_EQ(a.exit_code, 0);
  ASSERT_EQ(b.exit_code, 0);
  ASSERT_EQ(c.exit_code, 0);
  for (const char* key : {"Product", "OrbitFile", "XcaFile", "InsFile"})
    EXPECT_EQ(read_file(a.dir + a.truth.at("Scene").at(key)),
              read_file(b.dir + b.truth.at("Scene").at(key)))
        << key;
  EXPECT_EQ(read_text(a.dir + "synth_truth.txt"), read_text(b.dir + "synth_truth.txt"));
  const std::vector<uint8_t> pa = read_file(a.product), pc = read_file(c.product);
  ASSERT_EQ(pa.size(), pc.size());
  EXPECT_NE(pa, pc);
  for (const SynthRun* r : {&a, &b, &c}) remove_run(*r);
}

TEST(Synth, KeplerOrbitFileCoversTheSceneWithANodeBefore) {
  const SynthRun r = run_synth("--orbit kepler --pass ascending");
  ASSERT_EQ(r.exit_code, 0);
  EXPECT_EQ(r.truth.at("Scene").at("Pass"), "ASCENDING");
  const std::vector<uint8_t> o = read_file(r.dir + r.truth.at("Scene").at("OrbitFile"));
  const long long off = header_number(o, 1247 + 231), n = header_number(o, 1247 + 305);
  ASSERT_EQ(off, 1625);
  ASSERT_EQ(static_cast<long long>(o.size()), off + 129 * n);
  // The records begin two hours (120 records) before the scene.
  bool node_before = false;
  double prev_z = 0;
  for (long long i = 0; i < n; ++i) {
    const char* rec = reinterpret_cast<const char*>(&o[off + 129 * i]);
    EXPECT_EQ(rec[128], '\n');
    const double z = std::atof(std::string(rec + 70, 12).c_str());
    if (i > 0 && i < 120 && prev_z <= 0 && z > 0) node_before = true;
    prev_z = z;
  }
  EXPECT_TRUE(node_before);
  EXPECT_GE(n * 60.0, 3 * 3600.0);
  remove_run(r);
}

TEST(Synth, DefectsAreWrittenAsAsked) {
  const SynthRun r = run_synth(
      "--orbit kepler --blank-first 3 --blank-last 2 --mds-count 3 "
      "--zero-count 2 --dsd-beyond-end 5");
  ASSERT_EQ(r.exit_code, 0);
  const std::vector<uint8_t> f = read_file(r.product);
  const Dsd mds1 = dsd(f, 7);
  for (int i = 0; i < 4; ++i) EXPECT_EQ(f[mds1.offset + mds1.dsr * i + 12], i < 3 ? 0xFF : 0);
  EXPECT_EQ(f[mds1.offset + mds1.dsr * (mds1.num - 2) + 12], 0xFF);
  EXPECT_EQ(f[mds1.offset + mds1.dsr * (mds1.num - 3) + 12], 0);
  for (long long s = 17; s < mds1.dsr; ++s) EXPECT_EQ(f[mds1.offset + s], 0);
  EXPECT_GT(dsd(f, 9).size, 0);
  EXPECT_EQ(dsd(f, 10).size, 0);
  EXPECT_EQ(dsd(f, 11).size, 0);
  EXPECT_EQ(dsd(f, 2).num, 0);
  EXPECT_GT(dsd(f, 5).offset, static_cast<long long>(f.size()));
  EXPECT_EQ(r.truth.at("Scene").at("SubSwaths"), "3");
  remove_run(r);

  // Four measurement data sets: the fifth descriptor is there with size 0.
  const SynthRun four = run_synth("--orbit kepler --mds-count 4");
  ASSERT_EQ(four.exit_code, 0);
  const std::vector<uint8_t> f4 = read_file(four.product);
  for (int k = 0; k < 4; ++k) EXPECT_GT(dsd(f4, 7 + k).size, 0) << k;
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(&f4[kDsd0 + 280 * 11 + 9]), 6), "MDS5  ");
  EXPECT_EQ(dsd(f4, 11).size, 0);
  EXPECT_EQ(dsd(f4, 10).offset + dsd(f4, 10).size, static_cast<long long>(f4.size()));
  EXPECT_EQ(four.truth.at("Scene").at("SubSwaths"), "4");
  remove_run(four);

  const SynthRun t = run_synth("--orbit kepler --truncate 5000 --wrong-type ASA_IMS_1P");
  ASSERT_EQ(t.exit_code, 0);
  const std::string name = t.truth.at("Scene").at("Product");
  EXPECT_EQ(name.substr(0, 10), "ASA_IMS_1P");
  const std::vector<uint8_t> g = read_file(t.product);
  EXPECT_EQ(g.size(), 5000u);
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(&g[9]), 62), name);
  remove_run(t);
}

TEST(Synth, RefusesScenesOutsideTheOrbitFileAndBadOptions) {
  for (const char* args :
       {"--start \"01-JAN-2009 00:00:00\"", "--size huge", "--mds-count 9", "--pattern stripes",
        "--orbit /nonexistent/DOR_VOR", "--first-tie-sample 0", "--first-tie-sample 85",
        "--blank-start -1", "--blank-end 99999999999"}) {
    const SynthRun r = run_synth(args);
    EXPECT_NE(r.exit_code, 0) << args;
    remove_run(r);
  }
}

}  // namespace
}  // namespace synth_test
