// Data-set enumerations, their stored texts and the swath and polarisation
// numbers of the calibration files.
#include <cstdio>

#include "metadata_sections/data_set_info.h"
#include "metadata_fixture.h"

namespace {

void setText(char* field, const char* text) {
  std::snprintf(field, kParStringSize, "%s", text);
}

TEST(DataSetInfo, EnumerationsStoreTheirTextsAndUnknownValuesTheDefault) {
  DataSetInfo_Obj info;
  info.SetImageType(DS_IMAGE_COREGISTERED_SLC);
  EXPECT_STREQ(info.ImageType, "COREGISTERED SLANT RANGE COMPLEX IMAGE");
  info.SetImageType(static_cast<DSImageType>(99));
  EXPECT_TRUE(info.IsImageType(DS_IMAGE_NOT_SET));
  info.SetSensorType(static_cast<DSSensorType>(-1));
  EXPECT_STREQ(info.SensorName, "SENSOR UNKNOWN");
  info.SetUnitType(DS_UNIT_VOLT2);
  EXPECT_FALSE(info.IsUnitType(DS_UNIT_VOLT));
  // The comparison is exact.
  setText(info.AcquisitionMode, "scansar");
  EXPECT_FALSE(info.IsAcqMode(DS_ACQ_SCANSAR));
  EXPECT_STREQ(DSRefSysText(3), "REFERENCE SYSTEM UNDEFINED");
}

TEST(DataSetInfo, SetTypeSetsTheReferenceSystemOnlyForGeocodedData) {
  DataSetInfo_Obj info;
  info.SetType(DS_IMAGE_MULTILOOK, DS_SENSOR_ASAR, DS_ACQ_SCANSAR, DS_PROJECTION_SLANT_RANGE,
               DS_UNIT_VOLT, DS_REFSYS_WGS84);
  EXPECT_STREQ(info.RefSystem, "REFERENCE SYSTEM UNDEFINED");
  EXPECT_FALSE(info.IsType(DS_IMAGE_MULTILOOK, DS_SENSOR_ASAR, DS_ACQ_SCANSAR,
                           DS_PROJECTION_SLANT_RANGE, DS_UNIT_VOLT, DS_REFSYS_WGS84));
  EXPECT_TRUE(info.IsType(DS_IMAGE_MULTILOOK, DS_SENSOR_ASAR, DS_ACQ_SCANSAR,
                          DS_PROJECTION_SLANT_RANGE, DS_UNIT_VOLT, DS_REFSYS_UNDEFINED));
  info.SetType(DS_IMAGE_DEM, DS_SENSOR_ERS2, DS_ACQ_STRIPMAP, DS_PROJECTION_GEOCODED, DS_UNIT_METER,
               DS_REFSYS_EGM84);
  EXPECT_STREQ(info.RefSystem, "EGM84");
}

TEST(DataSetInfo, SwathAndPolarisationNumbers) {
  DataSetInfo_Obj info;
  const struct {
    const char* swath;
    int slot;
  } swaths[] = {{"IS1", 0}, {"IS3", 2},   {"IS7", 6},   {"SS1", 7},    {"SS2", 2},
                {"SS5", 5}, {"IS8", 666}, {"ss1", 666}, {"SS1 ", 666}, {"NOT_AVAILABLE", 666}};
  for (const auto& s : swaths) {
    setText(info.Swath, s.swath);
    EXPECT_EQ(info.getISNbr(), s.slot) << s.swath;
  }
  const char* polarisations[] = {"H/H", "V/V", "H/V", "V/H"};
  for (int i = 0; i < 4; ++i) {
    setText(info.Polarization, polarisations[i]);
    EXPECT_EQ(info.getPolarizationNbr(), i);
  }
  setText(info.Polarization, "HH");
  EXPECT_EQ(info.getPolarizationNbr(), 666);
}

}  // namespace
