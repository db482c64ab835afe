// Window reading throughput of BufferIO.
//
//   bench_bufferio make FILE [MiB]   writes a big-endian SHORT_COMPLEX raster
//                                    of about MiB mebibytes (default 1024)
//                                    with 17-byte line prefixes, and its header
//   bench_bufferio read FILE [BYTES] reads it line by line into FLOAT_COMPLEX;
//                                    with BYTES the file is opened first with
//                                    a read buffer of that size (0:
//                                    unbuffered), else BufferIO opens it
//
// The read prints a checksum so that the work cannot be skipped.
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "raster/buffer_io.h"
#include "raster/byte_order.h"
#include "raster/data_file.h"

namespace {

constexpr int kPixels = 6000;  // samples per line, about one wide-swath sub-swath
constexpr int kPrefix = 17;    // line time and quality of the product lines

int Make(const char* name, long mebibytes) {
  DataFile df;
  df.set_name(name);
  df.pixels_per_line = kPixels;
  df.row_prefix = kPrefix;
  df.cell_type = CT_SHORT_COMPLEX;
  df.byte_order = 1;
  df.lines_per_image = static_cast<int32_t>((mebibytes << 20) / df.line_length());
  df.set_buffer_size(1 << 20);
  if (df.open(DataFile::kOpenCreate) != 0) return 1;
  std::vector<unsigned char> line(static_cast<size_t>(df.line_length()));
  unsigned state = 12345;
  for (int k = 0; k < df.lines_per_image; ++k) {
    std::memset(line.data(), k & 0xFF, kPrefix);
    for (int i = 0; i < 2 * kPixels; ++i) {
      state = state * 1103515245u + 12345u;
      short2ch(static_cast<int16_t>(state >> 16), line.data() + kPrefix + 2 * i, 'm');
    }
    if (df.write(line.data(), df.line_length()) != 0) return 1;
  }
  if (df.close() != 0 || df.write_hdr() != 0) return 1;
  std::printf("%d lines of %lld bytes\n", df.lines_per_image,
              static_cast<long long>(df.line_length()));
  return 0;
}

int Read(const char* name, const char* buffer) {
  DataFile df;
  if (df.read_hdr(name) != 0) return 1;
  if (buffer != nullptr) {
    df.set_buffer_size(std::atoi(buffer));
    if (df.open(DataFile::kOpenRead) != 0) return 1;
  }
  BufferIO io(&df);
  io.first_sample = 0;
  io.num_samples = df.pixels_per_line;
  io.num_lines = 1;
  io.output_type = CT_FLOAT_COMPLEX;
  std::vector<float> out(2 * static_cast<size_t>(df.pixels_per_line));
  double sum = 0.0;
  for (int k = 0; k < df.lines_per_image; ++k) {
    io.first_line = k;
    if (io.readbuffer(reinterpret_cast<char*>(out.data())) != 0) return 1;
    sum += out[static_cast<size_t>(k) % out.size()];
  }
  df.close();
  std::printf("checksum %.1f\n", sum);
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc >= 3 && std::strcmp(argv[1], "make") == 0) {
    return Make(argv[2], argc >= 4 ? std::atol(argv[3]) : 1024);
  }
  if (argc >= 3 && std::strcmp(argv[1], "read") == 0) {
    return Read(argv[2], argc >= 4 ? argv[3] : nullptr);
  }
  std::fprintf(stderr, "usage: %s make FILE [MiB] | read FILE [BYTES]\n", argv[0]);
  return 2;
}
