// Products the extraction must refuse or only partly trust, the run without
// the copy, and the parameter blocks.
#include <cstdio>
#include <string>
#include <vector>

#include "extraction_fixture.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/poly_sar.h"
#include "raster/cell_type.h"
#include "raster/data_file.h"

namespace {

using namespace extraction_test;

// Damaged products: a documented code, and no raster or header left that
// could pass for a complete one (for a product of several images also none
// of the images before the one that fails).
TEST(BadProducts, RefusedWithACodeAndNoOutputLeft) {
  const struct {
    const char* args;
    int code;
  } cases[] = {
      {"--truncate 300000", 4},                  // inside the measurement data
      {"--truncate 20000", 4},                   // inside the annotation
      {"--dsd-beyond-end 1", 4},                 // main processing parameters
      {"--dsd-beyond-end 9", 4},                 // third measurement data set
      {"--zero-count 1", 1},                     // no main processing parameters
      {"--zero-count 5", 1},                     // no geolocation grid
      {"--mds-count 4", 1},                      // four sub-swaths
      {"--wrong-type ASA_IMS_1P", 1},            //
      {"--product IMS --zero-count 2", 1},       // no main processing parameters
      {"--product IMS --zero-count 8", 1},       // no geolocation grid
      {"--product IMS --dsd-beyond-end 10", 4},  // first MDS
      {"--product IMS --truncate 100000", 4},    // inside the measurement data
      {"--product IMS --truncate 9000", 4},      // inside the annotation
      {"--product APS --dsd-beyond-end 2", 4},   // main processing parameters
      {"--product APS --dsd-beyond-end 11", 4},  // second MDS
      {"--product APS --truncate 400000", 4},    // inside the second MDS
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.args);
    const SynthRun run = synth_test::run_synth(c.args);
    ASSERT_EQ(run.exit_code, 0);
    images_conf conf;
    images ex(conf);
    EXPECT_EQ(Extract(run, conf, &ex), c.code);
    for (const char* name : {"R", "R1", "R2", "R3", "R4", "R5"}) {
      EXPECT_FALSE(Exists(run.dir + name)) << name;
      EXPECT_FALSE(Exists(run.dir + name + ".hdr")) << name;
    }
    synth_test::remove_run(run);
  }
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

// Without the copy a single image is described where it lies: the raster
// is the product itself and its header the product's name with ".hdr",
// describing the first measurement data set inside the product.  A run
// that fails once the names are set (its orbit file ends a month before the
// scene) removes the header it began, and never the product.
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
  EXPECT_EQ(info.Swath, Text(run, "Image1", "Swath"));

  images_conf failing;
  failing.ExtractData = 0;
  images late(failing);
  EXPECT_NE(Extract(run, failing, &late, vlr_test::kSamplePor.c_str()), 0);
  EXPECT_EQ(late.rasterName(0), run.product);  // the failure came after the names
  EXPECT_EQ(synth_test::read_file(run.product), before);
  EXPECT_FALSE(Exists(run.product + ".hdr"));
  synth_test::remove_run(run);
}

// The three parameter blocks read from a hand-written file: every key but
// "ExtractData" is required, and a missing one fails the read.
TEST(ImagesParameters, BlocksReadFromAParameterFile) {
  char pattern[] = "/tmp/vlr_images_par_XXXXXX";
  ASSERT_NE(mkdtemp(pattern), nullptr);
  const std::string full = std::string(pattern) + "/full.par";
  const std::string part = std::string(pattern) + "/part.par";
  vlr_test::WriteFile(
      full,
      "[imagesConfiguration]\nMemory = 512\nReportLevel = 3\nReportFilename = r.txt\n"
      "Incore = 1\nVerbose = 1\n\n[imagesInput]\nASA_level1_filename = p.N1\n"
      "ASA_dor_vor = orbit\nASA_INS_Filename = ins\n\n[imagesOutput]\nOutputFile = out/R\n");
  vlr_test::WriteFile(part,
                      "[imagesConfiguration]\nMemory = 512\nReportLevel = 3\nIncore = 1\n"
                      "Verbose = 1\nExtractData = 0\n");
  images_conf c;
  images_input in;
  images_output out;
  ASSERT_EQ(c.readpar(full.c_str()), 0);
  EXPECT_EQ(c.Memory, 512);
  EXPECT_STREQ(c.ReportFilename, "r.txt");
  EXPECT_EQ(c.ExtractData, 1);  // optional, keeps its default
  ASSERT_EQ(in.readpar(full.c_str()), 0);
  EXPECT_STREQ(in.ASA_dor_vor, "orbit");
  ASSERT_EQ(out.readpar(full.c_str()), 0);
  EXPECT_STREQ(out.OutputFile, "out/R");

  images_conf missing;
  EXPECT_EQ(missing.readpar(part.c_str()), 1);  // no ReportFilename
  EXPECT_EQ(missing.ExtractData, 0);
  EXPECT_EQ(images_input().readpar(part.c_str()), 1);
  EXPECT_EQ(images_output().readpar(part.c_str()), 1);
  synth_test::shell("rm -rf '" + std::string(pattern) + "'");
}

}  // namespace
