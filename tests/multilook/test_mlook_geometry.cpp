// The checkerboard's cell edges must appear where the generator's geometry
// puts them, in slant and in ground range, and the output headers must
// describe the image they come with.
#include <algorithm>
#include <cmath>

#include "mlook_fixture.h"
#include "truth_math.h"

namespace mlook_test {
namespace {

constexpr const char* kChecker = "--size small --pattern checkerboard --band-limit --seed 7";
constexpr int kEdgeLines = 40;
constexpr double kDegToRad = M_PI / 180.0;

double Db(double x) {
  return 10.0 * std::log10(x);
}

// The values of the first element named `field` of a ".sml" file, read by
// python's own XML parser.
std::vector<std::string> XmlValues(const std::string& sml, const std::string& field) {
  const std::string script =
      "import sys, xml.etree.ElementTree as E\n"
      "root = E.parse(sys.argv[1]).getroot()\n"
      "node = next(e for e in root.iter() if e.tag.split('}')[-1] == sys.argv[2])\n"
      "values = [v.text or '' for v in node.iter() if v.tag.endswith('Value')]\n"
      "print('\\n'.join(values if values else [node.text or '']))\n";
  const std::string out = sml + ".values";
  EXPECT_EQ(synth_test::shell("python3 -c \"" + script + "\" '" + sml + "' '" + field + "' > '" +
                              out + "'"),
            0);
  std::vector<std::string> values;
  const std::string text = synth_test::read_text(out);
  for (size_t at = 0, nl; (nl = text.find('\n', at)) != std::string::npos; at = nl + 1)
    values.push_back(text.substr(at, nl - at));
  return values;
}

class MultilookGeometry : public MultilookTest {
 protected:
  // The checkerboard's cell edges within one pixel of where the truth puts
  // them, in every sub-swath, with the pattern's contrast.
  void CheckCheckerboard(bool ground) {
    const Imported& p = product(kChecker);
    // The ground-range resampling interpolates its range times between
    // exact solutions on a coarse grid: every output sample within a
    // hundredth of a composite sample of the exact ground-to-slant solution.
    double worst = 0.0;
    const Output o = multilook(p, ground ? "C_gr" : "C_pwr", ground, nullptr, [&](mlook& ml) {
      for (int line = 0; ground && line < ml.outputLines(); line += 3)
        for (int column = 0; column < ml.outputSamples(); ++column) {
          double az = 0.0, exact = 0.0, used = 0.0;
          ASSERT_EQ(ml.outputPixelTimes(column, line, &az, &exact), 0);
          ASSERT_EQ(ml.resampledRangeTime(column, line, &used), 0);
          worst = std::max(worst, std::fabs(used - exact) * ml.fs / ml.decimation());
        }
    });
    ASSERT_EQ(o.code, 0);
    EXPECT_LT(worst, 0.01);
    const auto traj = trajectory(p);
    const Grid grid(o, p, ground ? traj.get() : nullptr);
    const Image& im = o.image;
    const double azCell = p.number("Pattern", "AzCell");
    const double rgCell = p.number("Pattern", "RgCell");
    const double contrast = Db(p.number("Pattern", "High") / p.number("Pattern", "Low"));
    const double width = p.swath(4, "FarRangeTime") - p.swath(0, "NearRangeTime");
    // The image ends at the far range of the last sub-swath.
    EXPECT_NEAR(im.samples - 1, grid.column(width), 1.0);
    ExpectCheckerboardEdges(p, im, [&](double daz, double drg) {
      return std::array<double, 2>{grid.column(drg), grid.line(daz)};
    });
    // Contrast per sub-swath: mean power of the pixels of bright and of dark
    // cells, away from cell edges and the partly covered first and last
    // lines.
    double bright[kMlookSwaths] = {}, dark[kMlookSwaths] = {};
    int brightCount[kMlookSwaths] = {}, darkCount[kMlookSwaths] = {};
    for (int l = kEdgeLines; l < im.lines - kEdgeLines; ++l) {
      const double daz = grid.time(l);
      const double a = daz / azCell;
      if (a - std::floor(a) < 0.05 || a - std::floor(a) > 0.95) continue;
      for (int k = 0; k < im.samples; ++k) {
        const double drg = grid.rangeTime(k);
        const double r = drg / rgCell;
        if (drg < 0.0 || drg > width || r - std::floor(r) < 0.1 || r - std::floor(r) > 0.9)
          continue;
        int swath = 0;
        while (swath < 4 && drg > p.swath(swath + 1, "NearRangeTime") - p.swath(0, "NearRangeTime"))
          ++swath;
        const bool high =
            (static_cast<long>(std::floor(a)) + static_cast<long>(std::floor(r))) % 2 == 0;
        (high ? bright : dark)[swath] += im.power(l, k);
        ++(high ? brightCount : darkCount)[swath];
      }
    }
    for (int k = 0; k < kMlookSwaths; ++k) {
      ASSERT_GT(brightCount[k], 100) << "sub-swath " << k + 1;
      ASSERT_GT(darkCount[k], 100) << "sub-swath " << k + 1;
      EXPECT_NEAR(Db(bright[k] / brightCount[k] / (dark[k] / darkCount[k])), contrast, 0.5)
          << "sub-swath " << k + 1;
    }

    // The header describes the image: dimensions, sampling, corners within
    // one output pixel of the scene's, the composed swath; after conversion
    // the suite header (read by python's XML parser) says the same.
    const GeneralSAR& h = *o.header;
    EXPECT_EQ(h.datafile.data.cell_type, CT_FLOAT32);
    EXPECT_STREQ(h.dataSetInfo.Swath, "ALL");
    EXPECT_EQ(h.dataSetInfo.RangeLooks, o.looks);
    EXPECT_STREQ(h.dataSetInfo.ImageType, "MULTILOOK");
    const double fs = p.number("Scene", "RangeSamplingRate");
    if (ground) {
      EXPECT_DOUBLE_EQ(h.sampling.frg_hz, kHalfSpeedOfLight / kGroundStep);
    } else {
      EXPECT_GT(o.decimation, 1);
      EXPECT_NEAR(h.sampling.frg_hz * o.decimation, fs, 1.0);
    }
    // First line and near range where the scene starts.
    EXPECT_NEAR(h.roi.roi.SlowStartTime, p.number("Scene", "SensingStart"), 1e-6);
    EXPECT_NEAR(h.roi.roi.FastStartTime, p.swath(0, "NearRangeTime"), 0.5 / fs);
    // Corners within one output pixel of the scene's corners.
    ASSERT_EQ(text(p.run, "Scene", "Pass"), "DESCENDING");
    const double azimuthPixel = p.number("Scene", "AzimuthSpacing");
    const double rangePixel = ground ? kGroundStep
                                     : kHalfSpeedOfLight / h.sampling.frg_hz /
                                           std::sin(p.swath(0, "NearIncidence") * kDegToRad);
    const double tolerance = std::hypot(azimuthPixel, rangePixel);
    const struct {
      const geopoint& point;
      const char* truth;
    } corners[] = {{h.geoCoords.NorthEast, "SphFirstNear"},
                   {h.geoCoords.NorthWest, "SphFirstFar"},
                   {h.geoCoords.SouthEast, "SphLastNear"},
                   {h.geoCoords.SouthWest, "SphLastFar"}};
    for (const auto& c : corners) {
      EXPECT_LE(truth::SurfaceDistance(c.point.latitude, c.point.longitude,
                                       p.number("Scene", std::string(c.truth) + "Lat"),
                                       p.number("Scene", std::string(c.truth) + "Lon")),
                tolerance)
          << c.truth;
    }
    // The suite header after conversion.
    const std::string suite = o.name + "_hdr";
    ASSERT_EQ(writehdr_kestova((o.name + ".hdr").c_str(), suite.c_str(), xca(p).c_str()), 0);
    const std::string sml = o.name + ".sml";
    const std::pair<const char*, double> values[] = {{"NrOfPixelsPerLine", o.image.samples},
                                                     {"NrOfLinesPerImage", o.image.lines},
                                                     {"SamplingRate", h.sampling.frg_hz}};
    for (const auto& v : values) {
      const std::vector<std::string> read = XmlValues(sml, v.first);
      ASSERT_EQ(read.size(), 1u) << v.first;
      EXPECT_NEAR(std::atof(read[0].c_str()), v.second, 1e-3) << v.first;
    }
    bool composed = false;
    for (const std::string& v : XmlValues(sml, "OtherInfo"))
      composed = composed || v.find("|ALL|") != std::string::npos;
    EXPECT_TRUE(composed) << "no \"ALL\" swath in the scene data";
  }
};

TEST_F(MultilookGeometry, CheckerboardInSlantRange) {
  CheckCheckerboard(false);
}

TEST_F(MultilookGeometry, CheckerboardInGroundRange) {
  CheckCheckerboard(true);
}

}  // namespace
}  // namespace mlook_test
