// The raster description of a data set as a section of the metadata
// header: the header file "X.hdr" describes the raster "X".
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "raster/data_file.h"

class GSDataFile_Obj : public GeneralSAR_Base {
 public:
  // Reads the raster header of `file` without its last four characters (its
  // extension): 0, or 1 when the name is too short or the header cannot be
  // read.
  int readhdr(const char* file) override;
  // Writes the raster description into `file` (as the header of the raster
  // named `file` without its extension), then gives the wrapped raster back
  // its own name.  0, 1, or the writer's code.
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies the raster description.  Returns 0.
  int clone(GSDataFile_Obj* other) const;

  DataFile data;
};
