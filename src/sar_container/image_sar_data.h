// Fixed bundles of the metadata sections of a focused SAR image with its
// raster: ImageSARData_Obj and its later form GeneralSLCData, which also
// carries the data-set information.  Both derive the equivalent platform
// speed and distance of the image.
//
// The header of image X is "X.hdr"; it holds the raster description, the
// region "ROI" and the sections.
#pragma once

#include <string>

#include "metadata_sections/data_set_info.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/roi.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/sensor_attitude.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/state_vectors.h"
#include "raster/data_file.h"

class ImageSARData_Obj {
 public:
  // Longest image file name, in characters.
  static constexpr size_t kMaxImageFileName = 511;

  ImageSARData_Obj() = default;
  virtual ~ImageSARData_Obj() = default;
  // The sections own buffers.
  ImageSARData_Obj(const ImageSARData_Obj&) = delete;
  ImageSARData_Obj& operator=(const ImageSARData_Obj&) = delete;

  // The raster file the bundle describes.  0, or 1 for a name longer than
  // kMaxImageFileName (the name does not change).
  int setImageFile(const char* name);
  const std::string& imageFile() const { return imageFile_; }

  // Reads the raster header of the image file, the region "ROI" of `file`,
  // then from `file` the sampling constants, state vectors, orbit, sensor
  // attitude, polynomials, spectral windows, geographic corners, pulse and
  // swath information, in this order.  Without an image file name, `file`
  // without its ".hdr" becomes the name.  0, or the code of the first read
  // that failed (the later ones are not read).
  virtual int readhdr(const char* file);
  // Writes "<image file>.hdr": the raster header, the region "ROI", the
  // sampling constants, orbit, polynomials, geographic corners and swath
  // information, then the sensor attitude, spectral windows and pulse, so
  // that readhdr() reads back what was written.  0, 1 without an image file
  // name, or the code of the first write that failed (the later ones are
  // not written).
  virtual int writehdr();
  // Releases the state vectors and the polynomials.  Returns 0.
  int destroyAll();

  // Equivalent speed and distance of the image, stored in the sensor
  // attitude ("Eq_speed", "Eq_distance"), from the carrier frequency, the
  // range window (samples per line over the range sampling frequency), the
  // Doppler rate at the near and far range of the region (first Doppler
  // rate data set) and the Doppler centroid at mid range (first Doppler
  // centroid data set's azimuth time):
  //   Veq = sqrt(lambda c/4 Tw / (1/FR1 - 1/FR2) + (lambda fdc/2)^2)
  //   Req = -cos(asin(lambda fdc/2 / Veq)) Tw c/2 / (1 - FR1/FR2)
  // 0; 10 when a family is empty ("NO FR poly available", "NO DC poly
  // available"); 1 when the values give no finite speed and distance
  // (nothing is stored then).
  int compute_eqspeed();

  SamplingConstants_Obj sampling;
  SAROrbitStateVectors_Obj stateVectors;
  GeneralSAROrbit orbit;
  SensorAttitude_Obj attitude;
  polySAR polys;
  SpectralWindows_Obj spectralWindows;
  geoCoords_Obj geoCoords;
  SwathInfo swathInfo;
  SARPulse_Obj pulse;
  ROI_Obj roi;
  DataFile data;

 protected:
  // The header name "<image file>.hdr"; false without an image file name.
  bool headerName(std::string* name) const;

 private:
  std::string imageFile_;
};

// The later form: the same sections and the data-set information.  Reading
// also hands the wavelength of the sampling constants and the look side of
// the data-set information to the orbit.
class GeneralSLCData : public ImageSARData_Obj {
 public:
  // ImageSARData_Obj::readhdr, then the data-set information.
  int readhdr(const char* file) override;
  // ImageSARData_Obj::writehdr, then the data-set information.
  int writehdr() override;

  DataSetInfo_Obj dataSetInfo;
};
