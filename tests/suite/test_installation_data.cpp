// The installation's section key files and mandatory-field list.  The field table below is the
// contract between the key files and the code that writes and reads product headers: a path without
// a section name resolves to the first section of the catalogue that has the field, so a field
// defined in the wrong section, or shadowed by an earlier one, sends a value where no reader looks
// for it.
#include <gtest/gtest.h>

#include <fstream>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "suite/description_header.h"
#include "suite_fixture.h"

namespace vlr_test {
namespace {

constexpr CVLR_FieldShape kS = CVLR_FieldShape::Scalar;
constexpr CVLR_FieldShape kV = CVLR_FieldShape::Vector;
constexpr CVLR_FieldShape kM = CVLR_FieldShape::Matrix;
constexpr CVLR_FieldType kI = CVLR_FieldType::Integer;
constexpr CVLR_FieldType kD = CVLR_FieldType::Double;
constexpr CVLR_FieldType kT = CVLR_FieldType::String;

// Paths as the code names them, grouped by the section they must resolve to and their shape.
struct FieldGroup {
  const char* section;
  CVLR_FieldShape shape;
  CVLR_FieldType type;
  const char* paths;  // separated by blanks
};

const FieldGroup kContract[] = {
    {"OrbitCorrection", kV, kD, "AzimuthPixelShift"},
    {"StateVectorData", kS, kT, "StateVectorSource StateVectorReference TimeFirst"},
    {"StateVectorData", kS, kI, "nStateVectors"},
    {"StateVectorData", kS, kD, "TimeDelta"},
    {"StateVectorData", kV, kD, "pos_x pos_y pos_z vel_x vel_y vel_z"},
    {"InitialGeometry", kS, kT,
     "InitialGeometry.Projection InitialGeometry.TimeDirectionPixel "
     "InitialGeometry.TimeDirectionLines InitialGeometry.OrbitConfiguration"},
    {"InitialGeometry", kS, kD,
     "InitialGeometry.SceneHeading SceneHeading InitialGeometry.ReferenceHeight"},
    {"Processing", kS, kI,
     "NAzimuthLooks NRangeLooks nDopCenDataSet FromInImageAzimuthLooks FromInImageRangeLooks"},
    {"Processing", kS, kD, "PixelSpacingRg PixelSpacingAz CalConstProc"},
    {"Processing", kS, kT, "AzimuthStartTime AzimuthStopTime"},
    {"Processing", kV, kD, "SlantRange FastTime DopCenRgRefTime ProcessingVelocity"},
    {"Processing", kV, kT, "DopCenRefTime"},
    {"Processing", kV, kI, "DopCenPol_nCoeff"},
    {"Processing", kM, kD, "DopCenRangeCoeff"},
    {"ChannelInfo", kV, kD,
     "CarrierFrequency SamplingRate PRF PRFExtracted PulseDuration BandWidth"},
    {"ChannelInfo", kS, kD, "RangeLookAngle IncidenceAngle"},
    {"Sensor", kS, kI, "EnvisatTwoWayAntennaElevationPatternTableNbr"},
    {"Sensor", kS, kD, "EnvisatReferenceElevationAngle"},
    {"Sensor", kV, kD, "EnvisatTwoWayAntennaElevationPatternTable"},
    {"Sensor", kS, kT, "SensorName"},
    {"RasterInfo", kS, kI,
     "HeaderOffset RowPrefix RowSuffix NrOfPixelsPerLine NrOfLinesPerImage RasterInfo.NrOfChannels "
     "RasterInfo.FooterLen RasterInfo.TiffRowsInvert RasterInfo.TiffColsInvert"},
    {"RasterInfo", kS, kT, "CellType DataUnits BytesOrder RasterInfo.GeocodedImage"},
    {"RasterInfo", kS, kD,
     "NullCellValue RasterInfo.RealScaleFactor RasterInfo.ImaginaryScaleFactor "
     "RasterInfo.TiffMinValue RasterInfo.TiffMaxValue RasterInfo.TiffScale RasterInfo.TiffExponent "
     "RasterInfo.TiffRowScale RasterInfo.TiffColScale"},
    {"RasterInfo", kV, kT, "Description RasterInfo.ClassificationName"},
    {"RasterInfo", kV, kI, "RasterInfo.TiffLUTRed RasterInfo.TiffLUTGreen RasterInfo.TiffLUTBlue"},
    {"RasterInfo", kM, kT, "RasterInfo.OtherInfo"},
    {"RegistrationCoordinates", kS, kD,
     "LatNorthing LonEasting RegistrationCoordinates.PixelSpacingLatNorth "
     "RegistrationCoordinates.PixelSpacingLonEast"},
    {"sar_processing", kV, kD, "AzWinCoeff"},
    {"sar_processing", kS, kD,
     "Inter_Burst_Time SWST_MAX RgFilterCoeff Acquisition_Start_Time NoisePower ChirpPower RO_REF"},
    {"sar_processing", kS, kI, "Rank Echoes_per_burst Lines_per_burst Bursts Order"},
    {"orbit_information", kS, kI,
     "nDopRateDataSet nSl2GrDataSet nGr2SlDataSet nSl2ThetaDataSet nSl2PhiDataSet"},
    {"orbit_information", kV, kT,
     "DopRateRefTime SlantToGround-RefTime GroundToSlant-RefTime SlantToTheta-RefTime "
     "SlantToPhi-RefTime"},
    {"orbit_information", kV, kD,
     "DopRateRgRefTime SlantToGround-RgRefTime GroundToSlant-RgRefTime SlantToTheta-RgRefTime "
     "SlantToPhi-RgRefTime"},
    {"orbit_information", kV, kI, "DopRatePol_nCoeff"},
    {"orbit_information", kM, kD,
     "DopRateRangeCoeff SlantToGround GroundToSlant SlantToTheta SlantToPhi"},
    {"DEMCoordinates", kS, kD,
     "DEMCoordinates.NorthingCoordinateBegin DEMCoordinates.NorthingGridSize "
     "DEMCoordinates.NorthingCoordinateEnd DEMCoordinates.EastingCoordinateBegin "
     "DEMCoordinates.EastingGridSize DEMCoordinates.EastingCoordinateEnd"},
    {"CartographicSystem", kS, kT,
     "CartographicSystem.State CartographicSystem.Hemisphere CartographicSystem.Projection "
     "CartographicSystem.Zone CartographicSystem.Ellipsoid CartographicSystem.DatumShift"},
    {"CartographicSystem", kS, kD,
     "CartographicSystem.ReferenceHeight CartographicSystem.ProjectionDatumFalseNorthing "
     "CartographicSystem.ProjectionDatumFalseEasting CartographicSystem.CentralOfProjLongitude "
     "CartographicSystem.CentralOfProjLatitude CartographicSystem.ScaleFactor "
     "CartographicSystem.SphereRadius CartographicSystem.LatitudeOfTrueScale "
     "CartographicSystem.StandardParallel1 CartographicSystem.StandardParallel2"},
};

// The keywords of the "KEY=value" lines of an ENVISAT file's main and specific product headers.
std::set<std::string> productHeaderKeywords(const std::string& path) {
  constexpr size_t kMphSize = 1247;
  const std::string text = ReadFile(path);
  const size_t sphSizeAt = text.find("SPH_SIZE=");
  if (text.size() < kMphSize || sphSizeAt == std::string::npos) return {};
  const size_t sphSize = std::stoul(text.substr(sphSizeAt + 9, 11));
  std::istringstream lines(text.substr(0, std::min(text.size(), kMphSize + sphSize)));
  std::set<std::string> keys;
  std::string line;
  while (std::getline(lines, line)) {
    const size_t eq = line.find('=');
    if (eq != std::string::npos && eq > 0) keys.insert(line.substr(0, eq));
  }
  return keys;
}

using InstallationData = SuiteTest;

TEST_F(InstallationData, EverySectionKeyFileDefinesItsSectionAndItsStructures) {
  std::vector<std::string> sections = NVLR_UTILITY_ProductHeaderSections();
  sections.push_back("ENVI_HeaderDescriptionType");
  for (const std::string& name : sections) {
    CDescriptionSection section(name);
    ASSERT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), 0) << name;
    EXPECT_GT(section.fieldCount(), 0) << name;
    // A vector of structures is sized through its members, which must be vectors of one length.
    for (int i = 0; i < section.fieldCount(); ++i) {
      CDescriptionField& field = section.field(i);
      if (field.shape() != CVLR_FieldShape::Multiple) continue;
      EXPECT_GT(field.columns(), 1) << name << "." << field.name();
      EXPECT_EQ(RaisedCode([&] { setNumberOfElements(&field, 3); }), 0) << field.name();
      for (const CDescriptionField& sub : field.subFields())
        EXPECT_EQ(sub.columns(), 3) << field.name() << "." << sub.name();
    }
  }
}

TEST_F(InstallationData, EveryHeaderFieldPathResolvesToItsSectionShapeAndType) {
  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  for (const FieldGroup& group : kContract) {
    CDescriptionSection* section = findSection(header, group.section);
    ASSERT_NE(section, nullptr) << group.section;
    std::istringstream paths(group.paths);
    for (std::string path; paths >> path;) {
      CDescriptionField* field = nullptr;
      ASSERT_EQ(RaisedCode([&] { field = getField(header, path.c_str()); }), 0) << path;
      EXPECT_EQ(field, section->findField(path.substr(path.find('.') + 1)))
          << path << " resolves outside " << group.section;
      EXPECT_EQ(field->shape(), group.shape) << path;
      EXPECT_EQ(field->type(), group.type) << path;
    }
  }
}

TEST_F(InstallationData, FixedHeaderHoldsEveryKeywordOfRealProductHeaders) {
  CDescriptionHeader header(std::vector<std::string>{"EnvisatFixHeader"});
  CDescriptionSection* section = findSection(header, "EnvisatFixHeader");
  ASSERT_NE(section, nullptr);
  const std::string samples = SourceDir() + "/data/samples/envisat/";
  for (const char* file : {"ASA_XCA_AXVIEC20070517_153558_20070204_165113_20071231_000000",
                           "DOR_VOR_AXVF-P20080331_075200_20080301_215527_20080303_002327"}) {
    const std::set<std::string> keys = productHeaderKeywords(samples + file);
    EXPECT_GE(keys.size(), 40u) << file;
    for (const std::string& key : keys) {
      const CDescriptionField* field = section->findField(key);
      ASSERT_NE(field, nullptr) << key << " of " << file;
      EXPECT_EQ(field->shape(), kS) << key;
      EXPECT_EQ(field->type(), kT) << key;
    }
  }
}

// The mandatory-field check reads this list (its forms are covered with the check).
TEST_F(InstallationData, MandatoryListNamesRasterFields) {
  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  std::ifstream list(inst_.root() + "/mandatory/vlr_raster_file.mandatory");
  ASSERT_TRUE(list.good());
  std::string sectionName, name;
  int listed = 0;
  while (list >> sectionName >> name) {
    CDescriptionSection* section = findSection(header, sectionName.c_str());
    ASSERT_NE(section, nullptr) << sectionName;
    EXPECT_NE(section->findField(name), nullptr) << sectionName << " " << name;
    ++listed;
  }
  EXPECT_EQ(listed, 7);
}

}  // namespace
}  // namespace vlr_test
