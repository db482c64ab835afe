// The generator is the reference for the import: its products must follow
// the ENVISAT format rules, its truth must describe the records and the
// geometry it wrote, and it must be reproducible.
#include <gtest/gtest.h>

#include <cmath>
#include <filesystem>

#include "synth_run.h"
#include "truth_math.h"

namespace synth_test {
namespace {

// Record sizes and field offsets of the product, as the format defines them.
constexpr size_t kMph = 1247, kSph = 6099, kDsd0 = kMph + 1059, kDsdSize = 280;
constexpr size_t kMpp = 2009, kGeo = 521;
constexpr size_t kMppLines = 56, kMppSamples = 60, kMppStateVector = 1765;
constexpr size_t kGeoSamples = 25, kGeoRangeTimes = 69, kGeoLats = 157, kGeoLons = 201,
                 kGeoLastTime = 267, kGeoSwath = 501;
constexpr size_t kLineQuality = 12, kLineNumber = 13;

// A product kind: generator options, the descriptor index of the main
// processing parameters, the geolocation grid and the first measurement
// data set, and the truth section of image k.
struct Kind {
  const char* args;
  int mppDsd, geoDsd, mdsDsd;
  const char* section;
};

void PrintTo(const Kind& k, std::ostream* os) {
  *os << k.args;
}

class SynthProduct : public ::testing::TestWithParam<Kind> {
 protected:
  void SetUp() override {
    run_ = run_synth(GetParam().args);
    ASSERT_EQ(run_.exit_code, 0) << read_text(run_.dir + "synth.log");
    f_ = read_file(run_.product);
  }
  void TearDown() override { remove_run(run_); }
  std::string image(int k) const { return GetParam().section + std::to_string(k + 1); }
  double truth(int k, const std::string& key) const {
    return truth_number(run_.truth, image(k), key);
  }
  const uint8_t* mpp(int k) const {
    return &f_[product_dsd(f_, GetParam().mppDsd).offset + kMpp * k];
  }

  SynthRun run_;
  std::vector<uint8_t> f_;
};

TEST_P(SynthProduct, HeadersDescriptorsAndRecordsFollowTheFormat) {
  const Kind& kind = GetParam();
  ASSERT_GT(f_.size(), kMph + kSph);
  EXPECT_EQ(header_number(f_, 1075), static_cast<long long>(f_.size()));  // TOT_SIZE
  EXPECT_EQ(header_number(f_, 1113), static_cast<long long>(kSph));       // SPH_SIZE
  EXPECT_EQ(header_number(f_, 1140), 18);                                 // NUM_DSD
  EXPECT_EQ(std::string(reinterpret_cast<const char*>(&f_[9]), 62),
            std::filesystem::path(run_.product).filename().string());
  // Data sets follow each other in descriptor order, right after the headers.
  long long next = kMph + kSph;
  for (int k = 0; k < 18; ++k) {
    const Dsd d = product_dsd(f_, k);
    EXPECT_EQ(f_[kDsd0 + kDsdSize * k + kDsdSize - 1], '\n');
    if (d.size == 0) continue;
    EXPECT_EQ(d.offset, next) << "DSD " << k;
    EXPECT_EQ(d.size, d.num * d.dsr) << "DSD " << k;
    next = d.offset + d.size;
  }
  EXPECT_EQ(next, static_cast<long long>(f_.size()));
  const Dsd main = product_dsd(f_, kind.mppDsd), geo = product_dsd(f_, kind.geoDsd);
  ASSERT_EQ(main.dsr, static_cast<long long>(kMpp));
  ASSERT_EQ(geo.dsr, static_cast<long long>(kGeo));

  // One main-parameters record per image: its lines and samples give the
  // measurement data set, whose records are numbered lines from the first
  // line time to the last.
  for (int k = 0; k < main.num; ++k) {
    SCOPED_TRACE(image(k));
    const Dsd mds = product_dsd(f_, kind.mdsDsd + k);
    EXPECT_EQ(mds.offset, truth(k, "MdsOffset"));
    EXPECT_EQ(mds.num, truth(k, "Records"));
    EXPECT_EQ(be32(mpp(k) + kMppLines), static_cast<uint32_t>(mds.num));
    EXPECT_EQ(be32(mpp(k) + kMppSamples), truth(k, "Samples"));
    EXPECT_EQ(mds.dsr, 17 + 4 * static_cast<long long>(be32(mpp(k) + kMppSamples)));
    for (long long r = 0; r < mds.num; ++r) {
      const uint8_t* line = &f_[mds.offset + mds.dsr * r];
      ASSERT_EQ(line[kLineQuality], 0) << "record " << r;
      ASSERT_EQ(be32(line + kLineNumber), static_cast<uint32_t>(r + 1)) << "record " << r;
    }
    EXPECT_NEAR(mjd_time(&f_[mds.offset]), truth(k, "FirstLineTime"), 1e-6);
    EXPECT_NEAR(mjd_time(&f_[mds.offset + mds.dsr * (mds.num - 1)]), truth(k, "LastLineTime"),
                1e-6);
  }

  // Geolocation grid: every tie point at the range time of its sample, the
  // first line of each image (by the swath field of wide-swath records) at
  // its first line, its first near point at the first-near corner.
  const bool wss = std::string(kind.section) == "SubSwath";
  const double fs = truth_number(run_.truth, "Scene", "RangeSamplingRate");
  double firstTime[5], lastTime[5];
  std::fill(firstTime, firstTime + 5, NAN);
  std::fill(lastTime, lastTime + 5, -1e300);
  for (long long r = 0; r < geo.num; ++r) {
    const uint8_t* g = &f_[geo.offset + kGeo * r];
    const int k = wss ? g[kGeoSwath] - '1' : 0;
    ASSERT_TRUE(k >= 0 && k < main.num) << "record " << r;
    EXPECT_EQ(be32(g + kGeoSamples), truth(k, "FirstTieSample"));
    for (int j = 0; j < 11; ++j)
      EXPECT_NEAR(bef32(g + kGeoRangeTimes + 4 * j) * 1e-9,
                  truth(k, "NearRangeTime") + (be32(g + kGeoSamples + 4 * j) - 1.0) / fs, 0.3e-9);
    lastTime[k] = std::max(lastTime[k], mjd_time(g + kGeoLastTime));
    if (!std::isnan(firstTime[k])) continue;
    firstTime[k] = mjd_time(g);
    if (truth(k, "FirstTieSample") == 1) {
      EXPECT_EQ(static_cast<int32_t>(be32(g + kGeoLats)),
                std::lround(truth(k, "FirstNearLat") * 1e6));
      EXPECT_EQ(static_cast<int32_t>(be32(g + kGeoLons)),
                std::lround(truth(k, "FirstNearLon") * 1e6));
    }
  }
  for (int k = 0; k < (wss ? main.num : 1); ++k) {
    EXPECT_NEAR(firstTime[k], truth(k, "FirstLineTime"), 1e-6) << image(k);
    EXPECT_NEAR(lastTime[k], truth(k, "LastLineTime"), 1e-6) << image(k);
  }
}

// The first-line corners of every image lie on the ellipsoid at the slant
// range of their range time from the record's first state vector, at right
// angles to its velocity.
TEST_P(SynthProduct, CornersLieAtTheRangeAndZeroDopplerOfTheStateVector) {
  const Dsd main = product_dsd(f_, GetParam().mppDsd);
  for (int k = 0; k < main.num; ++k) {
    const uint8_t* sv = mpp(k) + kMppStateVector;
    EXPECT_NEAR(mjd_time(sv), truth(k, "FirstLineTime"), 1e-6) << image(k);
    truth::Vec3 p, v;
    for (int i = 0; i < 3; ++i) {
      p[i] = static_cast<int32_t>(be32(sv + 12 + 4 * i)) * 1e-2;
      v[i] = static_cast<int32_t>(be32(sv + 24 + 4 * i)) * 1e-5;
    }
    for (const std::string c : {"Near", "Far"}) {
      const truth::Vec3 x =
          truth::EarthFixed(truth(k, "First" + c + "Lat"), truth(k, "First" + c + "Lon"));
      const double range = truth::Distance(x, p);
      EXPECT_NEAR(range, truth(k, c + "RangeTime") * 299792458.0 / 2, 0.5) << image(k) << c;
      const double along = (x[0] - p[0]) * v[0] + (x[1] - p[1]) * v[1] + (x[2] - p[2]) * v[2];
      EXPECT_NEAR(along / (range * truth::Distance(v, {0, 0, 0})), 0.0, 1e-6) << image(k) << c;
    }
    EXPECT_GT(truth(k, "FarIncidence"), truth(k, "NearIncidence"));
  }
}

INSTANTIATE_TEST_SUITE_P(
    Products, SynthProduct,
    ::testing::Values(
        Kind{"--orbit kepler --pattern flat", 1, 5, 7, "SubSwath"},
        Kind{"--size small --first-tie-sample 7 --pass ascending", 1, 5, 7, "SubSwath"},
        Kind{"--product IMS --polarisation VV --first-tie-sample 5", 2, 8, 10, "Image"},
        Kind{"--product APS --orbit kepler --pass ascending", 2, 8, 10, "Image"}));

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

}  // namespace
}  // namespace synth_test
