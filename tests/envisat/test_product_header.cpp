#include <gtest/gtest.h>

#include <cmath>
#include <cstdio>
#include <cstring>
#include <fstream>
#include <string>
#include <utility>
#include <vector>

#include "envisat/product_header.h"
#include "synth_run.h"

using synth_test::remove_run;
using synth_test::run_synth;
using synth_test::SynthRun;

namespace {

// A data set descriptor as the format writes it, at the start of `dsd`.
void PutDsd(char* dsd, long long offset, long long size, long long records, long long recordSize) {
  char text[281];
  std::snprintf(text, sizeof text,
                "DS_NAME=\"%-28s\"\nDS_TYPE=M\nFILENAME=\"%-62s\"\n"
                "DS_OFFSET=%+021lld<bytes>\nDS_SIZE=%+021lld<bytes>\nNUM_DSR=%+011lld\n"
                "DSR_SIZE=%+011lld<bytes>\n%32s\n",
                "DATA SET", "", offset, size, records, recordSize, "");
  ASSERT_EQ(std::strlen(text), 280u);
  std::memcpy(dsd, text, 280);
}

double truth(const SynthRun& r, const char* s, const char* k) {
  return std::stod(r.truth.at(s).at(k));
}

// The header values of a generated product, as its truth states them.
TEST(ProductHeader, GeneratedProductAsItsTruthStates) {
  const SynthRun run = run_synth("--orbit kepler --polarisation VV --pass ascending");
  ASSERT_EQ(run.exit_code, 0);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(run.product.c_str(), &h), 0);
  const auto& scene = run.truth.at("Scene");
  EXPECT_EQ(h.product, scene.at("Product"));
  EXPECT_EQ(h.productType, "WSS");
  EXPECT_TRUE(h.wss);
  EXPECT_FALSE(h.aps || h.apm || h.app || h.wsm || h.gm1);
  EXPECT_EQ(h.sensingStart, scene.at("SensingStartText"));
  EXPECT_EQ(h.sensingStop, scene.at("SensingStopText"));
  EXPECT_EQ(h.acquisitionStation, "PDHS-K");
  EXPECT_EQ(h.softwareVer, "ASAR/4.05");
  EXPECT_EQ(std::stoi(h.absOrbit), std::stoi(scene.at("AbsOrbit")));
  EXPECT_EQ(std::stoi(h.relOrbit), std::stoi(scene.at("RelOrbit")));
  EXPECT_EQ(h.lastLineTime, scene.at("SensingStopText"));
  EXPECT_EQ(h.swath, "WS");
  EXPECT_EQ(h.sampleType, "COMPLEX");
  EXPECT_EQ(h.mds1Polar, "V/V");
  EXPECT_EQ(h.dataType, "SWOR");
  ASSERT_TRUE(h.spacingsValid);
  EXPECT_NEAR(h.rangeSpacing, truth(run, "Scene", "RangeSpacing"), 1e-6);
  EXPECT_NEAR(h.lineTimeInterval, truth(run, "Scene", "LineTimeInterval"), 1e-9);
  EXPECT_NEAR(h.azimuthSpacing, truth(run, "Scene", "AzimuthSpacing"), 1e-4);
  EXPECT_EQ(h.fileSize, truth(run, "Scene", "TotalSize"));
  // The tables sit where the wide-swath layout puts them (record sizes of
  // the format); the image data sets are checked through the extraction.
  const EnvisatDsdLayout& l = h.layout();
  const std::pair<size_t, int64_t> tables[] = {{l.mainProcessing, 2009},
                                               {l.doppler, 55},
                                               {l.chirp, 1483},
                                               {l.antenna, 162},
                                               {l.geolocation, 521}};
  for (const auto& [at, dsr] : tables) EXPECT_EQ(h.dataSet(at).dsrSize, dsr) << at;
  EnvisatDataSet mds[5];
  EXPECT_EQ(h.imageDataSets(mds), 5);
  remove_run(run);
}

// A product of headers only, encoded here from the published layout: MPH
// with the product name, SPH with the three spacings and well-formed
// descriptors in every slot of the wide-swath layout.
const std::string kWssName = "ASA_WSS_1PNPDK20080302_100000_000000602066_00000_31395_0000.N1";

struct HandmadeProduct {
  std::string mph = std::string(1247, ' ');
  std::string sph = std::string(6099, ' ');
  explicit HandmadeProduct(const std::string& name) {
    mph.replace(0, 9, "PRODUCT=\"");
    mph.replace(9, name.size(), name);
    sph.replace(856, 14, "RANGE_SPACING=");
    sph.replace(870, 18, "+7.80397367e+00<m>");
    sph.replace(889, 16, "AZIMUTH_SPACING=");
    sph.replace(905, 18, "+4.04000000e+00<m>");
    sph.replace(924, 19, "LINE_TIME_INTERVAL=");
    sph.replace(943, 18, "+1.21515000e-02<s>");
    const struct {
      size_t at;
      long long records, recordSize;
    } dsds[] = {{1339, 5, 2009},   {1619, 3, 55},     {1899, 5, 1483},   {2179, 5, 162},
                {2459, 11, 521},   {3019, 100, 2017}, {3299, 100, 2417}, {3579, 100, 1617},
                {3859, 100, 2817}, {4139, 100, 2217}};
    long long offset = 7346;
    for (const auto& d : dsds) {
      PutDsd(&sph[d.at], offset, d.records * d.recordSize, d.records, d.recordSize);
      offset += d.records * d.recordSize;
    }
  }
  std::string write(const std::string& path) const {
    std::ofstream(path, std::ios::binary) << mph << sph;
    return path;
  }
};

TEST(ProductHeader, HostileDescriptorsAreCaught) {
  // A descriptor pointing beyond the end, and a table with no records.
  HandmadeProduct wss(kWssName);
  PutDsd(&wss.sph[2459], 99999999, 11 * 521, 11, 521);
  PutDsd(&wss.sph[1619], 0, 0, 0, 55);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(wss.write(testing::TempDir() + "hostile").c_str(), &h), 0);
  const EnvisatDataSet geo = h.dataSet(h.layout().geolocation);
  EXPECT_TRUE(geo.valid);
  EXPECT_FALSE(geo.fitsIn(h.fileSize));
  const EnvisatDataSet dop = h.dataSet(h.layout().doppler);
  EXPECT_EQ(dop.numDsr, 0);
  EXPECT_FALSE(dop.present());

  // Negative numbers in descriptor fields read as absent.
  EnvisatHeaders g;
  std::memset(g.sph, ' ', sizeof g.sph);
  PutDsd(g.sph + 1619, -1625, 55, 1, 55);
  EXPECT_FALSE(g.dataSet(1619).valid);
  PutDsd(g.sph + 1619, 1625, 55, 1, 55);
  EXPECT_TRUE(g.dataSet(1619).fitsIn(1625 + 55));
  EXPECT_FALSE(g.dataSet(1619).fitsIn(1625 + 54));
  // A descriptor that would run past the block.
  EXPECT_FALSE(g.dataSet(kSphBlockSize - 100).valid);
}

// Header numbers that are not numbers of the format make a wide-swath
// product unreadable (4); any other product reads with the value marked
// invalid and the problem naming the field.
TEST(ProductHeader, MalformedNumbersAreRefused) {
  struct Edit {
    size_t at;  // offset in the SPH block
    const char* text;
  };
  const struct {
    const char* field;  // named first by the problem
    size_t dsd;         // the descriptor's SPH offset, 0 for a spacing
    std::vector<Edit> edits;
  } cases[] = {
      {"RANGE_SPACING", 0, {{870, "+inf           "}}},
      {"RANGE_SPACING", 0, {{870, "inf            "}}},
      {"AZIMUTH_SPACING", 0, {{905, "nan            "}}},
      {"AZIMUTH_SPACING", 0, {{905, "+1.0e+999      "}}},
      {"LINE_TIME_INTERVAL", 0, {{943, "+1.21515000x-02"}}},
      {"LINE_TIME_INTERVAL", 0, {{943, "0x1.8p-7       "}}},
      {"RANGE_SPACING", 0, {{885, "m  "}}},  // the unit "<m>" gone
      {"DS_OFFSET", 1339, {{1339 + 133, "+0000000000000000XXXX"}}},
      {"NUM_DSR", 1619, {{1619 + 207, "+1625garbage"}}},
      {"NUM_DSR", 1619, {{1619 + 207, "           "}}},
      {"DS_SIZE", 1899, {{1899 + 170, "+00000000000000007416"}}},  // 5 x 1483 + 1
      {"DS_SIZE", 1899, {{1899 + 170, "+00000000000000007414"}}},  // 5 x 1483 - 1
      {"DSR_SIZE", 2179, {{2179 + 239, "       "}}},               // the unit "<bytes>" gone
      {"DSR_SIZE", 3579, {{3579 + 228, "+0000000000"}}},
      {"DSR_SIZE", 4139, {{4139 + 228, "-0000000001"}}},
      // NUM_DSR x DSR_SIZE beyond 64 bits.
      {"DS_SIZE", 2459, {{2459 + 207, "+9999999999"}, {2459 + 228, "+9999999999"}}},
  };
  const std::string dir = testing::TempDir();
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.field) + " \"" + c.edits[0].text + "\"");
    HandmadeProduct wss(kWssName);
    EnvisatHeaders h;
    ASSERT_EQ(read_envisat_headers(wss.write(dir + "good_wss").c_str(), &h), 0);
    for (const Edit& e : c.edits) wss.sph.replace(e.at, std::strlen(e.text), e.text);
    EXPECT_EQ(read_envisat_headers(wss.write(dir + "bad_wss").c_str(), &h), 4);

    HandmadeProduct ims("ASA_IMS_" + kWssName.substr(8));
    ims.sph = wss.sph;
    ASSERT_EQ(read_envisat_headers(ims.write(dir + "bad_ims").c_str(), &h), 0);
    const char* problem = nullptr;
    if (c.dsd == 0) {
      EXPECT_FALSE(h.spacingsValid);
      problem = h.spacingProblem;
    } else {
      const EnvisatDataSet d = h.dataSet(c.dsd);
      EXPECT_FALSE(d.valid);
      EXPECT_FALSE(d.present());
      problem = d.problem;
    }
    ASSERT_NE(problem, nullptr);
    EXPECT_EQ(std::string(problem).rfind(std::string(c.field) + " ", 0), 0u) << problem;
  }
}

// Well-formed descriptors, including those of absent data sets, read as
// they stand; files cut inside the headers do not read.
TEST(ProductHeader, WellFormedHandmadeHeadersAndShortFiles) {
  HandmadeProduct wss(kWssName);
  // Absent fourth and fifth sub-swaths, with and without their record size.
  PutDsd(&wss.sph[4139], 0, 0, 0, 2217);
  PutDsd(&wss.sph[3859], 0, 0, 0, 0);
  EnvisatHeaders h;
  const std::string whole = wss.mph + wss.sph, file = testing::TempDir() + "handmade_wss";
  for (size_t cut : {1000, 3000, 7345}) {
    std::ofstream(file, std::ios::binary) << whole.substr(0, cut);
    EXPECT_EQ(read_envisat_headers(file.c_str(), &h), 4) << cut;
  }
  EXPECT_EQ(read_envisat_headers("/nonexistent/ASA_WSS", &h), 9);
  EXPECT_EQ(read_envisat_headers(nullptr, &h), 9);
  ASSERT_EQ(read_envisat_headers(wss.write(file).c_str(), &h), 0);
  EXPECT_EQ(h.fileSize, 7346);
  ASSERT_TRUE(h.spacingsValid);
  EXPECT_DOUBLE_EQ(h.rangeSpacing, 7.80397367);
  EXPECT_DOUBLE_EQ(h.azimuthSpacing, 4.04);
  EXPECT_DOUBLE_EQ(h.lineTimeInterval, 0.0121515);
  const EnvisatDataSet main = h.dataSet(1339);
  ASSERT_TRUE(main.valid);
  EXPECT_EQ(main.offset, 7346);
  EXPECT_EQ(main.size, 5 * 2009);
  EXPECT_EQ(main.numDsr, 5);
  EXPECT_EQ(main.dsrSize, 2009);
  EnvisatDataSet mds[5];
  EXPECT_EQ(h.imageDataSets(mds), 3);
  EXPECT_FALSE(mds[0].fitsIn(h.fileSize));
}

TEST(ProductHeader, FieldsAreScannedWithinTheirWidth) {
  // A blank value yields nothing rather than the text of the next line.
  const char block[] = "SOFTWARE_VER=\"              \"\nNEXT=\"value\"\n";
  EXPECT_EQ(EnvisatToken(block, sizeof block - 1, {14, 14}), "");
  EXPECT_EQ(EnvisatToken(block, sizeof block - 1, {36, 5}), "value");
  EXPECT_EQ(EnvisatToken(block, sizeof block - 1, {36, 500}), "");
  double v = 0;
  EXPECT_FALSE(EnvisatNumber(block, sizeof block - 1, {14, 14}, &v));
  const char num[] = "+7.80397367e+00<m>";
  ASSERT_TRUE(EnvisatNumber(num, sizeof num - 1, {0, 15}, &v));
  EXPECT_DOUBLE_EQ(v, 7.80397367);
  // The real calibration file with a blank software version.
  EnvisatHeaders h;
  const std::string& er1 = vlr_test::kSampleEr1Xca;
  ASSERT_EQ(read_envisat_headers(er1.c_str(), &h), 0);
  EXPECT_EQ(h.softwareVer, "");
  EXPECT_EQ(h.product, "ASA_XCA_AXVIEC20050301_000000_19910101_000000_20100101_000000");
  EXPECT_EQ(h.sensingStart, "01-JAN-1991 00:00:00.000000");
  EXPECT_EQ(h.productType, "XCA");
  EXPECT_FALSE(h.wss);
}

}  // namespace
