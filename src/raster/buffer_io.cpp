#include "raster/buffer_io.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "raster/byte_order.h"
#include "raster/sample_convert.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "bufferio";

// File bytes converted per step: small enough to stay in the cache next to
// the caller's line, large enough to keep the per-call cost negligible.
constexpr int64_t kChunkBytes = 64 * 1024;

// Read buffer given to a file that a read opens itself, when its user set
// none: line after line, the buffer saves one system call per line.
constexpr int kDefaultReadBuffer = 1 << 20;

bool IsTransferType(int code) {
  return code >= 0 && code <= 7;
}

}  // namespace

int64_t BufferIO::window_bytes() const {
  if (!IsTransferType(output_type) || num_lines < 0 || num_samples < 0) return 0;
  const int64_t line = int64_t{num_samples} * cell_type_size(output_type);
  if (num_lines > 0 && line > INT64_MAX / num_lines) return INT64_MAX;
  return num_lines * line;
}

bool BufferIO::must_swap() const {
  return (file->byte_order == 1 ? 'm' : 'l') != endi();
}

// 0 when the window lies inside the raster and, for sample transfers, the
// samples can be converted in the transfer's direction; else 1.
int BufferIO::check_window(Transfer transfer) const {
  if (file == nullptr || file->check_description() != 0) return 1;
  if (first_line < 0 || num_lines < 0 || first_line > file->lines_per_image - num_lines) return 1;
  if (transfer == kPrefix) return 0;
  const int from = transfer == kRead ? file->cell_type : output_type;
  const int to = transfer == kRead ? output_type : file->cell_type;
  if (!IsTransferType(from) || !IsTransferType(to) || !sample_conversion_supported(from, to)) {
    return 1;
  }
  if (first_sample < 0 || num_samples < 0 || first_sample > file->pixels_per_line - num_samples) {
    return 1;
  }
  return 0;
}

int BufferIO::open_for_reading() {
  if (file->buffer_size() == 0) file->set_buffer_size(kDefaultReadBuffer);
  return file->open(DataFile::kOpenRead);
}

// A window is written into the raster as it stands: an existing file is
// opened for writing in place (never truncated, so that the lines outside
// the window keep their samples), a missing one is created.
int BufferIO::open_for_writing() {
  struct stat st;
  const bool exists = ::stat(file->name().c_str(), &st) == 0;
  errno = 0;
  return file->open(exists ? DataFile::kOpenWrite : DataFile::kOpenCreate);
}

int BufferIO::readprefix(char* out) {
  VLR_SCOPE("BufferIO::readprefix", kModule);
  VLR_CALL(transfer_prefix(out, nullptr));
  return 0;
}

int BufferIO::writeprefix(const char* in) {
  VLR_SCOPE("BufferIO::writeprefix", kModule);
  VLR_CALL(transfer_prefix(nullptr, in));
  return 0;
}

// Prefix bytes of the window's lines into `out`, or from `in`.
int BufferIO::transfer_prefix(char* out, const char* in) {
  VLR_SCOPE("BufferIO::transfer_prefix", kModule);
  const bool reading = in == nullptr;
  if (check_window(kPrefix) != 0 || (out == nullptr && in == nullptr && num_lines > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  if (!file->is_open()) VLR_CALL(reading ? open_for_reading() : open_for_writing());
  const int64_t prefix = file->row_prefix;
  for (int32_t k = 0; k < num_lines; ++k) {
    VLR_CALL(file->seek(file->line_offset(first_line + k), DataFile::kSeekSet));
    if (reading) {
      VLR_CALL(file->read(out + k * prefix, prefix));
    } else {
      VLR_CALL(file->write(in + k * prefix, prefix));
    }
  }
  return 0;
}

int BufferIO::readbuffer(char* out, int capacity) {
  VLR_SCOPE("BufferIO::readbuffer", kModule);
  if (capacity < 0 || window_bytes() > capacity) {
    VLR_FAIL("Output buffer too small!", vlr::kLibInconsistent);
  }
  VLR_CALL(readbuffer(out));
  return 0;
}

int BufferIO::readbuffer(char* out) {
  VLR_SCOPE("BufferIO::readbuffer", kModule);
  if (check_window(kRead) != 0 || (out == nullptr && window_bytes() > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  if (!file->is_open()) VLR_CALL(open_for_reading());
  const int in_type = file->cell_type;
  const int64_t in_size = cell_type_size(in_type);
  const int64_t out_size = cell_type_size(output_type);
  const bool swap = must_swap();
  const bool same = in_type == output_type;
  const int64_t chunk = std::max<int64_t>(1, kChunkBytes / in_size);
  const size_t scratch = static_cast<size_t>(std::min<int64_t>(num_samples, chunk) * in_size);
  if (!same && scratch_.size() < scratch) scratch_.resize(scratch);
  unsigned char* dst = reinterpret_cast<unsigned char*>(out);
  for (int32_t k = 0; k < num_lines; ++k) {
    const int64_t start =
        file->line_offset(first_line + k) + file->row_prefix + first_sample * in_size;
    VLR_CALL(file->seek(start, DataFile::kSeekSet));
    if (same) {
      // Straight into the caller's memory, then into host order.
      VLR_CALL(file->read(dst, num_samples * in_size));
      if (swap) swap_samples(dst, in_type, static_cast<size_t>(num_samples));
      dst += num_samples * out_size;
      continue;
    }
    for (int64_t done = 0; done < num_samples;) {
      const int64_t n = std::min<int64_t>(chunk, num_samples - done);
      // A buffered file lends its buffer; otherwise read into the scratch.
      const unsigned char* view = scratch_.data();
      int rc = file->is_buffered() ? file->read_view(n * in_size, &view) : vlr::kLibInconsistent;
      if (rc == vlr::kLibInconsistent) {
        view = scratch_.data();
        rc = file->read(scratch_.data(), n * in_size);
      }
      VLR_CALL(rc);
      convert_samples(view, in_type, swap, dst, output_type, static_cast<size_t>(n));
      dst += n * out_size;
      done += n;
    }
  }
  return 0;
}

int BufferIO::writebuffer(const char* in) {
  VLR_SCOPE("BufferIO::writebuffer", kModule);
  if (check_window(kWrite) != 0 || (in == nullptr && window_bytes() > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  if (!file->is_open()) VLR_CALL(open_for_writing());
  const int file_type = file->cell_type;
  const int64_t file_size = cell_type_size(file_type);
  const int64_t in_size = cell_type_size(output_type);
  const bool swap = must_swap();
  const bool direct = file_type == output_type && !swap;
  const int64_t chunk = std::max<int64_t>(1, kChunkBytes / file_size);
  const size_t scratch = static_cast<size_t>(std::min<int64_t>(num_samples, chunk) * file_size);
  if (!direct && scratch_.size() < scratch) scratch_.resize(scratch);
  const unsigned char* src = reinterpret_cast<const unsigned char*>(in);
  for (int32_t k = 0; k < num_lines; ++k) {
    const int64_t start =
        file->line_offset(first_line + k) + file->row_prefix + first_sample * file_size;
    VLR_CALL(file->seek(start, DataFile::kSeekSet));
    if (direct) {
      VLR_CALL(file->write(src, num_samples * file_size));
      src += num_samples * in_size;
      continue;
    }
    for (int64_t done = 0; done < num_samples;) {
      const int64_t n = std::min<int64_t>(chunk, num_samples - done);
      convert_samples(src, output_type, false, scratch_.data(), file_type, static_cast<size_t>(n));
      if (swap) swap_samples(scratch_.data(), file_type, static_cast<size_t>(n));
      VLR_CALL(file->write(scratch_.data(), n * file_size));
      src += n * in_size;
      done += n;
    }
  }
  return 0;
}
