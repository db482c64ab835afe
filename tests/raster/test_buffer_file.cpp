#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cstdint>
#include <random>
#include <string>
#include <vector>

#include "raster/buffer_file.h"
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
    spit(path("sc"), bytes);
    spit(path("sc.hdr"),
         "[RasterInfo]\nHeaderOffset = 11\nRowPrefix = 17\n"
         "NrOfPixelsPerLine = 37\nNrOfLinesPerImage = 7\n"
         "CellType = SHORT_COMPLEX\nByteOrder = MSBFirst\n");
    bf->setFilename(path("sc").c_str());
    EXPECT_EQ(bf->readhdr(), 0);
    return bytes;
  }
};

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
      const std::string name = path("u");
      spit(name, model);
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
      EXPECT_EQ(slurp(name), model);
    }
  }
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
  missing.setFilename(path("nothing").c_str());
  EXPECT_EQ(missing.open(BufferFile::kOpRead), 9);
  char shortName[8];
  EXPECT_EQ(bf.getFilename(shortName, sizeof shortName), 1);  // cut, terminated
  EXPECT_EQ(std::string(shortName), path("sc").substr(0, 7));

  // Header names (damaged headers: with those of DataFile).
  EXPECT_EQ(BufferFile().readhdr("a.h"), 1);
  EXPECT_EQ(BufferFile().readhdr(path("missing.hdr").c_str()), 1);
}

}  // namespace
