// Window and look counts of the quick-look image of a data set.
#pragma once

#include "metadata_framework/general_sar_base.h"

class QuickLook_Obj : public GeneralSAR_Base {
 public:
  QuickLook_Obj();

  // Block "QuickLook" of channel 1.  A missing block is not an error: the
  // fields keep their values and the result is 0.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies the window and the look counts.  Returns 0.
  int clone(QuickLook_Obj* other) const;

  int QL_FirstSample = 0;
  int QL_Samples = 0;
  int QL_FirstLine = 0;
  int QL_Lines = 0;
  int QL_AzimuthML = 1;
  int QL_RangeML = 1;

 protected:
  void refreshParameters() override;
};
