// The ".sml" header: values written and read back exactly, the file layout,
// an independent XML parser's reading, carried-over sections, the map grid,
// the "SOFTWARE" entry and malformed files.
#include <dirent.h>

#include <cfloat>
#include <climits>
#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
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

  // Every shape and type, with the awkward values.
  void fill(CDescriptionHeader& h) {
    setInteger(field(h, "Shapes.Count"), INT_MIN);
    setDouble(field(h, "Shapes.Scale"), 7159012.345);
    setString(field(h, "Shapes.Label"), "line one\nline two");
    CDescriptionField* times = field(h, "Shapes.Times");
    const int nd = static_cast<int>(sizeof kDoubles / sizeof kDoubles[0]);
    setNumberOfElements(times, nd);
    for (int i = 0; i < nd; ++i) setDouble(times, i, kDoubles[i]);
    CDescriptionField* counts = field(h, "Shapes.Counts");
    setNumberOfElements(counts, 3);
    setInteger(counts, 0, INT_MAX);
    setInteger(counts, 2, -1);  // element 1 stays unset
    const std::vector<std::string> strings = sampleStrings();
    CDescriptionField* names = field(h, "Shapes.Names");
    setNumberOfElements(names, static_cast<int>(strings.size()));
    for (size_t i = 0; i < strings.size(); ++i) setString(names, static_cast<int>(i), strings[i]);
    CDescriptionField* grid = field(h, "Shapes.Grid");
    resize(grid, 2, 3);
    for (int r = 0; r < 2; ++r)
      for (int c = 0; c < 3; ++c) setDoubleAt(grid, r, c, kDoubles[r * 3 + c + 6]);
    CDescriptionField* table = field(h, "Shapes.Table");
    resize(table, 2, 2);
    setStringAt(table, 0, 0, "SOFTWARE");
    setStringAt(table, 0, 1, "a, b {c}");
    setStringAt(table, 1, 1, "");
    CDescriptionField* points = field(h, "Shapes.Points");
    setNumberOfElements(points, 3);
    auto& subs = points->subFields();
    subs[0].setDoubleAt(0, 0, 45.5);
    subs[0].setDoubleAt(0, 2, -0.1);
    subs[1].setStringAt(0, 0, "near");
    subs[1].setStringAt(0, 1, "mid & far");
    subs[1].setStringAt(0, 2, "");
    setString(field(h, "Other.Note"), "kept");
  }

  void expectFilled(CDescriptionHeader& h) {
    EXPECT_EQ(getInteger(field(h, "Shapes.Count")), INT_MIN);
    EXPECT_EQ(bits(getDouble(field(h, "Shapes.Scale"))), bits(7159012.345));
    EXPECT_EQ(getString(field(h, "Shapes.Label")), "line one\nline two");
    EXPECT_FALSE(isSet(field(h, "Shapes.Unset")));
    CDescriptionField* times = field(h, "Shapes.Times");
    ASSERT_EQ(times->columns(), static_cast<int>(sizeof kDoubles / sizeof kDoubles[0]));
    for (int i = 0; i < times->columns(); ++i) {
      SCOPED_TRACE(i);
      if (std::isnan(kDoubles[i])) {
        EXPECT_TRUE(std::isnan(getDouble(times, i)));
      } else {
        EXPECT_EQ(bits(getDouble(times, i)), bits(kDoubles[i]));
      }
    }
    CDescriptionField* counts = field(h, "Shapes.Counts");
    ASSERT_EQ(counts->columns(), 3);
    EXPECT_EQ(getInteger(counts, 0), INT_MAX);
    EXPECT_FALSE(counts->isSetAt(0, 1));
    EXPECT_EQ(getInteger(counts, 2), -1);
    const std::vector<std::string> strings = sampleStrings();
    CDescriptionField* names = field(h, "Shapes.Names");
    ASSERT_EQ(names->columns(), static_cast<int>(strings.size()));
    for (size_t i = 0; i < strings.size(); ++i) {
      SCOPED_TRACE(i);
      EXPECT_TRUE(names->isSetAt(0, static_cast<int>(i)));
      EXPECT_EQ(getString(names, static_cast<int>(i)), strings[i]);
    }
    CDescriptionField* grid = field(h, "Shapes.Grid");
    ASSERT_EQ(grid->rows(), 2);
    ASSERT_EQ(grid->columns(), 3);
    EXPECT_EQ(bits(getDoubleAt(grid, 0, 0)), bits(2.2250738585072009e-308));
    EXPECT_EQ(bits(getDoubleAt(grid, 1, 1)), bits(-HUGE_VAL));
    EXPECT_TRUE(std::isnan(getDoubleAt(grid, 1, 2)));
    CDescriptionField* table = field(h, "Shapes.Table");
    EXPECT_EQ(getStringAt(table, 0, 1), "a, b {c}");
    EXPECT_FALSE(table->isSetAt(1, 0));
    EXPECT_TRUE(table->isSetAt(1, 1));
    const auto& subs = field(h, "Shapes.Points")->subFields();
    ASSERT_EQ(subs[0].columns(), 3);
    EXPECT_EQ(subs[0].getDoubleAt(0, 0), 45.5);
    EXPECT_FALSE(subs[0].isSetAt(0, 1));
    EXPECT_EQ(bits(subs[0].getDoubleAt(0, 2)), bits(-0.1));
    EXPECT_EQ(subs[1].getStringAt(0, 1), "mid & far");
    EXPECT_TRUE(subs[1].isSetAt(0, 2));
    EXPECT_EQ(subs[1].getStringAt(0, 2), "");
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

TEST_F(HeaderXml, EveryShapeAndValueReadsBackExactly) {
  CDescriptionHeader written = header({"Shapes", "Other"});
  fill(written);
  writeXML(written, work("round.sml").c_str());
  for (const char* name : {"round", "round_hdr", "round.sml"}) {
    SCOPED_TRACE(name);
    CDescriptionHeader read = header({"Shapes", "Other"});
    ASSERT_TRUE(readHeader(read, work(name).c_str()));
    expectFilled(read);
  }
  // Section by section, the same values.
  CDescriptionHeader read = header({"Shapes", "Other"});
  ASSERT_TRUE(readHeader(read, work("round").c_str(), 1));
  expectFilled(read);
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

TEST_F(HeaderXml, AnIndependentParserFindsTheSameValues) {
  CDescriptionHeader h = header({"Shapes"});
  CDescriptionField* times = getField(h, "Shapes.Times");
  const std::vector<double> doubles = {7159012.345, 1e-6,      0.1 + 0.2, 4.9406564584124654e-324,
                                       DBL_MAX,     -1.0 / 3.0};
  setNumberOfElements(times, static_cast<int>(doubles.size()));
  for (size_t i = 0; i < doubles.size(); ++i) setDouble(times, static_cast<int>(i), doubles[i]);
  const std::vector<std::string> strings = {"<&>\"'", "tab\tlf\ncr\r", "\"\"", "plain"};
  CDescriptionField* names = getField(h, "Shapes.Names");
  setNumberOfElements(names, static_cast<int>(strings.size()));
  for (size_t i = 0; i < strings.size(); ++i) setString(names, static_cast<int>(i), strings[i]);
  writeXML(h, work("ascii.sml").c_str());
  // Prints float.hex of every double and the hex bytes of every string.
  WriteFile(work("read.py"),
            "import sys, xml.etree.ElementTree as ET\n"
            "ns = '{urn:veloran:schemas:header}'\n"
            "root = ET.parse(sys.argv[1]).getroot()\n"
            "for v in root.iter(ns + 'Times'):\n"
            "  for d in v.iter(ns + 'DoubleValue'): print('D', float(d.text).hex())\n"
            "for v in root.iter(ns + 'Names'):\n"
            "  for s in v.iter(ns + 'StringValue'): print('S', s.text.encode('latin-1').hex())\n");
  const vlr_test::RunResult r =
      vlr_test::RunProgram({"/usr/bin/python3", work("read.py"), work("ascii.sml")}, {}, true);
  ASSERT_EQ(r.status, 0) << r.err;
  std::vector<double> seenDoubles;
  std::vector<std::string> seenStrings;
  size_t at = 0;
  while (at < r.out.size()) {
    const size_t end = r.out.find('\n', at);
    const std::string line = r.out.substr(at, end - at);
    at = end == std::string::npos ? r.out.size() : end + 1;
    if (line.rfind("D ", 0) == 0) seenDoubles.push_back(std::strtod(line.c_str() + 2, nullptr));
    if (line.rfind("S ", 0) == 0) {
      std::string bytes;
      for (size_t i = 2; i + 1 < line.size(); i += 2)
        bytes.push_back(static_cast<char>(std::stoi(line.substr(i, 2), nullptr, 16)));
      seenStrings.push_back(bytes);
    }
  }
  ASSERT_EQ(seenDoubles.size(), doubles.size());
  for (size_t i = 0; i < doubles.size(); ++i) EXPECT_EQ(bits(seenDoubles[i]), bits(doubles[i]));
  // The empty-string mark aside, the parser sees the strings as written.
  EXPECT_EQ(seenStrings, strings);
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
  CDescriptionHeader read = header({"Shapes", "Other"});
  ASSERT_TRUE(readHeader(read, path.c_str()));
  EXPECT_EQ(getInteger(getField(read, "Shapes.Count")), 2);
  EXPECT_EQ(getString(getField(read, "Other.Note")), "from before & kept");
  EXPECT_EQ(getInteger(getField(read, "Other.Level")), 4);
}

std::vector<std::string> filesIn(const std::string& dir) {
  std::vector<std::string> names;
  if (DIR* d = opendir(dir.c_str())) {
    while (dirent* e = readdir(d))
      if (e->d_name[0] != '.') names.push_back(e->d_name);
    closedir(d);
  }
  return names;
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
  EXPECT_EQ(filesIn(dir), std::vector<std::string>{"h.sml"});
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

TEST_F(HeaderXml, SectionBySectionAndDescriptionDocuments) {
  CDescriptionHeader h = header({"Shapes"});
  setInteger(getField(h, "Shapes.Count"), 5);
  writeXML(h, work("one.sml").c_str());
  CDescriptionHeader wider = header({"Shapes", "Other"});
  EXPECT_EQ(RaisedCode([&] { readHeader(wider, work("one").c_str(), 1); }), 261122);
  EXPECT_TRUE(readHeader(wider, work("one").c_str(), 0));
  EXPECT_EQ(getInteger(getField(wider, "Shapes.Count")), 5);
  EXPECT_FALSE(readHeader(wider, work("nothing").c_str()));
  EXPECT_NE(processLog().find("File : " + work("nothing") + " Not Found"), std::string::npos);

  WriteFile(work("sections.xml"),
            "<?xml version=\"1.0\"?>\n<DESCRIPTIONS NumberOfElements=\"2\">\n"
            " <SECTION NAME=\"Shapes\"><Count>9</Count></SECTION>\n"
            " <SECTION NAME=\"Other\"><Note>described</Note><Level>3</Level></SECTION>\n"
            "</DESCRIPTIONS>\n");
  CDescriptionSection other("Other");
  other.defineFromKeyFile();
  ASSERT_TRUE(readFromXMLFile(other, work("sections.xml").c_str()));
  EXPECT_EQ(getString(other.findField("Note")), "described");
  EXPECT_EQ(getInteger(other.findField("Level")), 3);
  CDescriptionSection absent("Absent");
  EXPECT_FALSE(readFromXMLFile(absent, work("sections.xml").c_str()));
  CDescriptionSection fromSml("Other");
  fromSml.defineFromKeyFile();
  EXPECT_FALSE(readFromXMLFile(fromSml, work("one.sml").c_str()));
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

  resize(info, 2, 2);
  setStringAt(info, 0, 0, "SENSOR");
  setStringAt(info, 0, 1, "ASAR");
  setStringAt(info, 1, 0, "SOFTWARE");
  setStringAt(info, 1, 1, "older");
  writeHeader(h, work("sw").c_str());
  ASSERT_EQ(info->rows(), 2);
  EXPECT_EQ(getStringAt(info, 1, 1), id);

  resize(info, 1, 2);
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
