#include <gtest/gtest.h>

#include <cmath>
#include <cstdint>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "raster/buffer_io.h"
#include "raster/cell_type.h"
#include "raster_fixture.h"

namespace {

using raster_test::Components;
using raster_test::ComponentSize;
using raster_test::GetComponent;
using raster_test::PutComponent;
using raster_test::ReadFile;
using raster_test::WriteFile;

constexpr int kPixels = 5;
constexpr int kLines = 3;
constexpr int kPrefix = 17;
constexpr int kOffset = 11;

// Small whole numbers, exact in every cell type.
double Re(int line, int sample) {
  return line * 10 + sample - 7;
}
double Im(int line, int sample) {
  return -2 * (line * 10 + sample) + 5;
}

// Raster bytes of type `type`: header bytes 0xAA, prefixes holding the line
// number, samples Re/Im in the given byte order.
std::string MakeRaster(int type, bool big) {
  const int esize = cell_type_size(type);
  std::string bytes(kOffset, static_cast<char>(0xAA));
  for (int k = 0; k < kLines; ++k) {
    bytes.append(kPrefix, static_cast<char>('A' + k));
    std::vector<unsigned char> line(static_cast<size_t>(kPixels * esize));
    for (int s = 0; s < kPixels; ++s) {
      unsigned char* p = line.data() + s * esize;
      PutComponent(Re(k, s), type, big, p);
      if (Components(type) == 2) PutComponent(Im(k, s), type, big, p + ComponentSize(type));
    }
    bytes.append(reinterpret_cast<const char*>(line.data()), line.size());
  }
  return bytes;
}

void Describe(DataFile* df, const std::string& name, int type, bool big) {
  df->set_name(name.c_str());
  df->pixels_per_line = kPixels;
  df->lines_per_image = kLines;
  df->row_prefix = kPrefix;
  df->header_offset = kOffset;
  df->cell_type = type;
  df->byte_order = big ? 1 : 0;
}

class BufferIOTest : public raster_test::ScratchDir {};

TEST_F(BufferIOTest, ReadsEveryConversionPairInBothByteOrders) {
  for (int big = 0; big <= 1; ++big) {
    for (int from = 0; from <= 7; ++from) {
      const std::string path = Path("in_" + std::to_string(from) + "_" + std::to_string(big));
      WriteFile(path, MakeRaster(from, big));
      for (int to = 0; to <= 7; ++to) {
        SCOPED_TRACE("file type " + std::to_string(from) + " to " + std::to_string(to) +
                     (big ? " big-endian" : " little-endian"));
        DataFile df;
        Describe(&df, path, from, big);
        BufferIO io(&df);
        io.first_sample = 1;
        io.num_samples = 3;
        io.first_line = 1;
        io.num_lines = 2;
        io.output_type = to;
        const int osize = cell_type_size(to);
        std::vector<unsigned char> out(static_cast<size_t>(6 * osize), 0xEE);
        const int rc = io.readbuffer(reinterpret_cast<char*>(out.data()));
        if (Components(from) == 2 && Components(to) == 1) {
          EXPECT_EQ(rc, 1);  // a complex sample has no real value
          EXPECT_EQ(out[0], 0xEE);
          continue;
        }
        ASSERT_EQ(rc, 0);
        for (int k = 0; k < 2; ++k) {
          for (int s = 0; s < 3; ++s) {
            const unsigned char* p = out.data() + (k * 3 + s) * osize;
            EXPECT_EQ(GetComponent(to, false, p), Re(k + 1, s + 1));
            if (Components(to) == 2) {
              const double im = Components(from) == 2 ? Im(k + 1, s + 1) : 0.0;
              EXPECT_EQ(GetComponent(to, false, p + ComponentSize(to)), im);
            }
          }
        }
      }
    }
  }
}

TEST_F(BufferIOTest, WritesEveryConversionPairInBothByteOrders) {
  for (int big = 0; big <= 1; ++big) {
    for (int from = 0; from <= 7; ++from) {  // caller's type
      std::vector<unsigned char> in(static_cast<size_t>(kLines * kPixels * cell_type_size(from)));
      for (int k = 0; k < kLines; ++k) {
        for (int s = 0; s < kPixels; ++s) {
          unsigned char* p = in.data() + (k * kPixels + s) * cell_type_size(from);
          PutComponent(Re(k, s), from, false, p);
          if (Components(from) == 2) PutComponent(Im(k, s), from, false, p + ComponentSize(from));
        }
      }
      for (int to = 0; to <= 7; ++to) {  // file type
        SCOPED_TRACE("memory type " + std::to_string(from) + " to file type " + std::to_string(to) +
                     (big ? " big-endian" : " little-endian"));
        const std::string path = Path("out");
        DataFile df;
        Describe(&df, path, to, big);
        BufferIO io(&df);
        io.num_samples = kPixels;
        io.num_lines = kLines;
        io.output_type = from;
        const int rc = io.writebuffer(reinterpret_cast<const char*>(in.data()));
        if (Components(from) == 2 && Components(to) == 1) {
          EXPECT_EQ(rc, 1);
          continue;
        }
        ASSERT_EQ(rc, 0);
        ASSERT_EQ(df.close(), 0);
        const std::string bytes = ReadFile(path);
        ASSERT_EQ(static_cast<int64_t>(bytes.size()), df.data_size());
        const auto* raw = reinterpret_cast<const unsigned char*>(bytes.data());
        for (int k = 0; k < kLines; ++k) {
          for (int s = 0; s < kPixels; ++s) {
            const unsigned char* p = raw + df.line_offset(k) + kPrefix + s * cell_type_size(to);
            EXPECT_EQ(GetComponent(to, big, p), Re(k, s));
            if (Components(to) == 2) {
              const double im = Components(from) == 2 ? Im(k, s) : 0.0;
              EXPECT_EQ(GetComponent(to, big, p + ComponentSize(to)), im);
            }
          }
        }
      }
    }
  }
}

// Reads one line of `n` native-order samples of `file_type` as `out_type`.
int ReadLine(const std::string& path, const void* samples, size_t bytes, int file_type, int n,
             int out_type, void* out) {
  WriteFile(path, std::string(static_cast<const char*>(samples), bytes));
  DataFile df;
  df.set_name(path.c_str());
  df.pixels_per_line = n;
  df.lines_per_image = 1;
  df.cell_type = file_type;
  BufferIO io(&df);
  io.num_samples = n;
  io.num_lines = 1;
  io.output_type = out_type;
  return io.readbuffer(static_cast<char*>(out));
}

TEST_F(BufferIOTest, ConversionsRoundAndSaturate) {
  const double nan = std::numeric_limits<double>::quiet_NaN();
  const double doubles[6] = {2.5, -2.5, 1e10, -1e10, nan, 0.49};
  int32_t ints[6];
  ASSERT_EQ(ReadLine(Path("d"), doubles, sizeof doubles, CT_FLOAT64, 6, CT_INT32, ints), 0);
  const int32_t expected[6] = {3, -3, INT32_MAX, INT32_MIN, 0, 0};
  for (int i = 0; i < 6; ++i) EXPECT_EQ(ints[i], expected[i]) << i;

  const int32_t wide[3] = {40000, -40000, 5};
  int16_t shorts[3];
  ASSERT_EQ(ReadLine(Path("i"), wide, sizeof wide, CT_INT32, 3, CT_INT16, shorts), 0);
  EXPECT_EQ(shorts[0], 32767);
  EXPECT_EQ(shorts[1], -32768);
  EXPECT_EQ(shorts[2], 5);
}

TEST_F(BufferIOTest, PrefixWindowOf17Bytes) {
  WriteFile(Path("p"), MakeRaster(CT_SHORT_COMPLEX, true));
  DataFile df;
  Describe(&df, Path("p"), CT_SHORT_COMPLEX, true);
  BufferIO io(&df);
  io.first_line = 1;
  io.num_lines = 2;
  char prefixes[2 * kPrefix];
  ASSERT_EQ(io.readprefix(prefixes), 0);
  EXPECT_TRUE(df.is_buffered());  // opened by the read, with a read buffer
  EXPECT_EQ(std::string(prefixes, kPrefix), std::string(kPrefix, 'B'));
  EXPECT_EQ(std::string(prefixes + kPrefix, kPrefix), std::string(kPrefix, 'C'));

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
  std::string expected = MakeRaster(CT_SHORT_COMPLEX, true);
  for (int k = 0; k < kLines; ++k) expected.replace(df.line_offset(k), kPrefix, kPrefix, 'z');
  EXPECT_EQ(ReadFile(Path("p")), expected);
}

TEST_F(BufferIOTest, RefusesBadWindowsAndTypes) {
  WriteFile(Path("w"), MakeRaster(CT_INT16, false));
  DataFile df;
  Describe(&df, Path("w"), CT_INT16, false);
  BufferIO io(&df);
  io.output_type = CT_FLOAT32;
  io.num_lines = 1;
  float out[kPixels + 1] = {0};

  io.first_sample = 3;
  io.num_samples = 3;  // one past the line end
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 1);
  io.first_sample = -1;
  io.num_samples = 2;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 1);
  io.first_sample = 0;
  io.first_line = kLines;  // past the last line
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 1);
  io.first_line = 0;
  io.output_type = CT_INT8;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 1);
  io.output_type = CT_FLOAT32;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out), 4), 1);  // room for one float only
  EXPECT_EQ(out[0], 0.0f);
  io.num_lines = INT32_MAX;
  io.num_samples = INT32_MAX;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out), INT32_MAX), 1);
  io.num_lines = 1;
  io.num_samples = 2;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out), 8), 0);
  EXPECT_EQ(out[1], static_cast<float>(Re(0, 1)));
  BufferIO none;
  EXPECT_EQ(none.readbuffer(reinterpret_cast<char*>(out)), 1);

  // The description promises more lines than the file holds.
  df.close();
  df.lines_per_image = kLines + 1;
  io.first_line = kLines;
  EXPECT_EQ(io.readbuffer(reinterpret_cast<char*>(out)), 4);
  df.close();

  // A file opened for writing only cannot be read.
  DataFile created;
  Describe(&created, Path("new"), CT_INT16, false);
  ASSERT_EQ(created.open(DataFile::kOpenCreate), 0);
  BufferIO writer(&created);
  writer.num_samples = 1;
  writer.num_lines = 1;
  writer.output_type = CT_FLOAT32;
  EXPECT_EQ(writer.readbuffer(reinterpret_cast<char*>(out)), 1);
}

}  // namespace
