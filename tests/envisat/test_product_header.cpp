#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <fstream>
#include <string>

#include "envisat/product_header.h"
#include "synth_run.h"

using synth_test::remove_run;
using synth_test::run_synth;
using synth_test::SynthRun;

namespace {

double truth(const SynthRun& r, const char* s, const char* k) {
  return std::stod(r.truth.at(s).at(k));
}

class GeneratedProduct : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    run_ = new SynthRun(run_synth("--orbit kepler --polarisation VV --pass ascending"));
  }
  static void TearDownTestSuite() {
    remove_run(*run_);
    delete run_;
  }
  static SynthRun* run_;
};
SynthRun* GeneratedProduct::run_ = nullptr;

TEST_F(GeneratedProduct, HeaderValuesAtTheirOffsets) {
  ASSERT_EQ(run_->exit_code, 0);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(run_->product.c_str(), &h), 0);
  const auto& scene = run_->truth.at("Scene");
  EXPECT_EQ(h.product, scene.at("Product"));
  EXPECT_EQ(h.productType, "WSS");
  EXPECT_TRUE(h.wss);
  EXPECT_FALSE(h.aps || h.apm || h.app || h.wsm || h.gm1);
  EXPECT_EQ(h.sensingStart, scene.at("SensingStartText"));
  EXPECT_EQ(h.sensingStop, scene.at("SensingStopText"));
  EXPECT_EQ(h.acquisitionStation, "PDHS-K");
  EXPECT_EQ(h.procCenter, "PDHS-K");
  EXPECT_EQ(h.procTime.size(), 27u);
  EXPECT_EQ(h.softwareVer, "ASAR/4.05");
  EXPECT_EQ(std::stoi(h.absOrbit), std::stoi(scene.at("AbsOrbit")));
  EXPECT_EQ(std::stoi(h.relOrbit), std::stoi(scene.at("RelOrbit")));
  EXPECT_EQ(h.firstLineTime, scene.at("SensingStartText"));
  EXPECT_EQ(h.lastLineTime, scene.at("SensingStopText"));
  EXPECT_EQ(h.swath, "WS");
  EXPECT_EQ(h.sampleType, "COMPLEX");
  EXPECT_EQ(h.mds1Polar, "V/V");
  EXPECT_EQ(h.dataType, "SWOR");
  EXPECT_EQ(h.sphDescriptor.size(), 28u);
  ASSERT_TRUE(h.spacingsValid);
  EXPECT_NEAR(h.rangeSpacing, truth(*run_, "Scene", "RangeSpacing"), 1e-6);
  EXPECT_NEAR(h.lineTimeInterval, truth(*run_, "Scene", "LineTimeInterval"), 1e-9);
  EXPECT_NEAR(h.azimuthSpacing, truth(*run_, "Scene", "AzimuthSpacing"), 1e-4);
  EXPECT_EQ(h.fileSize, truth(*run_, "Scene", "TotalSize"));
}

TEST_F(GeneratedProduct, WideSwathDescriptors) {
  ASSERT_EQ(run_->exit_code, 0);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(run_->product.c_str(), &h), 0);
  const EnvisatDsdLayout& l = h.layout();
  EXPECT_EQ(l.mainProcessing, 1339u);
  const struct {
    size_t at;
    int64_t dsr;
  } tables[] = {{l.mainProcessing, 2009},
                {l.doppler, 55},
                {l.chirp, 1483},
                {l.antenna, 162},
                {l.geolocation, 521}};
  for (const auto& t : tables) {
    const EnvisatDataSet d = h.dataSet(t.at);
    EXPECT_TRUE(d.present()) << t.at;
    EXPECT_EQ(d.dsrSize, t.dsr);
    EXPECT_EQ(d.size, d.numDsr * d.dsrSize);
    EXPECT_TRUE(d.fitsIn(h.fileSize));
  }
  EXPECT_EQ(h.dataSet(l.mainProcessing).numDsr, 5);
  EnvisatDataSet mds[5];
  ASSERT_EQ(h.imageDataSets(mds), 5);
  for (int k = 0; k < 5; ++k) {
    const std::string s = "SubSwath" + std::to_string(k + 1);
    EXPECT_EQ(mds[k].offset, truth(*run_, s.c_str(), "MdsOffset"));
    EXPECT_EQ(mds[k].dsrSize, truth(*run_, s.c_str(), "RecordSize"));
    EXPECT_EQ(mds[k].numDsr, truth(*run_, s.c_str(), "Records"));
    EXPECT_TRUE(mds[k].fitsIn(h.fileSize));
  }
}

TEST(ProductHeader, FewerMeasurementDataSetsStopAtTheFirstEmpty) {
  const SynthRun r = run_synth("--orbit kepler --mds-count 3");
  ASSERT_EQ(r.exit_code, 0);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(r.product.c_str(), &h), 0);
  EnvisatDataSet mds[5];
  EXPECT_EQ(h.imageDataSets(mds), 3);
  remove_run(r);
}

TEST(ProductHeader, HostileDescriptorsAreCaught) {
  // A descriptor pointing beyond the end, and a table with no records.
  const SynthRun r = run_synth("--orbit kepler --dsd-beyond-end 5 --zero-count 2");
  ASSERT_EQ(r.exit_code, 0);
  EnvisatHeaders h;
  ASSERT_EQ(read_envisat_headers(r.product.c_str(), &h), 0);
  const EnvisatDataSet geo = h.dataSet(h.layout().geolocation);
  EXPECT_TRUE(geo.valid);
  EXPECT_FALSE(geo.fitsIn(h.fileSize));
  const EnvisatDataSet dop = h.dataSet(h.layout().doppler);
  EXPECT_EQ(dop.numDsr, 0);
  EXPECT_FALSE(dop.present());
  remove_run(r);

  // Garbage and negative numbers in descriptor fields read as absent.
  EnvisatHeaders g;
  std::memset(g.sph, ' ', sizeof g.sph);
  std::memcpy(g.sph + 1339 + 133, "+0000000000000000XXXX", 21);
  EXPECT_FALSE(g.dataSet(1339).valid);
  std::memcpy(g.sph + 1619 + 133, "-00000000000000001625", 21);
  std::memcpy(g.sph + 1619 + 170, "+00000000000000000055", 21);
  std::memcpy(g.sph + 1619 + 207, "+0000000001", 11);
  std::memcpy(g.sph + 1619 + 228, "+0000000055", 11);
  EXPECT_FALSE(g.dataSet(1619).valid);
  std::memcpy(g.sph + 1619 + 133, "+00000000000000001625", 21);
  EXPECT_TRUE(g.dataSet(1619).fitsIn(1625 + 55));
  EXPECT_FALSE(g.dataSet(1619).fitsIn(1625 + 54));
  // More records than the data set holds.
  std::memcpy(g.sph + 1619 + 207, "+0000000002", 11);
  EXPECT_FALSE(g.dataSet(1619).fitsIn(1 << 20));
  // A descriptor that would run past the block.
  EXPECT_FALSE(g.dataSet(kSphBlockSize - 100).valid);
}

TEST(ProductHeader, ShortAndMissingFiles) {
  EnvisatHeaders h;
  EXPECT_EQ(read_envisat_headers("/nonexistent/ASA_WSS", &h), 9);
  EXPECT_EQ(read_envisat_headers(nullptr, &h), 9);
  for (const char* cut : {"1000", "3000", "7345"}) {
    const SynthRun r = run_synth(std::string("--orbit kepler --truncate ") + cut);
    ASSERT_EQ(r.exit_code, 0);
    EXPECT_EQ(read_envisat_headers(r.product.c_str(), &h), 4) << cut;
    remove_run(r);
  }
  const SynthRun whole = run_synth("--orbit kepler --truncate 7346");
  ASSERT_EQ(whole.exit_code, 0);
  EXPECT_EQ(read_envisat_headers(whole.product.c_str(), &h), 0);
  EXPECT_EQ(h.fileSize, 7346);
  EnvisatDataSet mds[5];
  ASSERT_EQ(h.imageDataSets(mds), 5);
  EXPECT_FALSE(mds[0].fitsIn(h.fileSize));
  remove_run(whole);
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
