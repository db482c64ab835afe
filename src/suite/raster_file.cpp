// The suite raster file: lines of one cell type behind a header offset, each
// line framed by a prefix and a suffix, read and written with 64-bit offsets.
#include "suite/raster_file.h"

#include <sys/types.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>
#include <exception>
#include <string>
#include <type_traits>

#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "suite/cell_types.h"
#include "suite/description_header.h"
#include "suite/number_text.h"

namespace {

constexpr const char* kModule = "vlr_raster_file";
constexpr const char* kSection = "RasterInfo";
constexpr const char* kMostSignificantFirst = "MSBF";
// Offset below which a 32-bit stream position would do; mMaxLineSeek is
// derived from it for the dump.  Positioning itself is 64-bit throughout.
constexpr int64_t kStreamSeekLimit = 2000000000;
// Longest line record accepted.  The largest image line is 500000 pixels of
// 16 bytes; a prefix or suffix that pushes a record past this is taken for a
// broken header rather than allocated.
constexpr int64_t kMaxRecordLen = 64LL * 1024 * 1024;
constexpr int kDumpNameWidth = 15;

bool hostIsMostSignificantFirst() {
  const uint16_t probe = 1;
  unsigned char first;
  std::memcpy(&first, &probe, 1);
  return first == 0;
}

// Reverses the bytes of each value of valueSize bytes in place.
void swapValues(unsigned char* data, size_t bytes, int valueSize) {
  if (valueSize < 2) return;
  const size_t size = static_cast<size_t>(valueSize);
  for (size_t at = 0; at + size <= bytes; at += size) std::reverse(data + at, data + at + size);
}

// The field's value as a number, whatever its stored type; false when the
// field is absent, unset or not a number.
bool fieldNumber(CDescriptionHeader& header, const char* name, double& value) {
  const std::string path = std::string(kSection) + "." + name;
  const CDescriptionField* field = findField(header, path.c_str());
  if (field == nullptr || !field->isSet()) return false;
  switch (field->type()) {
    case CVLR_FieldType::Integer:
      value = field->getIntegerAt(0, 0);
      return true;
    case CVLR_FieldType::Double:
      value = field->getDoubleAt(0, 0);
      return true;
    case CVLR_FieldType::String:
      return NVLR_UTILITY_ParseDouble(field->getStringAt(0, 0), value);
    default:
      return false;
  }
}

// The field's text; false when absent or unset.
bool fieldText(CDescriptionHeader& header, const char* path, std::string& value) {
  const CDescriptionField* field = findField(header, path);
  if (field == nullptr || !field->isSet()) return false;
  if (field->type() == CVLR_FieldType::String) {
    value = field->getStringAt(0, 0);
  } else if (field->type() == CVLR_FieldType::Integer) {
    value = std::to_string(field->getIntegerAt(0, 0));
  } else {
    return false;
  }
  return true;
}

std::string dumpLine(const char* name, const std::string& value) {
  std::string line = name;
  if (line.size() < static_cast<size_t>(kDumpNameWidth)) line.resize(kDumpNameWidth, ' ');
  return line + " = " + value + "\n";
}

template <typename T>
std::string dumpLine(const char* name, T value) {
  if constexpr (std::is_floating_point<T>::value) {
    return dumpLine(name, NVLR_UTILITY_DoubleText(value));
  } else {
    return dumpLine(name, std::to_string(value));
  }
}

// Opening a raster that is already open is refused: its stream and state
// would be lost.
void requireClosed(int status, const std::string& name, const char* mode) {
  if (status == CVLR_RF_CLOSE) return;
  NVLR_UTILITY_TracePrint("Error: attempting to open the raster file %s ", name.c_str());
  NVLR_UTILITY_TracePrint("in %s mode while it was not closed\n", mode);
  NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name.c_str());
}

// Only regular files are rasters: a directory would open and fail on every
// read, and a pipe would block the open itself.
FILE* openStream(const std::string& name, const char* mode) {
  if (NVLR_UTILITY_FileExists(name.c_str()) && !NVLR_UTILITY_IsRegularFile(name.c_str())) {
    NVLR_UTILITY_TracePrint("Error: cannot open the file: %s  (not a regular file)\n",
                            name.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, name.c_str());
  }
  FILE* stream = std::fopen(name.c_str(), mode);
  if (stream == nullptr) {
    const int error = errno;
    NVLR_UTILITY_TracePrint("Error: cannot open the file: %s  errno = %d\n", name.c_str(), error);
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, name.c_str());
  }
  return stream;
}

// Runs body; an exception other than the suite's own error record is handed
// to onEscape, which reports it with the raster state instead of letting it
// reach a caller that cannot know the file's state.
template <typename Body, typename OnEscape>
void guarded(const char* what, Body&& body, OnEscape&& onEscape) {
  try {
    body();
  } catch (const CErrorExceptionManager&) {
    throw;
  } catch (const std::exception& exception) {
    onEscape(std::string(what) + " : " + exception.what());
  }
}

}  // namespace

CRasterFile::~CRasterFile() {
  if (mRasterStatus == CVLR_RF_CLOSE) return;
  try {
    NVLR_UTILITY_TracePrint("Warning: the raster file %s has not been closed: ", mFileName.c_str());
    NVLR_UTILITY_TracePrint("closing it\n");
    close();
  } catch (...) {
    // A destructor must not throw; the file is released below in any case.
  }
  mStream.reset();
  mRasterStatus = CVLR_RF_CLOSE;
}

void CRasterFile::openRead(const char* fileName) {
  guarded(
      "openRead",
      [&] {
        const std::string name = fileName ? fileName : "";
        requireClosed(mRasterStatus, name, "input");
        CDescriptionHeader header(std::vector<std::string>{kSection});
        if (!readHeader(header, name.c_str())) {
          const std::string headerName = NVLR_UTILITY_ResolveHeaderName(name.c_str());
          NVLR_UTILITY_TracePrint("Error: missing parameter file %s\n", headerName.c_str());
          NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, headerName.c_str());
        }
        openRead(name.c_str(), header);
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

void CRasterFile::openRead(const char* fileName, CDescriptionHeader& header) {
  guarded(
      "openRead",
      [&] {
        const std::string name = fileName ? fileName : "";
        requireClosed(mRasterStatus, name, "input");
        mFileName = name;
        // The description is checked before the file is opened, so a refused
        // header leaves the object closed.
        describe(header);
        mStream = FileHandle(openStream(mFileName, "rb"));
        mRasterStatus = CVLR_RF_READ;
        if (fseeko(mStream.get(), static_cast<off_t>(mHeaderLen), SEEK_SET) != 0) {
          mStream.reset();
          mRasterStatus = CVLR_RF_CLOSE;
          NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
        }
        mLinePosition = 0;
        mMaxLineWritten = 0;
        mLineBuffer.assign(static_cast<size_t>(mRecordLen), 0);
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

void CRasterFile::openWrite(const char* fileName, CDescriptionHeader& header) {
  guarded(
      "openWrite",
      [&] {
        const std::string name = fileName ? fileName : "";
        requireClosed(mRasterStatus, name, "output");
        mFileName = name;
        describe(header);
        mStream = FileHandle(openStream(mFileName, "wb"));
        // The header bytes are zeros: extending the empty file gives them without
        // writing them one by one.
        if (ftruncate(fileno(mStream.get()), static_cast<off_t>(mHeaderLen)) != 0 ||
            fseeko(mStream.get(), static_cast<off_t>(mHeaderLen), SEEK_SET) != 0) {
          mStream.reset();
          NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
        }
        mRasterStatus = CVLR_RF_WRITE;
        mLinePosition = 0;
        mMaxLineWritten = 0;
        mLineBuffer.assign(static_cast<size_t>(mRecordLen), 0);
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

void CRasterFile::describe(CDescriptionHeader& header) {
  const char* name = mFileName.c_str();
  auto required = [&](const char* field, double minimum, double maximum) -> int64_t {
    double value = 0.0;
    if (!fieldNumber(header, field, value)) {
      NVLR_UTILITY_TracePrint("Error: missing or unreadable field %s.%s\n", kSection, field);
      NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
    }
    if (!(value >= minimum && value <= maximum) || value != std::floor(value)) {
      NVLR_UTILITY_TracePrint("m%s = %s\n", field, NVLR_UTILITY_DoubleText(value).c_str());
      NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
    }
    return static_cast<int64_t>(value);
  };
  auto optional = [&](const char* field, double fallback) {
    double value = fallback;
    return fieldNumber(header, field, value) ? value : fallback;
  };

  if (findSection(header, kSection) == nullptr) {
    NVLR_UTILITY_TracePrint("Error: no section %s in the header of %s\n", kSection, name);
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
  }
  mNrOfLinesPerImage = static_cast<int>(required("NrOfLinesPerImage", 1, CVLR_RF_MAX_DIMENSION));
  mNrOfPixelsPerLine = static_cast<int>(required("NrOfPixelsPerLine", 1, CVLR_RF_MAX_DIMENSION));

  std::string cellType;
  const std::string cellPath = std::string(kSection) + ".CellType";
  mCellType = fieldText(header, cellPath.c_str(), cellType)
                  ? NVLR_UTILITY_CellTypeCode(cellType.c_str())
                  : -1;
  mBytesPerPixel = NVLR_UTILITY_CellTypeSize(mCellType, &mDataNbr);
  if (mBytesPerPixel < 0) {
    NVLR_UTILITY_TracePrint("theCellType = %s\nmDataNbr = %d\nmBytesPerPixel = %d\n",
                            cellType.c_str(), mDataNbr, mBytesPerPixel);
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
  }

  constexpr double kMaxFraming = static_cast<double>(kMaxRecordLen);
  mHeaderLen = required("HeaderOffset", 0, 9.0e15);
  mRowPrefix = static_cast<int>(required("RowPrefix", 0, kMaxFraming));
  mRowSuffix = static_cast<int>(required("RowSuffix", 0, kMaxFraming));
  const int64_t pixelBytes =
      mCellType == CVLR_BIT ? (static_cast<int64_t>(mNrOfPixelsPerLine) + 7) / 8 * mBytesPerPixel
                            : static_cast<int64_t>(mNrOfPixelsPerLine) * mBytesPerPixel;
  mRecordLen = pixelBytes + mRowPrefix + mRowSuffix;
  if (mRecordLen > kMaxRecordLen) {
    NVLR_UTILITY_TracePrint("mRecordLen = %lld\n", static_cast<long long>(mRecordLen));
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
  }
  mFooterLen = 0;
  double footer = 0.0;
  if (fieldNumber(header, "FooterLen", footer)) {
    if (!(footer >= 0 && footer <= kMaxFraming)) {
      NVLR_UTILITY_TracePrint("mFooterLen = %s\n", NVLR_UTILITY_DoubleText(footer).c_str());
      NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
    }
    mFooterLen = static_cast<int64_t>(footer);
  }

  std::string units;
  const std::string unitsPath = std::string(kSection) + ".DataUnits";
  mDataUnits =
      fieldText(header, unitsPath.c_str(), units) ? NVLR_UTILITY_DataUnitsCode(units.c_str()) : -1;
  std::string order;
  const std::string orderPath = std::string(kSection) + ".BytesOrder";
  const bool fileMostSignificantFirst =
      fieldText(header, orderPath.c_str(), order) && order == kMostSignificantFirst;
  mSwap = fileMostSignificantFirst != hostIsMostSignificantFirst();

  mDummyVal = optional("NullCellValue", 0.0);
  mRealScaleFactor = optional("RealScaleFactor", 1.0);
  mImaginaryScaleFactor = optional("ImaginaryScaleFactor", 1.0);
  mScaleFactor = 1.0;
  std::string direction;
  mLinesTimeDecrease = fieldText(header, "InitialGeometry.TimeDirectionLines", direction) &&
                       direction.find("DECREASE") != std::string::npos;
  mPixelsTimeDecrease = fieldText(header, "InitialGeometry.TimeDirectionPixel", direction) &&
                        direction.find("DECREASE") != std::string::npos;
  mMaxLineSeek = kStreamSeekLimit / mRecordLen;
  mStreamPositioningUsed = false;
}

void CRasterFile::seekLinePosition(int64_t line, bool forWrite) {
  if (line == mLinePosition) return;
  const int64_t target = mHeaderLen + line * mRecordLen;
  if (mRasterStatus == CVLR_RF_WRITE || mRasterStatus == CVLR_RF_READ_WRITE)
    std::fflush(mStream.get());
  mStreamPositioningUsed = true;
  if (fseeko(mStream.get(), static_cast<off_t>(target), SEEK_SET) == 0) {
    mLinePosition = line;
    return;
  }
  const int error = errno;
  const int64_t actual = static_cast<int64_t>(ftello(mStream.get()));
  NVLR_UTILITY_TracePrint("ERROR : _lseeki64 errno = %d\nFILE : %s\nmLinePosition : %lld\n", error,
                          mFileName.c_str(), static_cast<long long>(mLinePosition));
  NVLR_UTILITY_TracePrint("offset : %lld\nthis_pos : %lld\n", static_cast<long long>(target),
                          static_cast<long long>(line));
  NVLR_UTILITY_TracePrint("seekLinePosition(%s)  actual = %lld diff = %lld\n",
                          forWrite ? "Write " : "Read ", static_cast<long long>(actual),
                          static_cast<long long>(target - actual));
  NVLR_UTILITY_TracePrint("ERROR  %s   %s    FILE=%s   LINE=%d  ERRNO = %d\n", "seekLinePosition",
                          mFileName.c_str(), kModule, __LINE__, error);
  mLinePosition = -1;  // unknown until the next successful positioning
  NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
}

// For "BIT" rasters the destination receives, for each line, the packed bytes
// that hold the requested columns, bytes firstColumn / 8 to lastColumn / 8 of
// the line as stored (bit order untouched); the caller picks the bits.
void CRasterFile::readLines(int firstLine, int lineCount, int firstColumn, int lastColumn,
                            void* destination) {
  guarded(
      "readLines",
      [&] {
        if (mRasterStatus == CVLR_RF_CLOSE || mRasterStatus == CVLR_RF_WRITE ||
            mRasterStatus == CVLR_RF_TIFF_WRITE) {
          NVLR_UTILITY_TracePrint("Error: attempting to read from the raster file %s ",
                                  mFileName.c_str());
          NVLR_UTILITY_TracePrint(mRasterStatus == CVLR_RF_CLOSE
                                      ? "while it was not open\n"
                                      : "while it was open in write mode\n");
          NVLR_UTILITY_RaiseError(vlr::kCodeFileRead, kModule, __LINE__, mFileName.c_str());
        }
        const int64_t lastLine = static_cast<int64_t>(firstLine) + lineCount - 1;
        if (firstLine < 0 || lineCount < 1 || lastLine >= mNrOfLinesPerImage) {
          NVLR_UTILITY_TracePrint("Requested line %lld is outside the image!\n",
                                  static_cast<long long>(firstLine < 0 ? firstLine : lastLine));
          NVLR_UTILITY_RaiseError(vlr::kCodeFileRead, kModule, __LINE__, mFileName.c_str());
        }
        if (firstColumn < 0 || lastColumn < firstColumn || lastColumn >= mNrOfPixelsPerLine ||
            destination == nullptr) {
          NVLR_UTILITY_TracePrint("Requested column %d is outside the image!\n",
                                  firstColumn < 0 ? firstColumn : lastColumn);
          NVLR_UTILITY_RaiseError(vlr::kCodeFileRead, kModule, __LINE__, mFileName.c_str());
        }
        const bool bits = mCellType == CVLR_BIT;
        const int64_t firstUnit = bits ? firstColumn / 8 : firstColumn;
        const int64_t lastUnit = bits ? lastColumn / 8 : lastColumn;
        const size_t offset = static_cast<size_t>(mRowPrefix + firstUnit * mBytesPerPixel);
        const size_t length = static_cast<size_t>((lastUnit - firstUnit + 1) * mBytesPerPixel);
        unsigned char* out = static_cast<unsigned char*>(destination);
        for (int64_t line = firstLine; line <= lastLine; ++line) {
          seekLinePosition(line, false);
          const size_t got = std::fread(mLineBuffer.data(), 1, mLineBuffer.size(), mStream.get());
          if (got != mLineBuffer.size()) {
            NVLR_UTILITY_TracePrint("Read file  ERROR : STATUS %d\n", mRasterStatus);
            NVLR_UTILITY_TracePrint(
                "theRowNbr : %lld\nthis_pos : %lld\nthis_pos K : %lld\n",
                static_cast<long long>(line),
                static_cast<long long>(mHeaderLen + line * mRecordLen),
                static_cast<long long>((mHeaderLen + line * mRecordLen) / 1000));
            NVLR_UTILITY_TracePrint("(mRecordLen * theRowNbr) %lld\n",
                                    static_cast<long long>(mRecordLen * line));
            NVLR_UTILITY_TracePrint(
                "mLinePosition = %lld\ntheRowStart = %d\nmRecordLen = %lld\nmBytesPerPixel = "
                "%d\ndatalen = %zu\nmHeaderLen = %lld\n",
                static_cast<long long>(mLinePosition), firstLine,
                static_cast<long long>(mRecordLen), mBytesPerPixel, got,
                static_cast<long long>(mHeaderLen));
            mLinePosition = -1;
            NVLR_UTILITY_RaiseError(vlr::kCodeFileRead, kModule, __LINE__, mFileName.c_str());
          }
          mLinePosition = line + 1;
          std::memcpy(out, mLineBuffer.data() + offset, length);
          if (mSwap && !bits) swapValues(out, length, mBytesPerPixel / mDataNbr);
          out += length;
        }
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

// Each line of the source holds the pixel part of one record: for "BIT"
// rasters the packed bytes as they are to be stored.
void CRasterFile::writeLines(int firstLine, int lineCount, const void* source) {
  guarded(
      "writeLines",
      [&] {
        if (mRasterStatus != CVLR_RF_WRITE && mRasterStatus != CVLR_RF_READ_WRITE) {
          NVLR_UTILITY_TracePrint("Error: attempting to write to the raster file %s ",
                                  mFileName.c_str());
          NVLR_UTILITY_TracePrint(mRasterStatus == CVLR_RF_CLOSE
                                      ? "while it was not open\n"
                                      : "while it was open in read mode\n");
          NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
        }
        const int64_t lastLine = static_cast<int64_t>(firstLine) + lineCount - 1;
        if (firstLine < 0 || lineCount < 1 || lastLine >= mNrOfLinesPerImage || source == nullptr) {
          NVLR_UTILITY_TracePrint("Request to write line %lld outside the image!\n",
                                  static_cast<long long>(firstLine < 0 ? firstLine : lastLine));
          NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
        }
        const size_t pixelBytes = static_cast<size_t>(mRecordLen - mRowPrefix - mRowSuffix);
        unsigned char* pixels = mLineBuffer.data() + mRowPrefix;
        const unsigned char* in = static_cast<const unsigned char*>(source);
        for (int64_t line = firstLine; line <= lastLine; ++line) {
          // The prefix and suffix stay zero: only the pixel part is ever filled.
          std::memcpy(pixels, in, pixelBytes);
          if (mSwap && mCellType != CVLR_BIT)
            swapValues(pixels, pixelBytes, mBytesPerPixel / mDataNbr);
          in += pixelBytes;
          seekLinePosition(line, true);
          if (std::fwrite(mLineBuffer.data(), 1, mLineBuffer.size(), mStream.get()) !=
              mLineBuffer.size()) {
            NVLR_UTILITY_TracePrint("Write file ERROR : line %lld of %s  errno = %d\n",
                                    static_cast<long long>(line), mFileName.c_str(), errno);
            mLinePosition = -1;
            NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
          }
          mLinePosition = line + 1;
          mMaxLineWritten = std::max(mMaxLineWritten, line + 1);
        }
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

void CRasterFile::close() {
  guarded(
      "close",
      [&] {
        if (mRasterStatus == CVLR_RF_CLOSE) {
          const char* name = mFileName.empty() ? "no file name" : mFileName.c_str();
          NVLR_UTILITY_TracePrint("Error: attempting to close a raster file %s ", name);
          NVLR_UTILITY_TracePrint("while it was not open\n");
          NVLR_UTILITY_RaiseError(vlr::kCodeFileNotParsed, kModule, __LINE__, name);
        }
        bool written = true;
        if (mRasterStatus == CVLR_RF_WRITE || mRasterStatus == CVLR_RF_READ_WRITE) {
          if (mMaxLineWritten < mNrOfLinesPerImage) {
            const int64_t missing = mNrOfLinesPerImage - mMaxLineWritten;
            NVLR_UTILITY_TracePrint("\nWARNING NULL line writed : %lld in file : %s",
                                    static_cast<long long>(missing), mFileName.c_str());
            NVLR_UTILITY_RaiseWarning(vlr::kCodeRasterNotComplete, kModule, __LINE__,
                                      mFileName.c_str());
            std::fill(mLineBuffer.begin(), mLineBuffer.end(), 0);
            for (int64_t line = mMaxLineWritten; line < mNrOfLinesPerImage && written; ++line) {
              seekLinePosition(line, true);
              written = std::fwrite(mLineBuffer.data(), 1, mLineBuffer.size(), mStream.get()) ==
                        mLineBuffer.size();
              mLinePosition = written ? line + 1 : -1;
            }
            mMaxLineWritten = mNrOfLinesPerImage;
          }
          // The footer is zeros too; extending the file gives them.
          const int64_t total = mHeaderLen + mNrOfLinesPerImage * mRecordLen + mFooterLen;
          written = written && std::fflush(mStream.get()) == 0;
          if (written && mFooterLen > 0) {
            written = ftruncate(fileno(mStream.get()), static_cast<off_t>(total)) == 0;
          }
        }
        // A write-mode stream reports lost data only when it is closed.
        written = mStream.close() && written;
        const int status = mRasterStatus;
        mRasterStatus = CVLR_RF_CLOSE;
        mLineBuffer.clear();
        mLineBuffer.shrink_to_fit();
        if (!written && status != CVLR_RF_READ) {
          NVLR_UTILITY_TracePrint("Write file ERROR : closing %s  errno = %d\n", mFileName.c_str(),
                                  errno);
          NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFileName.c_str());
        }
      },
      [this](const std::string& what) { escaped(what.c_str()); });
}

std::string CRasterFile::dumpText() const {
  static const char* const kBanners[] = {
      "- RASTER FILE CLOSE **********************\n\n",
      "- RASTER FILE IN READ MODE **********************\n",
      "- RASTER FILE IN WRITE MODE **********************\n",
      "- RASTER FILE IN READ AND WRITE MODE **********************\n",
      "- RASTER TIFF FILE IN READ MODE **********************\n",
      "- RASTER TIFF FILE IN WRITE  MODE **********************\n",
  };
  std::string text = "\n\n ********************** ";
  const bool known = mRasterStatus >= CVLR_RF_CLOSE && mRasterStatus <= CVLR_RF_TIFF_WRITE;
  text +=
      known ? kBanners[mRasterStatus] : "- RASTER FILE IN UNKNOWN STATE **********************\n";
  text += dumpLine("File name", mFileName);
  text += dumpLine("CellType", mCellType);
  text += dumpLine("mDataUnits", mDataUnits);
  text += dumpLine("mDummyVal", mDummyVal);
  text += dumpLine("mHeaderLen", mHeaderLen);
  text += dumpLine("mRecordLen", mRecordLen);
  text += dumpLine("mRowPrefix", mRowPrefix);
  text += dumpLine("mRowSuffix", mRowSuffix);
  text += dumpLine("mFooterLen", mFooterLen);
  text += dumpLine("mLinePosition", mLinePosition);
  text += dumpLine("mBytesPerPixel", mBytesPerPixel);
  text += dumpLine("mDataNbr", mDataNbr);
  text += dumpLine("mMaxLineWritten", mMaxLineWritten);
  text += dumpLine("mMaxLineSeek", mMaxLineSeek);
  text += dumpLine("NrOfPixelsPerLine", mNrOfPixelsPerLine);
  text += dumpLine("NrOfLinesPerImage", mNrOfLinesPerImage);
  text += dumpLine("mRealScaleFactor", mRealScaleFactor);
  text += dumpLine("mImaginaryScaleFactor", mImaginaryScaleFactor);
  text += dumpLine("mScaleFactor", mScaleFactor);
  text += mLinesTimeDecrease ? "Lines time direction : DECREASE\n"
                             : "Lines time direction : INCREASE\n";
  text += mPixelsTimeDecrease ? "Pixels time direction : DECREASE\n"
                              : "Pixels time direction : INCREASE\n";
  text += mSwap ? "Swap DATA\n" : "Normal DATA\n";
  text += mStreamPositioningUsed ? "Stream positioning used\n" : "Stream positioning not used\n";
  return text;
}

void CRasterFile::escaped(const char* what) {
  NVLR_UTILITY_TracePrint("Exception in raster file %s : %s%s", mFileName.c_str(), what,
                          dumpText().c_str());
  NVLR_UTILITY_RaiseError(vlr::kCodeRasterException, kModule, __LINE__,
                          NVLR_UTILITY_ProcessLabel().c_str());
}
