// The suite raster file against bytes laid out by the tests themselves: every
// cell type in both byte orders, packed bits, offsets beyond 4 GiB, refused
// requests, and the zero lines that complete a file closed early.
#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "runtime/error_codes.h"
#include "suite/cell_types.h"
#include "suite/description_header.h"
#include "suite/raster_file.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;

struct Layout {
  int lines, pixels;
  const char* cellType;
  int prefix = 0, suffix = 0, headerOffset = 0;
  const char* order = nullptr;
};

// Byte k (0 = least significant) of value `part` of a pixel: distinct within
// a value, so a missing or a wrong swap shows.
unsigned char significance(int line, int pixel, int part, int k) {
  return static_cast<unsigned char>(line * 31 + pixel * 7 + part * 3 + k * 50 + 1);
}

class RasterFileTest : public vlr_test::SuiteTest {
 protected:
  CDescriptionHeader header(const Layout& l) {
    CDescriptionHeader h(std::vector<std::string>{"RasterInfo"});
    setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), l.lines);
    setInteger(getField(h, "RasterInfo.NrOfPixelsPerLine"), l.pixels);
    setString(getField(h, "RasterInfo.CellType"), l.cellType);
    setInteger(getField(h, "RasterInfo.HeaderOffset"), l.headerOffset);
    setInteger(getField(h, "RasterInfo.RowPrefix"), l.prefix);
    setInteger(getField(h, "RasterInfo.RowSuffix"), l.suffix);
    if (l.order) setString(getField(h, "RasterInfo.BytesOrder"), l.order);
    return h;
  }

  // The file as a writer in the given byte order lays it out; header,
  // prefixes and suffixes hold marker bytes that must never be read.
  std::string fileBytes(const Layout& l, bool mostSignificantFirst) {
    int values = 0;
    const int size = NVLR_UTILITY_CellTypeSize(NVLR_UTILITY_CellTypeCode(l.cellType), &values);
    const int valueSize = size / values;
    std::string bytes(static_cast<size_t>(l.headerOffset), '\xCC');
    for (int line = 0; line < l.lines; ++line) {
      bytes.append(static_cast<size_t>(l.prefix), '\xAA');
      for (int pixel = 0; pixel < l.pixels; ++pixel)
        for (int part = 0; part < values; ++part)
          for (int at = 0; at < valueSize; ++at)
            bytes += static_cast<char>(
                significance(line, pixel, part, mostSignificantFirst ? valueSize - 1 - at : at));
      bytes.append(static_cast<size_t>(l.suffix), '\xBB');
    }
    return bytes;
  }

  // The host-order bytes of the window, built from the values themselves.
  static std::vector<unsigned char> expected(int firstLine, int lines, int firstPixel,
                                             int lastPixel, int values, int valueSize) {
    std::vector<unsigned char> out;
    for (int line = firstLine; line < firstLine + lines; ++line)
      for (int pixel = firstPixel; pixel <= lastPixel; ++pixel)
        for (int part = 0; part < values; ++part) {
          uint64_t v = 0;
          for (int k = valueSize - 1; k >= 0; --k)
            v = (v << 8) | significance(line, pixel, part, k);
          unsigned char host[8];
          if (valueSize == 1) host[0] = static_cast<uint8_t>(v);
          const uint16_t v16 = static_cast<uint16_t>(v);
          const uint32_t v32 = static_cast<uint32_t>(v);
          if (valueSize == 2) std::memcpy(host, &v16, 2);
          if (valueSize == 4) std::memcpy(host, &v32, 4);
          if (valueSize == 8) std::memcpy(host, &v, 8);
          out.insert(out.end(), host, host + valueSize);
        }
    return out;
  }
};

TEST_F(RasterFileTest, CellTypeSizesAndNames) {
  const int sizes[CVLR_NBR_CELL_TYPES] = {1, 2, 1, 2, 2, 2, 4, 4, 8, 8, 16, 4, 4, 1, 4};
  for (int code = 0; code < CVLR_NBR_CELL_TYPES; ++code) {
    int values = 0;
    EXPECT_EQ(NVLR_UTILITY_CellTypeCode(NVLR_UTILITY_CellTypeName(code)), code);
    EXPECT_EQ(NVLR_UTILITY_CellTypeSize(code, &values), sizes[code]) << code;
    EXPECT_EQ(values, NVLR_UTILITY_IsComplexCellType(code) ? 2 : 1) << code;
  }
  EXPECT_EQ(NVLR_UTILITY_CellTypeCode("float"), -1);
  EXPECT_EQ(NVLR_UTILITY_CellTypeSize(-1, nullptr), -1);
  EXPECT_EQ(NVLR_UTILITY_DataUnitsCode("SQUARE ROOT"), 2);
}

TEST_F(RasterFileTest, EveryCellTypeReadsInBothByteOrders) {
  for (int code = 0; code < CVLR_NBR_CELL_TYPES; ++code) {
    if (code == CVLR_BIT) continue;
    for (bool msbf : {false, true}) {
      Layout l{4, 6, NVLR_UTILITY_CellTypeName(code), 3, 2, 7, msbf ? "MSBF" : "LSBF"};
      SCOPED_TRACE(std::string(l.cellType) + (msbf ? " MSBF" : " LSBF"));
      const std::string path = work("raster");
      vlr_test::WriteFile(path, fileBytes(l, msbf));
      CDescriptionHeader h = header(l);
      CRasterFile raster;
      raster.openRead(path.c_str(), h);
      int values = 0;
      const int size = NVLR_UTILITY_CellTypeSize(code, &values);
      std::vector<unsigned char> got(2 * 3 * static_cast<size_t>(size));
      raster.readLines(1, 2, 2, 4, got.data());
      EXPECT_EQ(got, expected(1, 2, 2, 4, values, size / values));
      raster.readLines(3, 1, 5, 5, got.data());  // last line, last pixel
      got.resize(static_cast<size_t>(size));
      EXPECT_EQ(got, expected(3, 1, 5, 5, values, size / values));
      raster.close();
    }
  }
}

TEST_F(RasterFileTest, BitLinesArePackedBytesNeverSwapped) {
  const Layout l{2, 9, "BIT", 0, 0, 0, "MSBF"};
  const std::string path = work("bits");
  vlr_test::WriteFile(path, std::string("\x81\x01\xF0\x80", 4));
  CDescriptionHeader h = header(l);
  CRasterFile raster;
  raster.openRead(path.c_str(), h);
  EXPECT_EQ(raster.recordLength(), 2);
  unsigned char got[4] = {};
  raster.readLines(0, 2, 0, 8, got);
  EXPECT_EQ(std::vector<unsigned char>(got, got + 4),
            (std::vector<unsigned char>{0x81, 0x01, 0xF0, 0x80}));
  raster.readLines(1, 1, 8, 8, got);  // pixel 8 lives in the line's second byte
  EXPECT_EQ(got[0], 0x80);
  raster.close();
}

TEST_F(RasterFileTest, LastLineOfAFileBeyondFourGibibytes) {
  const Layout l{4000, 300000, "FLOAT", 0, 0, 0, nullptr};
  const int64_t record = 300000LL * 4;
  const std::string path = work("large");
  const int fd = open(path.c_str(), O_CREAT | O_TRUNC | O_WRONLY, 0644);
  ASSERT_GE(fd, 0);
  ASSERT_EQ(ftruncate(fd, 4000 * record), 0);
  const float tail[3] = {1.5f, -2.25f, 3e38f};
  ASSERT_EQ(pwrite(fd, tail, sizeof tail, 4000 * record - sizeof tail), (ssize_t)sizeof tail);
  close(fd);
  CDescriptionHeader h = header(l);
  CRasterFile raster;
  raster.openRead(path.c_str(), h);
  float got[3] = {9, 9, 9};
  raster.readLines(0, 1, 299997, 299999, got);
  EXPECT_EQ(got[2], 0.0f);
  raster.readLines(3999, 1, 299997, 299999, got);
  EXPECT_EQ(std::memcmp(got, tail, sizeof tail), 0);
  raster.close();
}

TEST_F(RasterFileTest, RefusedDescriptionsAndRequests) {
  const std::string path = work("small");
  const Layout good{3, 4, "SHORT", 1, 1, 0, nullptr};
  vlr_test::WriteFile(path, fileBytes(good, false));
  auto openCode = [&](const Layout& l) {
    CDescriptionHeader h = header(l);
    CRasterFile raster;
    return RaisedCode([&] { raster.openRead(path.c_str(), h); });
  };
  EXPECT_EQ(openCode({3, 4, "float"}), vlr::kCodeFileNotParsed);
  EXPECT_EQ(openCode({0, 4, "SHORT"}), vlr::kCodeFileNotParsed);
  EXPECT_EQ(openCode({3, 500001, "SHORT"}), vlr::kCodeFileNotParsed);
  EXPECT_EQ(openCode({3, 4, "SHORT", -1}), vlr::kCodeFileNotParsed);
  EXPECT_EQ(openCode({3, 4, "SHORT", 0, 0, -8}), vlr::kCodeFileNotParsed);
  {
    CDescriptionHeader h = header(good);
    getField(h, "RasterInfo.CellType")->clear();
    CRasterFile raster;
    EXPECT_EQ(RaisedCode([&] { raster.openRead(path.c_str(), h); }), vlr::kCodeFileNotParsed);
    EXPECT_EQ(RaisedCode([&] { raster.openRead(work("none").c_str()); }), vlr::kCodeFileNotFound);
  }
  CDescriptionHeader h = header(good);
  CRasterFile raster;
  short buffer[8] = {};
  EXPECT_EQ(RaisedCode([&] { raster.readLines(0, 1, 0, 0, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.close(); }), vlr::kCodeFileNotParsed);
  EXPECT_EQ(RaisedCode([&] { raster.openRead(work("missing").c_str(), h); }),
            vlr::kCodeFileNotFound);
  ASSERT_EQ(mkfifo(work("pipe").c_str(), 0600), 0);  // would block a plain open
  EXPECT_EQ(RaisedCode([&] { raster.openRead(work("pipe").c_str(), h); }), vlr::kCodeFileNotFound);
  EXPECT_EQ(raster.status(), CVLR_RF_CLOSE);
  raster.openRead(path.c_str(), h);
  EXPECT_EQ(RaisedCode([&] { raster.openRead(path.c_str(), h); }), vlr::kCodeFileNotParsed);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(3, 1, 0, 0, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(2, 2, 0, 0, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(-1, 1, 0, 0, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(0, 1, 0, 4, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(0, 1, 3, 2, buffer); }), vlr::kCodeFileRead);
  EXPECT_EQ(RaisedCode([&] { raster.writeLines(0, 1, buffer); }), vlr::kCodeFileWrite);
  raster.close();

  // A file shorter than its description is a read failure, not garbage.
  vlr_test::WriteFile(path, fileBytes(good, false).substr(0, 20));
  raster.openRead(path.c_str(), h);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(2, 1, 0, 3, buffer); }), vlr::kCodeFileRead);
  raster.close();
}

TEST_F(RasterFileTest, WrittenLinesReadBackAndMissingLinesBecomeZeros) {
  const Layout l{4, 3, "SHORT_COMPLEX", 2, 1, 5, "MSBF"};
  const std::string path = work("written");
  CDescriptionHeader h = header(l);
  setDouble(getField(h, "RasterInfo.NullCellValue"), -9999.0);
  const int16_t lines[2][6] = {{1, -2, 300, -400, 0x1234, -32768}, {7, 8, 9, 10, 11, 12}};
  CRasterFile raster;
  raster.openWrite(path.c_str(), h);
  EXPECT_EQ(RaisedCode([&] { raster.writeLines(3, 2, lines); }), vlr::kCodeFileWrite);
  EXPECT_EQ(RaisedCode([&] { raster.readLines(0, 1, 0, 0, nullptr); }), vlr::kCodeFileRead);
  raster.writeLines(0, 2, lines);
  raster.close();

  EXPECT_NE(processLog().find("[ERROR ID : 130561]"), std::string::npos) << processLog();
  EXPECT_NE(processLog().find(path), std::string::npos);
  const std::string bytes = vlr_test::ReadFile(path);
  const size_t record = 2 + 3 * 4 + 1;
  ASSERT_EQ(bytes.size(), 5 + 4 * record);
  EXPECT_EQ(bytes.substr(0, 5 + 2), std::string(7, '\0'));
  // Most significant byte first: -2 is FF FE, 0x1234 is 12 34.
  EXPECT_EQ(bytes.substr(5 + 2, 4), std::string("\x00\x01\xFF\xFE", 4));
  EXPECT_EQ(bytes.substr(5 + 2 + 8, 4), std::string("\x12\x34\x80\x00", 4));
  EXPECT_EQ(bytes[5 + record - 1], '\0');
  EXPECT_EQ(bytes.substr(5 + 2 * record), std::string(2 * record, '\0'));

  raster.openRead(path.c_str(), h);
  EXPECT_EQ(raster.nullValue(), -9999.0);
  EXPECT_EQ(raster.realScaleFactor(), 1.0);
  int16_t got[3][6] = {};
  raster.readLines(0, 3, 0, 2, got);
  EXPECT_EQ(std::memcmp(got, lines, sizeof lines), 0);
  EXPECT_EQ(got[2][5], 0);
  raster.close();

  // Left open, the object completes the file itself when it goes.
  {
    CRasterFile unfinished;
    unfinished.openWrite(work("unfinished").c_str(), h);
  }
  EXPECT_EQ(vlr_test::ReadFile(work("unfinished")), std::string(5 + 4 * record, '\0'));
}

}  // namespace
