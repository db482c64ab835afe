#include <gtest/gtest.h>

#include <map>
#include <string>
#include <utility>
#include <vector>

#include "raster/buffer_file.h"
#include "raster/data_file.h"
#include "raster_fixture.h"

namespace {

class RasterHeaderTest : public raster_test::ScratchDir {
 protected:
  // A header document whose "RasterInfo" block holds `fields` in order.
  std::string Xml(const std::map<std::string, std::string>& fields) {
    std::string s =
        "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<TessalXmlDoc>\n"
        "  <NumberOfChannels>1</NumberOfChannels>\n  <Description>My description</Description>\n"
        "  <Channel Number=\"1\">\n    <RasterInfo>\n";
    for (const auto& [key, value] : fields) s += "      <" + key + ">" + value + "</" + key + ">\n";
    return s + "    </RasterInfo>\n  </Channel>\n</TessalXmlDoc>\n";
  }
  std::map<std::string, std::string> GoodXml() {
    return {{"NrOfLinesPerImage", "20"}, {"NrOfPixelsPerLine", "100"}, {"HeaderOffset", "12"},
            {"RowPrefix", "17"},         {"ByteOrder", "1"},           {"CellType", "6"}};
  }
  std::string Legacy(const std::map<std::string, std::string>& keys) {
    std::string s = "\n[RasterInfo]\n";
    for (const auto& [key, value] : keys) s += key + " = " + value + "\n";
    return s;
  }
  std::map<std::string, std::string> GoodLegacy() {
    return {{"HeaderOffset", "12"},      {"RowPrefix", "17"},   {"NrOfPixelsPerLine", "100"},
            {"NrOfLinesPerImage", "20"}, {"CellType", "INT16"}, {"ByteOrder", "MSBFirst"}};
  }
  // read_hdr of a header file with the given text; BufferFile's reader
  // must come to the same verdict.
  int ReadHeader(const std::string& text, DataFile* df) {
    const std::string name = path("h" + std::to_string(++count_));
    spit(name + ".hdr", text);
    const int result = df->read_hdr(name.c_str());
    EXPECT_EQ(BufferFile().readhdr((name + ".hdr").c_str()), result);
    return result;
  }
  int count_ = 0;
};

TEST_F(RasterHeaderTest, XmlHeaderRoundTripKeepsOtherBlocks) {
  const std::string name = path("scene");
  spit(name + ".hdr",
       "<?xml version=\"1.0\"?>\n<TessalXmlDoc><NumberOfChannels>1</NumberOfChannels>"
       "<Description>My description</Description><Channel Number=\"1\"><Other><A>5</A>"
       "</Other></Channel></TessalXmlDoc>\n");
  DataFile df;
  // A header offset beyond 2 GiB: product data sets start there.
  raster_test::Describe(&df, name, CT_SHORT_COMPLEX, true, 42, 5000, 17, 3000000000LL);
  ASSERT_EQ(df.write_hdr(), 0);
  ASSERT_EQ(df.write_hdr(), 0);  // rewriting keeps one block

  const std::string text = slurp(name + ".hdr");
  EXPECT_NE(text.find("<HeaderOffset>3000000000</HeaderOffset>"), std::string::npos);
  EXPECT_NE(text.find("<A>5</A>"), std::string::npos);
  EXPECT_EQ(text.find("<RasterInfo>"), text.rfind("<RasterInfo>"));

  DataFile back;
  ASSERT_EQ(back.read_hdr(name.c_str()), 0);
  EXPECT_EQ(back.header_offset, 3000000000LL);
}

TEST_F(RasterHeaderTest, LegacyHeaderForm) {
  DataFile df;
  ASSERT_EQ(ReadHeader(Legacy(GoodLegacy()), &df), 0);
  EXPECT_EQ(df.cell_type, CT_INT16);
  EXPECT_EQ(df.byte_order, 1);
  EXPECT_EQ(df.header_offset, 12);

  auto keys = GoodLegacy();
  keys["ByteOrder"] = "LSBFirst";
  keys["CellType"] = "FLOAT_COMPLEX";
  ASSERT_EQ(ReadHeader(Legacy(keys), &df), 0);
  EXPECT_EQ(df.byte_order, 0);
  EXPECT_EQ(df.cell_type, CT_FLOAT_COMPLEX);

  keys["CellType"] = "int16";  // texts are case-sensitive
  EXPECT_EQ(ReadHeader(Legacy(keys), &df), 1);
  EXPECT_EQ(df.cell_type, -1);
}

TEST_F(RasterHeaderTest, HostileHeadersAreRefused) {
  DataFile df;
  // Each key of either form missing.
  for (const auto& [key, value] : GoodXml()) {
    SCOPED_TRACE(key);
    auto fields = GoodXml();
    fields.erase(key);
    EXPECT_EQ(ReadHeader(Xml(fields), &df), 1);
    auto keys = GoodLegacy();
    keys.erase(key);
    EXPECT_EQ(ReadHeader(Legacy(keys), &df), 1);
  }
  // Impossible values.
  const std::vector<std::pair<std::string, std::string>> bad = {
      {"NrOfPixelsPerLine", "-5"}, {"NrOfLinesPerImage", "-1"},
      {"RowPrefix", "-17"},        {"HeaderOffset", "-12"},
      {"HeaderOffset", "1.5"},     {"HeaderOffset", "1e300"},
      {"CellType", "10"},          {"CellType", "-1"},
      {"ByteOrder", "2"},          {"NrOfPixelsPerLine", "2000000000"}};
  for (const auto& [key, value] : bad) {
    SCOPED_TRACE(key + " = " + value);
    auto fields = GoodXml();
    fields[key] = value;
    EXPECT_EQ(ReadHeader(Xml(fields), &df), 1);
  }
  for (const auto& [key, value] : std::vector<std::pair<std::string, std::string>>{
           {"NrOfPixelsPerLine", "-5"},
           {"NrOfLinesPerImage", "99999999999999999999"},
           {"NrOfPixelsPerLine", "1500000000"}}) {  // a line of 3 GB
    auto keys = GoodLegacy();
    keys[key] = value;
    EXPECT_EQ(ReadHeader(Legacy(keys), &df), 1) << key << " = " << value;
  }

  // Not a header at all, and no header.
  EXPECT_EQ(ReadHeader(std::string("\x01\xff<Tessal\0[Raster", 17), &df), 1);
  EXPECT_EQ(ReadHeader("", &df), 1);
  EXPECT_EQ(df.read_hdr(path("absent").c_str()), 1);
  EXPECT_EQ(df.read_hdr(nullptr), 1);

  // A description that no reader would accept is not written either.
  df.set_name(path("bad").c_str());
  df.pixels_per_line = -1;
  EXPECT_EQ(df.write_hdr(), 1);
}

}  // namespace
