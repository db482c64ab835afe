// The output's headers describe the image: dimensions, sampling, corners,
// and the composed swath; after conversion the suite header says the same.
#include <cmath>

#include "mlook_fixture.h"
#include "truth_math.h"

namespace mlook_test {
namespace {

constexpr const char* kScene = "--size small --pattern uniform --band-limit --seed 5";
constexpr double kDegToRad = M_PI / 180.0;

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

class MultilookHeader : public MultilookTest {
 protected:
  void Check(bool ground) {
    const Imported& p = product(kScene);
    const Output o = multilook(p, ground ? "H_gr" : "H_pwr", ground);
    ASSERT_EQ(o.code, 0);
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
    EXPECT_EQ(XmlValues(sml, "NrOfPixelsPerLine"),
              std::vector<std::string>{std::to_string(o.image.samples)});
    EXPECT_EQ(XmlValues(sml, "NrOfLinesPerImage"),
              std::vector<std::string>{std::to_string(o.image.lines)});
    const std::vector<std::string> rate = XmlValues(sml, "SamplingRate");
    ASSERT_EQ(rate.size(), 1u);
    EXPECT_NEAR(std::atof(rate[0].c_str()), h.sampling.frg_hz, 1e-3);
    bool composed = false;
    for (const std::string& v : XmlValues(sml, "OtherInfo"))
      composed = composed || v.find("|ALL|") != std::string::npos;
    EXPECT_TRUE(composed) << "no \"ALL\" swath in the scene data";
  }
};

TEST_F(MultilookHeader, SlantRange) {
  Check(false);
}

TEST_F(MultilookHeader, GroundRange) {
  Check(true);
}

}  // namespace
}  // namespace mlook_test
