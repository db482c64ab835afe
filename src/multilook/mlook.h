// The wide-swath multilook processor: turns the five single-look complex
// sub-swaths of a wide-swath import into one detected image of the whole
// swath, in slant or ground range, with its metadata header.
//
// Per sub-swath the range spectrum is split into looks whose bandwidth gives
// the requested ground resolution, the lines of every burst are weighted in
// azimuth so that the bursts covering a time add up to a constant, and the
// look powers are summed into a temporary power file "<output>SS<k>".  The
// five power files are then recomposed side by side on one range grid.
//
// Lifecycle: readimages (or readimages_kestova), run, writepar, freeimages.
// Functions return 0 or the processing libraries' codes (1 inconsistent
// data, 4 read, 5 write, 7 memory, 9 open, 10 missing input).
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "multilook/mlook_io.h"
#include "multilook/mlook_radar_grid.h"
#include "multilook/mlook_swath.h"
#include "runtime/call_scope.h"
#include "sar_container/general_sar.h"

// What the processor needs of one sub-swath, taken from its header.
namespace mlook_detail {
class HelperThread;
}

struct mlook_swath_par {
  int samples = 0;            // range samples per line
  int lines = 0;              // raster lines
  int bursts = 0;             // bursts in the raster
  int linesPerBurst = 0;      // L
  double firstRangeTime = 0;  // two-way range time of the first sample, s
  double bandwidth = 0;       // range bandwidth X, Hz
  double incidence = 0;       // incidence angle at mid swath, degrees
  int polarisation = 0;       // 0 "H/H", 1 "V/V", 2 otherwise
  double lineInterval = 0;    // s
  double burstCycle = 0;      // s
};

class mlook {
 public:
  // More looks than this are refused.
  static constexpr int kMaxLooks = kMlookMaxLooks;

  mlook(mlook_conf* conf, mlook_input* input, mlook_output* output);
  ~mlook();
  mlook(const mlook&) = delete;
  mlook& operator=(const mlook&) = delete;

  // Read the five sub-swath headers of the root "Level1Filename": the
  // library headers "<root>k.hdr" of the rasters "<root>k", or (kestova) the
  // suite headers of the rasters "<root>k_slc".  They also check the burst
  // range of the input block.
  int readimages();
  int readimages_kestova();
  // Look count N, look bandwidths and look centre frequencies from the
  // sub-swath parameters and the ground resolution.
  int fclook();
  // Multilooks every sub-swath into its temporary power file and recomposes
  // them into the output image.
  int run();
  // Writes the output's metadata header "<output>.hdr".
  int writepar();
  // Releases the headers and buffers; removes the temporary files when
  // DeleteTempFile is set.
  int freeimages();

  // Results of fclook (swath 0..4, look 0..looks()-1).
  int looks() const { return looks_; }
  double lookBandwidth(int swath) const { return swath_[swath].lookBandwidth; }
  double lookFrequency(int look, int swath) const { return swath_[swath].lookFrequency[look]; }
  // Results of run.
  int decimation() const { return decimation_; }
  int outputSamples() const { return outputSamples_; }
  int outputLines() const { return outputLines_; }
  double outputStartTime() const { return outputStartTime_; }
  double outputNearRangeTime() const { return swath_[0].rangeTime; }
  // Lines of sub-swath k that went through the range transforms (lines
  // whose azimuth weights are all 0 contribute nothing and are skipped).
  int64_t transformedLines(int k) const { return swath_[k].transformedLines; }
  int fftLength(int k) const { return swath_[k].fftLength; }
  // Zero-Doppler azimuth time and two-way range time of an output pixel
  // (column and row from 0, fractions allowed), and its latitude and
  // longitude on the ellipsoid.  Valid after run and before freeimages.
  int outputPixelTimes(double column, double row, double* azimuth, double* range);
  int geolocate(double column, double row, double* lat, double* lon);
  // The radar geometry of the output image (its line times and the range
  // time of its columns) and the orbit it was imaged from.  Valid after run
  // and before freeimages.
  int radarGrid(MlookRadarGrid* grid);
  const GeneralSAROrbit* orbit() const {
    return swath_[0].header ? &swath_[0].header->orbit : nullptr;
  }
  // Two-way range time from which the ground-range resampling took output
  // sample `column` of line `line`.  Valid after a ground-range run and
  // before freeimages; 0 or 1.
  int resampledRangeTime(int column, int line, double* range) const;
  // First composite sample of each sub-swath, as a two-way range time.
  double swathStartRangeTime(int k) const { return swath_[k].boundaryTime; }
  int lookLength(int k) const { return swath_[k].lookLength; }

  // Sub-swath parameters (filled by readimages; tests may set them before
  // fclook) and the range sampling frequency of sub-swath 1.
  mlook_swath_par swathPar[kMlookSwaths];
  double fs = 0.0;

 private:
  int readswath(int k, const char* header, bool kestova);
  int checkbursts();
  int setuprange();
  int readbursttimes(int k, std::vector<double>* times);
  int timing();
  int processswath(int k);
  int composeswaths();
  int groundgrid();
  void gridline(int line, double* nodes) const;
  int envi_beam_corr(int k, std::vector<float>* gain);
  void release();

  // Second thread of the burst and recomposition loops, during run().
  mlook_detail::HelperThread* helper_ = nullptr;
  mlook_conf* conf_;
  mlook_input* input_;
  mlook_output* output_;
  mlook_swath swath_[kMlookSwaths];

  int looks_ = 0;
  // Range grid: decimation D.
  int decimation_ = 0;

  // Azimuth grid: bursts processed, the output start time and line count.
  int firstBurst_ = 0;
  int burstCount_ = 0;
  double outputStartTime_ = 0.0;
  double lineInterval_ = 0.0;
  int outputLines_ = 0;
  int outputSamples_ = 0;
  int compositeSamples_ = 0;
  double outputFarRangeTime_ = 0.0;  // range time of the last output sample
  // Ground-range resampling: exact range times on a coarse grid of output
  // samples and lines (rows of gridColumns_ nodes).
  std::vector<double> gridTimes_;
  int gridColumns_ = 0;
  int gridRows_ = 0;
  int burstsDone_ = 0;
  int percentShown_ = -1;
};
