// The extraction against the generator's truth: every sample and line
// prefix of the five rasters against the product's own bytes, and the
// metadata headers against the values the generator wrote and the geometry
// it computed by itself.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cmath>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "extraction/images.h"
#include "extraction_fixture.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/geodetic.h"
#include "raster/data_file.h"
#include "runtime/suite_state.h"
#include "synth_run.h"

namespace {

using namespace extraction_test;

std::string Swath(int k) {
  return "SubSwath" + std::to_string(k);
}
class Extraction : public ::testing::TestWithParam<const char*> {};

TEST_P(Extraction, RastersAndHeadersOfEverySubSwathMatchTheTruth) {
  const SynthRun run = synth_test::run_synth(GetParam());
  ASSERT_EQ(run.exit_code, 0);
  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  ASSERT_EQ(ex.imageCount(), 5);
  const std::vector<uint8_t> product = synth_test::read_file(run.product);
  const double interval = Value(run, "Scene", "LineTimeInterval");
  const double cycle = Value(run, "Scene", "BurstCycle");
  for (int k = 1; k <= 5; ++k) {
    SCOPED_TRACE(Swath(k));
    const std::string s = Swath(k);
    const std::string raster = run.dir + "R" + std::to_string(k);
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

    SwathInfo swath;
    ASSERT_EQ(swath.readhdr(hdr.c_str()), 0);
    EXPECT_EQ(swath.Lines_per_burst, Value(run, s, "LinesPerBurst"));
    EXPECT_EQ(swath.Bursts, Value(run, s, "Bursts"));
    EXPECT_EQ(swath.Rank, Value(run, s, "Rank"));
    EXPECT_EQ(swath.Echoes_per_burst, Value(run, s, "EchoesPerBurst"));
    constexpr int kOrder[] = {0, 2, 4, 1, 3};
    EXPECT_EQ(swath.Order, kOrder[k - 1]);
    EXPECT_NEAR(swath.Acquisition_Start_Time, Value(run, s, "AcquisitionStartTime"), 1e-6);
    EXPECT_NEAR(swath.ChirpPower, Value(run, s, "ChirpPower"), 1e-6);
    EXPECT_NEAR(swath.NoisePower, Value(run, s, "NoisePower"), 1e-6);

    ExpectSamplingWindowsAndPulse(run, s, hdr, cycle);

    // The region: the zero-Doppler line grid of the sub-swath.
    const double first = Value(run, s, "FirstLineTime");
    const double last = Value(run, s, "LastLineTime");
    const double nearTime = Value(run, s, "NearRangeTime");
    GSRoi_Obj roi;
    ASSERT_EQ(roi.readhdr(hdr.c_str()), 0);
    // The grid stores range times as float nanoseconds: half a nanosecond
    // of resolution at 5.5 ms, far below one sample (52 ns).
    EXPECT_NEAR(roi.roi.FastStartTime, nearTime, 3e-10);
    EXPECT_NEAR(roi.roi.SlowStartTime, first, 1e-6);
    EXPECT_NEAR(roi.roi.SlowTimeLength, last - first, 1e-6);
    EXPECT_DOUBLE_EQ(roi.roi.SlowTimeDelta, interval);
    EXPECT_EQ(roi.roi.Lines, std::lround((last - first) / interval) + 1);

    // Polynomials: the sub-swath's own Doppler offset and the FM rate.
    polySAR polys;
    ASSERT_EQ(polys.readhdr(hdr.c_str()), 0);
    ASSERT_GE(polys.ndc, 1);
    // "DopplerRecord0": reference time, then the coefficients of the
    // sub-swath with its offset included.
    double dopTime = 0.0, dopC0 = 0.0, dopC1 = 0.0;
    ASSERT_EQ(std::sscanf(Text(run, s, "DopplerRecord0").c_str(), "%lf %lf %lf", &dopTime, &dopC0,
                          &dopC1),
              3);
    EXPECT_NEAR(polys.dc[0].taz0_s, dopTime, 1e-6);
    EXPECT_NEAR(polys.dc[0].trg0_s, Value(run, s, "DopplerRangeTime"), 1e-12);
    EXPECT_NEAR(polys.dc[0].pol[0], dopC0, 1e-3);
    EXPECT_NEAR(polys.dc[0].pol[1], dopC1, std::fabs(dopC1) * 1e-6);
    ExpectFmRateAndOrbitSpan(run, s, polys, hdr, first, last);

    // Corners and centre.
    geoCoords_Obj gc;
    ASSERT_EQ(gc.readhdr(hdr.c_str()), 0);
    const bool ascending = Text(run, "Scene", "Pass") == "ASCENDING";
    // A right-looking radar sees the west at near range on an ascending pass.
    const struct {
      const geopoint& point;
      const char* truth;
    } corners[] = {{ascending ? gc.SouthWest : gc.NorthEast, "FirstNear"},
                   {ascending ? gc.SouthEast : gc.NorthWest, "FirstFar"},
                   {ascending ? gc.NorthWest : gc.SouthEast, "LastNear"},
                   {ascending ? gc.NorthEast : gc.SouthWest, "LastFar"}};
    for (const auto& c : corners) {
      EXPECT_LT(
          Distance(c.point.latitude, c.point.longitude, Value(run, s, std::string(c.truth) + "Lat"),
                   Value(run, s, std::string(c.truth) + "Lon")),
          1.0)
          << c.truth;
    }
    // The centre at the middle of the image, with the angles seen there and
    // the heading of the ground track.
    EXPECT_LT(Distance(gc.Center.latitude, gc.Center.longitude, Value(run, s, "CentreLat"),
                       Value(run, s, "CentreLon")),
              1.0);
    // The stated incidence is taken from the geocentric direction of the
    // ground point, the generator's from the ellipsoid normal: they differ
    // by up to the difference of geocentric and geodetic latitude (0.19°).
    EXPECT_NEAR(gc.Center.incidence, Value(run, s, "CentreIncidence"), 0.2);
    EXPECT_NEAR(gc.Center.lookAngle, Value(run, s, "CentreLookAngle"), 1e-3);
    DataSetInfo_Obj info;
    ASSERT_EQ(info.readhdr(hdr.c_str()), 0);
    EXPECT_NEAR(info.SceneHeading, Value(run, s, "CentreHeading"), 0.1);
  }
  synth_test::remove_run(run);
}

INSTANTIATE_TEST_SUITE_P(
    Products, Extraction,
    ::testing::Values("--seed 1", "--seed 5 --pass ascending --polarisation VV",
                      "--seed 2 --blank-start 20 --blank-end 30",
                      "--seed 4 --blank-start 70 --blank-end 120 --blank-zero-time",
                      "--seed 6 --first-tie-sample 7 --pass ascending"));

// First and last line times from the burst structure of every sub-swath,
// whatever blank records stand at either end, against the generator's
// times of the first line of the first burst and the last of the last.
TEST(LineTimes, BurstStructureGivesTheFirstAndLastLineToAMicrosecond) {
  for (const char* args : {"--seed 8", "--seed 9 --blank-start 10 --blank-end 5",
                           "--seed 9 --blank-start 130 --blank-end 75 --blank-zero-time"}) {
    SCOPED_TRACE(args);
    const SynthRun run = synth_test::run_synth(args);
    ASSERT_EQ(run.exit_code, 0);
    for (int k = 1; k <= 5; ++k) {
      const std::string s = Swath(k);
      LineTiming timing;
      timing.lineInterval = Value(run, "Scene", "LineTimeInterval");
      timing.linesPerBurst = static_cast<int>(Value(run, s, "LinesPerBurst"));
      timing.burstCycle = Value(run, "Scene", "BurstCycle");
      timing.firstLineText = Text(run, "Scene", "SensingStartText");
      timing.lastLineText = Text(run, "Scene", "SensingStopText");
      const int64_t samples = static_cast<int64_t>(Value(run, s, "Samples"));
      double first = 0.0, last = 0.0;
      ASSERT_EQ(
          get_first_last(run.product.c_str(), static_cast<int64_t>(Value(run, s, "MdsOffset")),
                         17 + 4 * samples, static_cast<int64_t>(Value(run, s, "Records")), timing,
                         true, &first, &last),
          0);
      EXPECT_NEAR(first, Value(run, s, "FirstLineTime"), 1e-6) << s;
      EXPECT_NEAR(last, Value(run, s, "LastLineTime"), 1e-6) << s;
    }
    synth_test::remove_run(run);
  }
}

// GDAL's ENVISAT reader on the same product: its copy of the first
// measurement data set equals the samples of raster 1.
TEST(GdalAgrees, SamplesOfTheFirstSubSwath) {
  if (synth_test::shell("command -v gdal_translate >/dev/null 2>&1") != 0) {
    GTEST_SKIP() << "gdal-bin is not installed";
  }
  const SynthRun run = synth_test::run_synth("--size small --seed 11 --pass ascending");
  ASSERT_EQ(run.exit_code, 0);
  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex, kNoOrbit), 0);
  const std::string raw = run.dir + "gdal_ss1.bin";
  ASSERT_EQ(synth_test::shell("gdal_translate -q -ot CFloat32 -of ENVI -b 1 '" + run.product +
                              "' " + raw + " > /dev/null 2>&1"),
            0);
  const std::vector<uint8_t> gdal = synth_test::read_file(raw);
  const std::vector<uint8_t> ours = synth_test::read_file(run.dir + "R1");
  const size_t samples = static_cast<size_t>(Value(run, "SubSwath1", "Samples"));
  const size_t records = static_cast<size_t>(Value(run, "SubSwath1", "Records"));
  ASSERT_EQ(gdal.size(), samples * records * 8);
  ASSERT_EQ(ours.size(), (kPrefix + samples * 8) * records);
  size_t mismatches = 0;
  for (size_t r = 0; r < records; ++r) {
    if (std::memcmp(&gdal[r * samples * 8], &ours[r * (kPrefix + samples * 8) + kPrefix],
                    samples * 8) != 0) {
      ++mismatches;
    }
  }
  EXPECT_EQ(mismatches, 0u);
  synth_test::remove_run(run);
}

// Damaged products: a documented code, and no raster or header left that
// could pass for a complete one.
TEST(BadProducts, RefusedWithACodeAndNoOutputLeft) {
  const struct {
    const char* args;
    int code;
  } cases[] = {
      {"--truncate 300000", 4},   // inside the measurement data
      {"--truncate 20000", 4},    // inside the annotation
      {"--dsd-beyond-end 1", 4},  // main processing parameters
      {"--dsd-beyond-end 9", 4},  // third measurement data set
      {"--zero-count 1", 1},      // no main processing parameters
      {"--zero-count 5", 1},      // no geolocation grid
      {"--mds-count 4", 1},       // four sub-swaths
      {"--wrong-type ASA_IMS_1P", 1},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.args);
    const SynthRun run = synth_test::run_synth(c.args);
    ASSERT_EQ(run.exit_code, 0);
    images_conf conf;
    images ex(conf);
    EXPECT_EQ(Extract(run, conf, &ex), c.code);
    for (int k = 1; k <= 5; ++k) {
      EXPECT_FALSE(Exists(run.dir + "R" + std::to_string(k))) << k;
      EXPECT_FALSE(Exists(run.dir + "R" + std::to_string(k) + ".hdr")) << k;
    }
    synth_test::remove_run(run);
  }
}

// Antenna pattern records that do not fit their sub-swath (one naming
// another beam, one with a gain that is not a number) are left out of its
// header; the other sub-swaths keep theirs and the run succeeds.
TEST(BadProducts, AntennaPatternRecordsThatDoNotFitAreLeftOut) {
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
  std::FILE* f = std::fopen(run.product.c_str(), "wb");
  ASSERT_NE(f, nullptr);
  ASSERT_EQ(std::fwrite(bytes.data(), 1, bytes.size(), f), bytes.size());
  ASSERT_EQ(std::fclose(f), 0);

  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  for (int k = 1; k <= 5; ++k) {
    SCOPED_TRACE(Swath(k));
    const std::string hdr = run.dir + "R" + std::to_string(k) + ".hdr";
    if (k == 2 || k == 4) {
      AntennaPattern_Obj none;
      EXPECT_NE(none.readhdr(hdr.c_str()), 0);
    } else {
      ExpectElevationPattern(run, Swath(k), hdr, "ReferenceAngleSS" + std::to_string(k));
    }
  }
  synth_test::remove_run(run);
}

// Annotation that is only warned about: without Doppler records the
// headers hold no Doppler polynomial, and the run succeeds.
TEST(BadProducts, MissingDopplerRecordsOnlyLeaveTheDopplerOut) {
  const SynthRun run = synth_test::run_synth("--zero-count 2");
  ASSERT_EQ(run.exit_code, 0);
  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  polySAR polys;
  ASSERT_EQ(polys.readhdr((run.dir + "R3.hdr").c_str()), 0);
  EXPECT_EQ(polys.ndc, 0);
  EXPECT_EQ(polys.nfr, 1);
  synth_test::remove_run(run);
}

}  // namespace
