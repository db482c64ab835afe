#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <limits>
#include <string>
#include <vector>

#include "raster/buffer_io.h"
#include "raster/cell_type.h"
#include "raster/sample_convert.h"
#include "raster_fixture.h"

namespace {

using namespace raster_test;

constexpr int kPixels = 5;
constexpr int kLines = 3;

class BufferIOTest : public ScratchDir {};

// Each pair read as a window (lines 1-2, samples 1-3) from an independently
// encoded file, and written as a whole raster into a new file; a complex
// sample has no real value, so complex to real is refused both ways.
TEST_F(BufferIOTest, EveryConversionPairInBothByteOrders) {
  for (int big = 0; big <= 1; ++big) {
    for (int file = 0; file <= 7; ++file) {
      spit(path("in"), MakeRaster(file, big, kLines, kPixels));
      for (int mem = 0; mem <= 7; ++mem) {
        SCOPED_TRACE("file type " + std::to_string(file) + ", memory type " + std::to_string(mem) +
                     (big ? ", big-endian" : ", little-endian"));
        DataFile df;
        Describe(&df, path("in"), file, big, kLines, kPixels);
        BufferIO io(&df);
        io.first_sample = 1;
        io.num_samples = 3;
        io.first_line = 1;
        io.num_lines = 2;
        io.output_type = mem;
        std::string got(static_cast<size_t>(6 * cell_type_size(mem)), '\xEE');
        const bool real_file = Components(file) == 1;
        if (!real_file && Components(mem) == 1) {
          EXPECT_EQ(io.readbuffer(&got[0]), 1);
          EXPECT_EQ(got, std::string(got.size(), '\xEE'));
        } else {
          EXPECT_EQ(io.readbuffer(&got[0]), 0);
          EXPECT_EQ(got, Samples(mem, false, 1, 1, 3, real_file) +
                             Samples(mem, false, 2, 1, 3, real_file));
        }

        // Each file type has its own size: the raster is written afresh.
        std::filesystem::remove(path("out"));
        DataFile target;
        Describe(&target, path("out"), file, big, kLines, kPixels);
        BufferIO writer(&target);
        writer.num_samples = kPixels;
        writer.num_lines = kLines;
        writer.output_type = mem;
        std::string samples;
        for (int k = 0; k < kLines; ++k) samples += Samples(mem, false, k, 0, kPixels);
        if (Components(mem) == 2 && real_file) {
          EXPECT_EQ(writer.writebuffer(samples.data()), 1);
          continue;
        }
        ASSERT_EQ(writer.writebuffer(samples.data()), 0);
        ASSERT_EQ(target.close(), 0);
        EXPECT_EQ(slurp(path("out")),
                  MakeRaster(file, big, kLines, kPixels, true, Components(mem) == 1));
      }
    }
  }
}

// A window written into a closed raster goes into the file as it stands:
// every byte outside the window (header, prefixes, other lines and samples)
// stays, and the file keeps its size.
TEST_F(BufferIOTest, WindowWrittenIntoAClosedRasterKeepsTheRest) {
  constexpr int kWideLines = 6;
  constexpr int kWidePixels = 9;
  const struct {
    int type;
    bool big;
    int buffer;  // DataFile buffer size, 0: unbuffered
    int firstLine, numLines, firstSample, numSamples;
    bool prefixes;  // the prefixes of the window's lines instead of its samples
  } cases[] = {
      {CT_SHORT_COMPLEX, true, 0, 2, 2, 3, 4, false},
      {CT_SHORT_COMPLEX, true, 64, 2, 2, 3, 4, false},       // buffer shorter than a line
      {CT_SHORT_COMPLEX, true, 1 << 20, 2, 2, 3, 4, false},  // buffer larger than the file
      {CT_FLOAT32, false, 0, 0, 1, 0, kWidePixels, false},   // the first line
      {CT_FLOAT64, true, 64, 5, 1, 8, 1, false},             // the last sample
      {CT_INT16, false, 0, 1, 3, 0, 0, true},
      {CT_DOUBLE_COMPLEX, false, 4096, 3, 2, 0, 0, true},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE("type " + std::to_string(c.type) + " buffer " + std::to_string(c.buffer) +
                 (c.prefixes ? " prefixes" : " samples"));
    const std::string file = path("raster");
    std::string expected = MakeRaster(c.type, c.big, kWideLines, kWidePixels);
    spit(file, expected);
    const int64_t size = cell_type_size(c.type);
    const int64_t line = kPrefix + kWidePixels * size;
    std::string window;
    for (int k = c.firstLine; k < c.firstLine + c.numLines; ++k) {
      const size_t at = static_cast<size_t>(kOffset + k * line);
      if (c.prefixes) {
        const std::string prefix(kPrefix, static_cast<char>('a' + k));
        expected.replace(at, kPrefix, prefix);
        window += prefix;
      } else {
        expected.replace(at + kPrefix + c.firstSample * size, c.numSamples * size,
                         Samples(c.type, c.big, k + 100, c.firstSample, c.numSamples));
        window += Samples(c.type, false, k + 100, c.firstSample, c.numSamples);
      }
    }

    DataFile df;
    Describe(&df, file, c.type, c.big, kWideLines, kWidePixels);
    df.set_buffer_size(c.buffer);
    BufferIO io(&df);
    io.first_line = c.firstLine;
    io.num_lines = c.numLines;
    io.first_sample = c.firstSample;
    io.num_samples = c.numSamples;
    io.output_type = c.type;
    ASSERT_FALSE(df.is_open());
    ASSERT_EQ(c.prefixes ? io.writeprefix(window.data()) : io.writebuffer(window.data()), 0);
    ASSERT_EQ(df.close(), 0);
    EXPECT_EQ(slurp(file), expected);
  }
  // A raster that does not exist yet is created.
  DataFile df;
  Describe(&df, path("new"), CT_INT16, false, 1, 2);
  BufferIO io(&df);
  io.num_lines = 1;
  io.num_samples = 2;
  io.output_type = CT_INT16;
  const std::string samples = Samples(CT_INT16, false, 0, 0, 2);
  ASSERT_EQ(io.writebuffer(samples.data()), 0);
  ASSERT_EQ(df.close(), 0);
  EXPECT_EQ(slurp(path("new")), std::string(kOffset + kPrefix, '\0') + samples);
}

TEST_F(BufferIOTest, RefusesBadWindowsAndTypes) {
  spit(path("w"), MakeRaster(CT_INT16, false, kLines, kPixels));
  DataFile df;
  Describe(&df, path("w"), CT_INT16, false, kLines, kPixels);
  BufferIO io(&df);
  float out[kPixels + 1] = {0};
  struct Window {
    int first_line, num_lines, first_sample, num_samples, type, room, result;
  };
  const Window windows[] = {{0, 1, 3, 3, CT_FLOAT32, -1, 1},       // one past the line end
                            {0, 1, -1, 2, CT_FLOAT32, -1, 1},      // before the line start
                            {kLines, 1, 0, 2, CT_FLOAT32, -1, 1},  // past the last line
                            {0, 1, 0, 2, CT_INT8, -1, 1},          // no such conversion
                            {0, 1, 0, 2, CT_FLOAT32, 4, 1},        // room for one float only
                            {0, INT32_MAX, 0, INT32_MAX, CT_FLOAT32, INT32_MAX, 1},
                            {0, 1, 0, 2, CT_FLOAT32, 8, 0}};
  for (const Window& w : windows) {
    io.first_line = w.first_line;
    io.num_lines = w.num_lines;
    io.first_sample = w.first_sample;
    io.num_samples = w.num_samples;
    io.output_type = w.type;
    char* o = reinterpret_cast<char*>(out);
    EXPECT_EQ(w.room < 0 ? io.readbuffer(o) : io.readbuffer(o, w.room), w.result) << w.first_line;
    EXPECT_EQ(out[1], w.result == 0 ? static_cast<float>(Re(0, 1)) : 0.0f);  // untouched
  }
  BufferIO none;
  EXPECT_EQ(none.readbuffer(reinterpret_cast<char*>(out)), 1);

  // The description promises more lines than the file holds.
  df.close();
  df.lines_per_image = kLines + 1;
  io.first_line = kLines;
  io.num_lines = 1;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 4);
  df.close();

  // A file opened for writing only cannot be read.
  DataFile created;
  Describe(&created, path("new"), CT_INT16, false, kLines, kPixels);
  ASSERT_EQ(created.open(DataFile::kOpenCreate), 0);
  BufferIO writer(&created);
  writer.num_samples = 1;
  writer.num_lines = 1;
  writer.output_type = CT_FLOAT32;
  EXPECT_EQ(writer.readbuffer(reinterpret_cast<char*>(out)), 1);
}

// Seven repetitions of `values`: long enough for the vectorised loops and their tails.
template <class T>
std::vector<T> Repeated(const std::vector<T>& values) {
  std::vector<T> out;
  for (int k = 0; k < 7; ++k) out.insert(out.end(), values.begin(), values.end());
  return out;
}

// Conversions by value: floating point to integer rounded half away from zero, values beyond the
// destination's range saturated, NaN as 0; byte-swapped input reversed first.
TEST(SampleConvert, RoundsHalfAwayFromZeroSaturatesAndSwaps) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const auto floats =
      Repeated<float>({2.5f, -2.5f, 1.5f, -0.5f, 0.49999997f, 3.49f, 1e10f, nan, 1e6f, -1e6f});
  const auto ints = Repeated<int32_t>({3, -3, 2, -1, 0, 3, INT32_MAX, 0, 1000000, -1000000});
  const auto shorts = Repeated<int16_t>({3, -3, 2, -1, 0, 3, 32767, 0, 32767, -32768});
  const size_t n = floats.size();
  std::vector<int32_t> i(n);
  std::vector<int16_t> s(n);
  convert_samples(floats.data(), CT_FLOAT32, false, i.data(), CT_INT32, n);
  EXPECT_EQ(i, ints);
  convert_samples(floats.data(), CT_FLOAT32, false, s.data(), CT_INT16, n);
  EXPECT_EQ(s, shorts);
  convert_samples(ints.data(), CT_INT32, false, s.data(), CT_INT16, n);
  EXPECT_EQ(s, shorts);
  const auto doubles = Repeated<double>({-1.5, 1.5, 0.5, -0.5, 2.4999, 40000, -7, 0, -4e4, 1e300});
  convert_samples(doubles.data(), CT_FLOAT64, false, s.data(), CT_INT16, n);
  EXPECT_EQ(s, Repeated<int16_t>({-2, 2, 1, -1, 2, 32767, -7, 0, -32768, 32767}));
  std::vector<int32_t> swapped = ints;
  swap_samples(swapped.data(), CT_INT32, n);
  std::vector<float> back(n);
  convert_samples(swapped.data(), CT_INT32, true, back.data(), CT_FLOAT32, n);
  EXPECT_EQ(back[6], static_cast<float>(INT32_MAX));
  EXPECT_EQ(back[n - 1], -1e6f);
}

}  // namespace
