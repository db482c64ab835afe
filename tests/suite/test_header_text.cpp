// The "_hdr" text form, the installation's description file in that form,
// and the mandatory-field report.
#include <cmath>
#include <string>
#include <vector>

#include "installation.h"
#include "suite/description_header.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;
using vlr_test::WriteFile;

class HeaderText : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    writeKeyFile("Image",
                 "[Image]\nLines = I\nScale = D\nName = S\nTimes = VD\nTags = VS\n"
                 "Grid = MI\nPoints = 2 (Lat = VD, Tag = VS)\n");
    writeKeyFile("Braced", "[Braced]\nNote = S\nLevel = I\n");
    writeKeyFile("EnvisatFixHeader",
                 "[EnvisatFixHeader]\nPRODUCT = S\nABS_ORBIT = I\nLINE_TIME_INTERVAL = S\n");
  }

  CDescriptionHeader header() const {
    return CDescriptionHeader(std::vector<std::string>{"Image", "Braced", "EnvisatFixHeader"});
  }

  int readCode(const std::string& content) {
    WriteFile(work("bad_hdr"), content);
    CDescriptionHeader h = header();
    return RaisedCode([&] { readHeader(h, work("bad").c_str()); });
  }
};

TEST_F(HeaderText, OlderTextFormReadsEveryConstruct) {
  WriteFile(work("older_hdr"),
            "# written by an older release\r\n"
            "[Image]\r\n"
            "Lines = 12\r\n"
            "Lines=1500\r\n"
            "Scale = NaN\n"
            "Name = first, second {x}\n"
            "Times = 1.5, -2e-3 ,  7159012.345\n"
            "Tags = \"a, b\", plain , \"\", \"{brace}\"\n"
            "Unknown = 3\n"
            "a line without an equals sign\n"
            "Grid = {\n"
            "  1, 2, 3\n"
            "  ; a comment inside the block\n"
            "  4, 5, 6\n"
            "}\n"
            "Points = {\n"
            "  45.5, \"near, left\"\n"
            "  , far\n"
            "}\n"
            "Nobody {\n"
            "Note = not mine\n"
            "}\n"
            "Braced\n"
            "{\n"
            "  Note = \"quoted, with commas\"\n"
            "  Level = -4\n"
            "}\n"
            "Level = 99\n"
            "[EnvisatFixHeader]\n"
            "PRODUCT=\"ASA_WSS_1PNPDE20040101_000000_000000002023_00000_00000_0000.N1\"\n"
            "ABS_ORBIT=+09876\n"
            "LINE_TIME_INTERVAL=+1.234567e-03<s>\n");
  CDescriptionHeader h = header();
  ASSERT_TRUE(readHeader(h, work("older").c_str()));
  EXPECT_EQ(getInteger(getField(h, "Image.Lines")), 1500);
  EXPECT_TRUE(std::isnan(getDouble(getField(h, "Image.Scale"))));
  EXPECT_EQ(getString(getField(h, "Image.Name")), "first, second {x}");
  CDescriptionField* times = getField(h, "Image.Times");
  ASSERT_EQ(times->columns(), 3);
  EXPECT_EQ(getDouble(times, 1), -2e-3);
  EXPECT_EQ(getDouble(times, 2), 7159012.345);
  CDescriptionField* tags = getField(h, "Image.Tags");
  ASSERT_EQ(tags->columns(), 4);
  EXPECT_EQ(getString(tags, 0), "a, b");
  EXPECT_EQ(getString(tags, 1), "plain");
  EXPECT_TRUE(tags->isSetAt(0, 2));
  EXPECT_EQ(getString(tags, 2), "");
  EXPECT_EQ(getString(tags, 3), "{brace}");
  CDescriptionField* grid = getField(h, "Image.Grid");
  ASSERT_EQ(grid->rows(), 2);
  ASSERT_EQ(grid->columns(), 3);
  EXPECT_EQ(getIntegerAt(grid, 1, 2), 6);
  const auto& points = getField(h, "Image.Points")->subFields();
  ASSERT_EQ(points[0].columns(), 2);
  EXPECT_EQ(points[0].getDoubleAt(0, 0), 45.5);
  EXPECT_FALSE(points[0].isSetAt(0, 1));
  EXPECT_EQ(points[1].getStringAt(0, 0), "near, left");
  EXPECT_EQ(points[1].getStringAt(0, 1), "far");
  EXPECT_EQ(getString(getField(h, "Braced.Note")), "quoted, with commas");
  EXPECT_EQ(getInteger(getField(h, "Braced.Level")), -4);
  EXPECT_EQ(getString(getField(h, "EnvisatFixHeader.PRODUCT")),
            "ASA_WSS_1PNPDE20040101_000000_000000002023_00000_00000_0000.N1");
  EXPECT_EQ(getInteger(getField(h, "EnvisatFixHeader.ABS_ORBIT")), 9876);
  EXPECT_EQ(getString(getField(h, "EnvisatFixHeader.LINE_TIME_INTERVAL")), "+1.234567e-03<s>");

  // Section by section: every section is there, then one that is not.
  CDescriptionHeader bySection = header();
  EXPECT_TRUE(readHeader(bySection, work("older_hdr").c_str(), 1));
  EXPECT_EQ(getInteger(getField(bySection, "Braced.Level")), -4);
  writeKeyFile("Missing", "[Missing]\nX = I\n");
  CDescriptionHeader wider(std::vector<std::string>{"Image", "Missing"});
  EXPECT_EQ(RaisedCode([&] { readHeader(wider, work("older").c_str(), 1); }), 261122);
}

TEST_F(HeaderText, MalformedTextGivesAClearCode) {
  struct Case {
    const char* what;
    std::string content;
    int code;
  };
  const std::vector<Case> cases = {
      {"integer text", "[Image]\nLines = many\n", 261121},
      {"two values for a number", "[Image]\nLines = 1, 2\n", 261121},
      {"double with a unit", "[Image]\nScale = 1.5<m>\n", 261121},
      {"ragged matrix", "[Image]\nGrid = {\n1, 2\n3\n}\n", 261121},
      {"too many sub-field values", "[Image]\nPoints = {\n1, a, extra\n}\n", 261121},
      {"block for a vector", "[Image]\nTimes = {\n1\n}\n", 261121},
      {"over-long line", "[Image]\nName = " + std::string((1u << 20) + 1, 'n') + "\n", 261121},
      {"bad value in an unknown section", "[Nobody]\nLines = many\n", 0},
      {"unterminated block", "[Image]\nGrid = {\n1, 2\n", 0},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.what);
    EXPECT_EQ(readCode(c.content), c.code);
  }
  WriteFile(work("bad_hdr"), "[Image]\nLines = many\n");
  CDescriptionHeader h = header();
  try {
    readHeader(h, work("bad").c_str());
    FAIL();
  } catch (const CErrorExceptionManager& e) {
    EXPECT_NE(e.extra().find("Image.Lines"), std::string::npos);
  }
}

TEST_F(HeaderText, UnsetMandatoryFieldsAreReported) {
  writeKeyFile("RasterInfo", "[RasterInfo]\nNrOfLinesPerImage = I\nCellType = S\nRowPrefix = I\n");
  WriteFile(inst_.root() + "/mandatory/vlr_raster_file.mandatory",
            "RasterInfo NrOfLinesPerImage\n"
            "RasterInfo.CellType\n"
            "\n"
            "RasterInfo\tRowPrefix\r\n"
            "Sensor SensorName\n");
  CDescriptionHeader h(std::vector<std::string>{"RasterInfo"});
  setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), 10);
  checkMandatoryFields(h);
  const std::string log = processLog();
  EXPECT_EQ(log.find("[NrOfLinesPerImage]"), std::string::npos);
  EXPECT_NE(log.find("Mandatory Field [CellType] is not found in [RasterInfo] section\n"),
            std::string::npos);
  EXPECT_NE(log.find("Mandatory Field [RowPrefix] is not found in [RasterInfo] section\n"),
            std::string::npos);
  EXPECT_NE(log.find("Mandatory Field [SensorName] is not found in [Sensor] section\n"),
            std::string::npos);
}

}  // namespace
