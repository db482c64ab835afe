// A suite raster file: a flat file of lines described by the "RasterInfo"
// section of its header, read and written with 64-bit positions.
#pragma once

#include <cstdint>
#include <cstdio>
#include <string>
#include <vector>

#include "runtime/file_handle.h"

class CDescriptionHeader;

enum CVLR_RasterStatus {
  CVLR_RF_CLOSE = 0,
  CVLR_RF_READ = 1,
  CVLR_RF_WRITE = 2,
  CVLR_RF_READ_WRITE = 3,
  CVLR_RF_TIFF_READ = 4,
  CVLR_RF_TIFF_WRITE = 5,
};

// Largest line and pixel count a raster may declare.
constexpr int CVLR_RF_MAX_DIMENSION = 500000;

class CRasterFile {
 public:
  CRasterFile() = default;
  // Closes a file that was left open, with a trace warning.
  ~CRasterFile();
  CRasterFile(const CRasterFile&) = delete;
  CRasterFile& operator=(const CRasterFile&) = delete;

  // Reads the header of fileName ("_hdr"/".sml") and opens the raster for
  // reading.  261121 (bad description, already open), 261122 (no file).
  void openRead(const char* fileName);
  // The same from a header already in memory.
  void openRead(const char* fileName, CDescriptionHeader& header);
  // Creates the raster for writing as the header describes it.
  void openWrite(const char* fileName, CDescriptionHeader& header);

  // Copies columns firstColumn..lastColumn of lines firstLine..
  // firstLine + lineCount - 1 into destination, values in host byte order.
  void readLines(int firstLine, int lineCount, int firstColumn, int lastColumn, void* destination);
  // Writes whole lines (pixels only; prefix and suffix are written as zeros).
  void writeLines(int firstLine, int lineCount, const void* source);
  // Pads a file opened for writing with zero lines (warning 130561) and closes.
  void close();

  // The trace dump of the raster state.
  std::string dumpText() const;

  int status() const { return mRasterStatus; }
  int cellType() const { return mCellType; }
  int linesPerImage() const { return mNrOfLinesPerImage; }
  int pixelsPerLine() const { return mNrOfPixelsPerLine; }
  int bytesPerPixel() const { return mBytesPerPixel; }
  int valuesPerPixel() const { return mDataNbr; }
  int64_t recordLength() const { return mRecordLen; }
  bool swapped() const { return mSwap; }
  double nullValue() const { return mDummyVal; }
  double realScaleFactor() const { return mRealScaleFactor; }
  double imaginaryScaleFactor() const { return mImaginaryScaleFactor; }

 private:
  void describe(CDescriptionHeader& header);
  void seekLinePosition(int64_t line, bool forWrite);
  [[noreturn]] void escaped(const char* what);

  std::string mFileName;
  FileHandle mStream;
  int mRasterStatus = CVLR_RF_CLOSE;
  int mCellType = -1;
  int mDataUnits = -1;
  double mDummyVal = 0.0;
  int64_t mHeaderLen = 0;
  int64_t mRecordLen = 0;
  int mRowPrefix = 0;
  int mRowSuffix = 0;
  int64_t mFooterLen = 0;
  int64_t mLinePosition = 0;
  int mBytesPerPixel = 0;
  int mDataNbr = 0;
  int64_t mMaxLineWritten = 0;
  int64_t mMaxLineSeek = 0;
  int mNrOfPixelsPerLine = 0;
  int mNrOfLinesPerImage = 0;
  double mRealScaleFactor = 1.0;
  double mImaginaryScaleFactor = 1.0;
  double mScaleFactor = 1.0;
  bool mLinesTimeDecrease = false;
  bool mPixelsTimeDecrease = false;
  bool mSwap = false;
  std::vector<unsigned char> mLineBuffer;
  bool mStreamPositioningUsed = false;
};
