// A uniform scene must come out as a uniform image: no burst stripes, no
// steps at the sub-swath boundaries, in slant and in ground range.
#include <algorithm>
#include <cmath>

#include "mlook_fixture.h"

namespace mlook_test {
namespace {

constexpr const char* kUniform = "--size small --pattern uniform --band-limit --seed 5";
// Lines at either end of the image that fewer bursts cover than elsewhere.
constexpr int kEdgeLines = 60;
constexpr int kPhaseBins = 6;

double Db(double x) {
  return 10.0 * std::log10(x);
}

class MultilookUniformScene : public MultilookTest {
 protected:
  static double MeanPower(const Image& im, int line0, int line1, int k0, int k1) {
    double sum = 0.0;
    for (int l = line0; l < line1; ++l)
      for (int k = k0; k < k1; ++k) sum += im.power(l, k);
    return sum / (static_cast<double>(line1 - line0) * (k1 - k0));
  }
  // Middle of the overlap of sub-swaths k and k+1, as a range time from
  // the near range.
  static double Seam(const Imported& p, int k) {
    return 0.5 * (p.swath(k, "FarRangeTime") + p.swath(k + 1, "NearRangeTime")) -
           p.swath(0, "NearRangeTime");
  }
  // Finite, non-negative amplitudes, and the same level on either side of
  // each seam.
  static void CheckSeams(const Imported& p, const Output& o, const Grid& grid) {
    const Image& im = o.image;
    for (float a : im.v) ASSERT_TRUE(std::isfinite(a) && a >= 0.0f) << a;
    for (int k = 0; k + 1 < kMlookSwaths; ++k) {
      const int seam = static_cast<int>(std::lround(grid.column(Seam(p, k))));
      ASSERT_TRUE(seam > 12 && seam + 12 < im.samples) << seam;
      const double left = MeanPower(im, kEdgeLines, im.lines - kEdgeLines, seam - 12, seam - 2);
      const double right = MeanPower(im, kEdgeLines, im.lines - kEdgeLines, seam + 2, seam + 12);
      EXPECT_LE(std::fabs(Db(left / right)), 0.3) << "step at the seam after sub-swath " << k + 1;
    }
  }
};

TEST_F(MultilookUniformScene, SlantRangeHasNoBurstStripesNoSeamsAndNoBadValues) {
  const Imported& p = product(kUniform);
  const Output o = multilook(p, "U_pwr", false);
  ASSERT_EQ(o.code, 0);
  const Image& im = o.image;
  ASSERT_GT(im.lines, 4 * kEdgeLines);
  const Grid grid(o, p, nullptr);
  CheckSeams(p, o, grid);
  auto column = [&](double tau) { return grid.column(tau - p.swath(0, "NearRangeTime")); };
  const double interval = o.header->roi.roi.SlowTimeDelta;
  const double start = o.header->roi.roi.SlowStartTime;
  for (int k = 0; k < kMlookSwaths; ++k) {
    // The columns of sub-swath k away from its seams, folded by the phase
    // of each line in the sub-swath's burst cycle.
    const int c0 = static_cast<int>(std::ceil((k == 0 ? 0.0 : grid.column(Seam(p, k - 1))) + 4));
    const int c1 = static_cast<int>(
        std::floor((k == 4 ? column(p.swath(4, "FarRangeTime")) : grid.column(Seam(p, k))) - 4));
    ASSERT_LT(c0 + 20, c1) << k;
    const double cycle = p.swath(k, "BurstCycle");
    const double first = p.swath(k, "FirstLineTime");
    double sum[kPhaseBins] = {};
    int count[kPhaseBins] = {};
    for (int l = kEdgeLines; l < im.lines - kEdgeLines; ++l) {
      const double phase = std::fmod(start + l * interval - first + 100.0 * cycle, cycle) / cycle;
      const int bin = std::min(kPhaseBins - 1, static_cast<int>(phase * kPhaseBins));
      sum[bin] += MeanPower(im, l, l + 1, c0, c1);
      ++count[bin];
    }
    double lo = 1e300, hi = 0.0;
    for (int b = 0; b < kPhaseBins; ++b) {
      ASSERT_GT(count[b], 10);
      lo = std::min(lo, sum[b] / count[b]);
      hi = std::max(hi, sum[b] / count[b]);
    }
    EXPECT_LE(Db(hi / lo), 0.3) << "burst stripes in sub-swath " << k + 1;
  }
}

TEST_F(MultilookUniformScene, GroundRangeHasNoSeamsAndNoBadValues) {
  const Imported& p = product(kUniform);
  const Output o = multilook(p, "U_gr", true);
  ASSERT_EQ(o.code, 0);
  const auto traj = trajectory(p);
  CheckSeams(p, o, Grid(o, p, traj.get()));
}

// A resolution finer than any processed band gives one look: plain power
// detection, whose level is the scene's mean power with the range-spreading
// correction, since the squared burst weights of every time add up to 1.
TEST_F(MultilookUniformScene, OneLookKeepsTheScenePower) {
  const Imported& p = product(kUniform);
  const Output o =
      multilook(p, "U1_pwr", false, [](mlook_conf& c, mlook_input&) { c.GrResolution = 20; });
  ASSERT_EQ(o.code, 0);
  EXPECT_EQ(o.looks, 1);
  EXPECT_EQ(o.decimation, 1);
  const Grid grid(o, p, nullptr);
  const double referenceTime = 800000.0 / kHalfSpeedOfLight;  // the headers' reference range
  for (int k = 0; k < kMlookSwaths; ++k) {
    const double tau = p.swath(k, "CentreRangeTime");
    const int column =
        static_cast<int>(std::lround(grid.column(tau - p.swath(0, "NearRangeTime"))));
    const double r = tau / referenceTime;
    const double expected = p.swath(k, "MeanPower") * r * r * r / 3.0;
    const double got =
        MeanPower(o.image, kEdgeLines, o.image.lines - kEdgeLines, column - 10, column + 10);
    EXPECT_NEAR(Db(got / expected), 0.0, 0.2) << "sub-swath " << k + 1;
  }
}

}  // namespace
}  // namespace mlook_test
