// The metadata sections of a SAR data set: their older parameter-file form,
// failing and optional keys, shared headers and hostile headers.
#include <functional>
#include <memory>

#include "metadata_fixture.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/file_roi.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_data_file.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/processed_bandwidth.h"
#include "metadata_sections/quick_look.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/sensor_attitude.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "section_fields.h"

namespace {

using section_test::expectSameFields;
using section_test::fill;
using section_test::legacyText;

struct SectionCase {
  const char* section;
  std::function<std::unique_ptr<GeneralSAR_Base>()> make;
  std::map<std::string, std::string> keys;  // parameter-file keys that differ from the fields
  const char* failingField;                 // a field whose key the older form needs
  const char* optionalField;                // one it may lack (nullptr: none)
};

template <class T>
std::function<std::unique_ptr<GeneralSAR_Base>()> maker() {
  return [] { return std::unique_ptr<GeneralSAR_Base>(new T); };
}

// Fills the section, allocating what its counts ask for.
void fillSection(GeneralSAR_Base& s, int seed) {
  fill(s, seed);
  if (auto* swath = dynamic_cast<SwathInfo*>(&s)) swath->Swst_changes = 3;
  if (auto* pattern = dynamic_cast<AntennaPattern_Obj*>(&s)) pattern->PatternSamples = 7;
  ASSERT_EQ(s.createBuffers(), 0);
  fill(s, seed);
  if (auto* swath = dynamic_cast<SwathInfo*>(&s)) swath->Swst_changes = 3;
  if (auto* pattern = dynamic_cast<AntennaPattern_Obj*>(&s)) pattern->PatternSamples = 7;
}

std::vector<SectionCase> cases() {
  return {
      {"SamplingConstants",
       maker<SamplingConstants_Obj>(),
       {{"fc_hz", "CarrierFrequency"},
        {"frg_hz", "SamplingRate"},
        {"Brg_hz", "RangeBandWidth"},
        {"Trg_s", "RangeTSamplingStep"},
        {"prf_hz", "PRF"},
        {"pri_s", "PRI"},
        {"Baz_hz", "AzimuthBandwidth"},
        {"brf_hz", "BRF"},
        {"bri_s", "BRI"},
        {"lambda_m", "WaveLength"}},
       "bri_s",
       nullptr},
      {"Pulse", maker<SARPulse_Obj>(), {}, "PulseEnergy", nullptr},
      {"SensorAttitude", maker<SensorAttitude_Obj>(), {}, "DroopGain", nullptr},
      {"SpectralWindows", maker<SpectralWindows_Obj>(), {}, "RgMatchedFilterType", nullptr},
      {"SwathInfo", maker<SwathInfo>(), {}, "Swst_changes_bursts", nullptr},
      {"AntennaPattern", maker<AntennaPattern_Obj>(), {}, "DeltaAngle", "PatternSamples"},
      {"DataSetInfo", maker<DataSetInfo_Obj>(), {}, "Track", "MissingLines"},
  };
}

class Sections : public MetadataTest {};

// Headers of older releases hold each section as "[Section]" and "key = value" lines: every field
// is restored from them, a missing key the section needs fails the read, an optional one does not,
// and a missing file or section fails (the quick look alone has defaults instead).
TEST_F(Sections, OlderParameterFormRestoresEveryFieldOrFails) {
  for (const SectionCase& c : cases()) {
    SCOPED_TRACE(c.section);
    auto written = c.make();
    fillSection(*written, 1);
    // Parameter files are cached by name: each variant gets its own.
    const auto par = [&](const char* variant, const std::set<std::string>& skip) {
      const std::string file = path(std::string(c.section) + variant + ".par");
      spit(file, legacyText(*written, c.section, c.keys, skip));
      return file;
    };
    auto legacy = c.make();
    ASSERT_EQ(legacy->readhdr(par("", {"LookDirection"}).c_str()), 0);
    if (auto* info = dynamic_cast<DataSetInfo_Obj*>(legacy.get()))
      info->LookDirection = dynamic_cast<DataSetInfo_Obj*>(written.get())->LookDirection;
    expectSameFields(*written, *legacy);
    EXPECT_EQ(c.make()->readhdr(par("_broken", {c.failingField, "LookDirection"}).c_str()), 1);
    EXPECT_EQ(c.make()->readhdr(path("none.hdr").c_str()), 1);
    if (c.optionalField == nullptr) continue;
    EXPECT_EQ(c.make()->readhdr(par("_partial", {c.optionalField, "LookDirection"}).c_str()), 0);
  }
  QuickLook_Obj ql;
  EXPECT_EQ(ql.readhdr(path("none.hdr").c_str()), 0);
  EXPECT_EQ(ql.QL_AzimuthML, 1);
}

TEST_F(Sections, OverLongTextsOfTheOlderFormAreRefusedNotCut) {
  DataSetInfo_Obj info;
  fill(info, 5);
  const std::string longText(600, 'x');
  const std::string text =
      legacyText(info, "DataSetInfo", {}, {"LookDirection", "SensorName", "Track"});
  spit(path("long_optional.par"), text + "Track = 12\nSensorName = " + longText + "\n");
  DataSetInfo_Obj optional;
  EXPECT_EQ(optional.readhdr(path("long_optional.par").c_str()), 0);
  EXPECT_STREQ(optional.Track, "12");
  EXPECT_STREQ(optional.SensorName, "SENSOR UNKNOWN");
  spit(path("long_track.par"), text + "Track = " + longText + "\n");
  EXPECT_EQ(DataSetInfo_Obj().readhdr(path("long_track.par").c_str()), 1);
}

TEST_F(Sections, HostileCountsFailWithoutAllocating) {
  // A pattern of 10^9 samples, a negative one, 10^9 window changes: the
  // block does not read, and neither does the older form.
  for (const char* count : {"1000000000", "-5", "10001"}) {
    const std::string xml = path(std::string("pattern") + count + ".hdr");
    spit(xml,
         "<TessalXmlDoc><NumberOfChannels>1</NumberOfChannels><Description>d</Description>"
         "<Channel Number=\"1\"><AntennaPattern><StartAngle>1</StartAngle>"
         "<DeltaAngle>0.05</DeltaAngle><PatternSamples>" +
             std::string(count) + "</PatternSamples></AntennaPattern></Channel></TessalXmlDoc>");
    AntennaPattern_Obj pattern;
    EXPECT_EQ(pattern.readhdr(xml.c_str()), 1) << count;
    EXPECT_EQ(pattern.patternSize(), 0);

    const std::string par = path(std::string("pattern") + count + ".par");
    spit(par, "[AntennaPattern]\nStartAngle = 1\nDeltaAngle = 2\nPatternSamples = " +
                  std::string(count) + "\n");
    EXPECT_NE(pattern.readhdr(par.c_str()), 0) << count;
    EXPECT_EQ(pattern.patternSize(), 0);
  }
  // A header may hold no pattern (0 samples): there are no gains to hand out.
  AntennaPattern_Obj none;
  none.PatternSamples = 0;
  float gain = -1.0f;
  EXPECT_EQ(none.getPatternArray(&gain), 1);
  EXPECT_EQ(gain, -1.0f);
  SwathInfo swath;
  fill(swath, 1);
  const std::string par = path("swath.par");
  std::string text = legacyText(swath, "SwathInfo");
  text.replace(text.find("Swst_changes = "), std::string("Swst_changes = 171").size(),
               "Swst_changes = 1000000000");
  spit(par, text);
  SwathInfo read;
  EXPECT_NE(read.readhdr(par.c_str()), 0);
  EXPECT_EQ(read.swstChangesBursts(), nullptr);
}

TEST_F(Sections, GroundCornersStopAtTheFirstMissingPoint) {
  // Older form: grid sizes in "GeoGridSize", points in "Coordinates"; the
  // third point missing stops the read before the fourth.
  const std::string par = path("corners.par");
  spit(par,
       "[GeoGridSize]\nEastingGridSize = 1\nNorthingGridSize = 2\n[Coordinates]\n"
       "NorthWest = 1 2 3 4 5\nNorthEast = {6 7 8 9 10}\nSouthEast = 11 12 13 14 15\n"
       "Center = 16 17 18 19 20\n");
  geoCoords_Obj legacy;
  EXPECT_EQ(legacy.readhdr(par.c_str()), 1);
  EXPECT_EQ(legacy.NorthEast.incidence, 9);
  EXPECT_EQ(legacy.SouthEast.latitude, -999);
  spit(path("nogrid.par"), "[Coordinates]\nNorthWest = 1 2 3 4 5\n");
  EXPECT_EQ(geoCoords_Obj().readhdr(path("nogrid.par").c_str()), 1);
}

// The region and the raster description share the header of the raster;
// FileROI_Obj reads both at once.
TEST_F(Sections, RegionAndRasterSectionsShareTheRasterHeader) {
  const std::string hdr = path("image.hdr");
  GSDataFile_Obj raster;
  raster.data.set_name(path("elsewhere").c_str());
  raster.data.pixels_per_line = 1000;
  raster.data.lines_per_image = 20;
  raster.data.row_prefix = 17;
  raster.data.cell_type = CT_SHORT_COMPLEX;
  raster.data.byte_order = 1;
  ASSERT_EQ(raster.writehdr(hdr.c_str()), 0);
  EXPECT_EQ(raster.data.name(), path("elsewhere"));
  GSRoi_Obj roi;
  roi.roi.SetFastAxe(0.005, 1e-7, 1000);
  roi.roi.SetSlowAxe(7e8, 0.01, 20);
  ASSERT_EQ(roi.writehdr(hdr.c_str()), 0);

  // The raster named by a header is the one beside it, whatever name it was written with.
  EXPECT_EQ(GSDataFile_Obj().readhdr("x.h"), 1);
  FileROI_Obj both;
  both.fileName = path("image");
  EXPECT_EQ(both.read_roi(), 0);
  EXPECT_EQ(both.roi.Lines, 20);
  EXPECT_EQ(both.data.pixels_per_line, 1000);
  EXPECT_EQ(both.data.row_prefix, 17);
  EXPECT_EQ(both.data.name(), path("image"));
  // Neither part present: still 0, the members keep their values.
  FileROI_Obj missing;
  missing.fileName = path("absent");
  missing.roi.Samples = 5;
  EXPECT_EQ(missing.read_roi(), 0);
  EXPECT_EQ(missing.roi.Samples, 5);
}

TEST(ProcessedBandwidth, WeightedAxesTakeTheSmallerBandwidth) {
  SamplingConstants_Obj sampling;
  sampling.Brg_hz = 16e6, sampling.Baz_hz = 1700;
  SpectralWindows_Obj windows;
  windows.RgMatchedFilterCoef = 0, windows.RgLookBandwidth = 10e6;
  windows.AzMatchedFilterCoef = 0.75, windows.AzLookBandwidth = 1200;
  double az = 0, rg = 0;
  EXPECT_EQ(GetProcessedBandwidth(sampling, windows, &az, &rg), 0);
  EXPECT_EQ(rg, 16e6);
  EXPECT_EQ(az, 1200);
  windows.RgMatchedFilterCoef = 0.75, windows.AzLookBandwidth = 2000;
  GetProcessedBandwidth(sampling, windows, &az, &rg);
  EXPECT_EQ(rg, 10e6);
  EXPECT_EQ(az, 1700);
}

}  // namespace
