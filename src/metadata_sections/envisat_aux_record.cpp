#include "metadata_sections/envisat_aux_record.h"

#include <cerrno>
#include <cstdlib>
#include <string>

#include "raster/byte_order.h"
#include "raster/data_file.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "envisat_aux";

// The DS_OFFSET number as "%ld" reads it: leading blanks, an optional sign,
// digits.  False when the field holds no number or it does not fit.
bool scanOffset(const unsigned char* sph, int64_t* offset) {
  const std::string field(reinterpret_cast<const char*>(sph) + kAuxDsOffsetValue,
                          kAuxDsOffsetWidth);
  const char* begin = field.c_str();
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(begin, &end, 10);
  const bool ok = end != begin && errno == 0;
  errno = 0;
  if (!ok) return false;
  *offset = v;
  return true;
}

}  // namespace

int readEnvisatAuxRecord(const char* file, int64_t recordSize,
                         vlr::CkBuffer<unsigned char>* record) {
  VLR_SCOPE("readEnvisatAuxRecord", kModule);
  DataFile aux;
  aux.set_name(file);
  VLR_CALL(aux.open(DataFile::kOpenRead));
  unsigned char mph[kAuxMphSize];
  unsigned char sph[kAuxSphSize];
  VLR_CALL(aux.read(mph, kAuxMphSize));
  VLR_CALL(aux.read(sph, kAuxSphSize));
  int64_t offset = 0;
  if (!scanOffset(sph, &offset) || offset < 0 || offset > DataFile::kMaxHeaderOffset) {
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  VLR_CALL(aux.seek(offset, DataFile::kSeekSet));
  if (!record->allocate(static_cast<size_t>(recordSize)))
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  VLR_CALL(aux.read(record->data(), recordSize));
  VLR_CALL(aux.close());
  return 0;
}

float auxFloat(const unsigned char* record, size_t offset) {
  return ch2float4(record + offset, 'm');
}

double auxDouble(const unsigned char* record, size_t offset) {
  return ch2double8(record + offset, 'm');
}
