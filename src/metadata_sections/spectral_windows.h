// Matched-filter windows and look bandwidths of a focused SAR data set.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "metadata_framework/par_element.h"

class SpectralWindows_Obj : public GeneralSAR_Base {
 public:
  SpectralWindows_Obj();

  // Block "SpectralWindows" of channel 1, or else the parameter-file section
  // "SpectralWindows".  Read: 0, or 1 when neither form holds all six fields.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  int clone(SpectralWindows_Obj* other) const;

  char AzMatchedFilterType[kParStringSize];  // window name, "NOT_AVAILABLE" when unset
  char RgMatchedFilterType[kParStringSize];
  double RgMatchedFilterCoef = -999;  // window coefficient; 0 = no weighting
  double AzMatchedFilterCoef = -999;
  double RgLookBandwidth = -999;  // Hz
  double AzLookBandwidth = -999;  // Hz

 protected:
  void refreshParameters() override;
};
