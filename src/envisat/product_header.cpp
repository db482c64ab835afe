#include "envisat/product_header.h"

#include <cctype>
#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "images_v2";

bool in_block(size_t blockSize, EnvisatField f) {
  return f.offset <= blockSize && f.width <= blockSize - f.offset;
}

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
  h->sampleType = EnvisatToken(s, kSphBlockSize, kSphSampleType);
  h->mds1Polar = EnvisatToken(s, kSphBlockSize, kSphMds1Polar);
  h->mds2Polar = EnvisatToken(s, kSphBlockSize, kSphMds2Polar);
  h->dataType = EnvisatToken(s, kSphBlockSize, kSphDataType);
  h->spacingsValid = EnvisatNumber(s, kSphBlockSize, kSphRangeSpacing, &h->rangeSpacing) &&
                     EnvisatNumber(s, kSphBlockSize, kSphAzimuthSpacing, &h->azimuthSpacing) &&
                     EnvisatNumber(s, kSphBlockSize, kSphLineTimeInterval, &h->lineTimeInterval);
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
  const std::string s = EnvisatToken(block, blockSize, field);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const double v = std::strtod(s.c_str(), &end);
  const bool ok = end != s.c_str() && errno == 0;
  errno = 0;
  if (ok) *value = v;
  return ok;
}

bool EnvisatInteger(const char* block, size_t blockSize, EnvisatField field, int64_t* value) {
  const std::string s = EnvisatToken(block, blockSize, field);
  if (s.empty()) return false;
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(s.c_str(), &end, 10);
  const bool ok = end != s.c_str() && errno == 0;
  errno = 0;
  if (ok) *value = v;
  return ok;
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
  if (sphOffset > kSphBlockSize || kDsdRecordSize > kSphBlockSize - sphOffset) return d;
  const char* b = sph + sphOffset;
  int64_t v[4];
  if (!EnvisatInteger(b, kDsdRecordSize, kDsdOffset, &v[0]) ||
      !EnvisatInteger(b, kDsdRecordSize, kDsdSize, &v[1]) ||
      !EnvisatInteger(b, kDsdRecordSize, kDsdNumDsr, &v[2]) ||
      !EnvisatInteger(b, kDsdRecordSize, kDsdDsrSize, &v[3]))
    return d;
  for (int64_t x : v)
    if (x < 0) return d;
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
  return 0;
}
