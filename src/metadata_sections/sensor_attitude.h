// Platform attitude and antenna values of a SAR data set: equivalent speed
// and distance, mean Doppler centroid, squint, antenna length, the antenna
// droop gain and the instrument temperature.
#pragma once

#include "metadata_framework/general_sar_base.h"

class SensorAttitude_Obj : public GeneralSAR_Base {
 public:
  static constexpr int kDroopGains = 8;

  SensorAttitude_Obj();

  // Block "SensorAttitude" of channel 1, or else the parameter-file section
  // "SensorAttitude".  Read: 0, or 1 when neither form holds all seven
  // fields.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  int clone(SensorAttitude_Obj* other) const;

  // Temperature and droop gain of entry `mode` (0..4, chosen by the caller
  // from the acquisition mode) of the instrument characterisation file
  // `file` (ASA_INS).  Other modes read the file but change nothing.  0, or
  // the code of the failing open (9), read (4), seek or close.
  int getDroopGain(const char* file, int mode);

  double Eq_speed = -999;     // equivalent speed, m/s
  double Eq_distance = -999;  // equivalent distance, m
  double Mean_DC = -999;      // mean Doppler centroid, Hz
  double SquintAngle = -999;
  double AntennaLength = -999;  // m
  double DroopGain[kDroopGains] = {0, 0, 0, 0, 0, 0, 0, 0};
  double Temperature = -999;

 protected:
  void refreshParameters() override;
};
