#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <limits>
#include <random>
#include <string>
#include <vector>

#include "raster/buffer_file.h"
#include "raster/buffer_io.h"
#include "raster/data_file.h"
#include "raster_fixture.h"

namespace {

using namespace raster_test;

constexpr int kPixels = 37;
constexpr int kLines = 7;

class BufferFileTest : public ScratchDir {
 protected:
  // A big-endian SHORT_COMPLEX raster "sc", described in *bf through its
  // parameter-file header.
  std::string MakeShortComplex(BufferFile* bf) {
    const std::string bytes = MakeRaster(CT_SHORT_COMPLEX, true, kLines, kPixels);
    WriteFile(Path("sc"), bytes);
    WriteFile(Path("sc.hdr"),
              "[RasterInfo]\nHeaderOffset = 11\nRowPrefix = 17\n"
              "NrOfPixelsPerLine = 37\nNrOfLinesPerImage = 7\n"
              "CellType = SHORT_COMPLEX\nByteOrder = MSBFirst\n");
    bf->setFilename(Path("sc").c_str());
    EXPECT_EQ(bf->readhdr(), 0);
    return bytes;
  }
};

// A window goes into an existing raster only through an open file; in update mode every byte
// outside it stays, whatever the buffer, the object sees its writes before they are flushed, and a
// copy made then holds them too.
TEST_F(BufferFileTest, WindowsWrittenInUpdateModeKeepTheRestAndReachTheCopy) {
  BufferFile bf;
  const std::string bytes = MakeShortComplex(&bf);
  // Lines 2-4 take the values of lines 4-6; line 6 a new prefix.
  std::string expected = bytes;
  std::vector<fcomplex> in;
  for (int k = 4; k <= 6; ++k) {
    for (int s = 0; s < kPixels; ++s) in.emplace_back(Re(k, s), Im(k, s));
    expected.replace(kOffset + (k - 2) * (kPrefix + 4 * kPixels) + kPrefix, 4 * kPixels,
                     Samples(CT_SHORT_COMPLEX, true, k, 0, kPixels));
  }
  expected.replace(kOffset + 6 * (kPrefix + 4 * kPixels), kPrefix, kPrefix, '#');
  EXPECT_EQ(bf.writebuffer(in.data(), 2, 3, 0, 0), 9);  // closed: refused
  EXPECT_EQ(ReadFile(Path("sc")), bytes);
  for (int buffer : {0, 7, 50, 1 << 16}) {
    SCOPED_TRACE("buffer " + std::to_string(buffer));
    WriteFile(Path("sc"), bytes);
    ASSERT_EQ(bf.open(BufferFile::kOpUpdate), 0);
    ASSERT_EQ(bf.initbuffer(buffer, 20), 0);
    ASSERT_EQ(bf.writebuffer(in.data(), 2, 3, 0, 0), 0);
    ASSERT_EQ(bf.writeprefix(std::string(kPrefix, '#').c_str(), 6, 1), 0);
    std::vector<fcomplex> back(kPixels * 3);
    ASSERT_EQ(bf.readbuffer(back.data(), 2, 3, 0, 0), 0);
    EXPECT_EQ(back, in);
    ASSERT_EQ(bf.copy(Path("copy").c_str(), 100), 0);
    ASSERT_EQ(bf.close(), 0);
    EXPECT_EQ(ReadFile(Path("sc")), expected);
    EXPECT_EQ(ReadFile(Path("copy")), expected);
  }
}

// Any mix of seeks, reads and writes in update mode behaves like the same
// operations on the file's bytes in memory, and every byte written reaches
// the disk.
TEST_F(BufferFileTest, UpdateModeMatchesAPlainFileAndKeepsEveryByte) {
  for (int buffer : {0, 1, 8, 64, 4096}) {
    for (int history : {0, 3, 32}) {
      SCOPED_TRACE("buffer " + std::to_string(buffer) + " history " + std::to_string(history));
      std::mt19937 rng(static_cast<unsigned>(buffer * 131 + history));
      std::string model(500, '\0');
      for (char& c : model) c = static_cast<char>(rng());
      const std::string name = Path("u");
      WriteFile(name, model);
      BufferFile bf;
      bf.setFilename(name.c_str());
      ASSERT_EQ(bf.open(BufferFile::kOpUpdate), 0);
      ASSERT_EQ(bf.initbuffer(buffer, history), 0);
      int64_t pos = 0;
      std::vector<char> data(300);
      for (int step = 0; step < 400; ++step) {
        const int n = static_cast<int>(rng() % (step % 7 == 0 ? 300 : 40));
        const unsigned op = rng() % 4;
        if (op == 0) {  // seek, sometimes beyond the end
          pos = rng() % (model.size() + 30);
          ASSERT_EQ(bf.seek(pos, BufferFile::kSeekSet), 0);
        } else if (op == 1) {
          const int64_t expect =
              std::max<int64_t>(0, std::min<int64_t>(n, int64_t(model.size()) - pos));
          ASSERT_EQ(bf.read(data.data(), n), expect) << "step " << step;
          if (expect > 0) {
            ASSERT_EQ(std::string(data.data(), expect), model.substr(pos, expect)) << step;
          }
          pos += expect;
        } else {
          for (int i = 0; i < n; ++i) data[i] = static_cast<char>(rng());
          ASSERT_EQ(bf.write(data.data(), n), n);
          if (pos + n > int64_t(model.size())) model.resize(pos + n, '\0');
          model.replace(pos, n, data.data(), n);
          pos += n;
        }
        ASSERT_EQ(bf.tell(), pos) << "step " << step;
      }
      ASSERT_EQ(bf.close(), 0);
      EXPECT_EQ(ReadFile(name), model);
    }
  }
}

TEST_F(BufferFileTest, TypedConversionsRoundHalfAwayFromZero) {
  const float nan = std::numeric_limits<float>::quiet_NaN();
  const std::vector<float> values = {2.5f,  -2.5f, 1.5f, -0.5f, 0.49999997f,
                                     3.49f, 1e10f, nan,  1e6f,  -1e6f};
  const std::vector<int> ints = {3, -3, 2, -1, 0, 3, INT_MAX, 0, 1000000, -1000000};
  const std::vector<short> shorts = {3, -3, 2, -1, 0, 3, 32767, 0, 32767, -32768};
  const int n = static_cast<int>(values.size());
  BufferFile bf;
  bf.setFilename(Path("f").c_str());
  bf.setLines(1);
  bf.setSamples(n);
  bf.setType(CT_FLOAT32);
  bf.setFileEndian(1);
  ASSERT_EQ(bf.open(BufferFile::kOpWrite), 0);
  ASSERT_EQ(bf.writebuffer(values.data(), 0, 1, 0, n), 0);
  ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
  std::vector<int> i(n);
  std::vector<short> s(n);
  ASSERT_EQ(bf.readbuffer(i.data(), 0, 1, 0, n), 0);
  ASSERT_EQ(bf.readbuffer(s.data(), 0, 1, 0, n), 0);
  EXPECT_EQ(i, ints);
  EXPECT_EQ(s, shorts);
  EXPECT_FLOAT_EQ(bf.readFloat(0, 0), 2.5f);
  // Complex windows take complex files only; the output stays untouched.
  std::vector<fcomplex> c(n, fcomplex(7, 7));
  EXPECT_EQ(bf.readbuffer(c.data(), 0, 1, 0, n), 1);
  EXPECT_EQ(c[0], fcomplex(7, 7));

  // Doubles into an INT16 file, and a SHORT_COMPLEX file into doubles.
  bf.setType(CT_INT16);
  ASSERT_EQ(bf.open(BufferFile::kOpWrite), 0);
  const std::vector<double> halves = {-1.5, 1.5, 0.5, -0.5, 2.4999, 40000, -7, 0, -4e4, 1e300};
  ASSERT_EQ(bf.writebuffer(halves.data(), 0, 1, 0, n), 0);
  ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
  ASSERT_EQ(bf.readbuffer(s.data(), 0, 1, 0, n), 0);
  EXPECT_EQ(s, (std::vector<short>{-2, 2, 1, -1, 2, 32767, -7, 0, -32768, 32767}));
  bf.setType(CT_SHORT_COMPLEX);
  bf.setSamples(n / 2);
  std::vector<dcomplex> dc(n / 2);
  ASSERT_EQ(bf.readbuffer(dc.data(), 0, 1, 1, 2), 0);
  EXPECT_EQ(dc[0], dcomplex(1, -1));
  EXPECT_EQ(dc[1], dcomplex(2, 32767));
  // Integers narrowed: saturated.
  bf.setType(CT_INT32);
  bf.setSamples(n);
  ASSERT_EQ(bf.open(BufferFile::kOpWrite), 0);
  ASSERT_EQ(bf.writebuffer(ints.data(), 0, 1, 0, n), 0);
  ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
  ASSERT_EQ(bf.readbuffer(s.data(), 0, 1, 0, n), 0);
  EXPECT_EQ(s, shorts);
}

TEST_F(BufferFileTest, HostileSizesAreRefused) {
  BufferFile bf;
  MakeShortComplex(&bf);
  ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
  EXPECT_EQ(bf.initbuffer(-1, 0), 1);
  EXPECT_EQ(bf.initbuffer(INT_MAX, 0), 1);
  EXPECT_EQ(bf.initbuffer(64, -1), 1);
  EXPECT_EQ(bf.seek(-1, BufferFile::kSeekSet), 1);
  EXPECT_EQ(bf.seek(0, 7), 1);
  char byte;
  EXPECT_EQ(bf.read(&byte, -5), 0);
  std::vector<fcomplex> out(kPixels * kLines);
  const int windows[][4] = {{-1, 1, 0, 0}, {0, -1, 0, 0},      {kLines - 1, 2, 0, 0},
                            {0, 1, -1, 0}, {0, 1, 5, kPixels}, {0, INT_MAX, 0, INT_MAX}};
  for (const auto& w : windows) {
    EXPECT_EQ(bf.readbuffer(out.data(), w[0], w[1], w[2], w[3]), 1) << w[0] << " " << w[1];
  }
  EXPECT_EQ(bf.writebuffer(out.data(), 0, 1, 0, 0), 1);  // read mode
  // A description claiming more lines than the file holds reads short.
  bf.setLines(kLines + 1);
  EXPECT_EQ(bf.readbuffer(out.data(), kLines, 1, 0, 0), 4);
  bf.setSamples(-3);
  EXPECT_EQ(bf.readbuffer(out.data(), 0, 1, 0, 1), 1);
  bf.close();
  EXPECT_EQ(bf.readbuffer(out.data(), 0, 1, 0, 1), 9);
  EXPECT_EQ(bf.open(0), 1);
  BufferFile missing;
  missing.setFilename(Path("nothing").c_str());
  EXPECT_EQ(missing.open(BufferFile::kOpRead), 9);
  char shortName[8];
  EXPECT_EQ(bf.getFilename(shortName, sizeof shortName), 1);  // cut, terminated
  EXPECT_EQ(std::string(shortName), Path("sc").substr(0, 7));

  // Header names (damaged headers: with those of DataFile).
  EXPECT_EQ(BufferFile().readhdr("a.h"), 1);
  EXPECT_EQ(BufferFile().readhdr(Path("missing.hdr").c_str()), 1);
}

}  // namespace
