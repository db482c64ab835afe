// The suite header of a converted sub-swath against the generator's truth,
// closed forms and the library header read on its own.
#include <sys/stat.h>

#include <cmath>
#include <string>
#include <vector>

#include "convert_fixture.h"
#include "runtime/environment.h"

namespace {

using namespace convert_test;

TEST_F(Conversion, SubSwathHeaderHoldsEveryMappedValue) {
  const int k = 2;
  const std::string s = swath(k);
  const std::string raster = copySwath(k, "R2");
  const std::string name = raster + "_slc_hdr";
  vlr_test::WriteFile(name + "_orb.sml", "an older orbit header");
  ASSERT_EQ(writehdr_kestova((raster + ".hdr").c_str(), name.c_str(), vlr_test::kSampleXca.c_str()),
            0);
  EXPECT_FALSE(vlr_test::Exists(name + "_orb.sml"));
  EXPECT_TRUE(vlr_test::Exists(raster + "_slc.sml"));
  EXPECT_TRUE(vlr_test::Exists(raster + "_slc.vrt"));
  EXPECT_EQ(ckerr_count(), 0);
  const auto lib = library(raster + ".hdr");
  const auto hp = suiteHeader(name);
  CDescriptionHeader& h = *hp;

  // State vectors: the library's, value for value.
  const GeneralSAROrbit& orbit = lib->orbit;
  ASSERT_EQ(I(h, "nStateVectors"), orbit.n());
  EXPECT_NEAR(truth::Sec85(S(h, "TimeFirst")), orbit.t0(), 1e-6);
  EXPECT_EQ(D(h, "TimeDelta"), orbit.dt());
  const char* components[] = {"pos_x", "pos_y", "pos_z", "vel_x", "vel_y", "vel_z"};
  for (int c = 0; c < 6; ++c) {
    ASSERT_EQ(F(h, components[c])->columns(), orbit.n()) << components[c];
    const double* v = c < 3 ? orbit.positions() : orbit.velocities();
    for (int i = 0; i < orbit.n(); ++i) EXPECT_EQ(D(h, components[c], i), v[3 * i + c % 3]);
  }

  // Geometry: near, middle and far slant range, spacings and times.
  const double nearTime = value(s, "NearRangeTime"), farTime = value(s, "FarRangeTime");
  for (int i = 0; i < 3; ++i)
    EXPECT_NEAR(D(h, "SlantRange", i),
                (nearTime + i * (farTime - nearTime) / 2) * convert_test::kHalfSpeedOfLight, 0.05);
  // The generator's spacing: ground distance per line at mid swath.
  const double spacingAz = value("Scene", "AzimuthSpacing");
  EXPECT_NEAR(D(h, "PixelSpacingAz"), spacingAz, 0.005 * spacingAz);
  EXPECT_NEAR(D(h, "ProcessingVelocity"), spacingAz / value("Scene", "LineTimeInterval"),
              0.005 * spacingAz / value("Scene", "LineTimeInterval"));
  // Each sub-swath's own first and last line.
  EXPECT_NEAR(truth::Sec85(S(h, "AzimuthStartTime")), value(s, "FirstLineTime"), 1e-6);
  EXPECT_NEAR(truth::Sec85(S(h, "AzimuthStopTime")), value(s, "LastLineTime"), 2e-6);
  EXPECT_EQ(I(h, "NAzimuthLooks"), 1);
  EXPECT_EQ(I(h, "NRangeLooks"), 1);

  // Doppler centroid and rate of the sub-swath.
  double dopTime = 0, dopC0 = 0, dopC1 = 0;
  ASSERT_EQ(
      std::sscanf(truth(s, "DopplerRecord0").c_str(), "%lf %lf %lf", &dopTime, &dopC0, &dopC1), 3);
  ASSERT_EQ(I(h, "nDopCenDataSet"), 2);
  EXPECT_NEAR(truth::Sec85(S(h, "DopCenRefTime")), dopTime, 1e-6);
  EXPECT_NEAR(D(h, "DopCenRgRefTime"), value(s, "DopplerRangeTime"), 1e-12);
  EXPECT_EQ(getInteger(F(h, "DopCenPol_nCoeff"), 1), 5);
  EXPECT_NEAR(getDoubleAt(F(h, "DopCenRangeCoeff"), 0, 0), dopC0, 1e-3);
  EXPECT_NEAR(getDoubleAt(F(h, "DopCenRangeCoeff"), 0, 1), dopC1, std::fabs(dopC1) * 1e-6);
  ASSERT_EQ(I(h, "nDopRateDataSet"), 1);
  const char* rate[] = {"FmRateC0", "FmRateC1", "FmRateC2"};
  for (int c = 0; c < 3; ++c) {
    EXPECT_NEAR(getDoubleAt(F(h, "DopRateRangeCoeff"), 0, c), value(s, rate[c]),
                std::fabs(value(s, rate[c])) * 1e-6);
  }

  // Values of the sub-swath (or, with `scene`, of the scene) in the truth.
  const struct {
    const char* field;
    bool scene;
    const char* key;
    double tolerance;
  } reals[] = {{"FastTime", false, "NearRangeTime", 3e-10},
               {"PixelSpacingRg", true, "RangeSpacing", 1e-6},
               {"CarrierFrequency", true, "CarrierFrequency", 1e3},
               {"SamplingRate", true, "RangeSamplingRate", 1.0},
               {"PRF", false, "PRF", 1e-3},
               {"PRFExtracted", false, "PRF", 1e-3},
               {"PulseDuration", false, "PulseLength", 1e-12},
               {"BandWidth", false, "PulseBandwidth", 1.0},
               {"CalConstProc", false, "ExternalCalibrationFactor", 1e-2},
               {"Acquisition_Start_Time", false, "AcquisitionStartTime", 1e-6},
               {"NoisePower", false, "NoisePower", 1e-6},
               {"ChirpPower", false, "ChirpPower", 1e-6},
               {"Inter_Burst_Time", true, "BurstCycle", 1e-9},
               {"RgFilterCoeff", false, "RangeWindowCoefficient", 1e-6},
               {"AzWinCoeff", false, "AzimuthWindowCoefficient", 1e-6},
               {"LatNorthing", false, "CentreLat", 2e-5},
               {"LonEasting", false, "CentreLon", 2e-5}};
  for (const auto& r : reals)
    EXPECT_NEAR(D(h, r.field), value(r.scene ? "Scene" : s, r.key), r.tolerance) << r.field;
  const struct {
    const char* field;
    const char* key;
  } integers[] = {{"Rank", "Rank"},
                  {"Echoes_per_burst", "EchoesPerBurst"},
                  {"Lines_per_burst", "LinesPerBurst"},
                  {"Bursts", "Bursts"},
                  {"NrOfPixelsPerLine", "Samples"},
                  {"NrOfLinesPerImage", "Records"}};
  for (const auto& i : integers) EXPECT_EQ(I(h, i.field), value(s, i.key)) << i.field;
  EXPECT_EQ(I(h, "Order"), 2);  // SS2 is third in the burst sequence
  EXPECT_EQ(D(h, "RO_REF"), lib->dataSetInfo.RO_REF);
  // The sub-swath's elevation pattern table, whole.
  ASSERT_GT(lib->antenna.PatternSamples, 2);
  EXPECT_EQ(I(h, "EnvisatTwoWayAntennaElevationPatternTableNbr"), lib->antenna.PatternSamples);
  EXPECT_EQ(F(h, "EnvisatTwoWayAntennaElevationPatternTable")->columns(),
            lib->antenna.PatternSamples);

  // Raster layout of the extracted raster.
  EXPECT_EQ(S(h, "CellType"), "FLOAT_COMPLEX");
  EXPECT_EQ(S(h, "DataUnits"), "SLC");
  EXPECT_EQ(I(h, "RowPrefix"), 17);
  EXPECT_EQ(I(h, "HeaderOffset"), 0);
  EXPECT_EQ(S(h, "BytesOrder"), "LSBF");

  // Scene centre and corners.
  const geoCoords_Obj& g = lib->geoCoords;
  EXPECT_EQ(D(h, "IncidenceAngle"), g.Center.incidence);
  EXPECT_EQ(D(h, "RangeLookAngle"), g.Center.lookAngle);

  const std::vector<std::string> keys = {
      "ORIGIN DATA",       "ACQUISITION TIME",  "UTM_HEMISPHERE",       "UTM_ZONE",
      "SCENE DATA",        "SOFTWARE",          "CORNER POINT 3  X",    "CORNER POINT 3  Y",
      "CORNER POINT 4  X", "CORNER POINT 4  Y", "CORNER POINT 2  X",    "CORNER POINT 2  Y",
      "CORNER POINT 1  X", "CORNER POINT 1  Y", "CENTER SCENE POINT X", "CENTER SCENE POINT Y"};
  const auto rows = OtherInfo(h);
  ASSERT_EQ(rows.size(), keys.size());
  for (size_t i = 0; i < keys.size(); ++i) EXPECT_EQ(rows[i].first, keys[i]);
  EXPECT_EQ(rows[0].second, "ENVISAT_WSM");
  EXPECT_EQ(rows[1].second, truth("Scene", "SensingStartText"));
  // 45 degrees north, 150 degrees east.
  EXPECT_EQ(rows[2].second, "NORTH");
  EXPECT_EQ(rows[3].second, "56");
  EXPECT_EQ(rows[4].second, std::string("ENVISAT-1|ENVISAT_WSS|SS2|H/H|") +
                                lib->dataSetInfo.OrbitConfiguration + "|SLANT_RANGE");
  // The writer of the suite header names this program.
  EXPECT_EQ(rows[5].second, kVeloranIdentification);
  // A descending pass: the first line's near range lies north-east.
  const struct {
    size_t row;
    const char* truthPoint;
  } corners[] = {{6, "FirstFar"}, {8, "FirstNear"}, {10, "LastFar"}, {12, "LastNear"}};
  ASSERT_EQ(truth("Scene", "Pass"), "DESCENDING");
  for (const auto& c : corners) {
    EXPECT_NEAR(std::stod(rows[c.row].second), value(s, std::string(c.truthPoint) + "Lon"), 2e-5);
    EXPECT_NEAR(std::stod(rows[c.row + 1].second), value(s, std::string(c.truthPoint) + "Lat"),
                2e-5);
  }
  EXPECT_NEAR(std::stod(rows[14].second), value(s, "CentreLon"), 2e-5);
  EXPECT_NEAR(std::stod(rows[15].second), value(s, "CentreLat"), 2e-5);
  EXPECT_FALSE(isSet(F(h, "EnvisatFixHeader.PRODUCT")));
}

// Scene centres on both sides of the equator and of the date line.
TEST_F(Conversion, UtmZoneFollowsTheSceneCentre) {
  const std::string raster = copySwath(1, "R1");
  const std::string hdr = raster + ".hdr", name = raster + "_slc_hdr";
  const struct {
    double lat, lon;
    const char* hemisphere;
    const char* zone;
  } centres[] = {
      {-0.1, 7.5, "SOUTH", "32"}, {0.0, 187.5, "NORTH", "2"}, {10.0, 180.0, "NORTH", "60"}};
  for (const auto& c : centres) {
    SCOPED_TRACE(c.lon);
    editHeader(hdr,
               [&](GeneralSAR& gs) { gs.geoCoords.Center.set(c.lat, c.lon, 0.0, 20.0, 18.0); });
    ASSERT_EQ(writehdr_kestova(hdr.c_str(), name.c_str(), nullptr), 0);
    const auto h = suiteHeader(name);
    EXPECT_EQ(OtherInfoValue(*h, "UTM_HEMISPHERE"), c.hemisphere);
    EXPECT_EQ(OtherInfoValue(*h, "UTM_ZONE"), c.zone);
  }
}

// A sub-swath extracted without orbit: no state vectors, no corners, and no
// azimuth spacing rather than a negative one.
TEST_F(Conversion, HeaderWithoutOrbitKeepsOnlyWhatItHolds) {
  const std::string raster = copySwath(1, "R1");
  auto gs = library(raster + ".hdr");
  for (const auto o : {GeneralSAR::GS_ORBIT, GeneralSAR::GS_STATEVECTORS, GeneralSAR::GS_GEOCOORDS})
    gs->GSdisable(o);
  const std::string bare = work("N.hdr");
  ASSERT_EQ(gs->GSwrite(bare.c_str()), 0);
  ASSERT_EQ(writehdr_kestova(bare.c_str(), work("N_slc_hdr").c_str(), nullptr), 0);
  const auto h = suiteHeader(work("N_slc_hdr"));
  EXPECT_EQ(I(*h, "nStateVectors"), 0);
  EXPECT_EQ(F(*h, "pos_x")->columns(), 0);
  EXPECT_FALSE(isSet(F(*h, "PixelSpacingAz")));
  EXPECT_EQ(D(*h, "ProcessingVelocity"), -1.0);
  EXPECT_FALSE(isSet(F(*h, "LatNorthing")));
  EXPECT_EQ(OtherInfoValue(*h, "UTM_ZONE"), "<missing>");
  EXPECT_EQ(OtherInfo(*h).size(), 4u);
  EXPECT_NEAR(D(*h, "PixelSpacingRg"), value("Scene", "RangeSpacing"), 1e-6);
}

// Library headers the suite header cannot describe (a polarisation outside
// the four, a sample type the suite cannot name) or that cannot be read:
// refused with 1, nothing written and nothing left allocated.  Rasters of
// other sample types are described by their own types, never as floats.
TEST_F(Conversion, HeadersDescribedAsTheyAreOrRefused) {
  const auto polarisation = [](const char* p) {
    return [p](GeneralSAR& gs) {
      std::snprintf(gs.dataSetInfo.Polarization, kParStringSize, "%s", p);
    };
  };
  const auto cells = [](int type) {
    return [type](GeneralSAR& gs) { gs.datafile.data.cell_type = type; };
  };
  const struct {
    const char* what;
    std::function<void(GeneralSAR&)> edit;
    const char* cellType;  // null: refused
    const char* units;
  } cases[] = {{"no polarisation", polarisation(""), nullptr, nullptr},
               {"X/Y", polarisation("X/Y"), nullptr, nullptr},
               {"HH", polarisation("HH"), nullptr, nullptr},
               {"integer complex samples", cells(CT_INT32_COMPLEX), nullptr, nullptr},
               {"float samples", cells(CT_FLOAT32), "FLOAT", "AMPLITUDE"},
               {"short complex samples", cells(CT_SHORT_COMPLEX), "SHORT_COMPLEX", "SLC"},
               {"short samples", cells(CT_INT16), "SHORT", "AMPLITUDE"}};
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    const std::string raster = copySwath(1, "E");
    editHeader(raster + ".hdr", c.edit);
    const int code =
        writehdr_kestova((raster + ".hdr").c_str(), (raster + "_slc_hdr").c_str(), nullptr);
    EXPECT_EQ(ckerr_count(), 0);
    EXPECT_EQ(ckerr_depth(), 0);
    if (c.cellType != nullptr) {
      ASSERT_EQ(code, 0);
      const auto h = suiteHeader(raster + "_slc_hdr");
      EXPECT_EQ(S(*h, "CellType"), c.cellType);
      EXPECT_EQ(S(*h, "DataUnits"), c.units);
      continue;
    }
    EXPECT_EQ(code, 1);
    EXPECT_FALSE(vlr_test::Exists(raster + "_slc.sml"));
    EXPECT_FALSE(vlr_test::Exists(raster + "_slc.hdr"));
  }
  EXPECT_NE(processLog().find("PROCESSING ERROR: Wrong Polarization Type"), std::string::npos);

  vlr_test::WriteFile(work("empty.hdr"), "<?xml version=\"1.0\"?>\n<TessalXmlDoc/>\n");
  for (const std::string& bad :
       {work("absent.hdr"), work("empty.hdr"), work(std::string(600, 'x'))})
    EXPECT_EQ(writehdr_kestova(bad.c_str(), work("A_hdr").c_str(), nullptr), 1) << bad;
  EXPECT_EQ(writehdr_kestova(nullptr, work("A_hdr").c_str(), nullptr), 1);
  EXPECT_FALSE(vlr_test::Exists(work("A.sml")));
  EXPECT_EQ(ckerr_count(), 0);
}

}  // namespace
