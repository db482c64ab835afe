// The header model: key files that define sections, and the paths that find fields.
#include <string>

#include "suite/description_header.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;

class DescriptionModel : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    writeKeyFile("Alpha",
                 "# fields of the first test section\n"
                 "[Other]\n"
                 "Ignored = I\n"
                 "[Alpha]\n"
                 "Count = I\n"
                 "Scale\t=\tF\n"
                 "Label = S\n"
                 "Times = VD\n"
                 "Grid = MI\n"
                 "Names = VS\n"
                 "CellType = S\n"
                 "Points = 2 (Lat = VD, Tag = VS)\n"
                 "[Beta]\n"
                 "NotMine = I\n");
    writeKeyFile("Beta", " [Beta]\nCellType = S\nExtra = MD\n");
  }
};

TEST_F(DescriptionModel, BadKeyFilesRaiseClearCodes) {
  const struct {
    std::string content;
    int code;
  } cases[] = {
      {"[Gamma]\nBad = X\n", vlr::kCodeFieldType},
      {"[Gamma]\nBad = VX\n", vlr::kCodeFieldType},
      {"[Gamma]\nBad =\n", vlr::kCodeFieldType},
      {"[Gamma]\nTwice = I\nTwice = D\n", vlr::kCodeFieldType},
      {"[Gamma]\nShort = 3 (A = VD, B = VI)\n", vlr::kCodeFieldType},
      {"[Gamma]\nHuge = 99999999 (A = VD)\n", vlr::kCodeKeyFileMissing},
      {"[Gamma]\n" + std::string(200, 'N') + " = I\n", vlr::kCodeFieldType},      // over-long name
      {"[Gamma]\nA = S" + std::string(100000, ' ') + "\n", vlr::kCodeFieldType},  // long line
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.content.substr(0, 40));
    writeKeyFile("Gamma", c.content);
    CDescriptionSection section("Gamma");
    EXPECT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), c.code);
  }
  // Too many fields are refused at the limit, not allocated.
  std::string many = "[Gamma]\n";
  for (int i = 0; i < 100000; ++i) many += "F" + std::to_string(i) + " = D\n";
  writeKeyFile("Gamma", many);
  CDescriptionSection section("Gamma");
  EXPECT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), vlr::kCodeKeyFileMissing);
  EXPECT_EQ(section.fieldCount(), CVLR_DS_MAX_NBR_FIELDS);

  CDescriptionSection missing("NoSuchSection");
  EXPECT_EQ(RaisedCode([&] { missing.defineFromKeyFile(); }), vlr::kCodeKeyFileMissing);
  EXPECT_EQ(RaisedCode([&] { CDescriptionHeader h("Alpha", "Missing", nullptr); }),
            vlr::kCodeKeyFileMissing);
}

TEST_F(DescriptionModel, PathsFindTheSectionOrTheFirstField) {
  CDescriptionHeader header("Alpha", "Beta", nullptr);
  EXPECT_EQ(header.mInitialTag, "HEADER_INFO");
  CDescriptionField* first = getField(header, "CellType");
  CDescriptionField* beta = getField(header, "Beta.CellType");
  EXPECT_EQ(first, findSection(header, "Alpha")->findField("CellType"));
  EXPECT_EQ(beta, findSection(header, "Beta")->findField("CellType"));
  EXPECT_NE(first, beta);
  EXPECT_EQ(getField(header, "Extra"), findSection(header, "Beta")->findField("Extra"));
  for (const char* path : {"Nothing", "Beta.Count", "Gamma.Count", ".", ""}) {
    SCOPED_TRACE(path);
    EXPECT_EQ(RaisedCode([&] { getField(header, path); }), vlr::kCodeFieldNotFound);
  }
  EXPECT_EQ(findSection(header, "Gamma"), nullptr);
  // Only the lines under the section's own title define it; "F" is a double.
  EXPECT_EQ(findSection(header, "Alpha")->fieldCount(), 8);
  EXPECT_EQ(findSection(header, "Alpha")->findField("NotMine"), nullptr);
  EXPECT_EQ(getField(header, "Scale")->type(), CVLR_FieldType::Double);
}

}  // namespace
