// Two-way antenna elevation pattern: gains at PatternSamples angles from
// StartAngle in steps of DeltaAngle (degrees).  The gains are held in memory
// and in a raster of one line of FLOAT32 samples beside the header: the
// header "X.hdr" (or "X") keeps them in "X_pattern".
#pragma once

#include <string>

#include "metadata_framework/general_sar_base.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"

class AntennaPattern_Obj : public GeneralSAR_Base {
 public:
  static constexpr int kMaxPatternSamples = 10000;
  // Samples of a pattern of the external calibration file.
  static constexpr int kEnviPatternSamples = 201;

  AntennaPattern_Obj();
  ~AntennaPattern_Obj() override;
  AntennaPattern_Obj(const AntennaPattern_Obj&) = delete;
  AntennaPattern_Obj& operator=(const AntennaPattern_Obj&) = delete;

  // Allocates the pattern for PatternSamples gains (zeroed): 0 (no pattern
  // for 0 or the unset value -999), 1 for any other count outside
  // 0..kMaxPatternSamples, 7 when the allocation fails.
  int createBuffers() override;
  int destroyBuffers() override;

  // Block "AntennaPattern" of channel 1, or else the parameter-file section
  // "AntennaPattern"; names the pattern raster after `file`.  Read: 0, 1 when
  // neither form holds the angles or the sample count is invalid, 7.
  int readhdr(const char* file) override;
  // Names the pattern raster after `file`, stores the sample count in its
  // description, writes the block and, when a pattern is held in memory,
  // the pattern raster.  A pattern not yet loaded from the raster of another
  // name is loaded first and written to the new one.  0, the code of that
  // load, or the first failing writer's code.
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies the angles, the pattern and the raster's name and description.
  // 0, 1 (invalid sample count) or 7.
  int clone(AntennaPattern_Obj* other) const;

  // Writes the pattern held in memory into the pattern raster.  0, 1 (no
  // pattern or no raster name), or the code of the raster writer.
  int WritePatternArray();
  // The PatternSamples gains into `out`.  When the pattern in memory is not
  // loaded (its first gain is 0) it is read from the pattern raster first.
  // 0, 1 (no pattern), or the code of the raster reader.
  int getPatternArray(float* out);
  // The pattern of `swath` (0..7, as DataSetInfo_Obj::getISNbr gives it) and
  // `polarisation` (0..3, as getPolarizationNbr gives it) of the external
  // calibration file `file` (ASA_XCA): 201 gains over +-5 degrees about the
  // swath's reference elevation angle.  0, 1 for an index outside those
  // ranges, or the code of the failing open (9), read (4), seek or close.
  int getPatternENVI(const char* file, int polarisation, int swath);

  // Holds `count` gains from `startAngle` in steps of `deltaAngle` (degrees).
  // 0, 1 for a count outside 1..kMaxPatternSamples, a gain that is not finite
  // and positive, or angles that are not finite, 7.
  int setPattern(double startAngle, double deltaAngle, const float* gains, int count);

  // The gains in memory (PatternSamples of them, or none).
  const float* pattern() const { return pattern_.data(); }
  int patternSize() const { return static_cast<int>(pattern_.size()); }
  // The raster name used for a header file.
  static std::string patternFileName(const char* headerFile);

  double StartAngle = -999;  // degrees
  double DeltaAngle = -999;  // degrees
  int PatternSamples = -999;
  DataFile data;  // the pattern raster

 protected:
  void refreshParameters() override;

 private:
  void describeRaster();
  vlr::CkBuffer<float> pattern_;
};
