// Configuration, input and output blocks of the ASAR extraction, each read
// from a section of a parameter file.
#pragma once

#include <cstddef>

// Length of the file-name texts of the blocks.
constexpr size_t kImagesNameSize = 512;

// Section "imagesConfiguration".
class images_conf {
 public:
  // Reads the six keys.  0, or 1 when a key other than "ExtractData" is
  // missing (the keys read so far keep their values).
  int readpar(const char* headername);
  int writepar(const char* headername);  // no effect: 0
  int checkpar();                        // no effect: 0

  int Memory = 256;  // memory budget, not used by the extraction
  int ReportLevel = 1;
  char ReportFilename[kImagesNameSize] = "images_report.txt";
  int Incore = 0;
  int Verbose = 0;      // non-zero: the informational reports of the run
  int ExtractData = 1;  // non-zero: rasters named after the output and lines copied
};

// Section "imagesInput".
class images_input {
 public:
  // 0, or 1 when one of the three keys is missing.
  int readpar(const char* headername);
  // 0 when the product and the orbit file are named.  An empty product name
  // is reported at the level that ends the process ("ASA level 1 file not
  // inserted"), an empty orbit name likewise ("DOR VOR not inserted"); the
  // result is then 10.
  int checkpar();

  char ASA_level1_filename[kImagesNameSize] = "";
  char ASA_dor_vor[kImagesNameSize] = "";
  char ASA_INS_Filename[kImagesNameSize] = "";
};

// Section "imagesOutput".
class images_output {
 public:
  // 0, or 1 when "OutputFile" is missing.
  int readpar(const char* headername);

  char OutputFile[kImagesNameSize] = "";
};
