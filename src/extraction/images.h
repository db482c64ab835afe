// Extraction of an ASAR Level-1 image product: one raster and one metadata
// header per image (per sub-swath of a wide-swath product, per polarisation
// of an alternating-polarisation product, else one).
//
// run() reads the product's headers and annotation data sets, writes the
// metadata header "<raster>.hdr" of every image (data-set information,
// swath and burst information, sampling constants, spectral windows, raster
// description, state vectors and corners, region, polynomials, attitude,
// antenna elevation pattern and pulse) and then copies the image lines into
// the rasters.  A failing run removes the rasters and headers it had begun,
// so that no partial output is left looking complete.
#pragma once

#include <cstdint>
#include <string>

#include "extraction/images_io.h"

class DataSetInfo_Obj;

// Largest number of images of one product.
constexpr int kMaxImages = 5;

// What get_first_last needs to date the first and last line of an image.
struct LineTiming {
  double lineInterval = 0.0;  // s, from the SPH
  std::string firstLineText;  // UTC texts used when no line is valid
  std::string lastLineText;
  // Wide-swath data sets hold bursts: record r is line r mod L of burst
  // r / L, bursts follow each other at the burst cycle.
  int linesPerBurst = 0;
  double burstCycle = 0.0;  // s
};

// Dates the first and last line of the image whose `count` records of
// `recordSize` bytes start at `offset` in `product`.  A record counts when
// its quality flag is not -1 and its time is set.  Records one line
// interval apart (or, with `wideSwath`, on the burst structure of `timing`)
// give the time of record 0 and of record count - 1 from the first and the
// last record that counts; without any, the UTC texts of `timing` are used.
// 0; 9 "File not opened!"; 4 "File reading failed!"; 1 for an impossible
// layout or timing, or a UTC text that does not parse.
int get_first_last(const char* product, int64_t offset, int64_t recordSize, int64_t count,
                   const LineTiming& timing, bool wideSwath, double* first, double* last);

class images {
 public:
  explicit images(images_conf& conf) : conf(conf) {}

  images_input input;
  images_output output;
  images_conf& conf;

  // 0, or the code of the failing step (see the file comment).
  int run();
  // Copies the lines of every image into its raster.  0 or the first
  // failing code.
  int extractASARdata();

  int imageCount() const { return nImages_; }
  const char* headerName(int k) const { return headerNames_[k]; }
  const char* rasterName(int k) const { return rasterNames_[k]; }

  // Where the lines of one image are, as run() found them.
  struct ImageData {
    int64_t offset = 0;      // of the measurement data set in the product
    int64_t recordSize = 0;  // line prefix and samples
    int32_t samples = 0;
    int32_t lines = 0;  // records
    int32_t inputCellType = 0;
    int32_t outputCellType = 0;
  };

 private:
  struct Run;
  struct Image;
  int runSteps(Run& r);
  // Writes the header of image k, one section per step.
  int processImage(Run& r, int k);
  // Checks the image's records and dates its lines.
  int planImage(const Run& r, int k, Image* im);
  // Names the raster and header of image k and removes earlier ones.
  int prepareOutputNames(int k, Image* im);
  void fillDataSetInfo(const Run& r, const Image& im, DataSetInfo_Obj* info) const;
  int writeSwathInfo(const Run& r, const Image& im);
  int writeSamplingConstants(const Run& r, const Image& im, double* lambda);
  int writeSpectralWindows(const Image& im);
  // Records where the image's lines lie in the product, and writes that.
  int describeRaster(const Run& r, const Image& im);
  // State vectors, corners and scene heading, when an orbit file is given.
  int writeOrbitAndCorners(const Image& im, double lambda, DataSetInfo_Obj* info);
  int writeRegion(const Image& im);
  int writePolynomials(const Run& r, const Image& im);
  int writeAttitude(const Run& r, const Image& im);
  int writePulse(const Image& im);
  // The antenna elevation pattern of image k into its header `hdr`, when the
  // product has one for it; a record that cannot make a pattern is warned
  // about and left out.  0 or the code of the failing write.
  int writeElevationPattern(const Run& r, int k, const char* hdr);
  int copyImage(int k);
  void removeOutputs();

  char headerNames_[kMaxImages][kImagesNameSize] = {};
  char rasterNames_[kMaxImages][kImagesNameSize] = {};
  int nImages_ = 0;
  ImageData data_[kMaxImages];
};
