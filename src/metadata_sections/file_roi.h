// A region of interest together with the raster file it belongs to.
#pragma once

#include <string>

#include "metadata_sections/roi.h"
#include "raster/data_file.h"

class FileROI_Obj {
 public:
  // Reads the region (block or section "ROI" of "<fileName>.hdr") and the
  // raster header of fileName.  A part that cannot be read keeps its
  // previous values.  Returns 0.
  int read_roi();

  ROI_Obj roi;
  DataFile data;
  std::string fileName;  // the raster file
};
