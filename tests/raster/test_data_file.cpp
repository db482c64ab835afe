#include <gtest/gtest.h>

#include <cstdint>
#include <filesystem>
#include <random>
#include <string>
#include <vector>

#include "raster/buffer_io.h"
#include "raster/data_file.h"
#include "raster_fixture.h"

namespace {

using namespace raster_test;

class DataFileTest : public raster_test::ScratchDir {};

std::string RandomBytes(size_t n, unsigned seed) {
  std::mt19937 gen(seed);
  std::string s(n, '\0');
  for (auto& c : s) c = static_cast<char>(gen());
  return s;
}

// Written second half first and then in uneven pieces, and read through
// random seeks (absolute, and short steps back), the file holds and gives
// its bytes, unbuffered and with buffers of several sizes.
TEST_F(DataFileTest, BufferedAndUnbufferedTransfersGiveTheSameBytes) {
  const std::string data = RandomBytes(100003, 1);
  const int64_t size = static_cast<int64_t>(data.size());
  const int64_t half = size / 2;
  DataFile df;
  df.set_name(path("r").c_str());
  for (int buffer : {0, 1, 7, 1000, 65536, 300000}) {
    SCOPED_TRACE(buffer);
    df.set_buffer_size(buffer);
    ASSERT_EQ(df.open(DataFile::kOpenCreate), 0);
    ASSERT_EQ(df.seek(half, DataFile::kSeekSet), 0);
    ASSERT_EQ(df.write(data.data() + half, size - half), 0);
    ASSERT_EQ(df.seek(0, DataFile::kSeekSet), 0);
    for (int64_t at = 0; at < half;) {
      const int64_t n = std::min<int64_t>(half - at, 1 + at % 977);
      ASSERT_EQ(df.write(data.data() + at, n), 0);
      at += n;
      ASSERT_EQ(df.tell(), at);
    }
    char c;
    EXPECT_EQ(df.read(&c, 1), 1);  // open for writing
    ASSERT_EQ(df.close(), 0);
    ASSERT_EQ(slurp(path("r")), data);

    df.set_buffer_size(buffer);
    ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
    EXPECT_EQ(df.is_buffered(), buffer > 0);
    std::mt19937 gen(7);
    for (int step = 0; step < 300; ++step) {
      const int64_t back = std::min<int64_t>(df.tell(), gen() % 50);
      ASSERT_EQ(step % 3 == 0 ? df.seek(gen() % size, DataFile::kSeekSet)
                              : df.seek(-back, DataFile::kSeekCurrent),
                0);
      const int64_t at = df.tell();
      std::string piece(static_cast<size_t>(std::min<int64_t>(size - at, gen() % 9000)), '\0');
      ASSERT_EQ(df.read(&piece[0], static_cast<int64_t>(piece.size())), 0);
      ASSERT_EQ(piece, data.substr(at, piece.size())) << step;
      ASSERT_EQ(df.tell(), at + static_cast<int64_t>(piece.size()));
    }
    std::string all(data.size(), '\0');
    ASSERT_EQ(df.seek(0, DataFile::kSeekSet), 0);
    ASSERT_EQ(df.read(&all[0], size), 0);
    EXPECT_EQ(all, data);
    ASSERT_EQ(df.close(), 0);
    EXPECT_EQ(df.buffer_size(), 0);  // close drops the buffer
  }
  // Updating through a read buffer: a read after a write sees the new bytes.
  df.set_buffer_size(64);
  ASSERT_EQ(df.open(DataFile::kOpenUpdate), 0);
  char got[8];
  ASSERT_EQ(df.read(got, 4), 0);
  ASSERT_EQ(df.write("abcd", 4), 0);
  ASSERT_EQ(df.seek(2, DataFile::kSeekSet), 0);
  ASSERT_EQ(df.read(got, 8), 0);
  EXPECT_EQ(std::string(got, 8), data.substr(2, 2) + "abcd" + data.substr(8, 2));
  ASSERT_EQ(df.close(), 0);
}

TEST_F(DataFileTest, FailuresGiveTheirCodes) {
  spit(path("f"), "0123456789");
  DataFile df;
  df.set_name(path("missing").c_str());
  EXPECT_FALSE(df.exists());
  EXPECT_EQ(df.open(DataFile::kOpenRead), 9);
  EXPECT_EQ(df.open(DataFile::kOpenUpdate), 9);
  df.set_name(path("f").c_str());
  EXPECT_TRUE(df.exists());
  EXPECT_EQ(df.open(7), 1);
  char buf[16];
  EXPECT_EQ(df.read(buf, 1), 9);
  EXPECT_EQ(df.close(), 0);  // closing a closed file

  ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
  EXPECT_EQ(df.seek(0, DataFile::kSeekEnd), 1);  // unbuffered: no origin 2
  EXPECT_EQ(df.seek(-1, DataFile::kSeekSet), 1);
  EXPECT_EQ(df.write("x", 1), 1);
  ASSERT_EQ(df.seek(8, DataFile::kSeekSet), 0);
  EXPECT_EQ(df.read(buf, 3), 4);  // two bytes left
  ASSERT_EQ(df.close(), 0);

  df.set_buffer_size(4);
  ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
  ASSERT_EQ(df.seek(-3, DataFile::kSeekEnd), 0);
  EXPECT_EQ(df.tell(), 7);
  ASSERT_EQ(df.read(buf, 2), 0);
  EXPECT_EQ(std::string(buf, 2), "78");
  EXPECT_EQ(df.read(buf, 2), 4);  // the end of the file comes first
  ASSERT_EQ(df.close(), 0);
}

TEST_F(DataFileTest, OffsetsBeyondFourGiB) {
  // A sparse raster of 600000 lines of 1024 FLOAT_COMPLEX samples (4.9 GB).
  DataFile df;
  Describe(&df, path("big"), CT_FLOAT_COMPLEX, false, 600000, 1024, kPrefix, 0);
  const int64_t line = 590001;
  ASSERT_GT(df.line_offset(line), int64_t{1} << 32);
  std::vector<float> in(2048);
  for (size_t i = 0; i < in.size(); ++i) in[i] = static_cast<float>(i) - 1000.5f;
  ASSERT_EQ(df.open(DataFile::kOpenCreate), 0);
  ASSERT_EQ(df.seek(df.data_size() - 1, DataFile::kSeekSet), 0);
  ASSERT_EQ(df.write("", 1), 0);
  BufferIO io(&df);
  io.first_line = static_cast<int32_t>(line);
  io.num_lines = 1;
  io.num_samples = 1024;
  io.output_type = CT_FLOAT_COMPLEX;
  ASSERT_EQ(io.writebuffer(reinterpret_cast<const char*>(in.data())), 0);
  EXPECT_EQ(df.tell(), df.line_offset(line + 1));
  ASSERT_EQ(df.close(), 0);
  EXPECT_EQ(static_cast<int64_t>(std::filesystem::file_size(path("big"))), df.data_size());

  for (int buffered = 0; buffered <= 1; ++buffered) {
    df.set_buffer_size(buffered ? 65536 : 0);
    ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
    std::vector<float> out(2048, 0.0f);
    ASSERT_EQ(io.readbuffer(reinterpret_cast<char*>(out.data())), 0);
    EXPECT_EQ(out, in);
    ASSERT_EQ(df.close(), 0);
  }
  std::filesystem::remove(path("big"));
}

// A raster holds its data when the file is at least as long as the description; a copy of an
// open file is closed and writes its header like the original.
TEST_F(DataFileTest, HeldDataAndCopiesOfAnOpenFile) {
  DataFile df;
  Describe(&df, path("src"), CT_INT16, true, 3, 4, 2, 6);
  EXPECT_FALSE(df.holds_data());
  spit(path("src"), RandomBytes(static_cast<size_t>(df.data_size()), 3));
  EXPECT_TRUE(df.holds_data());
  df.lines_per_image = 10;  // longer than the file
  EXPECT_FALSE(df.holds_data());

  ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
  DataFile copy = df;
  EXPECT_FALSE(copy.is_open());
  EXPECT_EQ(copy.name(), df.name());
  copy.set_name(path("copy").c_str());
  copy.lines_per_image = 11;
  ASSERT_EQ(copy.write_hdr(), 0);
  DataFile copied;
  ASSERT_EQ(copied.read_hdr(path("copy").c_str()), 0);
  EXPECT_EQ(copied.header_offset, 6);
  EXPECT_EQ(copied.lines_per_image, 11);
}

}  // namespace
