// The complete metadata of one SAR data set: fourteen sections, each switched
// on or off, read from and written to one header file together.
//
// Reading a header enables exactly the sections the file holds; writing
// writes every enabled section; cloning copies the enabled sections into
// another container.  A disabled section keeps whatever values it holds but
// takes part in nothing.
//
// Two pairs of sections share one block of the header: the data file and
// the raster file ("RasterInfo"), the state vectors and the orbit
// ("StateVectorData").  A header holding the block enables both.
#pragma once

#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_framework/general_sar_base.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_data_file.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/sensor_attitude.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/state_vectors.h"
#include "raster/buffer_file.h"

class GeneralSAR {
 public:
  // Index of a section in the container.
  enum GSObject {
    GS_DATAFILE = 0,
    GS_ROI = 1,
    GS_POLYSAR = 2,
    GS_SAMPLING = 3,
    GS_STATEVECTORS = 4,
    GS_ORBIT = 5,
    GS_PULSE = 6,
    GS_ANTENNA = 7,
    GS_DATASETINFO = 8,
    GS_ATTITUDE = 9,
    GS_SPECTRALWINDOWS = 10,
    GS_GEOCOORDS = 11,
    GS_SWATHINFO = 12,
    GS_BUFFERFILE = 13,
  };
  static constexpr int kObjects = 14;

  // Every section with its defaults, all disabled.
  GeneralSAR();
  // The pointer table refers to the container's own members: copy with
  // GSclone().
  GeneralSAR(const GeneralSAR&) = delete;
  GeneralSAR& operator=(const GeneralSAR&) = delete;

  // The section of an index (null for an index outside the enumeration).
  GeneralSAR_Base* GSget(GSObject object);
  // Switch a section on or off; indices outside the enumeration are ignored.
  void GSenable(GSObject object);
  void GSdisable(GSObject object);
  // The enabled flag (false for an index outside the enumeration).
  bool GSexists(GSObject object) const;

  // Releases the variable parts (polynomials, state vectors and orbit, swath
  // and antenna buffers), then reads every section from the header `file`;
  // afterwards exactly the sections it holds are enabled.  The orbit gets
  // the wavelength of the sampling constants (when it is a positive number)
  // and, like the state vectors, the look side of the data-set information.  0, or 1 "File : <file>
  // DOES NOT EXIST!" when the file cannot be opened for reading.  A file that holds no known
  // section reads as 0 with every section disabled.
  int GSread(const char* file);
  // Writes every enabled section into `file`, from the last index down to
  // the first.  Every section is written even when one fails; 0, 1 without
  // a file name, or the code of the first section that could not be
  // written.
  int GSwrite(const char* file);
  // Copies every enabled section into `other` and enables it there; the
  // other sections of `other` are left as they are.  0, or the code of the
  // first section that could not be copied (that section is disabled in
  // `other`; the others are still copied).
  int GSclone(GeneralSAR* other) const;
  // Releases the variable parts of the sections (the flags do not change).
  // Returns 0.
  int GSdestroy();

  // The sections, in this order in memory.
  GSDataFile_Obj datafile;
  BufferFile bufferfile;
  GSRoi_Obj roi;
  polySAR polys;
  SamplingConstants_Obj sampling;
  SAROrbitStateVectors_Obj stateVectors;
  GeneralSAROrbit orbit;
  SARPulse_Obj pulse;
  AntennaPattern_Obj antenna;
  DataSetInfo_Obj dataSetInfo;
  SensorAttitude_Obj attitude;
  SpectralWindows_Obj spectralWindows;
  geoCoords_Obj geoCoords;
  SwathInfo swathInfo;

 private:
  static bool valid(int object) { return object >= 0 && object < kObjects; }
  // Copies section `object` into `other`.  0 or the section's code.
  int cloneObject(int object, GeneralSAR* other) const;

  bool enabled_[kObjects] = {};
  GeneralSAR_Base* objects_[kObjects] = {};
};
