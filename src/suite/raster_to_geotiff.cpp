// The GeoTIFF export: two passes over the product, line by line.  The first
// reads a regular subsample of the lines for the grey-level mapping, the
// second converts every line to bytes and writes it to the TIFF, so memory
// stays at a few lines and the sample whatever the size of the product.
#include "suite/raster_to_geotiff.h"

#include <tiffio.h>
#include <unistd.h>
#include <xtiffio.h>

#include <algorithm>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"
#include "suite/cell_types.h"
#include "suite/description_header.h"
#include "suite/map_utility.h"
#include "suite/raster_file.h"

namespace {

constexpr const char* kModule = "vlr_raster_to_geotiff";
constexpr const char* kTiffSuffix = ".tif";
constexpr const char* kDescriptionKey = "DESCRIPTION";
constexpr const char* kNoDataText = "0";

// Grey levels: 0 for null pixels, 1 (black) to 255 (white) for data, 128 for
// every pixel of a constant image.
constexpr int kNullByte = 0;
constexpr int kBlackByte = 1;
constexpr double kByteSpan = 254.0;
constexpr double kPowerExponent = 0.5;
constexpr double kLinearExponent = 1.0;
constexpr double kPercent = 100.0;
// Largest sample the statistics take.
constexpr double kMaxSamples = 1.0e6;
// Share of the progress given to the sampling pass.
constexpr int kSamplingPercent = 20;
constexpr int kLastPercent = 99;
// Strips of about this many bytes.
constexpr uint32_t kStripBytes = 64 * 1024;
// Above this image size the file is written as BigTIFF.
constexpr uint64_t kClassicTiffLimit = 4000000000ULL;

// How the display value w of a pixel maps to a byte.
struct Mapping {
  double exponent = kLinearExponent;
  double low = 0.0;   // w shown as black
  double high = 1.0;  // w shown as white
  // Halves keep the width finite for values near the limits of a double and
  // change nothing elsewhere, halving being exact.
  double halfWidth() const { return high / 2.0 - low / 2.0; }
  double scale() const { return 0.5 / halfWidth(); }
};

double displayValue(double v, double exponent) {
  return exponent == kLinearExponent ? v : std::copysign(std::pow(std::fabs(v), exponent), v);
}

unsigned char toByte(double w, const Mapping& m) {
  double t = (w / 2.0 - m.low / 2.0) / m.halfWidth();
  if (!(t > 0.0)) t = 0.0;
  if (t > 1.0) t = 1.0;
  return static_cast<unsigned char>(kBlackByte + static_cast<int>(std::floor(kByteSpan * t + 0.5)));
}

// One line of the product as values, NaN for null pixels.  Complex cells
// give their squared magnitude.
class LineReader {
 public:
  explicit LineReader(CRasterFile& file) : mFile(file) {
    const int pixels = file.pixelsPerLine();
    const size_t rawBytes = file.cellType() == CVLR_BIT
                                ? static_cast<size_t>((pixels + 7) / 8)
                                : static_cast<size_t>(pixels) * file.bytesPerPixel();
    mRaw.resize(rawBytes);
    mValues.resize(static_cast<size_t>(pixels));
    mComplex = NVLR_UTILITY_IsComplexCellType(file.cellType());
    mPartType = mComplex ? realPartType(file.cellType()) : file.cellType();
    mPartBytes = file.bytesPerPixel() / file.valuesPerPixel();
  }

  const std::vector<double>& read(int line) {
    mFile.readLines(line, 1, 0, mFile.pixelsPerLine() - 1, mRaw.data());
    const double null = mFile.nullValue();
    for (size_t p = 0; p < mValues.size(); ++p) {
      double v;
      if (mFile.cellType() == CVLR_BIT) {
        v = (mRaw[p / 8] >> (7 - p % 8)) & 1;
        mValues[p] = v == null ? kNull : v;
        continue;
      }
      const unsigned char* cell = mRaw.data() + p * mFile.bytesPerPixel();
      const double re = part(cell);
      if (mComplex) {
        const double im = part(cell + mPartBytes);
        const bool isNull = (re == null && im == null) || !std::isfinite(re) || !std::isfinite(im);
        v = isNull ? kNull : re * re + im * im;
      } else {
        v = re == null ? kNull : re;
      }
      mValues[p] = std::isfinite(v) ? v : kNull;
    }
    return mValues;
  }

 private:
  static constexpr double kNull = std::numeric_limits<double>::quiet_NaN();

  static int realPartType(int complexType) {
    switch (complexType) {
      case CVLR_BYTE_COMPLEX:
        return CVLR_BYTE;
      case CVLR_UBYTE_COMPLEX:
        return CVLR_UNSIGNED_BYTE;
      case CVLR_SHORT_COMPLEX:
        return CVLR_SHORT;
      case CVLR_UNSIGNED_SHORT_COMPLEX:
        return CVLR_UNSIGNED_SHORT;
      case CVLR_FLOAT_COMPLEX:
        return CVLR_FLOAT;
      default:
        return CVLR_DOUBLE;
    }
  }

  template <typename T>
  static double as(const unsigned char* p) {
    T v;
    std::memcpy(&v, p, sizeof v);
    return static_cast<double>(v);
  }

  double part(const unsigned char* p) const {
    switch (mPartType) {
      case CVLR_BYTE:
        return as<int8_t>(p);
      case CVLR_UNSIGNED_BYTE:
        return as<uint8_t>(p);
      case CVLR_SHORT:
        return as<int16_t>(p);
      case CVLR_UNSIGNED_SHORT:
        return as<uint16_t>(p);
      case CVLR_INT:
        return as<int32_t>(p);
      case CVLR_UNSIGNED_INT:
        return as<uint32_t>(p);
      case CVLR_FLOAT:
        return as<float>(p);
      default:
        return as<double>(p);
    }
  }

  CRasterFile& mFile;
  std::vector<unsigned char> mRaw;
  std::vector<double> mValues;
  bool mComplex = false;
  int mPartType = CVLR_DOUBLE;
  int mPartBytes = 0;
};

// Percent of the export written to the working file; a run the host has
// withdrawn stops here.
class Progress {
 public:
  void at(int percent) {
    percent = std::min(percent, kLastPercent);
    if (percent == mPrevious) return;
    const std::string batchOk = NVLR_UTILITY_WorkingFile() + "_batch_ok";
    if (!NVLR_UTILITY_FileExists(batchOk.c_str())) {
      NVLR_UTILITY_TracePrint("\n EXECUTION INTERRUPTED BY OPERATOR\n");
    }
    getAndSetPerc(mPrevious, percent, nullptr);
    mPrevious = percent;
  }

 private:
  int mPrevious = -1;
};

// Sampling step k: every k-th pixel of every k-th line, at most about
// kMaxSamples pixels.
int samplingStep(int lines, int pixels) {
  const double total = static_cast<double>(lines) * pixels;
  return total <= kMaxSamples ? 1 : static_cast<int>(std::ceil(std::sqrt(total / kMaxSamples)));
}

// Display values of the sampled valid pixels.
std::vector<double> sampleValues(CRasterFile& file, LineReader& reader, double exponent,
                                 Progress& progress) {
  const int lines = file.linesPerImage();
  const int step = samplingStep(lines, file.pixelsPerLine());
  std::vector<double> sample;
  for (int line = 0; line < lines; line += step) {
    progress.at(kSamplingPercent * line / lines);
    const std::vector<double>& values = reader.read(line);
    for (size_t p = 0; p < values.size(); p += static_cast<size_t>(step)) {
      if (!std::isnan(values[p])) sample.push_back(displayValue(values[p], exponent));
    }
  }
  // Valid pixels may all lie between the sampled ones: then take them all,
  // up to the size of a sample.
  if (!sample.empty() || step == 1) return sample;
  for (int line = 0; line < lines && sample.size() < kMaxSamples; ++line) {
    progress.at(kSamplingPercent * line / lines);
    for (double v : reader.read(line)) {
      if (!std::isnan(v) && sample.size() < kMaxSamples) {
        sample.push_back(displayValue(v, exponent));
      }
    }
  }
  return sample;
}

// The value at percentile p of the sample (reorders it).
double percentile(std::vector<double>& sample, double p) {
  const size_t k = static_cast<size_t>(std::floor(p / kPercent * (sample.size() - 1)));
  std::nth_element(sample.begin(), sample.begin() + static_cast<std::ptrdiff_t>(k), sample.end());
  return sample[k];
}

Mapping mappingOf(std::vector<double>& sample, double exponent, double saturation) {
  Mapping m;
  m.exponent = exponent;
  const auto range = std::minmax_element(sample.begin(), sample.end());
  const double smallest = *range.first;
  const double largest = *range.second;
  m.low = std::min(0.0, percentile(sample, saturation));
  m.high = percentile(sample, kPercent - saturation);
  // Most pixels alike: the whole range of the sample instead.
  if (!(m.high > m.low)) m.high = largest;
  if (!(m.high > m.low)) m.low = smallest;
  if (smallest == largest || !(m.halfWidth() > 0.0)) {
    // A constant image: its value in the middle of the grey scale.
    const double width = smallest != 0.0 ? std::fabs(smallest) : 1.0;
    m.low = smallest - width;
    m.high = smallest + width;
  }
  return m;
}

// The TIFF being written, under a temporary name until it is complete, so a
// failed export never leaves an image that looks whole.
class TiffOutput {
 public:
  TiffOutput(const std::string& finalPath, int lines, int pixels) : mFinal(finalPath) {
    mTemporary = finalPath + ".part";
    const uint64_t bytes = static_cast<uint64_t>(lines) * static_cast<uint64_t>(pixels);
    mTif = XTIFFOpen(mTemporary.c_str(), bytes < kClassicTiffLimit ? "w" : "w8");
    if (mTif != nullptr) VlrRunOutputBegun(mTemporary.c_str());
    if (mTif == nullptr || !declareNoDataTag()) fail();
    const uint32_t rowsPerStrip =
        std::max<uint32_t>(1, kStripBytes / static_cast<uint32_t>(pixels));
    const bool ok = TIFFSetField(mTif, TIFFTAG_IMAGEWIDTH, static_cast<uint32_t>(pixels)) &&
                    TIFFSetField(mTif, TIFFTAG_IMAGELENGTH, static_cast<uint32_t>(lines)) &&
                    TIFFSetField(mTif, TIFFTAG_BITSPERSAMPLE, 8) &&
                    TIFFSetField(mTif, TIFFTAG_SAMPLESPERPIXEL, 1) &&
                    TIFFSetField(mTif, TIFFTAG_SAMPLEFORMAT, SAMPLEFORMAT_UINT) &&
                    TIFFSetField(mTif, TIFFTAG_PHOTOMETRIC, PHOTOMETRIC_MINISBLACK) &&
                    TIFFSetField(mTif, TIFFTAG_PLANARCONFIG, PLANARCONFIG_CONTIG) &&
                    TIFFSetField(mTif, TIFFTAG_COMPRESSION, COMPRESSION_NONE) &&
                    TIFFSetField(mTif, TIFFTAG_ROWSPERSTRIP, rowsPerStrip) &&
                    TIFFSetField(mTif, TIFFTAG_SOFTWARE, NVLR_UTILITY_Identification().c_str()) &&
                    // Readers such as GDAL take byte 0 as no data.
                    TIFFSetField(mTif, TIFFTAG_GDAL_NODATA, kNoDataText);
    if (!ok) fail();
  }
  ~TiffOutput() { discard(); }
  TiffOutput(const TiffOutput&) = delete;
  TiffOutput& operator=(const TiffOutput&) = delete;

  TIFF* tif() { return mTif; }
  void writeLine(int line, std::vector<unsigned char>& bytes) {
    if (TIFFWriteScanline(mTif, bytes.data(), static_cast<uint32_t>(line), 0) < 0) fail();
  }
  void finish() {
    const bool flushed = TIFFFlush(mTif) != 0;
    XTIFFClose(mTif);
    mTif = nullptr;
    if (!flushed || std::rename(mTemporary.c_str(), mFinal.c_str()) != 0) fail();
    VlrRunOutputMoved(mTemporary.c_str(), mFinal.c_str());
    mDone = true;
  }

 private:
  // libtiff does not know GDAL's no-data tag by itself.
  bool declareNoDataTag() {
    static const TIFFFieldInfo kNoDataField = {
        TIFFTAG_GDAL_NODATA, -1, -1, TIFF_ASCII,
        FIELD_CUSTOM,        1,  0,  const_cast<char*>("GDALNoDataValue")};
    return TIFFMergeFieldInfo(mTif, &kNoDataField, 1) == 0;
  }

  // Closes and removes an incomplete file.
  void discard() {
    if (mTif != nullptr) XTIFFClose(mTif);
    mTif = nullptr;
    if (!mDone) unlink(mTemporary.c_str());
    if (!mDone) VlrRunOutputRemoved(mTemporary.c_str());
  }

  // The raise ends a real run without unwinding, so the file goes first.
  [[noreturn]] void fail() {
    discard();
    NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, mFinal.c_str());
  }

  std::string mFinal;
  std::string mTemporary;
  TIFF* mTif = nullptr;
  bool mDone = false;
};

struct ValueStatistics {
  double min = std::numeric_limits<double>::infinity();
  double max = -std::numeric_limits<double>::infinity();
  double sum = 0.0;
  int64_t count = 0;
  double mean() const { return count > 0 ? sum / static_cast<double>(count) : 0.0; }
};

ValueStatistics convert(CRasterFile& file, LineReader& reader, const Mapping& m, TiffOutput& out,
                        Progress& progress) {
  const int lines = file.linesPerImage();
  std::vector<unsigned char> bytes(static_cast<size_t>(file.pixelsPerLine()));
  ValueStatistics s;
  for (int line = 0; line < lines; ++line) {
    progress.at(kSamplingPercent +
                static_cast<int>((kLastPercent - kSamplingPercent) * int64_t{line} / lines));
    const std::vector<double>& values = reader.read(line);
    for (size_t p = 0; p < values.size(); ++p) {
      const double v = values[p];
      if (std::isnan(v)) {
        bytes[p] = kNullByte;
        continue;
      }
      bytes[p] = toByte(displayValue(v, m.exponent), m);
      s.min = std::min(s.min, v);
      s.max = std::max(s.max, v);
      s.sum += v;
      ++s.count;
    }
    out.writeLine(line, bytes);
  }
  return s;
}

std::string textOf(CDescriptionHeader& header, const char* path) {
  const CDescriptionField* f = findField(header, path);
  return f != nullptr && f->isSet() && f->type() == CVLR_FieldType::String ? f->getStringAt(0, 0)
                                                                           : std::string();
}

void setNumber(CDescriptionHeader& header, const char* path, double value) {
  setDouble(getField(header, path), value);
}

// Sets the (key, value) row of "RasterInfo.OtherInfo", adding it when absent.
void setOtherInfo(CDescriptionHeader& header, const char* key, const std::string& value) {
  CDescriptionField* info = getField(header, "RasterInfo.OtherInfo");
  if (!info->isSet()) {
    info->clear();
    info->resize(0, 2);
  }
  if (info->columns() < 2) info->resize(info->rows(), 2);
  int row = 0;
  while (row < info->rows() && !(info->isSetAt(row, 0) && info->getStringAt(row, 0) == key)) ++row;
  if (row == info->rows()) info->resize(row + 1, info->columns());
  info->setStringAt(row, 0, key);
  info->setStringAt(row, 1, value);
}

// The product header turned into the header of the exported image.
void writeExportHeader(CDescriptionHeader& header, const std::string& tifPath, const Mapping& m) {
  setString(getField(header, "RasterInfo.CellType"), NVLR_UTILITY_CellTypeName(CVLR_UNSIGNED_BYTE));
  setNumber(header, "RasterInfo.NullCellValue", kNullByte);
  setNumber(header, "RasterInfo.TiffMinValue", m.low);
  setNumber(header, "RasterInfo.TiffMaxValue", m.high);
  setNumber(header, "RasterInfo.TiffScale", m.scale());
  setNumber(header, "RasterInfo.TiffExponent", m.exponent);
  // The image has every line and pixel of the product.
  setNumber(header, "RasterInfo.TiffRowScale", 1.0);
  setNumber(header, "RasterInfo.TiffColScale", 1.0);
  // The TIFF lines carry no prefix or suffix.
  for (const char* path : {"RasterInfo.RowPrefix", "RasterInfo.RowSuffix"}) {
    CDescriptionField* f = findField(header, path);
    if (f != nullptr && f->isSet() && f->type() == CVLR_FieldType::Integer) setInteger(f, 0);
  }
  const std::string description =
      NVLR_UTILITY_Format("Image generated with : %s", NVLR_UTILITY_Identification().c_str());
  setOtherInfo(header, kDescriptionKey, description);
  writeHeader(header, (tifPath + "_hdr").c_str());
}

double usableSaturation(double saturation) {
  return std::isfinite(saturation) && saturation > 0.0 && saturation <= CVLR_TIFF_MAX_SATURATION
             ? saturation
             : CVLR_TIFF_DEFAULT_SATURATION;
}

}  // namespace

void NVLR_UTILITY_RasterToGeoTiff(const char* productName, const char* outputName,
                                  double saturation,
                                  const std::vector<CVlrGroundControlPoint>& gcps) {
  NVLR_UTILITY_TracePrint("\n  geotiff conversion\n");
  const std::string product = productName ? productName : "";
  std::string base = outputName && *outputName ? outputName : product;
  NVLR_UTILITY_RemoveSuffix(base, kTiffSuffix);
  const std::string tifPath = base + kTiffSuffix;
  saturation = usableSaturation(saturation);

  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  if (!readHeader(header, product.c_str())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeFileNotFound, kModule, __LINE__, product.c_str());
  }
  CRasterFile file;
  file.openRead(product.c_str(), header);
  const int lines = file.linesPerImage();
  const int pixels = file.pixelsPerLine();
  NVLR_UTILITY_LogPrint("\nMAKE TIFF OF FILE [%s]  ", product.c_str());
  NVLR_UTILITY_LogPrint("   TIFF  NAME  [%s%s]  ", base.c_str(), kTiffSuffix);
  NVLR_UTILITY_LogPrint("    Data Units : %s", textOf(header, "RasterInfo.DataUnits").c_str());
  NVLR_UTILITY_LogPrint("  ;  Data Type : %s", NVLR_UTILITY_CellTypeName(file.cellType()));
  NVLR_UTILITY_LogPrint("  ;  Number of Line : %d", lines);
  NVLR_UTILITY_LogPrint("  ;  Number of Pixels : %d", pixels);

  const CVlrMapReference reference = NVLR_UTILITY_ReadMapReference(header);
  if (reference.geocoded) NVLR_UTILITY_CheckMapState(reference);

  const bool power = NVLR_UTILITY_IsComplexCellType(file.cellType()) ||
                     textOf(header, "RasterInfo.DataUnits") == "POWER";
  const double exponent = power ? kPowerExponent : kLinearExponent;
  Progress progress;
  LineReader reader(file);
  std::vector<double> sample = sampleValues(file, reader, exponent, progress);
  if (sample.empty()) {
    const std::string text = "Error: 0 non null points in the input file : " + product;
    NVLR_UTILITY_TracePrint("%s\n", text.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__, text.c_str());
  }
  const Mapping mapping = mappingOf(sample, exponent, saturation);
  std::vector<double>().swap(sample);
  NVLR_UTILITY_LogPrint("\t\tSTATISTICS   Scale : %lf  ;  Exponent : %lf", mapping.scale(),
                        mapping.exponent);

  TiffOutput out(tifPath, lines, pixels);
  NVLR_UTILITY_SetUpGeoKeys(out.tif(), reference, gcps, tifPath.c_str());
  const ValueStatistics stats = convert(file, reader, mapping, out, progress);
  out.finish();
  file.close();

  NVLR_UTILITY_LogPrint("  ;  Min : %lf", stats.min);
  NVLR_UTILITY_LogPrint("  ;  Mean : %lf", stats.mean());
  NVLR_UTILITY_LogPrint("  ;  Max : %lf", stats.max);
  NVLR_UTILITY_LogPrint("    ;   TIFF  Saturation : %lf", saturation);
  NVLR_UTILITY_LogPrint("  ;  Scale : %lf", mapping.scale());
  NVLR_UTILITY_LogPrint("  ;  Exponent    : %lf\n", mapping.exponent);

  writeExportHeader(header, tifPath, mapping);
  if (reference.geocoded && reference.hasGrid && reference.state == CVLR_STATE_GEO_GLOBAL) {
    NVLR_UTILITY_WriteKmlOverlay(
        reference, base + ".kml", NVLR_UTILITY_BaseName(tifPath),
        NVLR_UTILITY_Format("Image generated with : %s", NVLR_UTILITY_Identification().c_str()));
  }
}
