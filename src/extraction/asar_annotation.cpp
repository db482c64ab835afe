#include "extraction/asar_annotation.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "extraction/product_file.h"
#include "raster/byte_order.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "time/mjd_time.h"

namespace asar {

namespace {

constexpr const char* kModule = "images_v2";

}  // namespace

float Record::f32(size_t offset) const {
  return offset + 4 <= size_ ? ch2float4(bytes_ + offset, 'm') : 0.0f;
}
int32_t Record::i32(size_t offset) const {
  return offset + 4 <= size_ ? ch2int4(bytes_ + offset, 'm') : 0;
}
uint32_t Record::u32(size_t offset) const {
  return offset + 4 <= size_ ? ch2uint4(bytes_ + offset, 'm') : 0;
}
int16_t Record::i16(size_t offset) const {
  return offset + 2 <= size_ ? ch2int2(bytes_ + offset, 'm') : 0;
}

double Record::time(size_t offset) const {
  MjdRecord r{};
  if (offset + kMjdRecordSize <= size_) std::memcpy(r.bytes, bytes_ + offset, kMjdRecordSize);
  return mjd2sec85(r);
}

std::string Record::token(size_t offset, size_t width) const {
  if (offset >= size_) return std::string();
  if (width > size_ - offset) width = size_ - offset;
  const char* p = reinterpret_cast<const char*>(bytes_) + offset;
  const char* end = p + width;
  while (p < end && (*p == ' ' || *p == '\t' || *p == '\n' || *p == '\r')) ++p;
  const char* q = p;
  while (q < end && *q != '\0' && *q != ' ' && *q != '\t' && *q != '\n' && *q != '\r') ++q;
  return std::string(p, q);
}

int AnnotationTable::read(int fd, int64_t fileSize, const EnvisatDataSet& ds, size_t minRecordSize,
                          const char* name) {
  VLR_SCOPE("AnnotationTable::read", kModule);
  release();
  recordSize_ = 0;
  if (!ds.present() || ds.numDsr <= 0) return 0;
  if (ds.dsrSize < static_cast<int64_t>(minRecordSize)) {
    VLR_FAIL(NVLR_UTILITY_Format("%s: records of %lld bytes, at least %zu expected", name,
                                 static_cast<long long>(ds.dsrSize), minRecordSize)
                 .c_str(),
             vlr::kLibInconsistent);
  }
  if (ds.numDsr > INT32_MAX || ds.dsrSize > INT64_MAX / ds.numDsr) {
    VLR_FAIL(NVLR_UTILITY_Format("%s: impossible record count", name).c_str(),
             vlr::kLibInconsistent);
  }
  if (!ds.fitsIn(fileSize)) {
    VLR_REPORT(NVLR_UTILITY_Format("%s: records beyond the end of the file", name).c_str(),
               ARE_ERROR);
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  const int64_t bytes = ds.numDsr * ds.dsrSize;
  if (!data_.allocate(static_cast<size_t>(bytes))) {
    VLR_FAIL(
        NVLR_UTILITY_Format("%s: cannot allocate %lld bytes", name, static_cast<long long>(bytes))
            .c_str(),
        vlr::kLibAlloc);
  }
  if (!ReadFullyAt(fd, data_.data(), static_cast<size_t>(bytes), ds.offset)) {
    release();
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  count_ = static_cast<int>(ds.numDsr);
  recordSize_ = static_cast<size_t>(ds.dsrSize);
  return 0;
}

}  // namespace asar
