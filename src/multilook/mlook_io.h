// Configuration, input and output blocks of the wide-swath multilook, each
// read from a section of a parameter file.
#pragma once

#include <cstddef>

#include "raster/data_file.h"

// Length of the file-name texts of the blocks.
constexpr size_t kMlookNameSize = 512;
// Sub-swaths of a wide-swath product.
constexpr int kMlookSwaths = 5;
// Value of an integer field that was never given.
constexpr int kMlookUndefinedInt = 0x7fffffff;

// Geometry of the multilook's output lines.
enum class OutputGeometry { kSlantRange, kGroundRange };

// Section "mlookConfiguration".
class mlook_conf {
 public:
  // Reads every key.  0, or 1 when a required key is missing ("RgAnt_flag"
  // and "DeleteTempFile" are optional and keep their values when absent).
  int readpar(const char* headername);
  int writepar(const char* headername);  // no effect: 0
  // 1, with a report naming the key, when Sl2Gr, GrSamplingStep,
  // GrResolution or RgWinLen is undefined or out of range (Sl2Gr 0..1,
  // GrResolution 1..1000, the others 0..1000), else 0.
  int checkpar();

  // The output geometry; the parameter file keeps it as the integer Sl2Gr.
  OutputGeometry geometry() const {
    return Sl2Gr != 0 ? OutputGeometry::kGroundRange : OutputGeometry::kSlantRange;
  }
  void setGeometry(OutputGeometry g) { Sl2Gr = g == OutputGeometry::kGroundRange ? 1 : 0; }

  int Sl2Gr = 1;            // 1: ground-range output, 0: slant range
  int GrSamplingStep = 75;  // ground sampling step, m
  int GrResolution = 120;   // ground resolution, m
  int RgWinLen = 20;        // range window length
  double W1 = 0.0;          // azimuth weight: flat part, in burst cycles
  double W2 = 0.0;          // azimuth weight: cosine roll-off, in burst cycles
  int Memory = 256;         // MB, not used
  int ReportLevel = 1;
  char ReportFilename[kMlookNameSize] = "mlook_report.txt";
  int Incore = 0;
  int Verbose = 0;
  int RgAnt_flag = 0;      // elevation antenna pattern correction
  int DeleteTempFile = 1;  // remove the temporary swath power files
};

// Section "mlookInput".
class mlook_input {
 public:
  // 0, or 1 when "Level1Filename" or "ASA_XCA_Filename" is missing; the
  // burst counts are 0 when missing.
  int readpar(const char* headername);
  int checkpar();  // no effect: 0

  char Level1Filename[kMlookNameSize] = "";    // root of the sub-swath rasters
  char ASA_XCA_Filename[kMlookNameSize] = "";  // external calibration file
  int BurstsToSkip = 0;
  int BurstsToProcess = 0;  // 0: every burst after the skipped ones
};

// Section "mlookOutput".
class mlook_output {
 public:
  // 0, or 1 when "OutputFilename" is missing.
  int readpar(const char* headername);

  char OutputFilename[kMlookNameSize] = "";
  // The sub-swath rasters and the recomposed image.
  DataFile swath[kMlookSwaths];
  DataFile image;
};
