// The installation's section key files and mandatory-field list.  The field table below is the
// contract between the key files and the code that writes and reads product headers: a path without
// a section name resolves to the first section of the catalogue that has the field, so a field
// defined in the wrong section, or shadowed by an earlier one, sends a value where no reader looks
// for it.
#include <gtest/gtest.h>

#include <fstream>
#include <memory>
#include <set>
#include <sstream>
#include <string>
#include <vector>

#include "suite/cell_types.h"
#include "suite/description_header.h"
#include "suite_fixture.h"

namespace vlr_test {
namespace {

// The product header catalogue, in header order.
const std::vector<std::string> kCatalogue = {"GCPRasterInfo",
                                             "Baseline",
                                             "OrbitCorrection",
                                             "StateVectorCalc",
                                             "StateVectorData",
                                             "InitialGeometry",
                                             "Processing",
                                             "RasterInfo",
                                             "PolarimetricCalibrationParameters",
                                             "interferometric_processing",
                                             "sar_processing",
                                             "orbit_information",
                                             "Sensor",
                                             "ChannelInfo",
                                             "DEMCoordinates",
                                             "RegistrationCoordinates",
                                             "CartographicSystem",
                                             "user_defined_section",
                                             "EnvisatFixHeader",
                                             "EnvisatDescriptionRecord"};
const char* const kEnviSection = "ENVI_HeaderDescriptionType";

constexpr CVLR_FieldShape kS = CVLR_FieldShape::Scalar;
constexpr CVLR_FieldShape kV = CVLR_FieldShape::Vector;
constexpr CVLR_FieldShape kM = CVLR_FieldShape::Matrix;
constexpr CVLR_FieldType kI = CVLR_FieldType::Integer;
constexpr CVLR_FieldType kD = CVLR_FieldType::Double;
constexpr CVLR_FieldType kT = CVLR_FieldType::String;

struct FieldContract {
  const char* path;
  const char* section;
  CVLR_FieldShape shape;
  CVLR_FieldType type;
};

const FieldContract kContract[] = {
    // Written by the header conversion and read back by the multilook.
    {"AzimuthPixelShift", "OrbitCorrection", kV, kD},
    {"StateVectorSource", "StateVectorData", kS, kT},
    {"StateVectorReference", "StateVectorData", kS, kT},
    {"nStateVectors", "StateVectorData", kS, kI},
    {"TimeFirst", "StateVectorData", kS, kT},
    {"TimeDelta", "StateVectorData", kS, kD},
    {"pos_x", "StateVectorData", kV, kD},
    {"pos_y", "StateVectorData", kV, kD},
    {"pos_z", "StateVectorData", kV, kD},
    {"vel_x", "StateVectorData", kV, kD},
    {"vel_y", "StateVectorData", kV, kD},
    {"vel_z", "StateVectorData", kV, kD},
    {"InitialGeometry.Projection", "InitialGeometry", kS, kT},
    {"InitialGeometry.SceneHeading", "InitialGeometry", kS, kD},
    {"SceneHeading", "InitialGeometry", kS, kD},
    {"InitialGeometry.TimeDirectionPixel", "InitialGeometry", kS, kT},
    {"InitialGeometry.TimeDirectionLines", "InitialGeometry", kS, kT},
    {"InitialGeometry.OrbitConfiguration", "InitialGeometry", kS, kT},
    {"InitialGeometry.ReferenceHeight", "InitialGeometry", kS, kD},
    {"NAzimuthLooks", "Processing", kS, kI},
    {"NRangeLooks", "Processing", kS, kI},
    {"SlantRange", "Processing", kV, kD},
    {"PixelSpacingRg", "Processing", kS, kD},
    {"PixelSpacingAz", "Processing", kS, kD},
    {"FastTime", "Processing", kV, kD},
    {"AzimuthStartTime", "Processing", kS, kT},
    {"AzimuthStopTime", "Processing", kS, kT},
    {"nDopCenDataSet", "Processing", kS, kI},
    {"DopCenRefTime", "Processing", kV, kT},
    {"DopCenRgRefTime", "Processing", kV, kD},
    {"DopCenPol_nCoeff", "Processing", kV, kI},
    {"DopCenRangeCoeff", "Processing", kM, kD},
    {"ProcessingVelocity", "Processing", kV, kD},
    {"FromInImageAzimuthLooks", "Processing", kS, kI},
    {"FromInImageRangeLooks", "Processing", kS, kI},
    {"CarrierFrequency", "ChannelInfo", kV, kD},
    {"SamplingRate", "ChannelInfo", kV, kD},
    {"PRF", "ChannelInfo", kV, kD},
    {"PRFExtracted", "ChannelInfo", kV, kD},
    {"PulseDuration", "ChannelInfo", kV, kD},
    {"BandWidth", "ChannelInfo", kV, kD},
    {"Description", "RasterInfo", kV, kT},
    {"CalConstProc", "Processing", kS, kD},
    {"RangeLookAngle", "ChannelInfo", kS, kD},
    {"IncidenceAngle", "ChannelInfo", kS, kD},
    {"EnvisatTwoWayAntennaElevationPatternTableNbr", "Sensor", kS, kI},
    {"EnvisatReferenceElevationAngle", "Sensor", kS, kD},
    {"EnvisatTwoWayAntennaElevationPatternTable", "Sensor", kV, kD},
    {"AzWinCoeff", "sar_processing", kV, kD},
    {"HeaderOffset", "RasterInfo", kS, kI},
    {"RowPrefix", "RasterInfo", kS, kI},
    {"RowSuffix", "RasterInfo", kS, kI},
    {"CellType", "RasterInfo", kS, kT},
    {"DataUnits", "RasterInfo", kS, kT},
    {"NullCellValue", "RasterInfo", kS, kD},
    {"NrOfPixelsPerLine", "RasterInfo", kS, kI},
    {"NrOfLinesPerImage", "RasterInfo", kS, kI},
    {"BytesOrder", "RasterInfo", kS, kT},
    {"SensorName", "Sensor", kS, kT},
    {"LatNorthing", "RegistrationCoordinates", kS, kD},
    {"LonEasting", "RegistrationCoordinates", kS, kD},
    {"Inter_Burst_Time", "sar_processing", kS, kD},
    {"SWST_MAX", "sar_processing", kS, kD},
    {"RgFilterCoeff", "sar_processing", kS, kD},
    {"Rank", "sar_processing", kS, kI},
    {"Echoes_per_burst", "sar_processing", kS, kI},
    {"Lines_per_burst", "sar_processing", kS, kI},
    {"Bursts", "sar_processing", kS, kI},
    {"Order", "sar_processing", kS, kI},
    {"Acquisition_Start_Time", "sar_processing", kS, kD},
    {"NoisePower", "sar_processing", kS, kD},
    {"ChirpPower", "sar_processing", kS, kD},
    {"RO_REF", "sar_processing", kS, kD},
    {"nDopRateDataSet", "orbit_information", kS, kI},
    {"nSl2GrDataSet", "orbit_information", kS, kI},
    {"nGr2SlDataSet", "orbit_information", kS, kI},
    {"nSl2ThetaDataSet", "orbit_information", kS, kI},
    {"nSl2PhiDataSet", "orbit_information", kS, kI},
    {"DopRateRefTime", "orbit_information", kV, kT},
    {"DopRateRgRefTime", "orbit_information", kV, kD},
    {"DopRatePol_nCoeff", "orbit_information", kV, kI},
    {"DopRateRangeCoeff", "orbit_information", kM, kD},
    {"SlantToGround", "orbit_information", kM, kD},
    {"SlantToGround-RefTime", "orbit_information", kV, kT},
    {"SlantToGround-RgRefTime", "orbit_information", kV, kD},
    {"GroundToSlant", "orbit_information", kM, kD},
    {"GroundToSlant-RefTime", "orbit_information", kV, kT},
    {"GroundToSlant-RgRefTime", "orbit_information", kV, kD},
    {"SlantToTheta", "orbit_information", kM, kD},
    {"SlantToTheta-RefTime", "orbit_information", kV, kT},
    {"SlantToTheta-RgRefTime", "orbit_information", kV, kD},
    {"SlantToPhi", "orbit_information", kM, kD},
    {"SlantToPhi-RefTime", "orbit_information", kV, kT},
    {"SlantToPhi-RgRefTime", "orbit_information", kV, kD},
    {"RasterInfo.OtherInfo", "RasterInfo", kM, kT},
    // Read by the raster file, the map grid, the ENVI header and the TIFF export.
    {"RasterInfo.NrOfChannels", "RasterInfo", kS, kI},
    {"RasterInfo.FooterLen", "RasterInfo", kS, kI},
    {"RasterInfo.RealScaleFactor", "RasterInfo", kS, kD},
    {"RasterInfo.ImaginaryScaleFactor", "RasterInfo", kS, kD},
    {"RasterInfo.GeocodedImage", "RasterInfo", kS, kT},
    {"RasterInfo.TiffMinValue", "RasterInfo", kS, kD},
    {"RasterInfo.TiffMaxValue", "RasterInfo", kS, kD},
    {"RasterInfo.TiffScale", "RasterInfo", kS, kD},
    {"RasterInfo.TiffExponent", "RasterInfo", kS, kD},
    {"RasterInfo.TiffRowScale", "RasterInfo", kS, kD},
    {"RasterInfo.TiffColScale", "RasterInfo", kS, kD},
    {"RasterInfo.TiffRowsInvert", "RasterInfo", kS, kI},
    {"RasterInfo.TiffColsInvert", "RasterInfo", kS, kI},
    {"RasterInfo.TiffLUTRed", "RasterInfo", kV, kI},
    {"RasterInfo.TiffLUTGreen", "RasterInfo", kV, kI},
    {"RasterInfo.TiffLUTBlue", "RasterInfo", kV, kI},
    {"RasterInfo.ClassificationName", "RasterInfo", kV, kT},
    {"RegistrationCoordinates.PixelSpacingLatNorth", "RegistrationCoordinates", kS, kD},
    {"RegistrationCoordinates.PixelSpacingLonEast", "RegistrationCoordinates", kS, kD},
    {"DEMCoordinates.NorthingCoordinateBegin", "DEMCoordinates", kS, kD},
    {"DEMCoordinates.NorthingGridSize", "DEMCoordinates", kS, kD},
    {"DEMCoordinates.NorthingCoordinateEnd", "DEMCoordinates", kS, kD},
    {"DEMCoordinates.EastingCoordinateBegin", "DEMCoordinates", kS, kD},
    {"DEMCoordinates.EastingGridSize", "DEMCoordinates", kS, kD},
    {"DEMCoordinates.EastingCoordinateEnd", "DEMCoordinates", kS, kD},
    {"CartographicSystem.State", "CartographicSystem", kS, kT},
    {"CartographicSystem.Hemisphere", "CartographicSystem", kS, kT},
    {"CartographicSystem.Projection", "CartographicSystem", kS, kT},
    {"CartographicSystem.Zone", "CartographicSystem", kS, kT},
    {"CartographicSystem.Ellipsoid", "CartographicSystem", kS, kT},
    {"CartographicSystem.DatumShift", "CartographicSystem", kS, kT},
    {"CartographicSystem.ReferenceHeight", "CartographicSystem", kS, kD},
    {"CartographicSystem.ProjectionDatumFalseNorthing", "CartographicSystem", kS, kD},
    {"CartographicSystem.ProjectionDatumFalseEasting", "CartographicSystem", kS, kD},
    {"CartographicSystem.CentralOfProjLongitude", "CartographicSystem", kS, kD},
    {"CartographicSystem.CentralOfProjLatitude", "CartographicSystem", kS, kD},
    {"CartographicSystem.ScaleFactor", "CartographicSystem", kS, kD},
    {"CartographicSystem.SphereRadius", "CartographicSystem", kS, kD},
    {"CartographicSystem.LatitudeOfTrueScale", "CartographicSystem", kS, kD},
    {"CartographicSystem.StandardParallel1", "CartographicSystem", kS, kD},
    {"CartographicSystem.StandardParallel2", "CartographicSystem", kS, kD},
};

std::string fieldName(const std::string& path) {
  const size_t dot = path.find('.');
  return dot == std::string::npos ? path : path.substr(dot + 1);
}

// The keywords of the "KEY=value" lines of an ENVISAT file's main and
// specific product headers.
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
  std::vector<std::string> sections = kCatalogue;
  sections.push_back(kEnviSection);
  for (const std::string& name : sections) {
    CDescriptionSection section(name);
    ASSERT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), 0) << name;
    EXPECT_GT(section.fieldCount(), 0) << name;
    // A vector of structures is sized through its members, which must be
    // vectors of one length.
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

TEST_F(InstallationData, ProductHeadersAreCreatedFromTheWholeCatalogue) {
  std::unique_ptr<CDescriptionHeader> header;
  ASSERT_EQ(RaisedCode([&] { header = std::make_unique<CDescriptionHeader>(kCatalogue); }), 0);
  ASSERT_EQ(header->sectionCount(), static_cast<int>(kCatalogue.size()));
  for (size_t i = 0; i < kCatalogue.size(); ++i)
    EXPECT_EQ(header->section(static_cast<int>(i)).name(), kCatalogue[i]);
  std::unique_ptr<CDescriptionHeader> fixed;
  EXPECT_EQ(
      RaisedCode([&] {
        fixed = std::make_unique<CDescriptionHeader>(std::vector<std::string>{"EnvisatFixHeader"});
      }),
      0);
}

TEST_F(InstallationData, EveryHeaderFieldPathResolvesToItsSectionShapeAndType) {
  CDescriptionHeader header(kCatalogue);
  for (const FieldContract& c : kContract) {
    CDescriptionField* field = nullptr;
    ASSERT_EQ(RaisedCode([&] { field = getField(header, c.path); }), 0) << c.path;
    CDescriptionSection* section = findSection(header, c.section);
    ASSERT_NE(section, nullptr) << c.section;
    EXPECT_EQ(field, section->findField(fieldName(c.path)))
        << c.path << " resolves outside " << c.section;
    EXPECT_EQ(field->shape(), c.shape) << c.path;
    EXPECT_EQ(field->type(), c.type) << c.path;
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

TEST_F(InstallationData, MandatoryListNamesRasterFieldsAndIsFoundByTheCheck) {
  CDescriptionHeader header(kCatalogue);
  std::ifstream list(inst_.root() + "/mandatory/vlr_raster_file.mandatory");
  ASSERT_TRUE(list.good());
  std::string sectionName, name;
  std::vector<CDescriptionField*> listed;
  while (list >> sectionName >> name) {
    CDescriptionSection* section = findSection(header, sectionName.c_str());
    ASSERT_NE(section, nullptr) << sectionName;
    CDescriptionField* field = section->findField(name);
    ASSERT_NE(field, nullptr) << sectionName << " " << name;
    listed.push_back(field);
  }
  ASSERT_EQ(listed.size(), 7u);
  for (CDescriptionField* field : listed) {
    if (field->type() == kT)
      setString(field, "X");
    else if (field->type() == kI)
      setInteger(field, 1);
  }
  getField(header, "RowSuffix")->clear();
  checkMandatoryFields(header);
  const std::string log = processLog();
  EXPECT_NE(log.find("Mandatory Field [RowSuffix] is not found in [RasterInfo] section"),
            std::string::npos)
      << log;
  EXPECT_EQ(log.find("Mandatory Field [CellType]"), std::string::npos) << log;
}

}  // namespace
}  // namespace vlr_test
