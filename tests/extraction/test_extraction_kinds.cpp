// The extraction of image-mode products against the generator's truth: a
// single-image stripmap product (IMS) and an alternating-polarisation one
// with two images (APS).  Every sample and line prefix of every raster
// against the product's own bytes, the names of rasters and headers, and the
// metadata against the values the generator wrote and the geometry it
// computed by itself.
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
#include "profile/profile.h"
#include "raster/cell_type.h"
#include "raster/data_file.h"
#include "synth_run.h"

namespace {

using namespace extraction_test;

std::string Image(int k) {
  return "Image" + std::to_string(k);
}
// A generated product and what the data-set information of its images must
// say: the acquisition mode of its kind and the polarisation of each image.
struct Kind {
  const char* args;
  int images;
  const char* mode;
  const char* polarisations[2];
};

void PrintTo(const Kind& k, std::ostream* os) {
  *os << k.args;
}

class ImageModeProducts : public ::testing::TestWithParam<Kind> {};

TEST_P(ImageModeProducts, RastersAndHeadersOfEveryImageMatchTheTruth) {
  const Kind& kind = GetParam();
  const SynthRun run = synth_test::run_synth(kind.args);
  ASSERT_EQ(run.exit_code, 0) << synth_test::read_text(run.dir + "synth.log");
  ASSERT_EQ(Value(run, "Scene", "Images"), kind.images);
  images_conf conf;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  ASSERT_EQ(ex.imageCount(), kind.images);
  const std::vector<uint8_t> product = synth_test::read_file(run.product);
  const double interval = Value(run, "Scene", "LineTimeInterval");
  const double rangeInterval = Value(run, "Scene", "RangeSpacing") / kHalfSpeedOfLight;
  const bool ascending = Text(run, "Scene", "Pass") == "ASCENDING";
  for (int k = 1; k <= kind.images; ++k) {
    const std::string s = Image(k);
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
    EXPECT_STREQ(info.Swath, "IS2");
    EXPECT_STREQ(info.Swath, Text(run, s, "Swath").c_str());
    // The SPH descriptor: its text, at most the blanks that pad its
    // 28-character field after it, nothing of the quote or the next line.
    const std::string description = info.Description;
    const std::string descriptor = Text(run, "Scene", "Descriptor");
    EXPECT_EQ(description.substr(0, description.find_last_not_of(' ') + 1), descriptor);
    EXPECT_LE(description.size(), 28u);
    EXPECT_STREQ(info.Polarization, kind.polarisations[k - 1]);
    EXPECT_STREQ(info.Polarization, Text(run, s, "Polarisation").c_str());
    EXPECT_STREQ(info.SceneID, Text(run, "Scene", "Product").c_str());
    EXPECT_STREQ(info.OrbitConfiguration, Text(run, "Scene", "Pass").c_str());
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

    ExpectSamplingWindowsAndPulse(run, s, hdr, 0.0);  // no bursts

    // First and last line from the line headers (or, where every line is
    // blank, from the SPH), to a microsecond.
    const double first = Value(run, s, "FirstLineTime");
    const double last = Value(run, s, "LastLineTime");
    LineTiming timing;
    timing.lineInterval = interval;
    timing.firstLineText = Text(run, "Scene", "SensingStartText");
    timing.lastLineText = Text(run, "Scene", "SensingStopText");
    double readFirst = 0.0, readLast = 0.0;
    ASSERT_EQ(get_first_last(run.product.c_str(), static_cast<int64_t>(Value(run, s, "MdsOffset")),
                             static_cast<int64_t>(Value(run, s, "RecordSize")),
                             static_cast<int64_t>(Value(run, s, "Records")), timing, false,
                             &readFirst, &readLast),
              0);
    EXPECT_NEAR(readFirst, first, 1e-6);
    EXPECT_NEAR(readLast, last, 1e-6);

    // The region: every record one line interval apart from the near range.
    const double nearTime = Value(run, s, "NearRangeTime");
    GSRoi_Obj roi;
    ASSERT_EQ(roi.readhdr(hdr.c_str()), 0);
    EXPECT_EQ(roi.roi.Lines, Value(run, s, "Records"));
    EXPECT_EQ(roi.roi.Samples, Value(run, s, "Samples"));
    // Range times are stored as float nanoseconds: half a nanosecond of
    // resolution at 5.6 ms, far below one sample (52 ns).
    EXPECT_NEAR(roi.roi.FastStartTime, nearTime, 3e-10);
    EXPECT_NEAR(roi.roi.FastTimeLength, Value(run, s, "FarRangeTime") - nearTime, 3e-10);
    EXPECT_NEAR(roi.roi.FastTimeDelta, rangeInterval, 1e-15);
    EXPECT_DOUBLE_EQ(roi.roi.SlowTimeDelta, interval);
    EXPECT_NEAR(roi.roi.SlowTimeLength, last - first, 1e-6);

    // Doppler polynomials: the records' own coefficients (no sub-swath
    // offset), and the FM rate of the image's record.
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
    ExpectFmRateAndOrbitSpan(run, s, polys, hdr, first, last);

    // The four corners against the generator's ground points, the centre at
    // the middle of the image and the heading of the ground track there.
    geoCoords_Obj gc;
    ASSERT_EQ(gc.readhdr(hdr.c_str()), 0);
    const struct {
      const geopoint& point;
      const char* corner;
    } corners[] = {
        {ascending ? gc.SouthWest : gc.NorthEast, "FirstNear"},
        {ascending ? gc.SouthEast : gc.NorthWest, "FirstFar"},
        {ascending ? gc.NorthWest : gc.SouthEast, "LastNear"},
        {ascending ? gc.NorthEast : gc.SouthWest, "LastFar"},
    };
    for (const auto& c : corners) {
      EXPECT_LT(Distance(c.point.latitude, c.point.longitude,
                         Value(run, s, std::string(c.corner) + "Lat"),
                         Value(run, s, std::string(c.corner) + "Lon")),
                1.0)
          << c.corner;
    }
    EXPECT_LT(Distance(gc.Center.latitude, gc.Center.longitude, Value(run, s, "CentreLat"),
                       Value(run, s, "CentreLon")),
              1.0);
    EXPECT_NEAR(info.SceneHeading, Value(run, s, "CentreHeading"), 0.1);

    // The product's one antenna pattern table is that of the first image.
    if (k == 1) {
      ExpectElevationPattern(run, s, hdr, "ReferenceAngle" + Text(run, s, "Swath"));
    } else {
      AntennaPattern_Obj none;
      EXPECT_NE(none.readhdr(hdr.c_str()), 0);
    }
  }
  synth_test::remove_run(run);
}

INSTANTIATE_TEST_SUITE_P(
    Products, ImageModeProducts,
    ::testing::Values(
        Kind{"--product IMS", 1, "STRIPMAP", {"H/H", nullptr}},
        Kind{"--product IMS --seed 5 --pass ascending --polarisation VV --first-tie-sample 9",
             1,
             "STRIPMAP",
             {"V/V", nullptr}},
        Kind{"--product IMS --size small --seed 2 --blank-start 12 --blank-end 7 --blank-zero-time",
             1,
             "STRIPMAP",
             {"H/H", nullptr}},
        // Every line blank: the line times come from the SPH.
        Kind{"--product IMS --seed 6 --blank-start 400", 1, "STRIPMAP", {"H/H", nullptr}},
        Kind{"--product APS --seed 3", 2, "DOUBLE POLARIZATION", {"H/H", "H/V"}},
        Kind{"--product APS --seed 4 --orbit kepler --pass ascending --polarisation VV "
             "--blank-start 3 --blank-end 9",
             2,
             "DOUBLE POLARIZATION",
             {"V/V", "V/H"}}));

// Without the copy a single image is described where it lies: the raster
// is the product itself and its header the product's name with ".hdr",
// describing the first measurement data set inside the product.
TEST(WithoutExtraction, SingleImageProductIsDescribedInPlace) {
  const SynthRun run = synth_test::run_synth("--product IMS --seed 8");
  ASSERT_EQ(run.exit_code, 0);
  const std::vector<uint8_t> before = synth_test::read_file(run.product);
  images_conf conf;
  conf.ExtractData = 0;
  images ex(conf);
  ASSERT_EQ(Extract(run, conf, &ex), 0);
  ASSERT_EQ(ex.imageCount(), 1);
  EXPECT_EQ(ex.rasterName(0), run.product);
  EXPECT_EQ(ex.headerName(0), run.product + ".hdr");
  EXPECT_TRUE(Exists(run.product + ".hdr"));
  EXPECT_FALSE(Exists(run.dir + "R"));
  EXPECT_FALSE(Exists(run.dir + "R.hdr"));
  EXPECT_EQ(synth_test::read_file(run.product), before);
  DataFile df;
  ASSERT_EQ(df.read_hdr(run.product.c_str()), 0);
  EXPECT_EQ(df.pixels_per_line, Value(run, "Image1", "Samples"));
  EXPECT_EQ(df.lines_per_image, Value(run, "Image1", "Records"));
  EXPECT_EQ(df.row_prefix, 17);
  EXPECT_EQ(df.header_offset, Value(run, "Image1", "MdsOffset"));
  EXPECT_EQ(df.cell_type, CT_SHORT_COMPLEX);
  EXPECT_EQ(df.byte_order, 1);  // big-endian, as in the product
  DataSetInfo_Obj info;
  ASSERT_EQ(info.readhdr((run.product + ".hdr").c_str()), 0);
  EXPECT_STREQ(info.Swath, "IS2");
  synth_test::remove_run(run);
}

// A run without the copy that fails once the names are set (its orbit file
// ends a month before the scene) removes the header it began, and never the
// product, which is its raster.
TEST(WithoutExtraction, FailingRunRemovesItsHeaderButNeverTheProduct) {
  const SynthRun run = synth_test::run_synth("--product IMS --seed 9");
  ASSERT_EQ(run.exit_code, 0);
  const std::vector<uint8_t> before = synth_test::read_file(run.product);
  images_conf conf;
  conf.ExtractData = 0;
  images ex(conf);
  EXPECT_NE(Extract(run, conf, &ex, vlr_test::kSamplePor.c_str()), 0);
  EXPECT_EQ(ex.rasterName(0), run.product);  // the failure came after the names
  EXPECT_EQ(synth_test::read_file(run.product), before);
  EXPECT_FALSE(Exists(run.product + ".hdr"));
  synth_test::remove_run(run);
}

// Damaged image-mode products: a documented code, and no raster or header
// left that could pass for a complete one (for APS also none of the first
// image when the second fails).
TEST(BadImageModeProducts, RefusedWithACodeAndNoOutputLeft) {
  const struct {
    const char* args;
    int code;
  } cases[] = {
      {"--product IMS --zero-count 2", 1},       // no main processing parameters
      {"--product IMS --zero-count 8", 1},       // no geolocation grid
      {"--product IMS --dsd-beyond-end 10", 4},  // first MDS
      {"--product IMS --truncate 100000", 4},    // inside the measurement data
      {"--product APS --dsd-beyond-end 2", 4},   // main processing parameters
      {"--product APS --dsd-beyond-end 11", 4},  // second MDS
      {"--product APS --truncate 400000", 4},    // inside the second MDS
      {"--product IMS --truncate 9000", 4},      // inside the annotation
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.args);
    const SynthRun run = synth_test::run_synth(c.args);
    ASSERT_EQ(run.exit_code, 0);
    images_conf conf;
    images ex(conf);
    EXPECT_EQ(Extract(run, conf, &ex), c.code);
    for (const char* name : {"R", "R1", "R2"}) {
      EXPECT_FALSE(Exists(run.dir + name)) << name;
      EXPECT_FALSE(Exists(run.dir + name + ".hdr")) << name;
    }
    synth_test::remove_run(run);
  }
}

}  // namespace

namespace {

// The three parameter blocks read from a hand-written file: every key but
// "ExtractData" is required, and a missing one fails the read.
TEST(ImagesParameters, BlocksReadFromAParameterFile) {
  char pattern[] = "/tmp/vlr_images_par_XXXXXX";
  ASSERT_NE(mkdtemp(pattern), nullptr);
  const std::string file = std::string(pattern) + "/images.par";
  const auto write = [&](const std::string& text) {
    FreeProfile(file.c_str());
    std::FILE* f = std::fopen(file.c_str(), "w");
    ASSERT_NE(f, nullptr);
    std::fputs(text.c_str(), f);
    std::fclose(f);
  };
  const std::string conf =
      "[imagesConfiguration]\nMemory = 512\nReportLevel = 3\nReportFilename = r.txt\n"
      "Incore = 1\nVerbose = 1\n";
  write(conf +
        "\n[imagesInput]\nASA_level1_filename = p.N1\nASA_dor_vor = orbit\n"
        "ASA_INS_Filename = ins\n\n[imagesOutput]\nOutputFile = out/R\n");
  images_conf c;
  images_input in;
  images_output out;
  ASSERT_EQ(c.readpar(file.c_str()), 0);
  EXPECT_EQ(c.Memory, 512);
  EXPECT_EQ(c.ReportLevel, 3);
  EXPECT_STREQ(c.ReportFilename, "r.txt");
  EXPECT_EQ(c.Verbose, 1);
  EXPECT_EQ(c.ExtractData, 1);  // optional, keeps its default
  ASSERT_EQ(in.readpar(file.c_str()), 0);
  EXPECT_STREQ(in.ASA_dor_vor, "orbit");
  EXPECT_EQ(in.checkpar(), 0);
  ASSERT_EQ(out.readpar(file.c_str()), 0);
  EXPECT_STREQ(out.OutputFile, "out/R");

  write(
      "[imagesConfiguration]\nMemory = 512\nReportLevel = 3\nIncore = 1\nVerbose = 1\n"
      "ExtractData = 0\n");
  images_conf missing;
  EXPECT_EQ(missing.readpar(file.c_str()), 1);  // no ReportFilename
  EXPECT_EQ(missing.ExtractData, 0);
  EXPECT_EQ(images_input().readpar(file.c_str()), 1);
  EXPECT_EQ(images_output().readpar(file.c_str()), 1);
  FreeProfile(file.c_str());
  synth_test::shell("rm -rf '" + std::string(pattern) + "'");
}

}  // namespace
