// Main and specific product headers and data set descriptors of ENVISAT
// products, read as fixed-size blocks with every value taken at its fixed
// offset.  The offsets are those of ESA's published ASAR product layouts; values
// are scanned only within their own field, so a blank or malformed field
// gives an empty text or a failed number, never text of a neighbouring line.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

// A value's place: offset of its first character in its block, and width;
// for a number, the unit text that the format puts right after it ("<bytes>"
// after DS_SIZE), or none.
struct EnvisatField {
  size_t offset;
  size_t width;
  const char* unit = nullptr;
};

constexpr size_t kMphSize = 1247;       // main product header
constexpr size_t kSphBlockSize = 6099;  // specific header block read after the MPH
constexpr size_t kDsdRecordSize = 280;
constexpr size_t kUtcTextWidth = 27;  // "DD-MMM-YYYY hh:mm:ss.uuuuuu"

// Main product header values (offsets from the start of the file).
constexpr EnvisatField kMphProduct{9, 62};
constexpr EnvisatField kMphAcquisitionStation{182, 20};
constexpr EnvisatField kMphProcCenter{217, 6};
constexpr EnvisatField kMphProcTime{236, kUtcTextWidth};
constexpr EnvisatField kMphSoftwareVer{279, 14};
constexpr EnvisatField kMphSensingStart{351, kUtcTextWidth};
constexpr EnvisatField kMphSensingStop{394, kUtcTextWidth};
constexpr EnvisatField kMphRelOrbit{493, 6};
constexpr EnvisatField kMphAbsOrbit{510, 6};

// Image-product specific header values (offsets from the start of the SPH).
constexpr EnvisatField kSphDescriptor{16, 28};
constexpr EnvisatField kSphFirstLineTime{135, kUtcTextWidth};
constexpr EnvisatField kSphLastLineTime{180, kUtcTextWidth};
constexpr EnvisatField kSphSwath{688, 3};
constexpr EnvisatField kSphPass{699, 10};
constexpr EnvisatField kSphSampleType{724, 8};
constexpr EnvisatField kSphMds1Polar{772, 3};
constexpr EnvisatField kSphMds2Polar{795, 3};
constexpr EnvisatField kSphRangeSpacing{870, 15, "<m>"};
constexpr EnvisatField kSphAzimuthSpacing{905, 15, "<m>"};
constexpr EnvisatField kSphLineTimeInterval{943, 15, "<s>"};
constexpr EnvisatField kSphDataType{1001, 4};

// Data set descriptor values (offsets from the start of the descriptor).
constexpr EnvisatField kDsdOffset{133, 21, "<bytes>"};
constexpr EnvisatField kDsdSize{170, 21, "<bytes>"};
constexpr EnvisatField kDsdNumDsr{207, 11};
constexpr EnvisatField kDsdDsrSize{228, 11, "<bytes>"};

// Where the extraction's descriptors sit in the SPH block, which differs
// between wide-swath (WSS) products and all others.
struct EnvisatDsdLayout {
  size_t mainProcessing;  // records of 2009 bytes
  size_t doppler;         // 55
  size_t chirp;           // 1483
  size_t antenna;         // 162
  size_t geolocation;     // 521
  size_t mds[5];          // 0 where the layout has no such descriptor
  int mdsSlots;
};
constexpr EnvisatDsdLayout kWssDsdLayout{
    1339, 1619, 1899, 2179, 2459, {3019, 3299, 3579, 3859, 4139}, 5};
constexpr EnvisatDsdLayout kImageDsdLayout{1619, 1899, 2459, 2739, 3299, {3859, 4139, 0, 0, 0}, 2};

// The first whitespace-delimited token of a field (as a "%Ns" scan limited to
// the field): "PDHS-K  " gives "PDHS-K", a blank field "".
std::string EnvisatToken(const char* block, size_t blockSize, EnvisatField field);
// The field's characters as they stand (for the date texts).
std::string EnvisatText(const char* block, size_t blockSize, EnvisatField field);
// The number rules of every ENVISAT header value.  A number is valid only
// when the whole field, without the blanks around it, is one decimal number
// (sign, digits, point, exponent: no "inf", "nan" or hexadecimal), finite
// and in range, and, when the field names a unit, that unit follows the
// field directly: "+7.80397367e+00<m>", "+00000000000000001625<bytes>".
// "+1625garbag" or "+0000000000000000XXXX" are not numbers.  false (value
// untouched) otherwise, also when the field lies outside the block.
bool EnvisatNumber(const char* block, size_t blockSize, EnvisatField field, double* value);
// The same for an integer (digits with an optional sign only).
bool EnvisatInteger(const char* block, size_t blockSize, EnvisatField field, int64_t* value);

// A header text quoted in a report: bytes that are not printable ASCII
// become '?'.
std::string EnvisatPrintable(const std::string& text);

// One data set descriptor.  It is valid when its four numbers follow the
// number rules, none is negative, DS_SIZE = NUM_DSR x DSR_SIZE and DSR_SIZE
// is positive for a data set with records.  An invalid descriptor reads as
// absent (all zero) with valid false, and `problem` names the field at
// fault.
struct EnvisatDataSet {
  int64_t offset = 0;
  int64_t size = 0;
  int64_t numDsr = 0;
  int64_t dsrSize = 0;
  bool valid = false;
  const char* problem = nullptr;  // e.g. "DS_SIZE is not a number"; nullptr when valid
  bool present() const { return valid && size > 0; }
  // True when the data set lies inside a file of `fileSize` bytes and its
  // records, numDsr of dsrSize bytes, fit inside it.
  bool fitsIn(int64_t fileSize) const;
};

// The two header blocks of a product and the values taken from them.
struct EnvisatHeaders {
  char mph[kMphSize];
  char sph[kSphBlockSize];
  int64_t fileSize = 0;

  // Main product header.
  std::string product;      // "%62s"
  std::string productType;  // characters 4 to 6 of the product name
  std::string acquisitionStation, procCenter, procTime, softwareVer;
  std::string sensingStart, sensingStop;  // 27-character UTC texts
  std::string relOrbit, absOrbit;

  // Specific product header (image products).
  std::string sphDescriptor;                // 28 characters as they stand
  std::string firstLineTime, lastLineTime;  // 27-character UTC texts
  std::string swath, sampleType, mds1Polar, mds2Polar, dataType;
  std::string pass;  // "ASCENDING" or "DESCENDING" as the SPH states it
  double rangeSpacing = 0.0, azimuthSpacing = 0.0, lineTimeInterval = 0.0;
  bool spacingsValid = false;            // all three numbers were read
  const char* spacingProblem = nullptr;  // the first that was not, when not

  // Product type flags (from productType).
  bool wss = false, aps = false, apm = false, app = false, wsm = false, gm1 = false;

  // Data set descriptor at an offset of the SPH block.
  EnvisatDataSet dataSet(size_t sphOffset) const;
  // The layout of this product's descriptors.
  const EnvisatDsdLayout& layout() const { return wss ? kWssDsdLayout : kImageDsdLayout; }
  // WSS: the measurement data sets in order up to the first of size 0 (at
  // most 5); others: the first MDS only (1 or 0).
  int imageDataSets(EnvisatDataSet out[5]) const;
};

// Reads the MPH and SPH blocks of a product and its header values.
// 0; 9 "File not opened!"; 4 "File reading failed!" (short MPH or SPH).  A
// wide-swath product (WSS) must also hold valid spacings and a valid
// descriptor in every slot of its layout: otherwise 4, with a report naming
// the field.  For other products spacingsValid and dataSet() tell.
int read_envisat_headers(const char* path, EnvisatHeaders* headers);
