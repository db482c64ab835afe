#include "metadata_sections/data_set_info.h"

#include <cfloat>
#include <climits>
#include <cstdio>
#include <cstring>

#include "metadata_sections/legacy_fields.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "data_set_info";
constexpr int kChannel = 1;
constexpr const char* kSection = "DataSetInfo";
constexpr int kFields = 33;
constexpr const char* kNotAvailable = "NOT_AVAILABLE";

constexpr const char* kImageTypeTexts[] = {"NOT SET",
                                           "RANGE FOCUSED",
                                           "AZIMUTH FOCUSED",
                                           "RAW DATA",
                                           "MULTILOOK",
                                           "INTERFEROMETRY",
                                           "FLAT EARTH",
                                           "COHERENCE MAP",
                                           "DEM",
                                           "SYNTHETIC FRINGES",
                                           "DEM IMAGE TIMES MAP",
                                           "IMAGE HEIGHT MAP",
                                           "COREGISTERED SLANT RANGE COMPLEX IMAGE",
                                           "PHASE UNWRAPPED",
                                           "RAW DATA ALIGNED"};
constexpr const char* kSensorTexts[] = {"SENSOR UNKNOWN", "ASAR",   "RADARSAT",    "ERS1",
                                        "ERS2",           "PALSAR", "TERRA SAR-X", "CSKS1",
                                        "CSKS2",          "CSKS3",  "CSKS4"};
constexpr const char* kAcqModeTexts[] = {"ACQUISITION MODE UNDEFINED", "STRIPMAP",
                                         "DOUBLE POLARIZATION", "QUAD POLARIZATION", "SCANSAR"};
constexpr const char* kProjectionTexts[] = {"PROJECTION UNDEFINED", "GROUND RANGE", "SLANT RANGE",
                                            "GEOCODED"};
constexpr const char* kUnitTexts[] = {
    "UNIT TYPE UNDEFINED", "VOLT", "VOLT^2", "VOLTcomplex", "meter", "Radian", "Degree", "sec"};
constexpr const char* kRefSysTexts[] = {"REFERENCE SYSTEM UNDEFINED", "WGS84", "EGM84"};

template <size_t N>
const char* textOf(const char* const (&texts)[N], int value) {
  return value >= 0 && value < static_cast<int>(N) ? texts[value] : texts[0];
}

void store(char* field, const char* text) {
  std::snprintf(field, kParStringSize, "%s", text);
}

// Swath texts in the order of the calibration files' slots.
constexpr const char* kImageSwaths[] = {"IS1", "IS2", "IS3", "IS4", "IS5", "IS6", "IS7"};
struct WideSwathSlot {
  const char* text;
  int slot;
};
constexpr WideSwathSlot kWideSwaths[] = {
    {"SS1", 7}, {"SS2", 2}, {"SS3", 3}, {"SS4", 4}, {"SS5", 5}};
constexpr const char* kPolarisations[] = {"H/H", "V/V", "H/V", "V/H"};

}  // namespace

const char* DSImageTypeText(int value) {
  return textOf(kImageTypeTexts, value);
}
const char* DSSensorTypeText(int value) {
  return textOf(kSensorTexts, value);
}
const char* DSAcqModeText(int value) {
  return textOf(kAcqModeTexts, value);
}
const char* DSProjectionText(int value) {
  return textOf(kProjectionTexts, value);
}
const char* DSUnitTypeText(int value) {
  return textOf(kUnitTexts, value);
}
const char* DSRefSysText(int value) {
  return textOf(kRefSysTexts, value);
}

DataSetInfo_Obj::DataSetInfo_Obj() {
  for (char* s :
       {OrbitNumber, Track, SenseDate, SceneID, Description, AcquisitionStation, ProcessingCenter,
        ProcessingDate, ProcessingSoftware, OrbitConfiguration, Polarization, Swath}) {
    store(s, kNotAvailable);
  }
  store(Projection, DSProjectionText(DS_PROJECTION_UNDEFINED));
  store(ImageType, DSImageTypeText(DS_IMAGE_NOT_SET));
  store(SensorName, DSSensorTypeText(DS_SENSOR_UNKNOWN));
  store(AcquisitionMode, DSAcqModeText(DS_ACQ_UNDEFINED));
  store(RefSystem, DSRefSysText(DS_REFSYS_UNDEFINED));
  store(UnitType, DSUnitTypeText(DS_UNIT_UNDEFINED));
  createElementsVector(kFields);
}

void DataSetInfo_Obj::refreshParameters() {
  addElementString("OrbitNumber", OrbitNumber, true);
  addElementString("Track", Track, true);
  addElementString("SenseDate", SenseDate, true);
  addElementString("SceneID", SceneID, true);
  addElementString("Description", Description, true);
  addElementString("AcquisitionStation", AcquisitionStation, true);
  addElementString("ProcessingCenter", ProcessingCenter, true);
  addElementString("ProcessingDate", ProcessingDate, true);
  addElementString("ProcessingSoftware", ProcessingSoftware, true);
  addElementDouble("SceneHeading", &SceneHeading, 1, -DBL_MAX, DBL_MAX, true);
  addElementString("OrbitConfiguration", OrbitConfiguration, true);
  addElementString("Polarization", Polarization, true);
  addElementString("Swath", Swath, true);
  addElementDouble("SWST_MIN", &SWST_MIN, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("SWST_MAX", &SWST_MAX, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("RO_REF", &RO_REF, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("RangeLooks", &RangeLooks, 1, 1, 1000, true);
  addElementDouble("RangeBandwidth", RangeBandwidth, 5, -DBL_MAX, DBL_MAX, true);
  addElementDouble("ExternalCalibrationFactor", &ExternalCalibrationFactor, 1, -DBL_MAX, DBL_MAX,
                   true);
  addElementString("Projection", Projection, true);
  addElementString("ImageType", ImageType, false);
  addElementInt("RGAntenna_flag", &RGAntenna_flag, 1, 0, 1, false);
  addElementInt("AZAntenna_flag", &AZAntenna_flag, 1, 0, 1, false);
  addElementInt("SpreadLoss_flag", &SpreadLoss_flag, 1, 0, 1, false);
  addElementInt("DroopGain_flag", &DroopGain_flag, 1, 0, 1, false);
  addElementInt("RGAntenna_AltitudeCorr_flag", &RGAntenna_AltitudeCorr_flag, 1, 0, 1, false);
  addElementInt("NoiseCorr_flag", &NoiseCorr_flag, 1, 0, 1, false);
  addElementString("SensorName", SensorName, false);
  addElementString("AcquisitionMode", AcquisitionMode, false);
  addElementString("RefSystem", RefSystem, false);
  addElementString("UnitType", UnitType, false);
  addElementInt("MissingLines", &MissingLines, 1, 0, INT_MAX, false);
  addElementInt("LookDirection", &LookDirection, 1, 0, INT_MAX, false);
  setAllocationFlag(true);
}

int DataSetInfo_Obj::readhdr(const char* file) {
  VLR_SCOPE("DataSetInfo_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  // The parameter-file form has every field but the last, "LookDirection".
  const char* keys[kFields];
  for (int i = 0; i < kFields; ++i) keys[i] = element(i).name.c_str();
  keys[kFields - 1] = nullptr;
  return readLegacyFields(*this, file, kSection, keys);
}

int DataSetInfo_Obj::writehdr(const char* file) {
  VLR_SCOPE("DataSetInfo_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int DataSetInfo_Obj::clone(DataSetInfo_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}

int DataSetInfo_Obj::SetImageType(DSImageType value) {
  store(ImageType, DSImageTypeText(value));
  return 0;
}
int DataSetInfo_Obj::SetSensorType(DSSensorType value) {
  store(SensorName, DSSensorTypeText(value));
  return 0;
}
int DataSetInfo_Obj::SetAcqMode(DSAcqMode value) {
  store(AcquisitionMode, DSAcqModeText(value));
  return 0;
}
int DataSetInfo_Obj::SetProjection(DSProjection value) {
  store(Projection, DSProjectionText(value));
  return 0;
}
int DataSetInfo_Obj::SetUnitType(DSUnitType value) {
  store(UnitType, DSUnitTypeText(value));
  return 0;
}
int DataSetInfo_Obj::SetRefSys(DSRefSys value) {
  store(RefSystem, DSRefSysText(value));
  return 0;
}

bool DataSetInfo_Obj::IsImageType(DSImageType value) const {
  return std::strcmp(ImageType, DSImageTypeText(value)) == 0;
}
bool DataSetInfo_Obj::IsSensorType(DSSensorType value) const {
  return std::strcmp(SensorName, DSSensorTypeText(value)) == 0;
}
bool DataSetInfo_Obj::IsAcqMode(DSAcqMode value) const {
  return std::strcmp(AcquisitionMode, DSAcqModeText(value)) == 0;
}
bool DataSetInfo_Obj::IsProjection(DSProjection value) const {
  return std::strcmp(Projection, DSProjectionText(value)) == 0;
}
bool DataSetInfo_Obj::IsUnitType(DSUnitType value) const {
  return std::strcmp(UnitType, DSUnitTypeText(value)) == 0;
}
bool DataSetInfo_Obj::IsRefSys(DSRefSys value) const {
  return std::strcmp(RefSystem, DSRefSysText(value)) == 0;
}

int DataSetInfo_Obj::SetType(DSImageType image, DSSensorType sensor, DSAcqMode mode,
                             DSProjection projection, DSUnitType unit, DSRefSys refsys) {
  SetImageType(image);
  SetSensorType(sensor);
  SetAcqMode(mode);
  SetProjection(projection);
  SetUnitType(unit);
  if (IsProjection(DS_PROJECTION_GEOCODED)) SetRefSys(refsys);
  return 0;
}

bool DataSetInfo_Obj::IsType(DSImageType image, DSSensorType sensor, DSAcqMode mode,
                             DSProjection projection, DSUnitType unit, DSRefSys refsys) const {
  return IsImageType(image) && IsSensorType(sensor) && IsAcqMode(mode) &&
         IsProjection(projection) && IsUnitType(unit) && IsRefSys(refsys);
}

int DataSetInfo_Obj::fillTESSAL() {
  store(ProcessingCenter, kProcessingCentre);
  return 0;
}

int DataSetInfo_Obj::getPolarizationNbr() const {
  for (int i = 0; i < 4; ++i)
    if (std::strcmp(Polarization, kPolarisations[i]) == 0) return i;
  return kUnknown;
}

int DataSetInfo_Obj::getISNbr() const {
  for (int i = 0; i < 7; ++i)
    if (std::strcmp(Swath, kImageSwaths[i]) == 0) return i;
  for (const WideSwathSlot& s : kWideSwaths)
    if (std::strcmp(Swath, s.text) == 0) return s.slot;
  return kUnknown;
}
