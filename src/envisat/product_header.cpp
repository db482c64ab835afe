#include "envisat/product_header.h"

#include <cctype>
#include <cerrno>
#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "runtime/call_scope.h"
#include "runtime/file_utility.h"

namespace {

constexpr const char* kModule = "images_v2";

bool in_block(size_t blockSize, EnvisatField f) {
  return f.offset <= blockSize && f.width <= blockSize - f.offset;
}

// Characters a number may hold.
constexpr const char* kDecimalChars = "+-0123456789.eE";
constexpr const char* kIntegerChars = "+-0123456789";

// The characters of a number field without the blanks around it: empty
// unless the field lies in the block, is followed by its unit and holds
// nothing but `allowed` characters.
std::string number_text(const char* block, size_t blockSize, EnvisatField field,
                        const char* allowed) {
  if (block == nullptr || !in_block(blockSize, field)) return std::string();
  const size_t end = field.offset + field.width;
  if (field.unit != nullptr) {
    const size_t n = std::strlen(field.unit);
    if (n > blockSize - end || std::memcmp(block + end, field.unit, n) != 0) return std::string();
  }
  const char* p = block + field.offset;
  const char* q = block + end;
  while (p < q && *p == ' ') ++p;
  while (q > p && q[-1] == ' ') --q;
  std::string s(p, q);
  if (s.find_first_not_of(allowed) != std::string::npos) return std::string();
  return s;
}

// The descriptors of the wide-swath layout, by data set name.
struct NamedDsd {
  const char* name;
  size_t sphOffset;
};
constexpr NamedDsd kWssDescriptors[] = {
    {"MAIN PROCESSING PARAMS ADS", kWssDsdLayout.mainProcessing},
    {"DOP CENTROID COEFFS ADS", kWssDsdLayout.doppler},
    {"CHIRP PARAMS ADS", kWssDsdLayout.chirp},
    {"MDS1 ANTENNA ELEV PATT ADS", kWssDsdLayout.antenna},
    {"GEOLOCATION GRID ADS", kWssDsdLayout.geolocation},
    {"MDS1", kWssDsdLayout.mds[0]},
    {"MDS2", kWssDsdLayout.mds[1]},
    {"MDS3", kWssDsdLayout.mds[2]},
    {"MDS4", kWssDsdLayout.mds[3]},
    {"MDS5", kWssDsdLayout.mds[4]},
};

void parse_values(EnvisatHeaders* h) {
  const char* m = h->mph;
  h->product = EnvisatToken(m, kMphSize, kMphProduct);
  h->productType = h->product.size() > 4 ? h->product.substr(4, 3) : std::string();
  h->acquisitionStation = EnvisatToken(m, kMphSize, kMphAcquisitionStation);
  h->procCenter = EnvisatToken(m, kMphSize, kMphProcCenter);
  h->procTime = EnvisatText(m, kMphSize, kMphProcTime);
  h->softwareVer = EnvisatToken(m, kMphSize, kMphSoftwareVer);
  h->sensingStart = EnvisatText(m, kMphSize, kMphSensingStart);
  h->sensingStop = EnvisatText(m, kMphSize, kMphSensingStop);
  h->relOrbit = EnvisatToken(m, kMphSize, kMphRelOrbit);
  h->absOrbit = EnvisatToken(m, kMphSize, kMphAbsOrbit);
  const char* s = h->sph;
  h->sphDescriptor = EnvisatText(s, kSphBlockSize, kSphDescriptor);
  h->firstLineTime = EnvisatText(s, kSphBlockSize, kSphFirstLineTime);
  h->lastLineTime = EnvisatText(s, kSphBlockSize, kSphLastLineTime);
  h->swath = EnvisatToken(s, kSphBlockSize, kSphSwath);
  h->pass = EnvisatToken(s, kSphBlockSize, kSphPass);
  h->sampleType = EnvisatToken(s, kSphBlockSize, kSphSampleType);
  h->mds1Polar = EnvisatToken(s, kSphBlockSize, kSphMds1Polar);
  h->mds2Polar = EnvisatToken(s, kSphBlockSize, kSphMds2Polar);
  h->dataType = EnvisatToken(s, kSphBlockSize, kSphDataType);
  const struct {
    EnvisatField field;
    double* value;
    const char* problem;
  } spacings[] = {
      {kSphRangeSpacing, &h->rangeSpacing, "RANGE_SPACING is not a finite number in metres"},
      {kSphAzimuthSpacing, &h->azimuthSpacing, "AZIMUTH_SPACING is not a finite number in metres"},
      {kSphLineTimeInterval, &h->lineTimeInterval,
       "LINE_TIME_INTERVAL is not a finite number in seconds"},
  };
  h->spacingsValid = true;
  h->spacingProblem = nullptr;
  for (const auto& sp : spacings) {
    if (!EnvisatNumber(s, kSphBlockSize, sp.field, sp.value)) {
      h->spacingsValid = false;
      h->spacingProblem = sp.problem;
      break;
    }
  }
  const std::string& t = h->productType;
  h->wss = t == "WSS";
  h->aps = t == "APS";
  h->apm = t == "APM";
  h->app = t == "APP";
  h->wsm = t == "WSM";
  h->gm1 = t == "GM1";
}

}  // namespace

std::string EnvisatToken(const char* block, size_t blockSize, EnvisatField field) {
  if (block == nullptr || !in_block(blockSize, field)) return std::string();
  const char* p = block + field.offset;
  const char* end = p + field.width;
  while (p < end && std::isspace(static_cast<unsigned char>(*p))) ++p;
  const char* q = p;
  while (q < end && *q != '\0' && !std::isspace(static_cast<unsigned char>(*q))) ++q;
  return std::string(p, q);
}

std::string EnvisatText(const char* block, size_t blockSize, EnvisatField field) {
  if (block == nullptr || !in_block(blockSize, field)) return std::string();
  const char* p = block + field.offset;
  return std::string(p, strnlen(p, field.width));
}

bool EnvisatNumber(const char* block, size_t blockSize, EnvisatField field, double* value) {
  const std::string s = number_text(block, blockSize, field, kDecimalChars);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const double v = std::strtod(s.c_str(), &end);
  const bool ok = end == s.c_str() + s.size() && errno == 0 && std::isfinite(v);
  errno = 0;
  if (ok) *value = v;
  return ok;
}

bool EnvisatInteger(const char* block, size_t blockSize, EnvisatField field, int64_t* value) {
  const std::string s = number_text(block, blockSize, field, kIntegerChars);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(s.c_str(), &end, 10);
  const bool ok = end == s.c_str() + s.size() && errno == 0;
  errno = 0;
  if (ok) *value = v;
  return ok;
}

std::string EnvisatPrintable(const std::string& text) {
  std::string out = text;
  for (char& c : out) {
    if (c < ' ' || c > '~') c = '?';
  }
  return out;
}

bool EnvisatDataSet::fitsIn(int64_t fileSize) const {
  if (!valid || offset < 0 || size < 0 || numDsr < 0 || dsrSize < 0) return false;
  if (offset > fileSize || size > fileSize - offset) return false;
  // The records must lie inside the data set (and so inside the file).
  if (dsrSize > 0 && numDsr > size / dsrSize) return false;
  return true;
}

EnvisatDataSet EnvisatHeaders::dataSet(size_t sphOffset) const {
  EnvisatDataSet d;
  if (sphOffset > kSphBlockSize || kDsdRecordSize > kSphBlockSize - sphOffset) {
    d.problem = "the descriptor lies outside the specific product header";
    return d;
  }
  const char* b = sph + sphOffset;
  const struct {
    EnvisatField field;
    const char* notNumber;
    const char* negative;
  } fields[4] = {
      {kDsdOffset, "DS_OFFSET is not a number of <bytes>", "DS_OFFSET is negative"},
      {kDsdSize, "DS_SIZE is not a number of <bytes>", "DS_SIZE is negative"},
      {kDsdNumDsr, "NUM_DSR is not a number", "NUM_DSR is negative"},
      {kDsdDsrSize, "DSR_SIZE is not a number of <bytes>", "DSR_SIZE is negative"},
  };
  int64_t v[4];
  for (int i = 0; i < 4; ++i) {
    if (!EnvisatInteger(b, kDsdRecordSize, fields[i].field, &v[i])) {
      d.problem = fields[i].notNumber;
      return d;
    }
    if (v[i] < 0) {
      d.problem = fields[i].negative;
      return d;
    }
  }
  // The data set is its records, no more and no less.
  if (v[2] > 0 && v[3] == 0) {
    d.problem = "DSR_SIZE is 0 for a data set with records";
    return d;
  }
  if ((v[2] > 0 && v[3] > INT64_MAX / v[2]) || v[1] != v[2] * v[3]) {
    d.problem = "DS_SIZE is not NUM_DSR x DSR_SIZE";
    return d;
  }
  d.offset = v[0];
  d.size = v[1];
  d.numDsr = v[2];
  d.dsrSize = v[3];
  d.valid = true;
  return d;
}

int EnvisatHeaders::imageDataSets(EnvisatDataSet out[5]) const {
  const EnvisatDsdLayout& l = layout();
  const int slots = wss ? l.mdsSlots : 1;
  int n = 0;
  for (; n < slots; ++n) {
    const EnvisatDataSet d = dataSet(l.mds[n]);
    if (!d.present()) break;
    out[n] = d;
  }
  return n;
}

int read_envisat_headers(const char* path, EnvisatHeaders* headers) {
  VLR_SCOPE("read_envisat_headers", kModule);
  std::FILE* f = path ? std::fopen(path, "rb") : nullptr;
  if (f == nullptr) VLR_FAIL("File not opened!", 9);
  std::memset(headers->mph, 0, sizeof headers->mph);
  std::memset(headers->sph, 0, sizeof headers->sph);
  const bool ok = std::fread(headers->mph, 1, kMphSize, f) == kMphSize &&
                  std::fread(headers->sph, 1, kSphBlockSize, f) == kSphBlockSize;
  int64_t size = -1;
  if (ok && std::fseek(f, 0, SEEK_END) == 0) size = static_cast<int64_t>(ftello(f));
  std::fclose(f);
  if (!ok || size < 0) VLR_FAIL("File reading failed!", 4);
  headers->fileSize = size;
  parse_values(headers);
  if (headers->wss) {
    if (!headers->spacingsValid) {
      VLR_FAIL(
          NVLR_UTILITY_Format("Specific product header of %s: %s", path, headers->spacingProblem)
              .c_str(),
          4);
    }
    for (const NamedDsd& dsd : kWssDescriptors) {
      const EnvisatDataSet d = headers->dataSet(dsd.sphOffset);
      if (!d.valid) {
        VLR_FAIL(NVLR_UTILITY_Format("Data set descriptor %s of %s: %s", dsd.name, path, d.problem)
                     .c_str(),
                 4);
      }
    }
  }
  return 0;
}
