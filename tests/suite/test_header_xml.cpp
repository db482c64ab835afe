// The ".sml" header: values written and read back exactly, the file layout,
// an independent XML parser's reading, carried-over sections, the map grid,
// the "SOFTWARE" entry and malformed files.
#include <cfloat>
#include <climits>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <filesystem>
#include <iterator>
#include <sstream>
#include <string>
#include <vector>

#include "installation.h"
#include "runtime/environment.h"
#include "suite/description_header.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;
using vlr_test::ReadFile;
using vlr_test::WriteFile;

uint64_t bits(double v) {
  uint64_t b;
  std::memcpy(&b, &v, sizeof b);
  return b;
}

std::string byteRange(int first, int last) {
  std::string s;
  for (int c = first; c <= last; ++c) s.push_back(static_cast<char>(c));
  return s;
}

const double kDoubles[] = {7159012.345,
                           1e-6,
                           0.1 + 0.2,
                           1.0 / 3.0,
                           -0.0,
                           4.9406564584124654e-324,
                           2.2250738585072009e-308,
                           DBL_MAX,
                           -DBL_MAX,
                           HUGE_VAL,
                           -HUGE_VAL,
                           std::nan("")};

std::vector<std::string> sampleStrings() {
  return {"",
          "<&>\"'",
          byteRange(128, 164),
          byteRange(165, 255),
          "tab\tlf\ncr\rcrlf\r\n",
          "\"\"",
          "##lt ##amp ####BIG5",
          "  blanks around  ",
          std::string(600, 'x'),
          std::string(100 * 1024, 'y') + "<end>"};
}

class HeaderXml : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    writeKeyFile("Shapes",
                 "[Shapes]\n"
                 "Count = I\nScale = D\nLabel = S\nUnset = D\n"
                 "Times = VD\nCounts = VI\nNames = VS\n"
                 "Grid = MD\nTable = MS\n"
                 "Points = 2 (Lat = VD, Tag = VS)\n");
    writeKeyFile("Other", "[Other]\nNote = S\nLevel = I\n");
  }

  static CDescriptionHeader header(const std::vector<std::string>& sections) {
    return CDescriptionHeader(sections);
  }
  CDescriptionField* field(CDescriptionHeader& h, const char* path) { return getField(h, path); }

  // The awkward doubles and strings, a vector with an unset element, and a second section.
  void fill(CDescriptionHeader& h) {
    CDescriptionField* times = field(h, "Shapes.Times");
    const int nd = static_cast<int>(sizeof kDoubles / sizeof kDoubles[0]);
    setNumberOfElements(times, nd);
    for (int i = 0; i < nd; ++i) setDouble(times, i, kDoubles[i]);
    const std::vector<std::string> strings = sampleStrings();
    CDescriptionField* names = field(h, "Shapes.Names");
    setNumberOfElements(names, static_cast<int>(strings.size()));
    for (size_t i = 0; i < strings.size(); ++i) setString(names, static_cast<int>(i), strings[i]);
    CDescriptionField* counts = field(h, "Shapes.Counts");
    setNumberOfElements(counts, 3);
    setInteger(counts, 0, INT_MAX);
    setInteger(counts, 2, INT_MIN);  // element 1 stays unset
    setString(field(h, "Other.Note"), "kept");
  }

  void expectFilled(CDescriptionHeader& h) {
    CDescriptionField* times = field(h, "Shapes.Times");
    ASSERT_EQ(times->columns(), static_cast<int>(sizeof kDoubles / sizeof kDoubles[0]));
    for (int i = 0; i < times->columns(); ++i) {
      EXPECT_TRUE(bits(getDouble(times, i)) == bits(kDoubles[i]) ||
                  (std::isnan(kDoubles[i]) && std::isnan(getDouble(times, i))))
          << i;
    }
    const std::vector<std::string> strings = sampleStrings();
    CDescriptionField* names = field(h, "Shapes.Names");
    ASSERT_EQ(names->columns(), static_cast<int>(strings.size()));
    for (size_t i = 0; i < strings.size(); ++i) {
      EXPECT_TRUE(names->isSetAt(0, static_cast<int>(i))) << i;
      EXPECT_EQ(getString(names, static_cast<int>(i)), strings[i]) << i;
    }
    CDescriptionField* counts = field(h, "Shapes.Counts");
    ASSERT_EQ(counts->columns(), 3);
    EXPECT_EQ(getInteger(counts, 0), INT_MAX);
    EXPECT_FALSE(counts->isSetAt(0, 1));
    EXPECT_EQ(getInteger(counts, 2), INT_MIN);
    EXPECT_FALSE(isSet(field(h, "Shapes.Unset")));
    EXPECT_EQ(getString(field(h, "Other.Note")), "kept");
  }

  int readCode(const std::string& content) {
    WriteFile(work("bad.sml"), content);
    CDescriptionHeader h = header({"Shapes"});
    return RaisedCode([&] { readHeader(h, work("bad").c_str()); });
  }

  static std::string wrap(const std::string& fields) {
    return "<?xml version=\"1.0\" ?>\n<HEADER_INFO>\n   <Shapes>\n" + fields +
           "   </Shapes>\n</HEADER_INFO>\n";
  }
};

// Written, every value reads back bit for bit, and Python's XML parser sees the same doubles and
// strings (the file is Latin-1 text).
TEST_F(HeaderXml, EveryShapeAndValueReadsBackExactlyAndAsAnIndependentParserSeesIt) {
  CDescriptionHeader written = header({"Shapes", "Other"});
  fill(written);
  writeXML(written, work("round.sml").c_str());
  for (const char* name : {"round", "round_hdr", "round.sml"}) {
    SCOPED_TRACE(name);
    CDescriptionHeader read = header({"Shapes", "Other"});
    ASSERT_TRUE(readHeader(read, work(name).c_str()));
    expectFilled(read);
  }

  // Prints float.hex of every double and the hex bytes of every string.
  WriteFile(work("read.py"),
            "import sys, xml.etree.ElementTree as ET\n"
            "ns = '{urn:veloran:schemas:header}'\n"
            "root = ET.fromstring(open(sys.argv[1], 'rb').read().decode('latin-1'))\n"
            "for d in root.iter(ns + 'Times'):\n"
            "  for v in d.iter(ns + 'DoubleValue'): print('D', float(v.text).hex())\n"
            "for n in root.iter(ns + 'Names'):\n"
            "  for v in n.iter(ns + 'StringValue'): print('S', v.text.encode('latin-1').hex())\n");
  const vlr_test::RunResult r =
      vlr_test::RunProgram({"/usr/bin/python3", work("read.py"), work("round.sml")}, {}, true);
  ASSERT_EQ(r.status, 0) << r.err;
  std::vector<double> doubles;
  std::vector<std::string> strings;
  std::istringstream lines(r.out);
  for (std::string kind, hex; lines >> kind >> hex;) {
    if (kind == "D") doubles.push_back(std::strtod(hex.c_str(), nullptr));
    std::string bytes;
    for (size_t i = 0; kind == "S" && i + 1 < hex.size(); i += 2)
      bytes.push_back(static_cast<char>(std::stoi(hex.substr(i, 2), nullptr, 16)));
    if (kind == "S") strings.push_back(bytes);
  }
  ASSERT_EQ(doubles.size(), sizeof kDoubles / sizeof kDoubles[0]);
  for (size_t i = 0; i < doubles.size(); ++i)
    EXPECT_TRUE(bits(doubles[i]) == bits(kDoubles[i]) || std::isnan(kDoubles[i])) << i;
  std::vector<std::string> expected = sampleStrings();
  expected[0] = "\"\"";  // the mark of the empty string
  EXPECT_EQ(strings, expected);
  // A matrix without rows keeps its width.
  EXPECT_EQ(readCode(wrap("      <Grid><DoubleMatrix NumberOfRows = \"0\" NumberOfColumns = "
                          "\"7\"></DoubleMatrix></Grid>\n")),
            0);
}

TEST_F(HeaderXml, WrittenFileHasTheHeaderLayout) {
  writeKeyFile("Small", "[Small]\nN = I\nV = VD\nM = MS\nS = 1 (A = VI)\nE = S\n");
  CDescriptionHeader h = header({"Small", "Other"});
  setInteger(getField(h, "Small.N"), 7);
  setNumberOfElements(getField(h, "Small.V"), 2);
  setDouble(getField(h, "Small.V"), 0, 0.5);
  setDouble(getField(h, "Small.V"), 1, std::nan(""));
  resize(getField(h, "Small.M"), 1, 2);
  setStringAt(getField(h, "Small.M"), 0, 0, "a<b");
  setNumberOfElements(getField(h, "Small.S"), 1);
  getField(h, "Small.S")->subFields()[0].setIntegerAt(0, 0, -3);
  writeXML(h, work("small.sml").c_str());
  const std::string expected =
      "<?xml version=\"1.0\" ?>\n"
      "<HEADER_INFO xmlns=\"urn:veloran:schemas:header\"\n"
      "\txmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\"\n"
      "\txsi:schemaLocation=\"urn:veloran:schemas:header\n"
      "\turn:veloran:schemas:header/VeloranHeaderSchema_version_1.0.xsd\">\n"
      "   <Small>\n"
      "      <N>7</N>\n"
      "      <V>\n"
      "         <DoubleVector NumberOfElements = \"2\">\n"
      "            <DoubleValue ID = \"0\">0.5</DoubleValue>\n"
      "            <DoubleValue ID = \"1\">NaN</DoubleValue>\n"
      "         </DoubleVector>\n"
      "      </V>\n"
      "      <M>\n"
      "         <StringMatrix NumberOfRows = \"1\" NumberOfColumns = \"2\">\n"
      "            <MatrixRow ID = \"0\">\n"
      "               <StringValue ID = \"0\">a&lt;b</StringValue>\n"
      "               <StringValue ID = \"1\"></StringValue>\n"
      "            </MatrixRow>\n"
      "         </StringMatrix>\n"
      "      </M>\n"
      "      <S>\n"
      "         <VectorOfStructs_S NumberOfElements = \"1\" NumberOfFields = \"1\">\n"
      "            <VectorOfStructsValues_S ID = \"0\">\n"
      "               <A>-3</A>\n"
      "            </VectorOfStructsValues_S>\n"
      "         </VectorOfStructs_S>\n"
      "      </S>\n"
      "      <E></E>\n"
      "   </Small>\n"
      "</HEADER_INFO>\n";
  EXPECT_EQ(ReadFile(work("small.sml")), expected);
}

TEST_F(HeaderXml, SectionsTheHeaderLacksAreCarriedOver) {
  CDescriptionHeader both = header({"Shapes", "Other"});
  setInteger(getField(both, "Shapes.Count"), 1);
  setString(getField(both, "Other.Note"), "from before & kept");
  setInteger(getField(both, "Other.Level"), 4);
  const std::string path = work("carry.sml");
  writeXML(both, path.c_str());
  const std::string before = ReadFile(path);
  const std::string otherBlock = before.substr(
      before.find("   <Other>"), before.find("</Other>\n") + 9 - before.find("   <Other>"));
  CDescriptionHeader shapesOnly = header({"Shapes"});
  setInteger(getField(shapesOnly, "Shapes.Count"), 2);
  writeXML(shapesOnly, path.c_str());
  writeXML(shapesOnly, path.c_str());
  const std::string after = ReadFile(path);
  EXPECT_NE(after.find(otherBlock), std::string::npos);
  EXPECT_EQ(after.find("<Other>"), after.rfind("<Other>"));
}

TEST_F(HeaderXml, AFailedWriteKeepsTheOldFileAndLeavesNoTemporary) {
  const std::string dir = work("out/");
  ASSERT_EQ(system(("mkdir -p " + dir).c_str()), 0);
  CDescriptionHeader h = header({"Other"});
  setString(getField(h, "Other.Note"), "good");
  writeXML(h, (dir + "h.sml").c_str());
  const std::string good = ReadFile(dir + "h.sml");
  setString(getField(h, "Other.Note"), std::string("bell\x07"));
  try {
    writeXML(h, (dir + "h.sml").c_str());
    FAIL() << "a control character was written";
  } catch (const CErrorExceptionManager& e) {
    EXPECT_EQ(e.code(), 261124);
    EXPECT_NE(e.extra().find("Other.Note"), std::string::npos);
  }
  EXPECT_EQ(ReadFile(dir + "h.sml"), good);
  EXPECT_EQ(std::distance(std::filesystem::directory_iterator(dir), {}), 1);  // no temporary
  EXPECT_EQ(RaisedCode([&] { writeXML(h, work("missing/dir/h.sml").c_str()); }), 261124);
}

TEST_F(HeaderXml, MalformedFilesGiveAClearCode) {
  const std::string intField = "      <Count>12</Count>\n";
  const std::string good = wrap(intField);
  struct Case {
    const char* what;
    std::string content;
    int code;
  };
  const std::vector<Case> cases = {
      {"well formed", good, 0},
      {"truncated", good.substr(0, good.size() / 2), 261121},
      {"empty file", "", 261121},
      {"mismatched tag", wrap("      <Count>12</Scale>\n"), 261121},
      {"wrong root", "<?xml version=\"1.0\" ?>\n<OTHER><Shapes/></OTHER>\n", 261121},
      {"unknown section",
       "<HEADER_INFO><Nobody><X>1</X></Nobody><Shapes>" + intField + "</Shapes></HEADER_INFO>", 0},
      {"integer text", wrap("      <Count>twelve</Count>\n"), 261121},
      {"integer beyond 32 bits", wrap("      <Count>2147483648</Count>\n"), 261121},
      {"double with trailing text", wrap("      <Scale>1.5x</Scale>\n"), 261121},
      {"huge count, two values",
       wrap("<Times><DoubleVector NumberOfElements = \"2000000000\">"
            "<DoubleValue ID = \"0\">1</DoubleValue><DoubleValue ID = \"1\">2</DoubleValue>"
            "</DoubleVector></Times>\n"),
       261121},
      {"negative count", wrap("<Times><DoubleVector NumberOfElements = \"-1\"/></Times>\n"),
       261121},
      {"ID outside the size",
       wrap("<Times><DoubleVector NumberOfElements = \"1\">"
            "<DoubleValue ID = \"5\">1</DoubleValue></DoubleVector></Times>\n"),
       261121},
      {"huge matrix",
       wrap("<Grid><DoubleMatrix NumberOfRows = \"1\" NumberOfColumns = "
            "\"99999999\"><MatrixRow ID = \"0\"/></DoubleMatrix></Grid>\n"),
       261121},
      {"character beyond Latin-1", wrap("      <Label>&#8364;</Label>\n"), 261121},
      {"10 MB value", wrap("      <Label>" + std::string(10u << 20, 'v') + "</Label>\n"), 261121},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(readCode(c.content), c.code);
  }
  // Read section by section, a section the file lacks is an error; a file of neither form is
  // reported as not found.
  WriteFile(work("bad.sml"), good);
  CDescriptionHeader wider = header({"Shapes", "Other"});
  EXPECT_EQ(RaisedCode([&] { readHeader(wider, work("bad").c_str(), 1); }), 261122);
  EXPECT_FALSE(readHeader(wider, work("nothing").c_str()));
  EXPECT_NE(processLog().find("File : " + work("nothing") + " Not Found"), std::string::npos);
  WriteFile(work("bad.sml"), wrap("      <Count>x</Count>\n"));
  CDescriptionHeader h = header({"Shapes"});
  try {
    readHeader(h, work("bad").c_str());
    FAIL();
  } catch (const CErrorExceptionManager& e) {
    EXPECT_NE(e.extra().find("bad.sml"), std::string::npos);
    EXPECT_NE(e.extra().find("Shapes.Count"), std::string::npos);
  }
}

class WrittenHeader : public vlr_test::SuiteTest {
 protected:
  CDescriptionHeader geocodedHeader(const char* geocoded) {
    CDescriptionHeader h(
        std::vector<std::string>{"RasterInfo", "RegistrationCoordinates", "DEMCoordinates"});
    setString(getField(h, "RasterInfo.GeocodedImage"), geocoded);
    setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), 100);
    setInteger(getField(h, "RasterInfo.NrOfPixelsPerLine"), 40);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLatNorth"), 0.5);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLonEast"), 0.25);
    setDouble(getField(h, "RegistrationCoordinates.LatNorthing"), 10.0);
    setDouble(getField(h, "RegistrationCoordinates.LonEasting"), -3.0);
    return h;
  }
};

TEST_F(WrittenHeader, GeocodedHeadersGetTheMapGrid) {
  CDescriptionHeader h = geocodedHeader("ok");
  writeHeader(h, work("geo_hdr").c_str());
  CDescriptionHeader read(std::vector<std::string>{"RasterInfo", "DEMCoordinates"});
  ASSERT_TRUE(readHeader(read, work("geo.sml").c_str()));
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.NorthingCoordinateBegin")), 60.0);
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.NorthingGridSize")), -0.5);
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.NorthingCoordinateEnd")), 10.0);
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.EastingCoordinateBegin")), -3.0);
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.EastingGridSize")), 0.25);
  EXPECT_EQ(getDouble(getField(read, "DEMCoordinates.EastingCoordinateEnd")), 7.0);

  CDescriptionHeader plain = geocodedHeader("NO");
  writeHeader(plain, work("plain.sml").c_str());
  EXPECT_EQ(ReadFile(work("plain.sml")).find("<DEMCoordinates>"), std::string::npos);
}

TEST_F(WrittenHeader, TheSoftwareRowIsSetReplacedOrAppended) {
  const std::string id = NVLR_UTILITY_Identification();
  CDescriptionHeader h(std::vector<std::string>{"RasterInfo"});
  CDescriptionField* info = getField(h, "RasterInfo.OtherInfo");
  writeHeader(h, work("sw").c_str());
  ASSERT_EQ(info->rows(), 1);
  EXPECT_EQ(getStringAt(info, 0, 0), "SOFTWARE");
  EXPECT_EQ(getStringAt(info, 0, 1), id);

  // A row of another key is kept; the "SOFTWARE" row is appended after it, then replaced.
  setStringAt(info, 0, 0, "SENSOR");
  setStringAt(info, 0, 1, "ASAR");
  writeHeader(h, work("sw").c_str());
  setStringAt(info, 1, 1, "older");
  writeHeader(h, work("sw").c_str());
  ASSERT_EQ(info->rows(), 2);
  EXPECT_EQ(getStringAt(info, 0, 0), "SENSOR");
  EXPECT_EQ(getStringAt(info, 1, 0), "SOFTWARE");
  EXPECT_EQ(getStringAt(info, 1, 1), id);
  CDescriptionHeader read(std::vector<std::string>{"RasterInfo"});
  ASSERT_TRUE(readHeader(read, work("sw_hdr").c_str()));
  EXPECT_EQ(getStringAt(getField(read, "RasterInfo.OtherInfo"), 1, 1), id);
}

}  // namespace
