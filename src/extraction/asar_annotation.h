// The annotation data sets of an ASAR Level-1 image product that the
// extraction reads: main processing parameters, Doppler centroid, geolocation
// grid, antenna elevation patterns and chirp parameters.  Every field is
// named once here with its byte offset inside its record; all binary values
// are big-endian.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

#include "envisat/product_header.h"
#include "runtime/call_scope.h"

namespace asar {

// Main processing parameters: one record per image, for wide-swath
// products one per sub-swath in sub-swath order.  Records of the older
// layout are 2009 bytes; newer ones append calibration vectors, so the
// record size is taken from the data set descriptor.
namespace mpp {
constexpr size_t kMinRecordSize = 2009;
constexpr size_t kFirstZeroDopplerTime = 0;  // MJD record
constexpr size_t kSwathDigit = 43;           // '1'..'5' in "SS1".."SS5", or blank
constexpr size_t kNumOutputLines = 56;       // uint32
constexpr size_t kSamplesPerLine = 60;       // uint32
constexpr size_t kLinesPerBurst = 69;        // int32
constexpr size_t kTimeDiffZeroDoppler = 73;  // float, s
// Per-beam image parameters (float[5] or uint32[5]); the record of a
// sub-swath holds its own value in the first slot.
constexpr size_t kPrf = 703;                // Hz
constexpr size_t kPulseLength = 723;        // s
constexpr size_t kRangeBandwidth = 743;     // Hz
constexpr size_t kRank = 893;               // int32
constexpr size_t kRangeSamplingRate = 983;  // Hz
constexpr size_t kRadarFrequency = 987;     // Hz
constexpr size_t kRangeWindowType = 993;    // 7 characters
constexpr size_t kRangeWindowCoef = 1000;
// Range look bandwidth, one float per sub-swath: slot k for sub-swath k.
constexpr size_t kRangeLookBandwidth = 1004;
constexpr size_t kAzimuthLookBandwidth = 1270;
constexpr size_t kAzimuthWindowType = 1278;  // 7 characters
constexpr size_t kAzimuthWindowCoef = 1285;
constexpr size_t kFmRateCoefficients = 1289;  // float[3]: c0, c1, c2
constexpr size_t kFmRateOrigin = 1301;        // float, ns
constexpr size_t kProcessorGain = 1377;
constexpr size_t kExternalCalibrationFactor = 1381;
constexpr size_t kNoisePower = 1393;
constexpr size_t kNoisePowerSecond = 1401;  // second polarisation of APM and APP
constexpr size_t kEchoesPerBurst = 1717;    // int32
constexpr size_t kWindowTypeWidth = 7;
}  // namespace mpp

// Doppler centroid coefficients.
namespace dop {
constexpr size_t kMinRecordSize = 55;
constexpr size_t kZeroDopplerTime = 0;  // MJD record
constexpr size_t kSlantRangeTime = 13;  // float, ns
constexpr size_t kCoefficients = 17;    // float[5]
constexpr size_t kCoefficientCount = 5;
constexpr size_t kSubSwathDelta = 42;  // int16[5], added to the constant term
}  // namespace dop

// Geolocation grid: rows of 11 tie points.
namespace geo {
constexpr size_t kMinRecordSize = 521;
constexpr size_t kZeroDopplerTime = 0;    // MJD record
constexpr size_t kFirstTieSample = 25;    // uint32 sample number, counted from 1
constexpr size_t kSlantRangeTimes = 69;   // float[11], ns
constexpr size_t kIncidenceAngles = 113;  // float[11], degrees
constexpr size_t kLatitudes = 157;        // int32[11], 1e-6 degrees
constexpr size_t kLongitudes = 201;       // int32[11], 1e-6 degrees
constexpr size_t kSwathDigit = 501;       // '1'..'5' in "SS1".."SS5"
constexpr int kTiePoints = 11;
}  // namespace geo

// Chirp parameters.
namespace chirp {
constexpr size_t kMinRecordSize = 1483;
constexpr size_t kPolarisation = 16;           // 3 characters, "H/H"
constexpr size_t kChirpPower = 35;             // float
constexpr size_t kElevationChirpPowerDb = 44;  // float, dB
}  // namespace chirp

// Antenna elevation patterns: per beam the two-way gain at 11 elevation
// angles spread over the beam's slant ranges.
namespace antenna {
constexpr size_t kMinRecordSize = 162;
constexpr size_t kBeamId = 13;           // "SS1".."SS5", or the image swath
constexpr size_t kSlantRangeTimes = 16;  // float[11], ns
constexpr size_t kElevationAngles = 60;  // float[11], degrees
constexpr size_t kPatternDb = 104;       // float[11], two-way dB
constexpr int kPoints = 11;
constexpr size_t kBeamIdWidth = 3;
}  // namespace antenna

// Measurement data set records: a 17-byte line header (MJD zero-Doppler
// time, int8 quality flag with -1 for a blank line, uint32 line number),
// then the samples.
namespace mds {
constexpr size_t kLinePrefixSize = 17;
constexpr size_t kQualityFlag = 12;
}  // namespace mds

// One record of a table, read with bounds that the table checked when it
// was loaded (its records are at least the minimum size of their kind).
class Record {
 public:
  Record(const unsigned char* bytes, size_t size) : bytes_(bytes), size_(size) {}
  float f32(size_t offset) const;
  int32_t i32(size_t offset) const;
  uint32_t u32(size_t offset) const;
  int16_t i16(size_t offset) const;
  char ch(size_t offset) const { return offset < size_ ? static_cast<char>(bytes_[offset]) : 0; }
  // An MJD time record as sec85.
  double time(size_t offset) const;
  // The first blank-delimited token within `width` characters ("%7s").
  std::string token(size_t offset, size_t width) const;
  const unsigned char* bytes() const { return bytes_; }
  size_t size() const { return size_; }

 private:
  const unsigned char* bytes_;
  size_t size_;
};

// One annotation data set read whole.
class AnnotationTable {
 public:
  // Reads the data set described by `ds` from the open product `fd`, of a
  // file of `fileSize` bytes, when it has records.  `name` names the data
  // set in reports.  0; 1 when its records are smaller than `minRecordSize`
  // or the descriptor is inconsistent; 4 ("File reading failed!") when the
  // records lie beyond the end of the file or cannot be read; 7.
  int read(int fd, int64_t fileSize, const EnvisatDataSet& ds, size_t minRecordSize,
           const char* name);
  int count() const { return count_; }
  size_t recordSize() const { return recordSize_; }
  Record record(int i) const {
    return Record(data_.data() + static_cast<size_t>(i) * recordSize_, recordSize_);
  }
  void release() {
    data_.reset();
    count_ = 0;
  }

 private:
  vlr::CkBuffer<unsigned char> data_;
  int count_ = 0;
  size_t recordSize_ = 0;
};

}  // namespace asar
