// The conversion's other roads: the suite header read back into the library's
// sections, the five sub-swaths of an import moved to their final names, and
// the composed product that carries the calibration file's fixed headers.
#include <cmath>
#include <string>
#include <vector>

#include "convert_fixture.h"
#include "runtime/error_codes.h"

namespace {

using namespace convert_test;

// Reference times to the microsecond a date text keeps, the rest exactly.
template <class P>
void ExpectSameFamily(const std::vector<P>& a, const std::vector<P>& b) {
  ASSERT_EQ(a.size(), b.size());
  for (size_t i = 0; i < a.size(); ++i) {
    EXPECT_NEAR(a[i].taz0_s, b[i].taz0_s, 1e-6);
    EXPECT_EQ(a[i].trg0_s, b[i].trg0_s);
    for (int c = 0; c < 7; ++c) EXPECT_EQ(a[i].pol[c], b[i].pol[c]) << c;
  }
}

// The suite header read back gives the library header's values; one field
// of each kind that the multilook never reads (and so no pipeline run
// would notice lost): state vectors, dates, polynomial families, integers,
// reals, texts, corners and the raster's name.
TEST_F(Conversion, RoundTripGivesBackEachKindOfValue) {
  const std::string raster = copySwath(4, "R4");
  const std::string name = raster + "_slc_hdr";
  ASSERT_EQ(writehdr_kestova((raster + ".hdr").c_str(), name.c_str(), nullptr), 0);
  auto lib = library(raster + ".hdr");
  auto back = std::make_unique<GeneralSAR>();
  ASSERT_EQ(readhdr_kestova(name.c_str(), back.get()), 0);

  const GeneralSAROrbit &o = lib->orbit, &ob = back->orbit;
  ASSERT_EQ(ob.n(), o.n());
  for (int i = 0; i < 3 * o.n(); ++i) EXPECT_EQ(ob.velocities()[i], o.velocities()[i]);
  EXPECT_EQ(back->stateVectors.n(), o.n());
  EXPECT_NEAR(back->roi.roi.SlowStartTime, value("SubSwath4", "FirstLineTime"), 1e-6);
  ExpectSameFamily(back->polys.sl2gr, lib->polys.sl2gr);
  ExpectSameFamily(back->polys.sl2theta, lib->polys.sl2theta);
  EXPECT_EQ(back->swathInfo.Order, lib->swathInfo.Order);
  EXPECT_EQ(back->swathInfo.NoisePower, lib->swathInfo.NoisePower);
  EXPECT_EQ(back->pulse.PulseLength, lib->pulse.PulseLength);
  for (auto m : {&DataSetInfo_Obj::Polarization, &DataSetInfo_Obj::SenseDate})
    EXPECT_STREQ(back->dataSetInfo.*m, lib->dataSetInfo.*m);
  EXPECT_STREQ(back->dataSetInfo.Swath, "SS4");
  EXPECT_NEAR(back->geoCoords.SouthWest.latitude, lib->geoCoords.SouthWest.latitude, 1e-6);
  EXPECT_NEAR(back->geoCoords.SouthWest.longitude, lib->geoCoords.SouthWest.longitude, 1e-6);
  EXPECT_EQ(back->datafile.data.name(), raster + "_slc");
  EXPECT_FALSE(back->GSexists(GeneralSAR::GS_ANTENNA));
  back.reset();
  lib.reset();
  EXPECT_EQ(ckerr_count(), 0);
}

// Headers whose values contradict each other are refused with 1; a field the
// key files do not define raises 848642.
TEST_F(Conversion, InconsistentSuiteHeadersAreRefused) {
  const std::string raster = copySwath(1, "R1");
  const std::string name = raster + "_slc_hdr";
  ASSERT_EQ(writehdr_kestova((raster + ".hdr").c_str(), name.c_str(), nullptr), 0);
  const struct {
    const char* what;
    std::function<void(CDescriptionHeader&)> edit;
  } cases[] = {
      {"more vectors than values",
       [](CDescriptionHeader& h) { setInteger(F(h, "nStateVectors"), 9); }},
      {"unknown cell type", [](CDescriptionHeader& h) { setString(F(h, "CellType"), "float"); }},
      {"six centroid coefficients",
       [](CDescriptionHeader& h) { setInteger(F(h, "DopCenPol_nCoeff"), 0, 6); }},
      {"date that is no date",
       [](CDescriptionHeader& h) { setString(F(h, "AzimuthStartTime"), "yesterday"); }},
      {"more rate polynomials than rows",
       [](CDescriptionHeader& h) { setInteger(F(h, "nDopRateDataSet"), 4); }},
      {"scene data of five texts",
       [](CDescriptionHeader& h) {
         CDescriptionField* f = F(h, "RasterInfo.OtherInfo");
         setStringAt(f, 4, 1, "ENVISAT-1|ENVISAT_WSS|SS1|H/H|SLANT_RANGE");
       }},
      {"negative polynomial count",
       [](CDescriptionHeader& h) { setInteger(F(h, "nSl2PhiDataSet"), -1); }},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    const auto h = suiteHeader(name);
    c.edit(*h);
    auto gs = std::make_unique<GeneralSAR>();
    EXPECT_EQ(readpar_kestova(*h, raster.c_str(), gs.get()), 1);
    EXPECT_EQ(ckerr_depth(), 0);
  }
  auto gs = std::make_unique<GeneralSAR>();
  EXPECT_EQ(readhdr_kestova(work("nothing_hdr").c_str(), gs.get()), 9);
  EXPECT_EQ(ckerr_count(), 0);

  // An installation whose key file lacks a field the mapping reads.
  writeKeyFile("sar_processing", "[sar_processing]\nRank = I\n");
  EXPECT_EQ(vlr_test::RaisedCode([&] { readhdr_kestova(name.c_str(), gs.get()); }),
            vlr::kCodeFieldNotFound);
}

TEST_F(Conversion, Tessal2kestovaConvertsAndMovesEverySubSwath) {
  const std::string root = work("R");
  for (int k = 1; k <= 5; ++k) copySwath(k, "R" + std::to_string(k));
  vlr_test::WriteFile(root + "3_slc", "an older raster");
  ASSERT_EQ(tessal2kestova(root.c_str(), vlr_test::kSampleXca.c_str(), 1), 0);
  for (int k = 1; k <= 5; ++k) {
    SCOPED_TRACE(k);
    const std::string n = root + std::to_string(k);
    EXPECT_FALSE(vlr_test::Exists(n));
    EXPECT_EQ(vlr_test::ReadFile(n + "_slc"),
              vlr_test::ReadFile(run_->dir + "R" + std::to_string(k)));
    EXPECT_TRUE(vlr_test::Exists(n + "_slc.sml"));
    // Lines with a prefix: a virtual raster, no ENVI header.
    EXPECT_TRUE(vlr_test::Exists(n + "_slc.vrt"));
    EXPECT_FALSE(vlr_test::Exists(n + "_slc.hdr"));
    const auto h = suiteHeader(n + "_slc_hdr");
    EXPECT_EQ(OtherInfoValue(*h, "SCENE DATA").substr(0, 26),
              "ENVISAT-1|ENVISAT_WSS|SS" + std::to_string(k) + "|");
  }
  EXPECT_EQ(ckerr_count(), 0);

  // A raster that is missing is a failure, after the sub-swaths before it.
  const std::string other = work("Q");
  for (int k = 1; k <= 5; ++k) copySwath(k, "Q" + std::to_string(k));
  std::remove((other + "3").c_str());
  EXPECT_EQ(tessal2kestova(other.c_str(), nullptr), vlr::kLibMissing);
  EXPECT_TRUE(vlr_test::Exists(other + "2_slc"));
  EXPECT_FALSE(vlr_test::Exists(other + "4_slc.sml"));
  EXPECT_NE(processLog().find("Cannot rename file " + other + "3"), std::string::npos);

  EXPECT_EQ(tessal2kestova(work(std::string(510, 'r')).c_str(), nullptr, 0), 1);
  EXPECT_EQ(tessal2kestova("", nullptr, 0), 1);
}

// A composed product: looks, origin, the speed from the orbit and the
// calibration file's main and specific product headers.
TEST_F(Conversion, ComposedProductCarriesTheAuxiliaryFileHeaders) {
  const std::string raster = copySwath(3, "O");
  const std::string hdr = raster + ".hdr";
  editHeader(hdr, [](GeneralSAR& gs) {
    std::snprintf(gs.dataSetInfo.Swath, kParStringSize, "ALL");
    gs.attitude.Eq_speed = 0.0;
    gs.dataSetInfo.RangeLooks = 7;
  });
  // Not "O_hdr": its ENVI header "O.hdr" would replace the library header.
  const std::string name = work("M_hdr");
  ASSERT_EQ(writehdr_kestova(hdr.c_str(), name.c_str(), vlr_test::kSampleXca.c_str()), 0);
  EXPECT_EQ(ckerr_count(), 0);
  for (const char* temporary : {"_tmp1_hdr", "_tmp2_hdr"})
    EXPECT_FALSE(vlr_test::Exists(name + temporary)) << temporary;
  auto h = suiteHeader(name);
  // The range looks the multilook states; its lines keep the input spacing.
  EXPECT_EQ(I(*h, "NAzimuthLooks"), 1);
  EXPECT_EQ(I(*h, "NRangeLooks"), 7);
  EXPECT_EQ(OtherInfoValue(*h, "ORIGIN DATA"), "ENVISAT_WS_SR");
  const std::string scene = OtherInfoValue(*h, "SCENE DATA");
  EXPECT_EQ(scene.substr(0, 26), "ENVISAT-1|ENVISAT_WSM|ALL|");
  EXPECT_EQ(scene.substr(scene.rfind('|') + 1), "SLANT_RANGE");
  const double speed = value("Scene", "AzimuthSpacing") / value("Scene", "LineTimeInterval");
  EXPECT_NEAR(D(*h, "ProcessingVelocity"), speed, 0.005 * speed);
  // The calibration file's own keywords, as its headers write them.
  EXPECT_EQ(S(*h, "EnvisatFixHeader.PRODUCT"),
            "ASA_XCA_AXVIEC20070517_153558_20070204_165113_20071231_000000 ");
  EXPECT_EQ(S(*h, "EnvisatFixHeader.SENSING_START"), "04-FEB-2007 16:51:13.000000");
  EXPECT_EQ(S(*h, "EnvisatFixHeader.SPH_SIZE"), "+0000000378<bytes>");
  EXPECT_EQ(S(*h, "EnvisatFixHeader.DS_SIZE"), "+00000000000000026552<bytes>");

  editHeader(hdr, [](GeneralSAR& gs) { gs.dataSetInfo.SetProjection(DS_PROJECTION_GROUND_RANGE); });
  ASSERT_EQ(writehdr_kestova(hdr.c_str(), name.c_str(), vlr_test::kSampleXca.c_str()), 0);
  h = suiteHeader(name);
  EXPECT_EQ(OtherInfoValue(*h, "ORIGIN DATA"), "ENVISAT_WS_GR");
  EXPECT_EQ(S(*h, "InitialGeometry.Projection"), "GROUND_RANGE");
  EXPECT_EQ(OtherInfoValue(*h, "SCENE DATA").substr(scene.rfind('|')), "|GROUND_RANGE");

  // Auxiliary files that cannot give their headers.
  const std::string xca = vlr_test::ReadFile(vlr_test::kSampleXca);
  vlr_test::WriteFile(work("short_mph"), xca.substr(0, 1000));
  vlr_test::WriteFile(work("short_sph"), xca.substr(0, 1300));
  std::string noSize = xca;
  noSize.replace(1104, 8, "SPH_SIZX");
  vlr_test::WriteFile(work("no_size"), noSize);
  std::string binary = xca;
  binary[1247 + 10] = '\0';
  vlr_test::WriteFile(work("binary_sph"), binary);
  const struct {
    std::string aux;
    int code;
  } cases[] = {{work("absent"), 9},  {work("short_mph"), 4},  {work("short_sph"), 4},
               {work("no_size"), 1}, {work("binary_sph"), 1}, {"", 9}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.aux);
    EXPECT_EQ(writehdr_kestova(hdr.c_str(), name.c_str(), c.aux.c_str()), c.code);
    EXPECT_FALSE(vlr_test::Exists(name + "_tmp1_hdr"));
    EXPECT_FALSE(vlr_test::Exists(name + "_tmp2_hdr"));
    EXPECT_EQ(ckerr_count(), 0);
  }

  // Without orbit a composed product has no speed.
  auto gs = library(hdr);
  gs->GSdisable(GeneralSAR::GS_ORBIT);
  gs->GSdisable(GeneralSAR::GS_STATEVECTORS);
  ASSERT_EQ(gs->GSwrite(work("P.hdr").c_str()), 0);
  EXPECT_EQ(
      writehdr_kestova(work("P.hdr").c_str(), work("P_hdr").c_str(), vlr_test::kSampleXca.c_str()),
      1);
}

}  // namespace
