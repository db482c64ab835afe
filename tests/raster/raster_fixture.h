// Helpers of the raster tests: an independent encoder of sample values and
// whole rasters in either byte order.
#pragma once

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "metadata_fixture.h"
#include "raster/data_file.h"

namespace raster_test {

constexpr int kPrefix = 17;  // the line header of ENVISAT image lines
constexpr int kOffset = 11;  // header bytes before the first line

// A scratch directory per test, with slurp/spit for whole files.
using ScratchDir = MetadataTest;

// Sets the description of *df.
inline void Describe(DataFile* df, const std::string& name, int type, bool big, int lines,
                     int pixels, int prefix = kPrefix, int64_t offset = kOffset) {
  df->set_name(name.c_str());
  df->lines_per_image = lines;
  df->pixels_per_line = pixels;
  df->row_prefix = prefix;
  df->header_offset = offset;
  df->cell_type = type;
  df->byte_order = big ? 1 : 0;
}

// Cell types 0..7: components float, double, int32, int16; even types complex.
inline int ComponentSize(int type) {
  static const int sizes[4] = {4, 8, 4, 2};
  return sizes[type / 2];
}
inline int Components(int type) {
  return type % 2 == 0 ? 2 : 1;
}

// One component of type T at p, most significant byte first when `big`.
template <class T>
void Put(double v, bool big, unsigned char* p) {
  const T t = static_cast<T>(v);
  const auto* b = reinterpret_cast<const unsigned char*>(&t);
  for (size_t i = 0; i < sizeof(T); ++i) p[i] = big ? b[sizeof(T) - 1 - i] : b[i];
}

inline void PutComponent(double v, int type, bool big, unsigned char* p) {
  static void (*const put[4])(double, bool, unsigned char*) = {Put<float>, Put<double>,
                                                               Put<int32_t>, Put<int16_t>};
  put[type / 2](v, big, p);
}

// Small whole numbers, exact in every cell type.
inline double Re(int line, int sample) {
  return line * 10 + sample - 7;
}
inline double Im(int line, int sample) {
  return -2 * (line * 10 + sample) + 5;
}

// Samples first_sample.. of one line as `type` in the given byte order;
// imaginary parts 0 when `real_only`.
inline std::string Samples(int type, bool big, int line, int first_sample, int samples,
                           bool real_only = false) {
  const int size = ComponentSize(type);
  std::string out(static_cast<size_t>(samples * size * Components(type)), '\0');
  auto* p = reinterpret_cast<unsigned char*>(&out[0]);
  for (int s = first_sample; s < first_sample + samples; ++s, p += size * Components(type)) {
    PutComponent(Re(line, s), type, big, p);
    if (Components(type) == 2) PutComponent(real_only ? 0.0 : Im(line, s), type, big, p + size);
  }
  return out;
}

// A raster: kOffset header bytes 0xAA, then per line kPrefix letters
// 'A' + line and the samples.  Header and prefixes are zero bytes when
// `blank`, as in a file that only had its samples written.
inline std::string MakeRaster(int type, bool big, int lines, int pixels, bool blank = false,
                              bool real_only = false) {
  std::string bytes(kOffset, blank ? '\0' : '\xAA');
  for (int k = 0; k < lines; ++k) {
    bytes.append(kPrefix, blank ? '\0' : static_cast<char>('A' + k));
    bytes += Samples(type, big, k, 0, pixels, real_only);
  }
  return bytes;
}

}  // namespace raster_test
