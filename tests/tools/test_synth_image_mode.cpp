// Image-mode products of the generator (IMS: one image, APS: two images of
// alternating polarisation): the image-mode descriptor layout, the values a
// reader takes from the headers and records, lines one interval apart, and a
// truth that describes the files and the geometry.
#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <string>
#include <vector>

#include "synth_run.h"

namespace synth_test {
namespace {

// Offsets of the values read from the product, as the format defines them.
constexpr size_t kMph = 1247;
constexpr size_t kSphDescriptor = 16, kSphFirstLine = 135, kSphLastLine = 180, kSphSwath = 688,
                 kSphSampleType = 724, kSphPolar1 = 772, kSphPolar2 = 795, kSphDataType = 1001;
constexpr size_t kMphSensingStart = 351, kMphSensingStop = 394;
constexpr size_t kDsdName = 9;
// Descriptor index (SPH offset 1059 + 280 k) of each data set in the
// image-mode layout.
constexpr int kMppDsd = 2, kDopDsd = 3, kChirpDsd = 5, kAntDsd = 6, kGeoDsd = 8, kMds1Dsd = 10,
              kMds2Dsd = 11;
constexpr size_t kMpp = 2009, kDop = 55, kChirp = 1483, kGeo = 521;
constexpr size_t kMppSwath = 41, kMppLines = 56, kMppSamples = 60, kMppLinesPerBurst = 69,
                 kMppPrf = 703, kMppLookBwRange = 1004, kMppNoise = 1393, kMppStateVector = 1765;
constexpr size_t kDopDelta = 42, kChirpPolar = 16;
constexpr size_t kGeoFirstTime = 0, kGeoSamples = 25, kGeoRangeTimes = 69, kGeoLats = 157,
                 kGeoLons = 201, kGeoLastTime = 267;
constexpr size_t kLineQuality = 12, kLineNumber = 13;

std::string text(const std::vector<uint8_t>& f, size_t offset, size_t n) {
  return std::string(reinterpret_cast<const char*>(&f[offset]), n);
}
std::string image(int k) {
  return "Image" + std::to_string(k + 1);
}
double num(const Params& t, const std::string& s, const std::string& k) {
  return truth_number(t, s, k);
}

struct Kind {
  const char* args;
  const char* type;
  int images;
  const char* polar[2];
};

void PrintTo(const Kind& k, std::ostream* os) {
  *os << k.args;
}

class ImageMode : public ::testing::TestWithParam<Kind> {};

TEST_P(ImageMode, LayoutHeadersRecordsAndTruthAgree) {
  const Kind& kind = GetParam();
  const SynthRun run = run_synth(kind.args);
  ASSERT_EQ(run.exit_code, 0) << read_text(run.dir + "synth.log");
  const Params& t = run.truth;
  const std::vector<uint8_t> f = read_file(run.product);
  ASSERT_GT(f.size(), kMph + 6099);
  const std::string name = t.at("Scene").at("Product");
  EXPECT_EQ(name.substr(0, 10), std::string("ASA_") + kind.type + "_1P");
  EXPECT_EQ(t.at("Scene").at("ProductType"), kind.type);
  EXPECT_EQ(text(f, 9, 62), name);
  EXPECT_EQ(header_number(f, 1075), static_cast<long long>(f.size()));  // TOT_SIZE
  EXPECT_EQ(header_number(f, 1113), 6099);                              // SPH_SIZE
  EXPECT_EQ(header_number(f, 1140), 18);                                // NUM_DSD

  // The descriptors the readers take, at their SPH offsets.
  const struct {
    size_t sph_offset;
    int index;
    const char* name;
  } named[] = {{1619, kMppDsd, "MAIN PROCESSING PARAMS ADS"},
               {1899, kDopDsd, "DOP CENTROID COEFFS ADS"},
               {2459, kChirpDsd, "CHIRP PARAMS ADS"},
               {2739, kAntDsd, "MDS1 ANTENNA ELEV PATT ADS"},
               {3299, kGeoDsd, "GEOLOCATION GRID ADS"},
               {3859, kMds1Dsd, "MDS1"},
               {4139, kMds2Dsd, "MDS2"}};
  for (const auto& d : named) {
    EXPECT_EQ(d.sph_offset, 1059u + 280u * d.index);
    std::string n = text(f, kMph + d.sph_offset + kDsdName, 28);
    n.erase(n.find_last_not_of(' ') + 1);
    EXPECT_EQ(n, d.name);
  }
  // Data sets follow each other in descriptor order, right after the headers.
  long long next = kMph + 6099;
  for (int k = 0; k < 18; ++k) {
    const Dsd d = product_dsd(f, k);
    if (d.size == 0) continue;
    EXPECT_EQ(d.offset, next) << "DSD " << k;
    EXPECT_EQ(d.size, d.num * d.dsr) << "DSD " << k;
    next = d.offset + d.size;
  }
  EXPECT_EQ(next, static_cast<long long>(f.size()));

  // Specific header values.
  const size_t sph = kMph;
  EXPECT_EQ(text(f, sph + kSphDescriptor, t.at("Scene").at("Descriptor").size()),
            t.at("Scene").at("Descriptor"));
  EXPECT_EQ(text(f, sph + kSphFirstLine, 27), t.at("Scene").at("SensingStartText"));
  EXPECT_EQ(text(f, sph + kSphLastLine, 27), t.at("Scene").at("SensingStopText"));
  EXPECT_EQ(text(f, kMphSensingStart, 27), t.at("Scene").at("SensingStartText"));
  EXPECT_EQ(text(f, kMphSensingStop, 27), t.at("Scene").at("SensingStopText"));
  EXPECT_EQ(text(f, sph + kSphSwath, 3), "IS2");
  EXPECT_EQ(text(f, sph + kSphSampleType, 8), "COMPLEX ");
  EXPECT_EQ(text(f, sph + kSphDataType, 5), "SWORD");
  EXPECT_EQ(text(f, sph + kSphPolar1, 3), kind.polar[0]);
  EXPECT_EQ(text(f, sph + kSphPolar2, 3), kind.images > 1 ? kind.polar[1] : "   ");

  // One main-parameters and one chirp record per image; MDS k+1 holds
  // image k; the second MDS is empty in a single-image product.
  const Dsd mpp = product_dsd(f, kMppDsd), chirp = product_dsd(f, kChirpDsd);
  ASSERT_EQ(mpp.num, kind.images);
  ASSERT_EQ(mpp.dsr, static_cast<long long>(kMpp));
  ASSERT_EQ(chirp.num, kind.images);
  EXPECT_EQ(product_dsd(f, kAntDsd).num, 1);
  if (kind.images == 1) {
    EXPECT_EQ(product_dsd(f, kMds2Dsd).size, 0);
  }
  const double dt = num(t, "Scene", "LineTimeInterval");
  EXPECT_NEAR(std::stod(text(f, sph + 943, 15)), dt, 1e-15);  // LINE_TIME_INTERVAL
  for (int k = 0; k < kind.images; ++k) {
    SCOPED_TRACE(image(k));
    const std::string s = image(k);
    EXPECT_EQ(t.at(s).at("Polarisation"), kind.polar[k]);
    EXPECT_EQ(t.at(s).at("Swath"), "IS2");
    for (const char* wss_only : {"LinesPerBurst", "Bursts", "Rank", "BurstCycle", "DopplerDelta"})
      EXPECT_EQ(t.at(s).count(wss_only), 0u) << wss_only;
    const Dsd mds = product_dsd(f, kMds1Dsd + k);
    const uint8_t* m = &f[mpp.offset + kMpp * k];
    EXPECT_EQ(mds.offset, num(t, s, "MdsOffset"));
    EXPECT_EQ(mds.num, num(t, s, "Records"));
    EXPECT_EQ(mds.dsr, num(t, s, "RecordSize"));
    EXPECT_EQ(be32(m + kMppLines), static_cast<uint32_t>(mds.num));
    EXPECT_EQ(be32(m + kMppSamples), num(t, s, "Samples"));
    EXPECT_EQ(mds.dsr, 17 + 4 * static_cast<long long>(be32(m + kMppSamples)));
    EXPECT_EQ(text(f, mpp.offset + kMpp * k + kMppSwath, 3), "IS2");
    EXPECT_EQ(be32(m + kMppLinesPerBurst), 0u);  // no bursts
    EXPECT_FLOAT_EQ(bef32(m + kMppPrf), num(t, s, "PRF"));
    EXPECT_FLOAT_EQ(bef32(m + kMppNoise), num(t, s, "NoisePower"));
    // The range look bandwidth of every image in the first slot only.
    EXPECT_FLOAT_EQ(bef32(m + kMppLookBwRange), num(t, s, "RangeLookBandwidth"));
    for (int e = 1; e < 5; ++e) EXPECT_EQ(bef32(m + kMppLookBwRange + 4 * e), 0.0f) << e;
    EXPECT_EQ(text(f, chirp.offset + kChirp * k + kChirpPolar, 3), kind.polar[k]);
    // Records one line interval apart from the first line.
    const double first = num(t, s, "FirstLineTime");
    for (long long r = 0; r < mds.num; ++r) {
      const uint8_t* line = &f[mds.offset + mds.dsr * r];
      ASSERT_NEAR(mjd_time(line), first + r * dt, 1.01e-6) << "record " << r;
      ASSERT_EQ(line[kLineQuality], 0);
      ASSERT_EQ(be32(line + kLineNumber), static_cast<uint32_t>(r + 1));
    }
    EXPECT_NEAR(first + (mds.num - 1) * dt, num(t, s, "LastLineTime"), 1.01e-6);
  }
  // Two images of the same lines: the speckle of each its own.
  if (kind.images == 2) {
    const Dsd a = product_dsd(f, kMds1Dsd), b = product_dsd(f, kMds2Dsd);
    EXPECT_EQ(a.num, b.num);
    EXPECT_EQ(a.dsr, b.dsr);
    EXPECT_NE(std::memcmp(&f[a.offset], &f[b.offset], a.size), 0);
    EXPECT_NE(num(t, "Image1", "NoisePower"), num(t, "Image2", "NoisePower"));
  }

  // Doppler records carry no sub-swath offsets.
  const Dsd dop = product_dsd(f, kDopDsd);
  ASSERT_GE(dop.num, 2);
  for (long long j = 0; j < dop.num; ++j)
    for (int e = 0; e < 5; ++e) EXPECT_EQ(be16(&f[dop.offset + kDop * j + kDopDelta + 2 * e]), 0);

  // One grid for the images: from the first line to the last, every tie
  // point at the range time of its sample, the first near one at the
  // first-near corner.
  const Dsd geo = product_dsd(f, kGeoDsd);
  ASSERT_GE(geo.num, 2);
  const std::string s = image(0);
  const double fs = num(t, "Scene", "RangeSamplingRate");
  for (long long r = 0; r < geo.num; ++r) {
    const uint8_t* g = &f[geo.offset + kGeo * r];
    EXPECT_EQ(be32(g + kGeoSamples), num(t, s, "FirstTieSample"));
    EXPECT_EQ(be32(g + kGeoSamples + 40), num(t, s, "Samples"));
    for (int j = 0; j < 11; ++j)
      EXPECT_NEAR(bef32(g + kGeoRangeTimes + 4 * j) * 1e-9,
                  num(t, s, "NearRangeTime") + (be32(g + kGeoSamples + 4 * j) - 1.0) / fs, 0.3e-9);
  }
  const uint8_t* g0 = &f[geo.offset];
  EXPECT_NEAR(mjd_time(g0 + kGeoFirstTime), num(t, s, "FirstLineTime"), 1e-6);
  EXPECT_NEAR(mjd_time(&f[geo.offset + kGeo * (geo.num - 1) + kGeoLastTime]),
              num(t, s, "LastLineTime"), 1e-6);
  if (num(t, s, "FirstTieSample") == 1) {
    EXPECT_EQ(static_cast<int32_t>(be32(g0 + kGeoLats)),
              std::lround(num(t, s, "FirstNearLat") * 1e6));
    EXPECT_EQ(static_cast<int32_t>(be32(g0 + kGeoLons)),
              std::lround(num(t, s, "FirstNearLon") * 1e6));
  }
  remove_run(run);
}

INSTANTIATE_TEST_SUITE_P(
    Products, ImageMode,
    ::testing::Values(Kind{"--product IMS --orbit kepler", "IMS", 1, {"H/H", nullptr}},
                      Kind{"--product IMS --size small --polarisation VV --first-tie-sample 5",
                           "IMS",
                           1,
                           {"V/V", nullptr}},
                      Kind{"--product APS", "APS", 2, {"H/H", "H/V"}},
                      Kind{"--product APS --orbit kepler --polarisation VV --pass ascending",
                           "APS",
                           2,
                           {"V/V", "V/H"}}));

// The first-line corners of every image lie on the ellipsoid at the slant
// range of their range time from the record's first state vector, at right
// angles to its velocity.
TEST(ImageModeGeometry, CornersLieAtTheRangeAndZeroDopplerOfTheStateVector) {
  const double a = 6378137.0, b = 6356752.314245, e2 = 1 - b * b / (a * a);
  for (const char* args : {"--product IMS", "--product APS --orbit kepler --pass ascending"}) {
    SCOPED_TRACE(args);
    const SynthRun run = run_synth(args);
    ASSERT_EQ(run.exit_code, 0);
    const std::vector<uint8_t> f = read_file(run.product);
    const Dsd mpp = product_dsd(f, kMppDsd);
    for (int k = 0; k < mpp.num; ++k) {
      const std::string s = image(k);
      const uint8_t* m = &f[mpp.offset + kMpp * k];
      EXPECT_NEAR(mjd_time(m + kMppStateVector), num(run.truth, s, "FirstLineTime"), 1e-6);
      double p[3], v[3];
      for (int i = 0; i < 3; ++i) {
        p[i] = static_cast<int32_t>(be32(m + kMppStateVector + 12 + 4 * i)) * 1e-2;
        v[i] = static_cast<int32_t>(be32(m + kMppStateVector + 24 + 4 * i)) * 1e-5;
      }
      for (const char* c : {"FirstNear", "FirstFar"}) {
        const double lat = num(run.truth, s, std::string(c) + "Lat") * M_PI / 180;
        const double lon = num(run.truth, s, std::string(c) + "Lon") * M_PI / 180;
        const double nr = a / std::sqrt(1 - e2 * std::sin(lat) * std::sin(lat));
        const double x[3] = {nr * std::cos(lat) * std::cos(lon), nr * std::cos(lat) * std::sin(lon),
                             nr * (1 - e2) * std::sin(lat)};
        const double dx[3] = {x[0] - p[0], x[1] - p[1], x[2] - p[2]};
        const double range = std::sqrt(dx[0] * dx[0] + dx[1] * dx[1] + dx[2] * dx[2]);
        const double tau =
            num(run.truth, s, c == std::string("FirstNear") ? "NearRangeTime" : "FarRangeTime");
        EXPECT_NEAR(range, tau * 299792458.0 / 2, 0.5) << s << c;
        const double speed = std::sqrt(v[0] * v[0] + v[1] * v[1] + v[2] * v[2]);
        EXPECT_NEAR((dx[0] * v[0] + dx[1] * v[1] + dx[2] * v[2]) / (range * speed), 0.0, 1e-6);
      }
      // Swath IS2: incidence between 19 and 27 degrees.
      EXPECT_GT(num(run.truth, s, "NearIncidence"), 19.0);
      EXPECT_LT(num(run.truth, s, "FarIncidence"), 27.0);
    }
    remove_run(run);
  }
}

// Without bursts there is no taper: every line has the stated mean power.
TEST(ImageModeRadiometry, UniformPatternHasTheStatedPowerOnEveryPartOfTheImage) {
  const SynthRun run = run_synth("--product APS --pattern uniform --seed 12");
  ASSERT_EQ(run.exit_code, 0);
  const std::vector<uint8_t> f = read_file(run.product);
  for (int k = 0; k < 2; ++k) {
    const Dsd d = product_dsd(f, kMds1Dsd + k);
    const long long n = (d.dsr - 17) / 4;
    double half[2] = {0, 0};
    for (long long r = 0; r < d.num; ++r)
      for (long long s = 0; s < n; ++s) {
        const uint8_t* q = &f[d.offset + r * d.dsr + 17 + 4 * s];
        half[2 * r >= d.num] += double(be16(q)) * be16(q) + double(be16(q + 2)) * be16(q + 2);
      }
    const double expected = num(run.truth, image(k), "MeanPower") * n * (d.num / 2.0);
    EXPECT_NEAR(half[0] / expected, 1.0, 0.03) << image(k);
    EXPECT_NEAR(half[1] / expected, 1.0, 0.03) << image(k);
  }
  remove_run(run);
}

TEST(ImageModeOptions, SameSeedSameBytesAndDefectsAsAsked) {
  const SynthRun a = run_synth("--product APS --orbit kepler --seed 5");
  const SynthRun b = run_synth("--product APS --orbit kepler --seed 5");
  ASSERT_EQ(a.exit_code, 0);
  ASSERT_EQ(b.exit_code, 0);
  EXPECT_EQ(read_file(a.product), read_file(b.product));
  EXPECT_EQ(read_text(a.dir + "synth_truth.txt"), read_text(b.dir + "synth_truth.txt"));
  remove_run(a);
  remove_run(b);

  // Annotation descriptors of the image-mode layout can be emptied; the
  // blank records are in both images.
  const SynthRun d = run_synth("--product APS --orbit kepler --zero-count 8 --blank-start 2");
  ASSERT_EQ(d.exit_code, 0);
  const std::vector<uint8_t> f = read_file(d.product);
  EXPECT_EQ(product_dsd(f, kGeoDsd).num, 0);
  EXPECT_EQ(product_dsd(f, kGeoDsd).size, 0);
  for (int k = 0; k < 2; ++k) {
    const Dsd m = product_dsd(f, kMds1Dsd + k);
    for (int r = 0; r < 3; ++r) EXPECT_EQ(f[m.offset + m.dsr * r + kLineQuality], r < 2 ? 0xFF : 0);
  }
  remove_run(d);
}

TEST(ImageModeOptions, RefusesUnknownProductsAndWideSwathOnlyOptions) {
  for (const char* args :
       {"--product GMS", "--product ims", "--product IMS --mds-count 1",
        "--product APS --mds-count 2", "--zero-count 7", "--product IMS --zero-count 10",
        "--product IMS --first-tie-sample 213"}) {
    const SynthRun r = run_synth(args);
    EXPECT_NE(r.exit_code, 0) << args;
    remove_run(r);
  }
}

}  // namespace
}  // namespace synth_test
