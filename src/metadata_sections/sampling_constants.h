// Sampling constants of a SAR data set: carrier, range and azimuth sampling,
// bandwidths and burst timing.
#pragma once

#include "metadata_framework/general_sar_base.h"

class SamplingConstants_Obj : public GeneralSAR_Base {
 public:
  SamplingConstants_Obj();

  // Block "SamplingConstants" of channel 1, or else the parameter-file
  // section of that name.  Read: 0, or 1 when neither form holds all ten
  // values.  Write: 0 or the writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies every field into `other`.  Returns 0.
  int clone(SamplingConstants_Obj* other) const;

  double fc_hz = -999;     // carrier frequency, Hz
  double frg_hz = -999;    // range sampling frequency, Hz
  double Brg_hz = -999;    // range bandwidth, Hz
  double Trg_s = -999;     // range sampling step, s
  double prf_hz = -999;    // pulse repetition frequency, Hz
  double pri_s = -999;     // pulse repetition interval, s
  double Baz_hz = -999;    // azimuth bandwidth, Hz
  double brf_hz = -999;    // burst repetition frequency, Hz
  double bri_s = -999;     // burst repetition interval, s
  double lambda_m = -999;  // wavelength, m

 protected:
  void refreshParameters() override;
};
