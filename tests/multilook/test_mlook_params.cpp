// Parameter blocks, the look plan, and runs on inputs the processor must
// refuse or handle specially.
#include <cmath>

#include "mlook_fixture.h"

namespace mlook_test {
namespace {

constexpr const char* kScene = "--size small --pattern uniform --band-limit --seed 5";
constexpr double kDegToRad = M_PI / 180.0;

// Bandwidth X of a swath whose processed band 0.8 X needs `ratio` times the
// resolution bandwidth at incidence 30 degrees and 100 m resolution.
double Bandwidth(double ratio) {
  const double resolution = kHalfSpeedOfLight / (std::sin(30.0 * kDegToRad) * 100.0);
  return ratio * resolution / 0.8;
}

class MultilookParameters : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    init_ckerr_locking();
    init_report(0, "ASAR FOCUSSING", 1);
    conf_.GrResolution = 100;
  }
  std::string write(const std::string& name, const std::string& content) {
    const std::string path = work(name);
    vlr_test::WriteFile(path, content);
    return path;
  }
  // Look count for the ratios 1.3 a / g of the five swaths.
  int looks(const double* m, mlook* ml) {
    for (int i = 0; i < kMlookSwaths; ++i) {
      ml->swathPar[i].bandwidth = Bandwidth(m[i] / 1.3);
      ml->swathPar[i].incidence = 30.0;
    }
    return ml->fclook();
  }
  mlook_conf conf_;
  mlook_input input_;
  mlook_output output_;
};

TEST_F(MultilookParameters, MissingKeysAndRanges) {
  // W2 missing: refused, the other keys still read, the optional ones kept.
  const std::string text =
      "[mlookConfiguration]\nSl2Gr = 0\nGrSamplingStep = 50\nGrResolution = 100\n"
      "RgWinLen = 10\nW1 = 0.3\nMemory = 64\nReportLevel = 2\nReportFilename = r.txt\n"
      "Incore = 0\nVerbose = 1\n";
  mlook_conf conf;
  EXPECT_EQ(conf.readpar(write("conf.hdr", text).c_str()), 1);
  EXPECT_EQ(conf.Verbose, 1);
  EXPECT_EQ(conf.DeleteTempFile, 1);
  EXPECT_EQ(conf.checkpar(), 0);
  // Out of range; no ground resolution is no resolution at all, not one look.
  for (int mlook_conf::*field : {&mlook_conf::Sl2Gr, &mlook_conf::GrSamplingStep,
                                 &mlook_conf::GrResolution, &mlook_conf::RgWinLen}) {
    for (int bad : {-1, 1001, kMlookUndefinedInt}) {
      mlook_conf c;
      c.*field = bad;
      EXPECT_EQ(c.checkpar(), 1) << bad;
    }
  }
  mlook_conf none;
  none.GrResolution = 0;
  EXPECT_EQ(none.checkpar(), 1);
  EXPECT_NE(processLog().find("GrResolution = 0 is outside 1 to 1000"), std::string::npos);
  mlook_input input;
  EXPECT_EQ(input.readpar(write("in.hdr", "[mlookInput]\nLevel1Filename = R\n").c_str()), 1);
  EXPECT_EQ(input.BurstsToProcess, 0);
}

TEST_F(MultilookParameters, LookCountFollowsTheWidestSwathAndCentresSpanEachBand) {
  mlook ml(&conf_, &input_, &output_);
  // Every processed band narrower than the resolution band: one look.
  const double narrow[] = {1.1, 1.1, 1.1, 1.1, 1.1};
  ASSERT_EQ(looks(narrow, &ml), 0);
  EXPECT_EQ(ml.looks(), 1);
  EXPECT_NEAR(ml.lookBandwidth(2), 0.8 * ml.swathPar[2].bandwidth, 1e-6);
  const double four[] = {3.5, 1.0, 1.0, 2.0, 0.5};  // m = 4 at most: 3 looks
  ASSERT_EQ(looks(four, &ml), 0);
  EXPECT_EQ(ml.looks(), 3);
  const double sixteen[] = {1.0, 1.0, 15.5, 2.0, 0.5};  // m = 16: 15 looks
  ASSERT_EQ(looks(sixteen, &ml), 0);
  EXPECT_EQ(ml.looks(), 15);
  const double seventeen[] = {1.0, 1.0, 16.5, 2.0, 0.5};
  EXPECT_EQ(looks(seventeen, &ml), 1);
  EXPECT_NE(processLog().find("Number of estimated range looks must be lower than 15, try "
                              "changing Ground Resolution"),
            std::string::npos);
  conf_.GrResolution = 0;  // no resolution asked for is not one look
  EXPECT_EQ(looks(narrow, &ml), 1);
  conf_.GrResolution = 100;
  const double five[] = {4.5, 3.5, 2.5, 1.7, 0.9};  // m = 5: 5 looks
  ASSERT_EQ(looks(five, &ml), 0);
  ASSERT_EQ(ml.looks(), 5);
  for (int i = 0; i < kMlookSwaths; ++i) {
    // Centres 0, +f, -f, +2f, -2f; the outer looks end at the band edges.
    const double x = ml.swathPar[i].bandwidth, b = ml.lookBandwidth(i), f = ml.lookFrequency(1, i);
    EXPECT_EQ(ml.lookFrequency(0, i), 0.0);
    EXPECT_DOUBLE_EQ(ml.lookFrequency(2, i), -f);
    EXPECT_NEAR(ml.lookFrequency(3, i), 2 * f, 1e-6 * x);
    EXPECT_DOUBLE_EQ(ml.lookFrequency(4, i), -ml.lookFrequency(3, i));
    EXPECT_NEAR(2 * f + b / 2, x / 2, 1e-6 * x) << i;
  }
}

// Runs on generated products that the processor must refuse or treat as
// edge cases.
class MultilookInputs : public MultilookTest {
 protected:
  // Copies the imported sub-swaths to "<working>root" and returns the root.
  std::string copyImport(const Imported& p, const std::string& root) {
    for (int k = 1; k <= kMlookSwaths; ++k) {
      const std::string from = p.root + std::to_string(k) + "_slc";
      const std::string to = work(root) + std::to_string(k) + "_slc";
      EXPECT_EQ(synth_test::shell("cp '" + from + "' '" + to + "' && cp '" + from + ".sml' '" + to +
                                  ".sml'"),
                0);
    }
    return work(root);
  }
};

// A burst range beyond the shortest sub-swath and a missing sub-swath are
// refused.
TEST_F(MultilookInputs, ImpossibleBurstRangeOrMissingSwathIsRefused) {
  const Imported& p = product(kScene);
  const int bursts = static_cast<int>(p.swath(0, "Bursts"));
  const Output o = multilook(p, "B_pwr", false, [&](mlook_conf&, mlook_input& in) {
    in.BurstsToSkip = 2;
    in.BurstsToProcess = bursts - 1;
  });
  EXPECT_EQ(o.code, 1);
  EXPECT_NE(
      processLog().find("Bursts To Skip + Bursts To Process are greater than available bursts"),
      std::string::npos);
  const std::string root = copyImport(p, "M");
  ASSERT_EQ(std::remove((root + "3_slc").c_str()), 0);
  EXPECT_NE(multilook(Imported{p.run, root}, "M_pwr", false).code, 0);
}

TEST_F(MultilookInputs, BurstSelectionSetsTheOutputSpan) {
  const Imported& p = product(kScene);
  const Output o = multilook(p, "S_pwr", false, [](mlook_conf&, mlook_input& in) {
    in.BurstsToSkip = 3;
    in.BurstsToProcess = 6;
  });
  ASSERT_EQ(o.code, 0);
  const double cycle = p.number("Scene", "BurstCycle");
  const double interval = p.number("Scene", "LineTimeInterval");
  EXPECT_NEAR(o.header->roi.roi.SlowStartTime, p.number("Scene", "SensingStart") + 3 * cycle, 1e-6);
  // Six bursts of every swath: from the earliest first line to the last
  // line of the latest sixth burst.
  double last = 0.0;
  for (int k = 0; k < kMlookSwaths; ++k)
    last = std::max(last, p.swath(k, "FirstLineTime") + 8 * cycle +
                              (p.swath(k, "LinesPerBurst") - 1) * interval);
  EXPECT_NEAR(o.image.lines - 1, (last - o.header->roi.roi.SlowStartTime) / interval, 1.0);
  // Temporary files are gone.
  for (int k = 1; k <= kMlookSwaths; ++k)
    EXPECT_FALSE(vlr_test::Exists(o.name + "SS" + std::to_string(k)));
}

TEST_F(MultilookInputs, NegativeFlatWeightGivesAnEmptyImage) {
  const Imported& p = product(kScene);
  const Output o = multilook(p, "W_pwr", false, [](mlook_conf& c, mlook_input&) { c.W1 = -0.1; });
  ASSERT_EQ(o.code, 0);
  for (float a : o.image.v) ASSERT_EQ(a, 0.0f);
}

// Bursts are dated by the burst structure, as the import dates its lines: a
// line time that breaks the structure (here the third burst of sub-swath 2
// dated a day early) changes nothing.
TEST_F(MultilookInputs, BurstTimesFollowTheBurstStructure) {
  const Imported& p = product(kScene);
  const std::string root = copyImport(p, "T");
  const std::string raster = root + "2_slc";
  std::vector<uint8_t> bytes = synth_test::read_file(raster);
  const size_t line = 17 + 8 * static_cast<size_t>(p.swath(1, "Samples"));
  const size_t third = 2 * static_cast<size_t>(p.swath(1, "LinesPerBurst")) * line;
  ASSERT_LT(third + 12, bytes.size());
  bytes[third + 3] -= 1;  // one day earlier
  vlr_test::WriteFile(raster, std::string(bytes.begin(), bytes.end()));
  const Output damaged = multilook(Imported{p.run, root}, "T_pwr", false);
  const Output intact = multilook(p, "I_pwr", false);
  ASSERT_EQ(damaged.code, 0);
  ASSERT_EQ(intact.code, 0);
  EXPECT_TRUE(damaged.image.v == intact.image.v);
}

TEST_F(MultilookInputs, AntennaCorrectionFollowsTheElevationPattern) {
  const Imported& p = product(kScene);
  const Output plain = multilook(p, "A0_pwr", false);
  const Output corrected =
      multilook(p, "A1_pwr", false, [](mlook_conf& c, mlook_input&) { c.RgAnt_flag = 1; });
  ASSERT_EQ(plain.code, 0);
  ASSERT_EQ(corrected.code, 0);
  const auto traj = trajectory(p);
  const double t = 0.5 * (p.number("Scene", "SensingStart") + p.number("Scene", "SensingStop"));
  const ROI_Obj& roi = plain.header->roi.roi;
  const double rate = plain.header->sampling.frg_hz;
  for (int k = 0; k < kMlookSwaths; ++k) {
    const double c = 0.75 + 0.05 * p.swath(k, "XcaSlot");  // the generator's pattern
    const double reference = p.number("Calibration", "ReferenceAngleSS" + std::to_string(k + 1));
    // Three columns inside the swath, away from the seams.
    for (double f : {0.25, 0.5, 0.75}) {
      const double tau = p.swath(k, "NearRangeTime") +
                         f * (p.swath(k, "FarRangeTime") - p.swath(k, "NearRangeTime"));
      const int column = static_cast<int>(std::lround((tau - roi.FastStartTime) * rate));
      synth::GroundPoint g;
      ASSERT_TRUE(synth::zero_doppler_point(traj->at(t), roi.FastStartTime + column / rate, &g));
      const double offset = g.look_deg - reference;
      double a = 0.0, b = 0.0;
      for (int l = 40; l < plain.image.lines - 40; ++l) {
        a += corrected.image.power(l, column);
        b += plain.image.power(l, column);
      }
      // Two-way pattern -c offset^2 dB, corrected in power.
      EXPECT_NEAR(10.0 * std::log10(a / b), c * offset * offset, 0.1)
          << "sub-swath " << k + 1 << " at " << f;
    }
  }
}

}  // namespace
}  // namespace mlook_test
