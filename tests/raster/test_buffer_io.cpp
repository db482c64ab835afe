#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "raster/buffer_io.h"
#include "raster/cell_type.h"
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
      WriteFile(Path("in"), MakeRaster(file, big, kLines, kPixels));
      for (int mem = 0; mem <= 7; ++mem) {
        SCOPED_TRACE("file type " + std::to_string(file) + ", memory type " + std::to_string(mem) +
                     (big ? ", big-endian" : ", little-endian"));
        DataFile df;
        Describe(&df, Path("in"), file, big, kLines, kPixels);
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

        DataFile target;
        Describe(&target, Path("out"), file, big, kLines, kPixels);
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
        EXPECT_EQ(ReadFile(Path("out")),
                  MakeRaster(file, big, kLines, kPixels, true, Components(mem) == 1));
      }
    }
  }
}

TEST_F(BufferIOTest, PrefixWindowOf17Bytes) {
  const std::string raster = MakeRaster(CT_SHORT_COMPLEX, true, kLines, kPixels);
  WriteFile(Path("p"), raster);
  DataFile df;
  Describe(&df, Path("p"), CT_SHORT_COMPLEX, true, kLines, kPixels);
  BufferIO io(&df);
  io.first_line = 1;
  io.num_lines = 2;
  char prefixes[2 * kPrefix];
  ASSERT_EQ(io.readprefix(prefixes), 0);
  EXPECT_TRUE(df.is_buffered());  // opened by the read, with a read buffer
  EXPECT_EQ(std::string(prefixes, 2 * kPrefix),
            std::string(kPrefix, 'B') + std::string(kPrefix, 'C'));

  // Whole lines, and the first sample of the window right after the prefix.
  io.first_line = 0;
  io.num_lines = kLines;
  io.num_samples = 1;
  io.output_type = CT_FLOAT_COMPLEX;
  float first[2 * kLines];
  ASSERT_EQ(io.readbuffer(reinterpret_cast<char*>(first)), 0);
  for (int k = 0; k < kLines; ++k) {
    EXPECT_EQ(first[2 * k], Re(k, 0));
    EXPECT_EQ(first[2 * k + 1], Im(k, 0));
  }
  EXPECT_EQ(df.close(), 0);

  // Prefixes written back land before the samples and leave them intact.
  ASSERT_EQ(df.open(DataFile::kOpenUpdate), 0);
  const std::string fresh(kPrefix * kLines, 'z');
  ASSERT_EQ(io.writeprefix(fresh.data()), 0);
  ASSERT_EQ(df.close(), 0);
  std::string expected = raster;
  for (int k = 0; k < kLines; ++k) expected.replace(df.line_offset(k), kPrefix, kPrefix, 'z');
  EXPECT_EQ(ReadFile(Path("p")), expected);
}

TEST_F(BufferIOTest, RefusesBadWindowsAndTypes) {
  WriteFile(Path("w"), MakeRaster(CT_INT16, false, kLines, kPixels));
  DataFile df;
  Describe(&df, Path("w"), CT_INT16, false, kLines, kPixels);
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
  Describe(&created, Path("new"), CT_INT16, false, kLines, kPixels);
  ASSERT_EQ(created.open(DataFile::kOpenCreate), 0);
  BufferIO writer(&created);
  writer.num_samples = 1;
  writer.num_lines = 1;
  writer.output_type = CT_FLOAT32;
  EXPECT_EQ(writer.readbuffer(reinterpret_cast<char*>(out)), 1);
}

}  // namespace
