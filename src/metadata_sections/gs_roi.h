// The region of interest of a data set as a section of the metadata header.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "metadata_sections/roi.h"

class GSRoi_Obj : public GeneralSAR_Base {
 public:
  // The region "ROI" of `file` (block of channel 1, or else parameter-file
  // section).  Read: 0 or 1 (see ROI_Obj::read_roi).  Write: 0 or the
  // writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies the region's eight values.  Returns 0.
  int clone(GSRoi_Obj* other) const;

  ROI_Obj roi;
};
