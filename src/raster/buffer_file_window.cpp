// BufferFile: typed window transfers, line prefixes, the file header bytes
// and single samples.
#include <algorithm>
#include <cstring>

#include "raster/buffer_file.h"
#include "raster/file_messages.h"
#include "raster/sample_convert.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "bufferfile";

using namespace raster_messages;

// File bytes converted per step.
constexpr int64_t kChunkBytes = 64 * 1024;

// A caller's type and a unit type of the file are exchanged by value when
// both are real or both complex, among the cell types 0..7.
bool Exchangeable(int file_type, int caller_type) {
  return sample_conversion_supported(file_type, caller_type) &&
         cell_type_is_complex(file_type) == cell_type_is_complex(caller_type);
}

}  // namespace

// 0 when the window lies inside the raster; a number of samples of 0 is
// replaced by the rest of the line from the first sample.
int BufferFile::check_window(int first_line, int num_lines, int first_sample,
                             int* num_samples) const {
  if (check_description() != 0) return 1;
  if (first_line < 0 || num_lines < 0 || first_line > lines_ - num_lines) return 1;
  if (first_sample < 0 || first_sample > samples_) return 1;
  if (*num_samples == 0) *num_samples = samples_ - first_sample;
  if (*num_samples < 0 || first_sample > samples_ - *num_samples) return 1;
  return 0;
}

int BufferFile::read_window(void* out, int out_type, int first_line, int num_lines,
                            int first_sample, int num_samples) {
  VLR_SCOPE("BufferFile::readbuffer", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (op_type_ == kOpWrite) VLR_FAIL("File open for writing!", vlr::kLibInconsistent);
  if (!Exchangeable(unit_type_, out_type))
    VLR_FAIL("Unsupported cell type!", vlr::kLibInconsistent);
  if (check_window(first_line, num_lines, first_sample, &num_samples) != 0 ||
      (out == nullptr && num_lines > 0 && num_samples > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  const int type = unit_type_;
  const int64_t in_size = cell_type_size(type);
  const int64_t out_size = cell_type_size(out_type);
  const bool swap = must_swap();
  const bool same = type == out_type;
  const int64_t chunk = std::max<int64_t>(1, kChunkBytes / in_size);
  if (!same) scratch_.resize(static_cast<size_t>(std::min<int64_t>(num_samples, chunk) * in_size));
  auto* dst = static_cast<unsigned char*>(out);
  for (int k = 0; k < num_lines; ++k) {
    const int64_t start = header_offset_ + (first_line + int64_t{k}) * line_length() + row_prefix_ +
                          first_sample * in_size;
    VLR_CALL(seek(start, kSeekSet));
    if (same) {
      const int64_t bytes = num_samples * in_size;
      if (read(dst, bytes) != bytes) VLR_FAIL(kReadFailed, vlr::kLibRead);
      if (swap) swap_samples(dst, type, static_cast<size_t>(num_samples));
      dst += bytes;
      continue;
    }
    for (int64_t done = 0; done < num_samples;) {
      const int64_t n = std::min<int64_t>(chunk, num_samples - done);
      const int64_t bytes = n * in_size;
      const unsigned char* src = scratch_.data();
      if (is_buffered() && readable() - cursor_ >= bytes) {
        src = buffer_.data() + cursor_;  // converted straight out of the buffer
        cursor_ += bytes;
      } else if (read(scratch_.data(), bytes) != bytes) {
        VLR_FAIL(kReadFailed, vlr::kLibRead);
      }
      convert_samples(src, type, swap, dst, out_type, static_cast<size_t>(n));
      dst += n * out_size;
      done += n;
    }
  }
  return 0;
}

int BufferFile::write_window(const void* in, int in_type, int first_line, int num_lines,
                             int first_sample, int num_samples) {
  VLR_SCOPE("BufferFile::writebuffer", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (!is_writing()) VLR_FAIL("File open for reading!", vlr::kLibInconsistent);
  if (!Exchangeable(unit_type_, in_type)) VLR_FAIL("Unsupported cell type!", vlr::kLibInconsistent);
  if (check_window(first_line, num_lines, first_sample, &num_samples) != 0 ||
      (in == nullptr && num_lines > 0 && num_samples > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  const int type = unit_type_;
  const int64_t file_size = cell_type_size(type);
  const int64_t in_size = cell_type_size(in_type);
  const bool swap = must_swap();
  const bool direct = type == in_type && !swap;
  const int64_t chunk = std::max<int64_t>(1, kChunkBytes / file_size);
  if (!direct) {
    scratch_.resize(static_cast<size_t>(std::min<int64_t>(num_samples, chunk) * file_size));
  }
  const auto* src = static_cast<const unsigned char*>(in);
  for (int k = 0; k < num_lines; ++k) {
    const int64_t start = header_offset_ + (first_line + int64_t{k}) * line_length() + row_prefix_ +
                          first_sample * file_size;
    VLR_CALL(seek(start, kSeekSet));
    if (direct) {
      const int64_t bytes = num_samples * file_size;
      if (write(src, bytes) != bytes) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
      src += bytes;
      continue;
    }
    for (int64_t done = 0; done < num_samples;) {
      const int64_t n = std::min<int64_t>(chunk, num_samples - done);
      convert_samples(src, in_type, false, scratch_.data(), type, static_cast<size_t>(n));
      if (swap) swap_samples(scratch_.data(), type, static_cast<size_t>(n));
      if (write(scratch_.data(), n * file_size) != n * file_size) {
        VLR_FAIL(kWriteFailed, vlr::kLibWrite);
      }
      src += n * in_size;
      done += n;
    }
  }
  return 0;
}

int BufferFile::readbuffer(float* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_FLOAT32, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::readbuffer(double* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_FLOAT64, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::readbuffer(int* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_INT32, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::readbuffer(short* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_INT16, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::readbuffer(fcomplex* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_FLOAT_COMPLEX, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::readbuffer(dcomplex* out, int first_line, int num_lines, int first_sample,
                           int num_samples) {
  return read_window(out, CT_DOUBLE_COMPLEX, first_line, num_lines, first_sample, num_samples);
}

int BufferFile::writebuffer(const float* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_FLOAT32, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::writebuffer(const double* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_FLOAT64, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::writebuffer(const int* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_INT32, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::writebuffer(const short* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_INT16, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::writebuffer(const fcomplex* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_FLOAT_COMPLEX, first_line, num_lines, first_sample, num_samples);
}
int BufferFile::writebuffer(const dcomplex* in, int first_line, int num_lines, int first_sample,
                            int num_samples) {
  return write_window(in, CT_DOUBLE_COMPLEX, first_line, num_lines, first_sample, num_samples);
}

// Prefix bytes of the window's lines into `out`, or from `in`.
int BufferFile::transfer_prefix(char* out, const char* in, int first_line, int num_lines) {
  VLR_SCOPE("BufferFile::transfer_prefix", kModule);
  const bool reading = in == nullptr;
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (reading ? op_type_ == kOpWrite : !is_writing()) {
    VLR_FAIL("Wrong file operation type!", vlr::kLibInconsistent);
  }
  if (check_description() != 0 || first_line < 0 || num_lines < 0 ||
      first_line > lines_ - num_lines || (reading && out == nullptr && num_lines > 0)) {
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  const int64_t prefix = row_prefix_;
  for (int k = 0; k < num_lines; ++k) {
    VLR_CALL(seek(header_offset_ + (first_line + int64_t{k}) * line_length(), kSeekSet));
    if (reading) {
      if (read(out + k * prefix, prefix) != prefix) VLR_FAIL(kReadFailed, vlr::kLibRead);
    } else if (write(in + k * prefix, prefix) != prefix) {
      VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    }
  }
  return 0;
}

int BufferFile::readprefix(char* out, int first_line, int num_lines) {
  return transfer_prefix(out, nullptr, first_line, num_lines);
}

int BufferFile::writeprefix(const char* in, int first_line, int num_lines) {
  if (in == nullptr && num_lines != 0) {
    VLR_SCOPE("BufferFile::writeprefix", kModule);
    VLR_FAIL("Invalid raster window!", vlr::kLibInconsistent);
  }
  static const char kNothing = 0;
  return transfer_prefix(nullptr, in != nullptr ? in : &kNothing, first_line, num_lines);
}

int BufferFile::writeOffset(const char* in, int size) {
  VLR_SCOPE("BufferFile::writeOffset", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (!is_writing()) VLR_FAIL("File open for reading!", vlr::kLibInconsistent);
  if (size < 0 || (in == nullptr && size > 0))
    VLR_FAIL("Invalid header size!", vlr::kLibInconsistent);
  VLR_CALL(seek(0, kSeekSet));
  if (write(in, size) != size) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  header_offset_ = size;
  return 0;
}

template <class T>
T BufferFile::read_sample(int type, int line, int sample) {
  static_assert(sizeof(T) <= 16, "one sample");
  if (!is_open() || op_type_ == kOpWrite || unit_type_ != type || check_description() != 0 ||
      line < 0 || line >= lines_ || sample < 0 || sample >= samples_) {
    return T{};
  }
  const int64_t size = cell_type_size(type);
  const int64_t at = header_offset_ + line * line_length() + row_prefix_ + sample * size;
  unsigned char bytes[16];
  if (seek(at, kSeekSet) != 0 || read(bytes, size) != size) return T{};
  if (must_swap()) swap_samples(bytes, type, 1);
  T value;
  std::memcpy(&value, bytes, sizeof value);
  return value;
}

float BufferFile::readFloat(int line, int sample) {
  return read_sample<float>(CT_FLOAT32, line, sample);
}
double BufferFile::readDouble(int line, int sample) {
  return read_sample<double>(CT_FLOAT64, line, sample);
}
int BufferFile::readInt(int line, int sample) {
  return read_sample<int32_t>(CT_INT32, line, sample);
}
short BufferFile::readShort(int line, int sample) {
  return read_sample<int16_t>(CT_INT16, line, sample);
}
fcomplex BufferFile::readFloatComplex(int line, int sample) {
  return read_sample<fcomplex>(CT_FLOAT_COMPLEX, line, sample);
}
dcomplex BufferFile::readDoubleComplex(int line, int sample) {
  return read_sample<dcomplex>(CT_DOUBLE_COMPLEX, line, sample);
}
