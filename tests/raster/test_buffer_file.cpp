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

// A window goes into an existing raster only through an open file, and in
// update mode every byte outside it stays, whatever the buffer.
TEST_F(BufferFileTest, WindowWrittenIntoAnExistingRasterKeepsTheRest) {
  BufferFile bf;
  const std::string bytes = MakeShortComplex(&bf);
  std::vector<fcomplex> window;
  std::string expected = bytes;
  const int64_t line = kPrefix + kPixels * 4;
  for (int k = 2; k < 4; ++k) {
    for (int s = 5; s < 10; ++s) window.emplace_back(Re(k + 100, s), Im(k + 100, s));
    expected.replace(static_cast<size_t>(kOffset + k * line + kPrefix + 5 * 4), 5 * 4,
                     Samples(CT_SHORT_COMPLEX, true, k + 100, 5, 5));
  }
  // Closed: refused, the file untouched.
  EXPECT_EQ(bf.writebuffer(window.data(), 2, 2, 5, 5), 9);
  EXPECT_EQ(ReadFile(Path("sc")), bytes);
  for (int buffer : {0, 7, 50, 1 << 16}) {
    SCOPED_TRACE("buffer " + std::to_string(buffer));
    WriteFile(Path("sc"), bytes);
    ASSERT_EQ(bf.open(BufferFile::kOpUpdate), 0);
    ASSERT_EQ(bf.initbuffer(buffer, 0), 0);
    ASSERT_EQ(bf.writebuffer(window.data(), 2, 2, 5, 5), 0);
    ASSERT_EQ(bf.close(), 0);
    EXPECT_EQ(ReadFile(Path("sc")), expected);
  }
}

TEST_F(BufferFileTest, BufferSmallerThanALineReadsTheSameBytes) {
  BufferFile bf;
  const std::string bytes = MakeShortComplex(&bf);
  std::vector<fcomplex> expected;
  for (int k = 0; k < kLines; ++k) {
    for (int s = 0; s < kPixels; ++s) expected.emplace_back(Re(k, s), Im(k, s));
  }
  // Raw reads in odd pieces, then whole windows converted to FLOAT_COMPLEX.
  for (int buffer : {0, 1, 7, 50, 1 << 16}) {
    for (int history : {0, 5, 1000}) {
      SCOPED_TRACE("buffer " + std::to_string(buffer) + " history " + std::to_string(history));
      ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
      ASSERT_EQ(bf.initbuffer(buffer, history), 0);
      std::string got;
      char piece[13];
      for (int64_t n; (n = bf.read(piece, sizeof piece)) > 0;) got.append(piece, n);
      EXPECT_EQ(got, bytes);
      std::vector<fcomplex> window(kPixels * kLines);
      ASSERT_EQ(bf.readbuffer(window.data(), 0, kLines, 0, 0), 0);
      EXPECT_EQ(window, expected);
      std::string prefixes(kPrefix * 2, ' ');
      ASSERT_EQ(bf.readprefix(&prefixes[0], 5, 2), 0);
      EXPECT_EQ(prefixes, std::string(kPrefix, 'F') + std::string(kPrefix, 'G'));
      ASSERT_EQ(bf.close(), 0);
    }
  }
}

TEST_F(BufferFileTest, BackwardSeeksInsideTheHistoryStayInMemory) {
  std::string bytes(300, '\0');
  for (size_t i = 0; i < bytes.size(); ++i) bytes[i] = static_cast<char>(i);
  const std::string name = Path("h");
  WriteFile(name, bytes);
  BufferFile bf;
  bf.setFilename(name.c_str());
  ASSERT_EQ(bf.open(BufferFile::kOpRead), 0);
  ASSERT_EQ(bf.initbuffer(64, 16), 0);
  char out[64];
  ASSERT_EQ(bf.read(out, 30), 30);
  ASSERT_EQ(bf.read(out, 50), 50);  // refills at 64, keeping 48..63
  EXPECT_EQ(std::string(out, 50), bytes.substr(30, 50));
  // Change the file behind the object: what is still in memory stays old.
  std::string changed = bytes;
  for (int i = 40; i < 120; ++i) changed[i] = 'X';
  WriteFile(name, changed);
  ASSERT_EQ(bf.seek(-32, BufferFile::kSeekCurrent), 0);  // 48: the oldest byte kept
  EXPECT_EQ(bf.tell(), 48);
  ASSERT_EQ(bf.read(out, 20), 20);
  EXPECT_EQ(std::string(out, 20), bytes.substr(48, 20));
  ASSERT_EQ(bf.seek(47, BufferFile::kSeekSet), 0);  // one byte further: from the disk
  ASSERT_EQ(bf.read(out, 2), 2);
  EXPECT_EQ(std::string(out, 2), "XX");
  ASSERT_EQ(bf.seek(-10, BufferFile::kSeekEnd), 0);
  EXPECT_EQ(bf.read(out, 64), 10);  // the end of the file ends the request
  EXPECT_EQ(std::string(out, 10), bytes.substr(290));
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

TEST_F(BufferFileTest, WindowsWrittenInUpdateModeReachTheFileAndItsCopy) {
  BufferFile bf;
  std::string expected = MakeShortComplex(&bf);
  ASSERT_EQ(bf.open(BufferFile::kOpUpdate), 0);
  ASSERT_EQ(bf.initbuffer(50, 20), 0);  // smaller than one line
  // Lines 2-4 take the values of lines 4-6; line 6 a new prefix.
  std::vector<fcomplex> in;
  for (int k = 4; k <= 6; ++k) {
    for (int s = 0; s < kPixels; ++s) in.emplace_back(Re(k, s), Im(k, s));
    expected.replace(kOffset + (k - 2) * (kPrefix + 4 * kPixels) + kPrefix, 4 * kPixels,
                     Samples(CT_SHORT_COMPLEX, true, k, 0, kPixels));
  }
  expected.replace(kOffset + 6 * (kPrefix + 4 * kPixels), kPrefix, kPrefix, '#');
  ASSERT_EQ(bf.writebuffer(in.data(), 2, 3, 0, 0), 0);
  ASSERT_EQ(bf.writeprefix(std::string(kPrefix, '#').c_str(), 6, 1), 0);
  // The same object sees its writes before anything is flushed, and a copy
  // made now holds them too.
  std::vector<fcomplex> back(kPixels * 3);
  ASSERT_EQ(bf.readbuffer(back.data(), 2, 3, 0, 0), 0);
  EXPECT_EQ(back, in);
  ASSERT_EQ(bf.copy(Path("copy").c_str(), 100), 0);
  ASSERT_EQ(bf.close(), 0);
  EXPECT_EQ(ReadFile(Path("sc")), expected);
  EXPECT_EQ(ReadFile(Path("copy")), expected);
}

// A full disk: every way out of the buffer reports the failure.
TEST_F(BufferFileTest, FailingDiskWritesAreReported) {
  if (!std::ifstream("/dev/full")) GTEST_SKIP() << "no /dev/full";
  BufferFile bf;
  bf.setFilename("/dev/full");
  ASSERT_EQ(bf.open(BufferFile::kOpUpdate), 0);
  const char data[100] = {1};
  EXPECT_EQ(bf.write(data, 10), 0);  // unbuffered: nothing accepted
  ASSERT_EQ(bf.initbuffer(64, 8), 0);
  EXPECT_EQ(bf.write(data, 10), 10);
  EXPECT_EQ(bf.flush(), 5);
  EXPECT_EQ(bf.seek(1000, BufferFile::kSeekSet), 5);
  EXPECT_EQ(bf.write(data, 100), 0);  // would go past the buffer to the disk
  EXPECT_EQ(bf.write(data, 20), 20);
  EXPECT_EQ(bf.write(data, 40), 34);  // the rest needs the disk
  EXPECT_EQ(bf.close(), 5);
}

TEST_F(BufferFileTest, NewFileWithHeaderBytesAndPrefixes) {
  const std::string name = Path("new");
  BufferFile bf;
  bf.setFilename(name.c_str());
  bf.setLines(kLines);
  bf.setSamples(kPixels);
  bf.setRowPrefix(kPrefix);
  bf.setType(CT_INT16);
  bf.setFileEndian(1);
  ASSERT_EQ(bf.open(BufferFile::kOpWrite), 0);
  ASSERT_EQ(bf.initbuffer(100, 50), 0);
  ASSERT_EQ(bf.writeOffset("HEAD", 4), 0);
  std::vector<short> line(kPixels);
  for (int k = kLines - 1; k >= 0; --k) {  // backwards, to move the buffer around
    for (int s = 0; s < kPixels; ++s) line[s] = static_cast<short>(-k * 1000 - s);
    ASSERT_EQ(bf.writebuffer(line.data(), k, 1, 0, 0), 0);
    ASSERT_EQ(bf.writeprefix(std::string(kPrefix, 'A' + k).c_str(), k, 1), 0);
  }
  EXPECT_EQ(bf.read(line.data(), 2), 0);  // write mode does not read
  ASSERT_EQ(bf.close(), 0);
  ASSERT_EQ(bf.writehdr(), 0);

  const std::string bytes = ReadFile(name);
  ASSERT_EQ(bytes.size(), 4u + kLines * (kPrefix + 2u * kPixels));
  EXPECT_EQ(bytes.substr(0, 4), "HEAD");
  BufferFile check;
  ASSERT_EQ(check.readhdr((name + ".hdr").c_str()), 0);
  EXPECT_EQ(check.getOffsetSize(), 4);
  ASSERT_EQ(check.open(BufferFile::kOpRead), 0);
  EXPECT_EQ(check.readShort(5, 7), -5007);  // swapped from the big-endian file
  EXPECT_EQ(check.readInt(5, 7), 0);        // not an INT32 file
  EXPECT_EQ(check.readShort(kLines, 0), 0);
  std::string prefix(kPrefix, ' ');
  ASSERT_EQ(check.readprefix(&prefix[0], 3, 1), 0);
  EXPECT_EQ(prefix, std::string(kPrefix, 'D'));
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

// The older parameter-file header rewritten as the XML block, and a sparse
// file updated beyond 4 GiB through a clone of what that block describes.
TEST_F(BufferFileTest, HeaderFormsAndOffsetsBeyondFourGiB) {
  WriteFile(Path("far.hdr"),
            "[RasterInfo]\nHeaderOffset = 5000000000\nRowPrefix = 3\nNrOfPixelsPerLine = 4\n"
            "NrOfLinesPerImage = 2\nCellType = INT32\nByteOrder = LSBFirst\n");
  BufferFile legacy;
  ASSERT_EQ(legacy.readhdr(Path("far.hdr").c_str()), 0);
  EXPECT_EQ(legacy.filename(), Path("far"));
  ASSERT_EQ(legacy.writehdr(Path("xml.hdr").c_str()), 0);
  BufferFile bf;
  ASSERT_EQ(bf.readhdr(), 1);  // no name yet
  ASSERT_EQ(bf.readhdr(Path("xml.hdr").c_str()), 0);
  EXPECT_EQ(bf.getOffsetSize(), 5000000000LL);
  BufferFile copy;
  bf.clone(&copy);
  const std::string name = Path("xml");
  EXPECT_EQ(copy.filename(), name);

  WriteFile(name, "");
  std::filesystem::resize_file(name, 5000000000LL + 2 * 19);  // sparse
  ASSERT_EQ(copy.open(BufferFile::kOpUpdate), 0);
  EXPECT_TRUE(copy.is_writing());
  ASSERT_EQ(copy.initbuffer(32, 8), 0);
  const int line[4] = {1, -2, 3, -4};
  ASSERT_EQ(copy.writebuffer(line, 1, 1, 0, 0), 0);
  EXPECT_EQ(copy.readInt(1, 3), -4);
  ASSERT_EQ(copy.close(), 0);
  DataFile df;
  ASSERT_EQ(df.read_hdr(name.c_str()), 0);
  ASSERT_EQ(df.open(DataFile::kOpenRead), 0);
  int back[4];
  ASSERT_EQ(df.seek(5000000000LL + 19 + 3, DataFile::kSeekSet), 0);
  ASSERT_EQ(df.read(back, sizeof back), 0);
  EXPECT_EQ(std::vector<int>(back, back + 4), std::vector<int>(line, line + 4));
}

}  // namespace
