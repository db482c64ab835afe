// The extraction of wide-swath (WSS), stripmap (IMS) and alternating
// polarisation (APS) products: every raster against the product's own bytes,
// the metadata against the generator's values and geometry.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "extraction_fixture.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "orbit/general_sar_orbit.h"
#include "raster/data_file.h"
#include "truth_math.h"

namespace {

using namespace extraction_test;

// Bytes of the time and quality prefix of every line.
constexpr size_t kPrefix = 17;

// Every record of an image's MDS (truth section `section`) against its
// raster: prefix bytes unchanged, samples the product's big-endian int16
// values as floats.
void ExpectRasterHoldsEveryRecord(const SynthRun& run, const std::vector<uint8_t>& product,
                                  const std::string& section, const std::string& raster) {
  const int samples = static_cast<int>(Value(run, section, "Samples"));
  const int records = static_cast<int>(Value(run, section, "Records"));
  const size_t offset = static_cast<size_t>(Value(run, section, "MdsOffset"));
  const size_t inRecord = kPrefix + 4 * static_cast<size_t>(samples);
  ASSERT_EQ(static_cast<double>(inRecord), Value(run, section, "RecordSize"));
  const size_t outRecord = kPrefix + 8 * static_cast<size_t>(samples);
  const std::vector<uint8_t> out = synth_test::read_file(raster);
  ASSERT_EQ(out.size(), outRecord * records) << raster;
  ASSERT_LE(offset + inRecord * records, product.size());
  for (int r = 0; r < records; ++r) {
    const uint8_t* in = product.data() + offset + inRecord * r;
    const uint8_t* line = out.data() + outRecord * r;
    ASSERT_EQ(std::memcmp(in, line, kPrefix), 0) << raster << " prefix of record " << r;
    for (int s = 0; s < 2 * samples; ++s) {
      float v;
      std::memcpy(&v, line + kPrefix + 4 * s, 4);
      ASSERT_EQ(v, static_cast<float>(synth_test::be16(in + kPrefix + 2 * s)))
          << raster << " record " << r << " component " << s;
    }
  }
}

// The antenna elevation pattern of the header against the parabola in dB
// that the generator wrote into the product's pattern record of truth
// section `s`, about the calibration reference angle `referenceKey`.
void ExpectElevationPattern(const SynthRun& run, const std::string& s, const std::string& hdr,
                            const std::string& referenceKey) {
  AntennaPattern_Obj p;
  ASSERT_EQ(p.readhdr(hdr.c_str()), 0);
  ASSERT_GE(p.PatternSamples, 3);
  std::vector<float> gains(static_cast<size_t>(p.PatternSamples));
  ASSERT_EQ(p.getPatternArray(gains.data()), 0);
  const double slot = Value(run, s, "XcaSlot");
  const double centre = Value(run, "Calibration", referenceKey);
  for (int i = 0; i < p.PatternSamples; ++i) {
    const double offset = p.StartAngle + i * p.DeltaAngle - centre;
    const double db = -(0.75 + 0.05 * slot) * offset * offset;
    EXPECT_NEAR(gains[static_cast<size_t>(i)], std::pow(10.0, db / 20.0), 1e-6) << i;
  }
}

// A generated product, its number of images and the acquisition mode its
// data-set information must state.
struct Kind {
  const char* args;
  int images;
  const char* mode;
};

void PrintTo(const Kind& k, std::ostream* os) {
  *os << k.args;
}

class Extraction : public ::testing::TestWithParam<Kind> {};

TEST_P(Extraction, RastersAndHeadersOfEveryImageMatchTheTruth) {
  const Kind& kind = GetParam();
  const SynthRun run = synth_test::run_synth(kind.args);
  ASSERT_EQ(run.exit_code, 0) << synth_test::read_text(run.dir + "synth.log");
  const bool wss = Text(run, "Scene", "ProductType") == "WSS";
  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  ASSERT_EQ(ex.imageCount(), kind.images);
  const std::vector<uint8_t> product = synth_test::read_file(run.product);
  const double interval = Value(run, "Scene", "LineTimeInterval");
  const double rangeInterval = Value(run, "Scene", "RangeSpacing") / 149896229.0;
  const bool ascending = Text(run, "Scene", "Pass") == "ASCENDING";
  for (int k = 1; k <= kind.images; ++k) {
    const std::string s = (wss ? "SubSwath" : "Image") + std::to_string(k);
    SCOPED_TRACE(s);
    // A single image is named after the output itself, several are numbered.
    const std::string raster = run.dir + (kind.images == 1 ? "R" : "R" + std::to_string(k));
    const std::string hdr = raster + ".hdr";
    EXPECT_EQ(ex.rasterName(k - 1), raster);
    EXPECT_EQ(ex.headerName(k - 1), hdr);
    ExpectRasterHoldsEveryRecord(run, product, s, raster);

    DataFile df;
    ASSERT_EQ(df.read_hdr(raster.c_str()), 0);
    EXPECT_EQ(df.pixels_per_line, Value(run, s, "Samples"));
    EXPECT_EQ(df.lines_per_image, Value(run, s, "Records"));
    EXPECT_EQ(df.row_prefix, 17);
    EXPECT_EQ(df.header_offset, 0);
    EXPECT_EQ(df.cell_type, CT_FLOAT_COMPLEX);

    DataSetInfo_Obj info;
    ASSERT_EQ(info.readhdr(hdr.c_str()), 0);
    const std::string swathName = wss ? "SS" + std::to_string(k) : Text(run, s, "Swath");
    EXPECT_EQ(info.Swath, swathName);
    // The SPH descriptor: its text, at most the blanks that pad its
    // 28-character field after it, nothing of the quote or the next line.
    const std::string description = info.Description;
    EXPECT_EQ(description.substr(0, description.find_last_not_of(' ') + 1),
              wss ? "ASA WSS" : Text(run, "Scene", "Descriptor"));
    EXPECT_LE(description.size(), 28u);
    EXPECT_EQ(info.Polarization,
              Text(run, wss ? "Scene" : s, "Polarisation"));  // H/V for the second APS image
    EXPECT_EQ(info.SceneID, Text(run, "Scene", "Product"));
    EXPECT_EQ(info.OrbitConfiguration, Text(run, "Scene", "Pass"));
    EXPECT_STREQ(info.SensorName, "ASAR");
    EXPECT_STREQ(info.AcquisitionMode, kind.mode);
    EXPECT_STREQ(info.UnitType, "VOLTcomplex");
    EXPECT_STREQ(info.ImageType, "AZIMUTH FOCUSED");
    EXPECT_STREQ(info.Projection, "SLANT RANGE");
    EXPECT_NEAR(info.ExternalCalibrationFactor, Value(run, s, "ExternalCalibrationFactor"), 1e-2);

    SwathInfo swath;
    ASSERT_EQ(swath.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(swath.Acquisition_Start_Time, Value(run, s, "AcquisitionStartTime"), 1e-6);
    EXPECT_NEAR(swath.NoisePower, Value(run, s, "NoisePower"), 1e-6);
    EXPECT_NEAR(swath.ProcessorGain, Value(run, s, "ProcessorGain"), 1e-6);
    if (wss) {
      EXPECT_EQ(swath.Lines_per_burst, Value(run, s, "LinesPerBurst"));
      EXPECT_EQ(swath.Bursts, Value(run, s, "Bursts"));
      EXPECT_EQ(swath.Rank, Value(run, s, "Rank"));
      EXPECT_EQ(swath.Echoes_per_burst, Value(run, s, "EchoesPerBurst"));
      constexpr int kOrder[] = {0, 2, 4, 1, 3};  // place in the burst sequence
      EXPECT_EQ(swath.Order, kOrder[k - 1]);
      EXPECT_NEAR(swath.ChirpPower, Value(run, s, "ChirpPower"), 1e-6);
    }

    SamplingConstants_Obj sc;
    ASSERT_EQ(sc.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(sc.prf_hz, Value(run, s, "PRF"), 1e-3);
    EXPECT_NEAR(sc.bri_s, wss ? Value(run, "Scene", "BurstCycle") : 0.0, 1e-9);
    EXPECT_NEAR(sc.fc_hz, Value(run, "Scene", "CarrierFrequency"), 1e3);
    EXPECT_NEAR(sc.frg_hz, Value(run, "Scene", "RangeSamplingRate"), 1.0);
    EXPECT_NEAR(sc.Brg_hz, Value(run, s, "PulseBandwidth"), 1.0);
    SpectralWindows_Obj sw;
    ASSERT_EQ(sw.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(sw.RgLookBandwidth, Value(run, s, "RangeLookBandwidth"), 1.0);
    EXPECT_NEAR(sw.AzLookBandwidth, Value(run, s, "AzimuthLookBandwidth"), 1e-3);
    EXPECT_EQ(sw.RgMatchedFilterType, Text(run, s, "RangeWindowType"));
    EXPECT_EQ(sw.AzMatchedFilterType, Text(run, s, "AzimuthWindowType"));
    EXPECT_NEAR(sw.RgMatchedFilterCoef, Value(run, s, "RangeWindowCoefficient"), 1e-6);
    EXPECT_NEAR(sw.AzMatchedFilterCoef, Value(run, s, "AzimuthWindowCoefficient"), 1e-6);
    SARPulse_Obj pulse;
    ASSERT_EQ(pulse.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(pulse.PulseLength, Value(run, s, "PulseLength"), 1e-12);

    // The region: first and last line from the line headers (past blank
    // records, through the burst structure of a wide swath; from the SPH
    // where every line is blank) to a microsecond, and the range extent.
    // Range times are stored as float nanoseconds: half a nanosecond of
    // resolution at 5.5 ms, far below one sample (52 ns).
    const double first = Value(run, s, "FirstLineTime"), last = Value(run, s, "LastLineTime");
    const double nearTime = Value(run, s, "NearRangeTime");
    GSRoi_Obj roi;
    ASSERT_EQ(roi.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(roi.roi.SlowStartTime, first, 1e-6);
    EXPECT_NEAR(roi.roi.SlowTimeLength, last - first, 1e-6);
    EXPECT_DOUBLE_EQ(roi.roi.SlowTimeDelta, interval);
    // A wide swath's region is the zero-Doppler line grid, not its records.
    EXPECT_EQ(roi.roi.Lines, wss ? std::lround((last - first) / interval) + 1
                                 : std::lround(Value(run, s, "Records")));
    EXPECT_EQ(roi.roi.Samples, Value(run, s, "Samples"));
    EXPECT_NEAR(roi.roi.FastStartTime, nearTime, 3e-10);
    EXPECT_NEAR(roi.roi.FastTimeLength, Value(run, s, "FarRangeTime") - nearTime, 3e-10);
    EXPECT_NEAR(roi.roi.FastTimeDelta, rangeInterval, 1e-15);

    // Doppler polynomials: every record with the sub-swath's own offset
    // included; the FM rate of the image's record.
    polySAR polys;
    ASSERT_EQ(polys.readhdr(hdr.c_str()), 0);
    ASSERT_EQ(polys.ndc, Value(run, "Doppler", "Records"));
    for (int j = 0; j < polys.ndc; ++j) {
      double dopTime = 0.0, dopC0 = 0.0, dopC1 = 0.0;
      ASSERT_EQ(std::sscanf(Text(run, s, "DopplerRecord" + std::to_string(j)).c_str(),
                            "%lf %lf %lf", &dopTime, &dopC0, &dopC1),
                3);
      EXPECT_NEAR(polys.dc[j].taz0_s, dopTime, 1e-6) << j;
      EXPECT_NEAR(polys.dc[j].trg0_s, Value(run, s, "DopplerRangeTime"), 1e-12) << j;
      EXPECT_NEAR(polys.dc[j].pol[0], dopC0, 1e-3) << j;
      EXPECT_NEAR(polys.dc[j].pol[1], dopC1, std::fabs(dopC1) * 1e-6) << j;
    }
    ASSERT_EQ(polys.nfr, 1);
    const double rate[] = {Value(run, s, "FmRateC0"), Value(run, s, "FmRateC1"),
                           Value(run, s, "FmRateC2")};
    EXPECT_NEAR(polys.fr[0].pol[0], rate[0], 1e-3);
    EXPECT_NEAR(polys.fr[0].pol[1], rate[1], std::fabs(rate[1]) * 1e-6);
    EXPECT_NEAR(polys.fr[0].pol[4], rate[2], std::fabs(rate[2]) * 1e-6);
    EXPECT_NEAR(polys.fr[0].trg0_s, Value(run, s, "FmRateRangeTime"), 1e-12);

    // State vectors that span the image's lines.
    GeneralSAROrbit orbit;
    ASSERT_EQ(orbit.readhdr(hdr.c_str()), 0);
    ASSERT_GE(orbit.n(), 5);
    EXPECT_LE(orbit.t0(), first);
    EXPECT_GE(orbit.t0() + (orbit.n() - 1) * orbit.dt(), last);

    // The four corners against the generator's ground points (a
    // right-looking radar sees the west at near range on an ascending pass),
    // the centre at the middle of the image with the angles seen there and
    // the heading of the ground track.
    geoCoords_Obj gc;
    ASSERT_EQ(gc.readhdr(hdr.c_str()), 0);
    const struct {
      const geopoint& point;
      std::string truth;
    } points[] = {{ascending ? gc.SouthWest : gc.NorthEast, "FirstNear"},
                  {ascending ? gc.SouthEast : gc.NorthWest, "FirstFar"},
                  {ascending ? gc.NorthWest : gc.SouthEast, "LastNear"},
                  {ascending ? gc.NorthEast : gc.SouthWest, "LastFar"},
                  {gc.Center, "Centre"}};
    for (const auto& c : points) {
      EXPECT_LT(
          truth::SurfaceDistance(c.point.latitude, c.point.longitude,
                                 Value(run, s, c.truth + "Lat"), Value(run, s, c.truth + "Lon")),
          1.0)
          << c.truth;
    }
    // The stated incidence is taken from the geocentric direction of the
    // ground point, the generator's from the ellipsoid normal: they differ
    // by up to the difference of geocentric and geodetic latitude (0.19°).
    EXPECT_NEAR(gc.Center.incidence, Value(run, s, "CentreIncidence"), 0.2);
    EXPECT_NEAR(gc.Center.lookAngle, Value(run, s, "CentreLookAngle"), 1e-3);
    EXPECT_NEAR(info.SceneHeading, Value(run, s, "CentreHeading"), 0.1);

    // Every sub-swath has its pattern; an image-mode product's one pattern
    // table is that of its first image.
    if (wss || k == 1) {
      ExpectElevationPattern(run, s, hdr, "ReferenceAngle" + swathName);
    } else {
      AntennaPattern_Obj none;
      EXPECT_NE(none.readhdr(hdr.c_str()), 0);
    }
  }
  synth_test::remove_run(run);
}

constexpr const char* kWss = "SCANSAR";
constexpr const char* kIms = "STRIPMAP";
constexpr const char* kAps = "DOUBLE POLARIZATION";

INSTANTIATE_TEST_SUITE_P(
    Products, Extraction,
    ::testing::Values(
        Kind{"--seed 1", 5, kWss}, Kind{"--seed 5 --pass ascending --polarisation VV", 5, kWss},
        Kind{"--seed 2 --blank-start 20 --blank-end 30", 5, kWss},
        Kind{"--seed 4 --blank-start 70 --blank-end 120 --blank-zero-time", 5, kWss},
        Kind{"--seed 9 --blank-start 130 --blank-end 75 --blank-zero-time", 5, kWss},
        Kind{"--seed 6 --first-tie-sample 7 --pass ascending", 5, kWss},
        Kind{"--product IMS", 1, kIms},
        Kind{"--product IMS --seed 5 --pass ascending --polarisation VV --first-tie-sample 9", 1,
             kIms},
        Kind{"--product IMS --size small --seed 2 --blank-start 12 --blank-end 7 --blank-zero-time",
             1, kIms},
        // Every line blank: the line times come from the SPH.
        Kind{"--product IMS --seed 6 --blank-start 400", 1, kIms},
        Kind{"--product APS --seed 3", 2, kAps},
        Kind{"--product APS --seed 4 --orbit kepler --pass ascending --polarisation VV "
             "--blank-start 3 --blank-end 9",
             2, kAps}));

// Antenna pattern records that do not fit their sub-swath (one naming
// another beam, one with a gain that is not a number) are left out of its
// header; the other sub-swaths keep theirs and the run succeeds.
TEST(DamagedAntennaPatterns, RecordsThatDoNotFitAreLeftOut) {
  const SynthRun run = synth_test::run_synth("--seed 3");
  ASSERT_EQ(run.exit_code, 0);
  const std::vector<uint8_t> original = synth_test::read_file(run.product);
  std::string bytes(original.begin(), original.end());
  const size_t dsd = bytes.find("DS_NAME=\"MDS1 ANTENNA ELEV PATT ADS");
  ASSERT_NE(dsd, std::string::npos);
  const size_t offset = std::stoull(bytes.substr(bytes.find("DS_OFFSET=", dsd) + 10, 21));
  constexpr size_t kRecord = 162, kBeam = 13, kFirstGain = 104;
  bytes.replace(offset + kRecord + kBeam, 3, "SS3");
  const char quietNaN[4] = {0x7f, static_cast<char>(0xc0), 0, 0};
  bytes.replace(offset + 3 * kRecord + kFirstGain + 8, 4, quietNaN, 4);
  vlr_test::WriteFile(run.product, bytes);

  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  for (int k = 1; k <= 5; ++k) {
    SCOPED_TRACE(k);
    const std::string hdr = run.dir + "R" + std::to_string(k) + ".hdr";
    AntennaPattern_Obj none;
    if (k == 2 || k == 4)
      EXPECT_NE(none.readhdr(hdr.c_str()), 0);
    else
      ExpectElevationPattern(run, "SubSwath" + std::to_string(k), hdr,
                             "ReferenceAngleSS" + std::to_string(k));
  }
  synth_test::remove_run(run);
}

}  // namespace
