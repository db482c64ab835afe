// Each sub-swath of a generated product must be told apart from the others:
// its own sample count, burst timing, per-beam array slot, Doppler offset,
// chirp power, geolocation records, near range and FM rate.  A reader that
// takes one sub-swath's values for another, or the wrong slot of an array,
// must get a value that differs from the truth.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdio>
#include <cstring>
#include <set>
#include <string>
#include <vector>

#include "synth_run.h"

namespace synth_test {
namespace {

// Record sizes and fields of the product, as the format defines them.
constexpr size_t kMpp = 2009, kDop = 55, kChirp = 1483, kGeo = 521;
constexpr size_t kMppFirstTime = 0, kMppLastTime = 13, kMppLines = 56, kMppSamples = 60,
                 kMppLinesPerBurst = 69, kMppTimeDiff = 73, kMppPrf = 703, kMppPulseLen = 723,
                 kMppPulseBw = 743, kMppRank = 893, kMppRgWindow = 993, kMppRgCoef = 1000,
                 kMppLookBwRange = 1004, kMppLookBwAz = 1270, kMppAzCoef = 1285, kMppFmRate = 1289,
                 kMppFmOrigin = 1301, kMppGain = 1377, kMppExtCal = 1381, kMppNoise = 1393,
                 kMppEchoes = 1717;
constexpr size_t kDopCoef0 = 17, kDopDelta = 42;
constexpr size_t kChirpPower = 35;
constexpr size_t kGeoFirstTime = 0, kGeoSamples = 25, kGeoRangeTimes = 69, kGeoLats = 157,
                 kGeoLons = 201, kGeoLastTime = 267, kGeoSwath = 501;
constexpr size_t kLineHeader = 17, kLineQuality = 12, kLineNumber = 13;
constexpr double kHalfC = 149896229.0;
constexpr int kMppDsd = 1, kDopDsd = 2, kChirpDsd = 3, kGeoDsd = 5, kMdsDsd = 7;

std::string swath(int k) {
  return "SubSwath" + std::to_string(k + 1);
}

// A generated product read whole, with its truth.
struct Product {
  SynthRun run;
  std::vector<uint8_t> f;
  double t(const std::string& section, const std::string& key) const {
    return truth_number(run.truth, section, key);
  }
  double s(int k, const std::string& key) const { return t(swath(k), key); }
  const uint8_t* mpp(int k) const { return &f[product_dsd(f, kMppDsd).offset + kMpp * k]; }
  const uint8_t* line(int k, long long r) const {
    const Dsd d = product_dsd(f, kMdsDsd + k);
    return &f[d.offset + d.dsr * r];
  }
};

Product generate(const std::string& args) {
  Product p;
  p.run = run_synth(args);
  if (p.run.exit_code == 0) p.f = read_file(p.run.product);
  return p;
}

// Two products: a tiny one on the Keplerian orbit with the first tie point
// at sample 1, a small one on the real orbit with the first tie point later.
class SubSwaths : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    products_ = new std::vector<Product>;
    products_->push_back(generate("--orbit kepler --pattern flat"));
    products_->push_back(generate("--size small --first-tie-sample 7"));
  }
  static void TearDownTestSuite() {
    for (const Product& p : *products_) remove_run(p.run);
    delete products_;
  }
  void SetUp() override {
    for (const Product& p : *products_) ASSERT_EQ(p.run.exit_code, 0);
  }
  static std::vector<Product>* products_;
};
std::vector<Product>* SubSwaths::products_ = nullptr;

double field(const uint8_t* p, bool is_float) {
  return is_float ? bef32(p) : be32(p);
}

TEST_F(SubSwaths, PerBeamArraysHoldTheOwnValueOnlyInTheSlotThatIsRead) {
  // Fields read at their base offset use slot 0; the range look bandwidth
  // slot k.  Sub-swath k's value is in that slot of record k, and neither in
  // another slot of record k, nor in that slot of another record, nor in
  // slot k of the first record.
  const struct {
    size_t offset;
    bool per_sub_swath_slot;
    bool is_float;
    const char* key;
  } arrays[] = {
      {kMppPrf, false, true, "PRF"},
      {kMppPulseLen, false, true, "PulseLength"},
      {kMppPulseBw, false, true, "PulseBandwidth"},
      {kMppRank, false, false, "Rank"},
      {kMppEchoes, false, false, "EchoesPerBurst"},
      {kMppLookBwRange, true, true, "RangeLookBandwidth"},
  };
  for (const Product& p : *products_) {
    for (const auto& a : arrays) {
      for (int k = 0; k < 5; ++k) {
        const double want = p.s(k, a.key);
        const int slot = a.per_sub_swath_slot ? k : 0;
        for (int j = 0; j < 5; ++j)
          for (int e = 0; e < 5; ++e) {
            const bool right = j == k && e == slot;
            const bool mistake = !right && (j == k || e == slot || (j == 0 && e == k));
            if (!right && !mistake) continue;
            const double v = field(p.mpp(j) + a.offset + 4 * e, a.is_float);
            const bool same = std::fabs(v - want) <= 1e-6 * std::fabs(want);
            EXPECT_EQ(same, right)
                << a.key << " of " << swath(k) << " in record " << j << " slot " << e;
          }
      }
    }
  }
}

TEST_F(SubSwaths, ScalarValuesOfEachRecordAreTheSubSwathsOwn) {
  const struct {
    size_t offset;
    bool is_float;
    const char* key;
  } scalars[] = {
      {kMppLines, false, "Records"},
      {kMppSamples, false, "Samples"},
      {kMppLinesPerBurst, false, "LinesPerBurst"},
      {kMppTimeDiff, true, "TimeDiffZeroDoppler"},
      {kMppRgCoef, true, "RangeWindowCoefficient"},
      {kMppLookBwAz, true, "AzimuthLookBandwidth"},
      {kMppAzCoef, true, "AzimuthWindowCoefficient"},
      {kMppGain, true, "ProcessorGain"},
      {kMppExtCal, true, "ExternalCalibrationFactor"},
      {kMppNoise, true, "NoisePower"},
  };
  for (const Product& p : *products_) {
    for (const auto& s : scalars) {
      std::set<double> values;
      for (int k = 0; k < 5; ++k) {
        const double v = field(p.mpp(k) + s.offset, s.is_float);
        EXPECT_NEAR(v, p.s(k, s.key), 1e-6 * std::fabs(v)) << s.key << " " << swath(k);
        values.insert(v);
      }
      EXPECT_EQ(values.size(), 5u) << s.key << " is the same in two sub-swaths";
    }
    for (int k = 0; k < 5; ++k) {
      EXPECT_EQ(std::string(reinterpret_cast<const char*>(p.mpp(k) + kMppRgWindow), 7),
                p.run.truth.at(swath(k)).at("RangeWindowType"));
      const Dsd mds = product_dsd(p.f, kMdsDsd + k);
      EXPECT_EQ(mds.num, p.s(k, "Records"));
      EXPECT_EQ(mds.dsr, 17 + 4 * p.s(k, "Samples"));
    }
  }
}

TEST_F(SubSwaths, DopplerOffsetsAndChirpPowersDifferPerSubSwath) {
  for (const Product& p : *products_) {
    const Dsd dop = product_dsd(p.f, kDopDsd), chirp = product_dsd(p.f, kChirpDsd);
    ASSERT_GE(dop.num, 2);
    std::set<int> deltas;
    std::set<float> powers;
    for (int k = 0; k < 5; ++k) {
      for (long long j = 0; j < dop.num; ++j) {
        const uint8_t* r = &p.f[dop.offset + kDop * j];
        EXPECT_EQ(be16(r + kDopDelta + 2 * k), p.s(k, "DopplerDelta"));
        // The truth's polynomial of the sub-swath carries the offset.
        double t = 0, c0 = 0;
        ASSERT_EQ(
            std::sscanf(p.run.truth.at(swath(k)).at("DopplerRecord" + std::to_string(j)).c_str(),
                        "%lf %lf", &t, &c0),
            2);
        EXPECT_NEAR(t, mjd_time(r), 1e-6);
        EXPECT_NEAR(c0, bef32(r + kDopCoef0) + be16(r + kDopDelta + 2 * k), 1e-4);
      }
      deltas.insert(be16(&p.f[dop.offset + kDopDelta + 2 * k]));
      const float power = bef32(&p.f[chirp.offset + kChirp * k + kChirpPower]);
      EXPECT_FLOAT_EQ(power, p.s(k, "ChirpPower"));
      powers.insert(power);
    }
    EXPECT_EQ(deltas.size(), 5u);
    EXPECT_EQ(deltas.count(0), 0u);  // ignoring the offset is a mistake in every sub-swath
    EXPECT_EQ(powers.size(), 5u);
  }
}

TEST_F(SubSwaths, BurstsFollowTheCycleOfThePrfsNotTheLineGrid) {
  for (const Product& p : *products_) {
    const double dt = p.t("Scene", "LineTimeInterval");
    // The burst cycle from the records, as a reader computes it.
    double cycle = 0;
    for (int k = 0; k < 5; ++k)
      cycle +=
          (be32(p.mpp(k) + kMppRank) + be32(p.mpp(k) + kMppEchoes)) / bef32(p.mpp(k) + kMppPrf);
    EXPECT_NEAR(cycle, p.t("Scene", "BurstCycle"), 1e-9);
    const double lines = cycle / dt;
    EXPECT_GT(lines - std::floor(lines), 0.05);
    EXPECT_LT(lines - std::floor(lines), 0.95);
    double first_min = 1e300, first_max = -1e300, last_max = -1e300;
    for (int k = 0; k < 5; ++k) {
      const int L = static_cast<int>(p.s(k, "LinesPerBurst"));
      const long long n = static_cast<long long>(p.s(k, "Records"));
      ASSERT_EQ(n, L * static_cast<long long>(p.s(k, "Bursts")));
      const double first = p.s(k, "FirstLineTime");
      first_min = std::min(first_min, first);
      first_max = std::max(first_max, first);
      last_max = std::max(last_max, p.s(k, "LastLineTime"));
      // Record r is line r mod L of burst r / L.
      for (long long r = 0; r < n; ++r) {
        const uint8_t* line = p.line(k, r);
        ASSERT_NEAR(mjd_time(line), first + (r / L) * cycle + (r % L) * dt, 1.01e-6)
            << swath(k) << " record " << r;
        ASSERT_EQ(line[kLineQuality], 0);
        ASSERT_EQ(be32(line + kLineNumber), static_cast<uint32_t>(r + 1));
      }
      EXPECT_NEAR(mjd_time(p.line(k, 0)), mjd_time(p.mpp(k) + kMppFirstTime), 1e-6);
      EXPECT_NEAR(mjd_time(p.line(k, n - 1)), p.s(k, "LastLineTime"), 1e-6);
      EXPECT_NEAR(mjd_time(p.mpp(k) + kMppLastTime), p.s(k, "LastLineTime"), 1e-6);
      EXPECT_NEAR(mjd_time(p.mpp(k)) + bef32(p.mpp(k) + kMppTimeDiff),
                  p.s(k, "AcquisitionStartTime"), 1e-6);
      // Each zero-Doppler time lies in about three bursts: a burst spans about
      // three cycles, and where bursts follow on both sides (products of
      // many bursts) times are covered that often on average.
      EXPECT_NEAR(L * dt / cycle, 3.0, 0.3) << swath(k);
      const double from = first + (L - 1) * dt, to = first + (n / L - 1) * cycle;
      if (to - from < 5 * cycle) continue;
      double covered = 0;
      int samples = 0;
      for (double t = from; t < to; t += dt / 3, ++samples)
        for (long long b = 0; b * L < n; ++b) {
          const double start = first + b * cycle;
          if (t >= start && t <= start + (L - 1) * dt) ++covered;
        }
      EXPECT_NEAR(covered / samples, (L - 1) * dt / cycle, 0.05) << swath(k);
      EXPECT_NEAR(covered / samples, 3.0, 0.3) << swath(k);
    }
    // Different first lines, within one burst cycle of each other.
    EXPECT_GT(first_max - first_min, dt);
    EXPECT_LT(first_max - first_min, cycle);
    EXPECT_NEAR(first_min, p.t("Scene", "SensingStart"), 1e-6);
    EXPECT_NEAR(last_max, p.t("Scene", "SensingStop"), 1e-6);
  }
}

TEST_F(SubSwaths, GeolocationRecordsInterleaveAndGiveTheNearRange) {
  for (const Product& p : *products_) {
    const Dsd geo = product_dsd(p.f, kGeoDsd);
    const double fs = p.t("Scene", "RangeSamplingRate");
    // The SPH range spacing gives the sample interval a reader uses.
    const double trg = p.t("Scene", "RangeSpacing") / kHalfC;
    double prev = -1e300;
    int first_record[5] = {-1, -1, -1, -1, -1};
    std::vector<double> times[5];
    double near_read[5] = {0};
    for (long long r = 0; r < geo.num; ++r) {
      const uint8_t* g = &p.f[geo.offset + kGeo * r];
      const double t = mjd_time(g + kGeoFirstTime);
      EXPECT_GE(t, prev) << "record " << r;
      prev = t;
      const int k = g[kGeoSwath] - '1';
      ASSERT_TRUE(k >= 0 && k < 5) << "record " << r;
      if (first_record[k] < 0) {
        first_record[k] = static_cast<int>(r);
        near_read[k] = bef32(g + kGeoRangeTimes) * 1e-9 - (be32(g + kGeoSamples) - 1.0) * trg;
      }
      times[k].push_back(t);
      const int first_tie = static_cast<int>(p.s(k, "FirstTieSample"));
      EXPECT_EQ(be32(g + kGeoSamples), static_cast<uint32_t>(first_tie));
      EXPECT_EQ(be32(g + kGeoSamples + 40), p.s(k, "Samples"));
      // Every tie point lies at the range time of its sample.
      for (int j = 0; j < 11; ++j)
        EXPECT_NEAR(bef32(g + kGeoRangeTimes + 4 * j) * 1e-9,
                    p.s(k, "NearRangeTime") + (be32(g + kGeoSamples + 4 * j) - 1.0) / fs, 0.3e-9);
    }
    for (int k = 0; k < 5; ++k) {
      SCOPED_TRACE(swath(k));
      ASSERT_GE(first_record[k], 0);
      // The records of the sub-swaths interleave: none starts at its own index.
      EXPECT_NE(first_record[k], k);
      EXPECT_NEAR(times[k].front(), p.s(k, "FirstLineTime"), 1e-6);
      for (size_t j = 2; j < times[k].size(); ++j)
        EXPECT_NEAR(times[k][j] - times[k][j - 1], times[k][1] - times[k][0], 2e-6);
      EXPECT_NEAR(near_read[k], p.s(k, "NearRangeTime"), 0.3e-9);
      // Near ranges are no whole number of samples apart.
      const double offset = (near_read[k] - near_read[0]) * fs;
      EXPECT_NEAR(offset, p.s(k, "NearRangeOffsetSamples"), 0.01);
      if (k > 0) {
        EXPECT_GT(offset - std::floor(offset), 0.1);
        EXPECT_LT(offset - std::floor(offset), 0.9);
      }
    }
    // The last grid line of each sub-swath is its last line.
    for (int k = 0; k < 5; ++k) {
      double last = -1e300;
      for (long long r = 0; r < geo.num; ++r) {
        const uint8_t* g = &p.f[geo.offset + kGeo * r];
        if (g[kGeoSwath] == '1' + k) last = std::max(last, mjd_time(g + kGeoLastTime));
      }
      EXPECT_NEAR(last, p.s(k, "LastLineTime"), 1e-6) << swath(k);
    }
  }
  // With the first tie point at sample 7, leaving out the sample term puts
  // the near range six samples too far.
  const Product& late = (*products_)[1];
  EXPECT_EQ(late.s(0, "FirstTieSample"), 7);
  const uint8_t* g = &late.f[product_dsd(late.f, kGeoDsd).offset];
  const int k = g[kGeoSwath] - '1';
  EXPECT_NEAR(bef32(g + kGeoRangeTimes) * 1e-9 - late.s(k, "NearRangeTime"),
              6 / late.t("Scene", "RangeSamplingRate"), 0.3e-9);
}

// ------------------------------------------------------------ FM rate
// Seconds since 1985 of "DD-MMM-YYYY HH:MM:SS.ffffff".
double utc_seconds(const std::string& text) {
  static const char* const months[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                       "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
  int d = 0, y = 0, hh = 0, mm = 0;
  double ss = 0;
  char mon[4] = {0};
  if (std::sscanf(text.c_str(), "%d-%3c-%d %d:%d:%lf", &d, mon, &y, &hh, &mm, &ss) != 6)
    return std::nan("");
  int m = 0;
  while (m < 12 && std::strncmp(mon, months[m], 3) != 0) ++m;
  // Days from 1985-01-01, by counting years and months.
  long days = 0;
  for (int yy = 1985; yy < y; ++yy)
    days += (yy % 4 == 0 && (yy % 100 != 0 || yy % 400 == 0)) ? 366 : 365;
  const int month_days[] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};
  for (int i = 0; i < m; ++i)
    days += month_days[i] + (i == 1 && y % 4 == 0 && (y % 100 != 0 || y % 400 == 0));
  days += d - 1;
  return days * 86400.0 + hh * 3600.0 + mm * 60.0 + ss;
}

struct OrbitRecord {
  double t, p[3];
};

std::vector<OrbitRecord> read_orbit(const std::string& path) {
  const std::vector<uint8_t> o = read_file(path);
  const long long off = header_number(o, 1247 + 231), n = header_number(o, 1247 + 305);
  std::vector<OrbitRecord> recs;
  for (long long i = 0; i < n && off + 129 * (i + 1) <= static_cast<long long>(o.size()); ++i) {
    const std::string r(reinterpret_cast<const char*>(&o[off + 129 * i]), 129);
    recs.push_back({utc_seconds(r.substr(0, 27)),
                    {std::atof(r.substr(44, 12).c_str()), std::atof(r.substr(57, 12).c_str()),
                     std::atof(r.substr(70, 12).c_str())}});
  }
  return recs;
}

// Position at t by Lagrange interpolation through the ten nearest records.
void position(const std::vector<OrbitRecord>& recs, double t, double out[3]) {
  const int n = static_cast<int>(recs.size());
  int k = 0;
  while (k < n && recs[k].t < t) ++k;
  const int first = std::max(0, std::min(k - 5, n - 10));
  out[0] = out[1] = out[2] = 0;
  for (int j = first; j < first + 10; ++j) {
    double w = 1;
    for (int m = first; m < first + 10; ++m)
      if (m != j) w *= (t - recs[m].t) / (recs[j].t - recs[m].t);
    for (int a = 0; a < 3; ++a) out[a] += w * recs[j].p[a];
  }
}

TEST_F(SubSwaths, FmRateIsTheSecondDerivativeOfTheRangeHistory) {
  // f = -(2 / lambda) d^2R/dt^2 for the range R(t) from the orbit file's
  // trajectory to a ground point of the geolocation grid, by central
  // differences, against the record's polynomial at the tie points.
  for (const Product& p : *products_) {
    const std::vector<OrbitRecord> orbit =
        read_orbit(p.run.dir + p.run.truth.at("Scene").at("OrbitFile"));
    ASSERT_GT(orbit.size(), 10u);
    const double lambda = 299792458.0 / p.t("Scene", "CarrierFrequency");
    const double a = 6378137.0, b = 6356752.314245, e2 = 1 - b * b / (a * a);
    const Dsd geo = product_dsd(p.f, kGeoDsd);
    for (int k = 0; k < 5; ++k) {
      SCOPED_TRACE(swath(k));
      // The grid line nearest the sub-swath's centre time.
      const uint8_t* g = nullptr;
      for (long long r = 0; r < geo.num; ++r) {
        const uint8_t* c = &p.f[geo.offset + kGeo * r];
        if (c[kGeoSwath] != '1' + k) continue;
        if (!g || std::fabs(mjd_time(c) - p.s(k, "CentreTime")) <
                      std::fabs(mjd_time(g) - p.s(k, "CentreTime")))
          g = c;
      }
      ASSERT_NE(g, nullptr);
      const double t = mjd_time(g);
      const double c[3] = {bef32(p.mpp(k) + kMppFmRate), bef32(p.mpp(k) + kMppFmRate + 4),
                           bef32(p.mpp(k) + kMppFmRate + 8)};
      const double origin = bef32(p.mpp(k) + kMppFmOrigin) * 1e-9;
      EXPECT_NEAR(c[0], p.s(k, "FmRateC0"), 1e-6 * std::fabs(c[0]));
      EXPECT_NEAR(origin, p.s(k, "FmRateRangeTime"), 1e-15);
      for (int j = 0; j < 11; ++j) {
        const double lat = static_cast<int32_t>(be32(g + kGeoLats + 4 * j)) * 1e-6 * M_PI / 180;
        const double lon = static_cast<int32_t>(be32(g + kGeoLons + 4 * j)) * 1e-6 * M_PI / 180;
        const double nr = a / std::sqrt(1 - e2 * std::sin(lat) * std::sin(lat));
        const double ground[3] = {nr * std::cos(lat) * std::cos(lon),
                                  nr * std::cos(lat) * std::sin(lon),
                                  nr * (1 - e2) * std::sin(lat)};
        auto range = [&](double at) {
          double sat[3];
          position(orbit, at, sat);
          return std::sqrt((sat[0] - ground[0]) * (sat[0] - ground[0]) +
                           (sat[1] - ground[1]) * (sat[1] - ground[1]) +
                           (sat[2] - ground[2]) * (sat[2] - ground[2]));
        };
        const double h = 1.0;
        const double second = (range(t + h) - 2 * range(t) + range(t - h)) / (h * h);
        const double expected = -2.0 / lambda * second;
        const double r = bef32(g + kGeoRangeTimes + 4 * j) * 1e-9 - origin;
        const double got = c[0] + c[1] * r + c[2] * r * r;
        EXPECT_NEAR(got, expected, 0.1) << "tie point " << j;
      }
    }
  }
}

// ------------------------------------------------- radiometry and spectra
// Power of each sample of a line.
std::vector<std::complex<double>> samples(const uint8_t* line, int n) {
  std::vector<std::complex<double>> v(n);
  for (int s = 0; s < n; ++s)
    v[s] = {double(be16(line + kLineHeader + 4 * s)), double(be16(line + kLineHeader + 4 * s + 2))};
  return v;
}

// Share of a line's DFT power outside |f| <= band / 2 (and the share in the
// outer tenth of the band), bins next to the edge counted in neither.
void spectrum_shares(const std::vector<std::complex<double>>& x, double fs, double band,
                     double* outside, double* edge) {
  const int n = static_cast<int>(x.size());
  double total = 0, out = 0, rim = 0;
  for (int b = 0; b < n; ++b) {
    std::complex<double> sum = 0;
    for (int m = 0; m < n; ++m) sum += x[m] * std::polar(1.0, -2 * M_PI * double(b) * m / n);
    const double pw = std::norm(sum);
    total += pw;
    const double f = std::fabs((b < (n + 1) / 2 ? b : b - n) * fs / n);
    if (std::fabs(f - band / 2) <= fs / n) continue;
    if (f > band / 2) out += pw;
    if (f < band / 2 && f > 0.4 * band) rim += pw;
  }
  *outside = out / total;
  *edge = rim / total;
}

TEST(SynthRadiometry, UniformPatternHasOneExpectedPowerAndBandLimitHoldsTheSpectrum) {
  for (const bool limited : {false, true}) {
    SCOPED_TRACE(limited ? "band-limited" : "white");
    const Product p = generate(std::string("--orbit kepler --pattern uniform --seed 4") +
                               (limited ? " --band-limit" : ""));
    ASSERT_EQ(p.run.exit_code, 0);
    const double fs = p.t("Scene", "RangeSamplingRate");
    for (int k = 0; k < 5; ++k) {
      SCOPED_TRACE(swath(k));
      const int n = static_cast<int>(p.s(k, "Samples"));
      const long long records = static_cast<long long>(p.s(k, "Records"));
      const int L = static_cast<int>(p.s(k, "LinesPerBurst"));
      // Mean power over the sub-swath, and on lines at the burst edges against
      // lines at the burst centres: no taper.
      double sum = 0, edge = 0, centre = 0;
      long long count = 0, n_edge = 0, n_centre = 0;
      for (long long r = 0; r < records; ++r) {
        double line_power = 0;
        for (const auto& v : samples(p.line(k, r), n)) line_power += std::norm(v);
        sum += line_power;
        count += n;
        const int i = static_cast<int>(r % L);
        if (i < L / 6 || i >= L - L / 6) edge += line_power, n_edge += n;
        if (i >= L / 3 && i < L - L / 3) centre += line_power, n_centre += n;
      }
      EXPECT_NEAR(sum / count / p.s(k, "MeanPower"), 1.0, 0.03);
      EXPECT_NEAR((edge / n_edge) / (centre / n_centre), 1.0, 0.06);
      // Range spectra of a few lines.
      const double band = p.s(k, "RangeSpectrumBandwidth");
      const double chirp_bw = bef32(p.mpp(k) + kMppPulseBw);
      EXPECT_NEAR(band, limited ? chirp_bw : fs, 1.0);
      double outside = 0, rim = 0;
      for (long long r : {records / 5, records / 2, records - 3}) {
        double o = 0, e = 0;
        spectrum_shares(samples(p.line(k, r), n), fs, chirp_bw, &o, &e);
        outside += o / 3;
        rim += e / 3;
      }
      if (limited) {
        EXPECT_LT(outside, 1e-4);
        EXPECT_GT(rim, 0.1);  // the whole band is used: 20 % of it lies there
      } else {
        EXPECT_NEAR(outside, 1 - chirp_bw / fs, 0.12);
      }
    }
    remove_run(p.run);
  }
}

TEST(SynthBlanks, BlankRecordsLeaveTimesAndTruthAlone) {
  const Product base = generate("--orbit kepler --seed 9");
  ASSERT_EQ(base.run.exit_code, 0);
  const struct {
    int start, end;
    bool zero_time;
  } cases[] = {{20, 70, false}, {60, 5, true}};  // less and more than one burst
  for (const auto& c : cases) {
    char args[128];
    std::snprintf(args, sizeof args, "--orbit kepler --seed 9 --blank-start %d --blank-end %d%s",
                  c.start, c.end, c.zero_time ? " --blank-zero-time" : "");
    SCOPED_TRACE(args);
    const Product p = generate(args);
    ASSERT_EQ(p.run.exit_code, 0);
    for (int k = 0; k < 5; ++k) {
      for (const char* key : {"FirstLineTime", "LastLineTime", "CentreTime", "FirstNearLat"})
        EXPECT_EQ(p.run.truth.at(swath(k)).at(key), base.run.truth.at(swath(k)).at(key));
      const long long n = static_cast<long long>(p.s(k, "Records"));
      const size_t rec = 17 + 4 * static_cast<size_t>(p.s(k, "Samples"));
      for (long long r = 0; r < n; ++r) {
        const bool blank = r < c.start || r >= n - c.end;
        const uint8_t* got = p.line(k, r);
        const uint8_t* want = base.line(k, r);
        ASSERT_EQ(got[kLineQuality], blank ? 0xFF : 0) << swath(k) << " record " << r;
        ASSERT_EQ(be32(got + kLineNumber), static_cast<uint32_t>(r + 1));
        if (!blank) {
          ASSERT_EQ(std::memcmp(got, want, rec), 0) << swath(k) << " record " << r;
          continue;
        }
        const bool zero_time = std::all_of(got, got + 12, [](uint8_t v) { return v == 0; });
        ASSERT_EQ(zero_time, c.zero_time);
        if (!c.zero_time) {
          ASSERT_EQ(std::memcmp(got, want, 12), 0);
        }
        ASSERT_TRUE(std::all_of(got + kLineHeader, got + rec, [](uint8_t v) { return v == 0; }));
      }
    }
    remove_run(p.run);
  }
  remove_run(base.run);
}

}  // namespace
}  // namespace synth_test
