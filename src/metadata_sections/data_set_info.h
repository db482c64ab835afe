// Identification, acquisition and processing description of a SAR data set,
// with the kind of image it holds.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "metadata_framework/par_element.h"

// The kinds of data a data set can hold, stored in "ImageType".
enum DSImageType {
  DS_IMAGE_NOT_SET = 0,
  DS_IMAGE_RANGE_FOCUSED = 1,
  DS_IMAGE_AZIMUTH_FOCUSED = 2,
  DS_IMAGE_RAW_DATA = 3,
  DS_IMAGE_MULTILOOK = 4,
  DS_IMAGE_INTERFEROMETRY = 5,
  DS_IMAGE_FLAT_EARTH = 6,
  DS_IMAGE_COHERENCE_MAP = 7,
  DS_IMAGE_DEM = 8,
  DS_IMAGE_SYNTHETIC_FRINGES = 9,
  DS_IMAGE_DEM_IMAGE_TIMES_MAP = 10,
  DS_IMAGE_IMAGE_HEIGHT_MAP = 11,
  DS_IMAGE_COREGISTERED_SLC = 12,
  DS_IMAGE_PHASE_UNWRAPPED = 13,
  DS_IMAGE_RAW_DATA_ALIGNED = 14,
};

// Sensors, stored in "SensorName".
enum DSSensorType {
  DS_SENSOR_UNKNOWN = 0,
  DS_SENSOR_ASAR = 1,
  DS_SENSOR_RADARSAT = 2,
  DS_SENSOR_ERS1 = 3,
  DS_SENSOR_ERS2 = 4,
  DS_SENSOR_PALSAR = 5,
  DS_SENSOR_TERRASARX = 6,
  DS_SENSOR_CSKS1 = 7,
  DS_SENSOR_CSKS2 = 8,
  DS_SENSOR_CSKS3 = 9,
  DS_SENSOR_CSKS4 = 10,
};

// Acquisition modes, stored in "AcquisitionMode".
enum DSAcqMode {
  DS_ACQ_UNDEFINED = 0,
  DS_ACQ_STRIPMAP = 1,
  DS_ACQ_DOUBLE_POLARIZATION = 2,
  DS_ACQ_QUAD_POLARIZATION = 3,
  DS_ACQ_SCANSAR = 4,
};

// Image geometries, stored in "Projection".
enum DSProjection {
  DS_PROJECTION_UNDEFINED = 0,
  DS_PROJECTION_GROUND_RANGE = 1,
  DS_PROJECTION_SLANT_RANGE = 2,
  DS_PROJECTION_GEOCODED = 3,
};

// Units of the samples, stored in "UnitType".
enum DSUnitType {
  DS_UNIT_UNDEFINED = 0,
  DS_UNIT_VOLT = 1,
  DS_UNIT_VOLT2 = 2,
  DS_UNIT_VOLT_COMPLEX = 3,
  DS_UNIT_METER = 4,
  DS_UNIT_RADIAN = 5,
  DS_UNIT_DEGREE = 6,
  DS_UNIT_SEC = 7,
};

// Reference systems of geocoded data, stored in "RefSystem".
enum DSRefSys {
  DS_REFSYS_UNDEFINED = 0,
  DS_REFSYS_WGS84 = 1,
  DS_REFSYS_EGM84 = 2,
};

// The text stored for each value; values outside the enumeration give the
// default text (that of value 0).
const char* DSImageTypeText(int value);
const char* DSSensorTypeText(int value);
const char* DSAcqModeText(int value);
const char* DSProjectionText(int value);
const char* DSUnitTypeText(int value);
const char* DSRefSysText(int value);

class DataSetInfo_Obj : public GeneralSAR_Base {
 public:
  // Processing-centre text of data sets this system produces.
  static constexpr const char* kProcessingCentre = "VELORAN SAR PROCESSING";
  // Results of getPolarizationNbr() and getISNbr() for unknown texts.
  static constexpr int kUnknown = 666;

  DataSetInfo_Obj();

  // Block "DataSetInfo" of channel 1, or else the parameter-file section
  // "DataSetInfo" ("LookDirection" is not part of that form).  Read: 0, or 1
  // when neither form holds fields 1 to 20 ("OrbitNumber" to
  // "Projection").  Write: 0 or the writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  int clone(DataSetInfo_Obj* other) const;

  // Store the text of the value.  Return 0.
  int SetImageType(DSImageType value);
  int SetSensorType(DSSensorType value);
  int SetAcqMode(DSAcqMode value);
  int SetProjection(DSProjection value);
  int SetUnitType(DSUnitType value);
  int SetRefSys(DSRefSys value);
  // Exact comparison of the stored text with the value's text.
  bool IsImageType(DSImageType value) const;
  bool IsSensorType(DSSensorType value) const;
  bool IsAcqMode(DSAcqMode value) const;
  bool IsProjection(DSProjection value) const;
  bool IsUnitType(DSUnitType value) const;
  bool IsRefSys(DSRefSys value) const;
  // The first five setters; the reference system only for geocoded data.
  int SetType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection,
              DSUnitType unit, DSRefSys refsys);
  // All six comparisons.
  bool IsType(DSImageType image, DSSensorType sensor, DSAcqMode mode, DSProjection projection,
              DSUnitType unit, DSRefSys refsys) const;
  // Marks the data set as processed here.  Returns 0.
  int fillTESSAL();

  // "H/H" 0, "V/V" 1, "H/V" 2, "V/H" 3, otherwise kUnknown.
  int getPolarizationNbr() const;
  // Swath slot of the calibration files: "IS1".."IS7" 0..6, "SS1" 7,
  // "SS2".."SS5" 2..5 (they share the slots of IS3..IS6), otherwise
  // kUnknown.
  int getISNbr() const;

  char OrbitNumber[kParStringSize];
  char Track[kParStringSize];
  char SenseDate[kParStringSize];
  char SceneID[kParStringSize];
  char Description[kParStringSize];
  char AcquisitionStation[kParStringSize];
  char ProcessingCenter[kParStringSize];
  char ProcessingDate[kParStringSize];
  char ProcessingSoftware[kParStringSize];
  double SceneHeading = -999;  // degrees
  char OrbitConfiguration[kParStringSize];
  char Polarization[kParStringSize];  // "H/H", "V/V", "H/V", "V/H"
  char Swath[kParStringSize];         // "IS1".."IS7", "SS1".."SS5"
  double SWST_MIN = -999;
  double SWST_MAX = -999;
  double RO_REF = 800000.0;  // reference slant range, m
  int RangeLooks = 1;
  double RangeBandwidth[5] = {0, 0, 0, 0, 0};
  double ExternalCalibrationFactor = 1.0;
  char Projection[kParStringSize];
  char ImageType[kParStringSize];
  // Calibration steps applied (0 or 1).
  int RGAntenna_flag = 0;
  int AZAntenna_flag = 0;
  int SpreadLoss_flag = 0;
  int DroopGain_flag = 0;
  int RGAntenna_AltitudeCorr_flag = 0;
  int NoiseCorr_flag = 0;
  char SensorName[kParStringSize];
  char AcquisitionMode[kParStringSize];
  char RefSystem[kParStringSize];
  char UnitType[kParStringSize];
  int MissingLines = -1;
  int LookDirection = 0;

 protected:
  void refreshParameters() override;
};
