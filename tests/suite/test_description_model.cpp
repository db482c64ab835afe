// The header model: sections from key files, typed access, paths and copies.
#include <cmath>
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

TEST_F(DescriptionModel, KeyFileWordsGiveShapesAndTypes) {
  CDescriptionSection section("Alpha");
  section.defineFromKeyFile();
  ASSERT_EQ(section.fieldCount(), 8);
  struct Expected {
    const char* name;
    CVLR_FieldShape shape;
    CVLR_FieldType type;
  };
  const Expected expected[] = {
      {"Count", CVLR_FieldShape::Scalar, CVLR_FieldType::Integer},
      {"Scale", CVLR_FieldShape::Scalar, CVLR_FieldType::Double},
      {"Label", CVLR_FieldShape::Scalar, CVLR_FieldType::String},
      {"Times", CVLR_FieldShape::Vector, CVLR_FieldType::Double},
      {"Grid", CVLR_FieldShape::Matrix, CVLR_FieldType::Integer},
      {"Names", CVLR_FieldShape::Vector, CVLR_FieldType::String},
      {"CellType", CVLR_FieldShape::Scalar, CVLR_FieldType::String},
      {"Points", CVLR_FieldShape::Multiple, CVLR_FieldType::FieldOfSection},
  };
  for (int i = 0; i < section.fieldCount(); ++i) {
    SCOPED_TRACE(expected[i].name);
    EXPECT_EQ(section.field(i).name(), expected[i].name);
    EXPECT_EQ(section.field(i).shape(), expected[i].shape);
    EXPECT_EQ(section.field(i).type(), expected[i].type);
    EXPECT_FALSE(section.field(i).isSet());
  }
  const CDescriptionField* points = section.findField("Points");
  ASSERT_EQ(points->columns(), 2);
  EXPECT_EQ(points->subFields()[0].name(), "Lat");
  EXPECT_EQ(points->subFields()[1].type(), CVLR_FieldType::String);
  EXPECT_EQ(section.findField("Ignored"), nullptr);
  EXPECT_EQ(section.findField("NotMine"), nullptr);
}

TEST_F(DescriptionModel, BadKeyFilesRaiseClearCodes) {
  const struct {
    const char* content;
    int code;
  } cases[] = {
      {"[Gamma]\nBad = X\n", vlr::kCodeFieldType},
      {"[Gamma]\nBad = VX\n", vlr::kCodeFieldType},
      {"[Gamma]\nBad =\n", vlr::kCodeFieldType},
      {"[Gamma]\nTwice = I\nTwice = D\n", vlr::kCodeFieldType},
      {"[Gamma]\nShort = 3 (A = VD, B = VI)\n", vlr::kCodeFieldType},
      {"[Gamma]\nHuge = 99999999 (A = VD)\n", vlr::kCodeKeyFileMissing},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.content);
    writeKeyFile("Gamma", c.content);
    CDescriptionSection section("Gamma");
    EXPECT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), c.code);
  }
  // A name longer than a field name may be, and a line longer than a key
  // line may be.
  writeKeyFile("Gamma", "[Gamma]\n" + std::string(200, 'N') + " = I\n");
  CDescriptionSection longName("Gamma");
  EXPECT_EQ(RaisedCode([&] { longName.defineFromKeyFile(); }), vlr::kCodeFieldType);
  writeKeyFile("Gamma", "[Gamma]\nA = S" + std::string(100000, ' ') + "\n");
  CDescriptionSection longLine("Gamma");
  EXPECT_EQ(RaisedCode([&] { longLine.defineFromKeyFile(); }), vlr::kCodeFieldType);

  CDescriptionSection missing("NoSuchSection");
  EXPECT_EQ(RaisedCode([&] { missing.defineFromKeyFile(); }), vlr::kCodeKeyFileMissing);
  EXPECT_EQ(RaisedCode([&] { CDescriptionHeader h("Alpha", "Missing", nullptr); }),
            vlr::kCodeKeyFileMissing);
}

TEST_F(DescriptionModel, HundredThousandFieldsAreRefusedNotAllocated) {
  std::string content = "[Many]\n";
  for (int i = 0; i < 100000; ++i) content += "F" + std::to_string(i) + " = D\n";
  writeKeyFile("Many", content);
  CDescriptionSection section("Many");
  EXPECT_EQ(RaisedCode([&] { section.defineFromKeyFile(); }), vlr::kCodeKeyFileMissing);
  EXPECT_EQ(section.fieldCount(), CVLR_DS_MAX_NBR_FIELDS);
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
}

TEST_F(DescriptionModel, TypedAccessChecksTypeAndBounds) {
  CDescriptionHeader header("Alpha", nullptr);
  CDescriptionField* count = getField(header, "Count");
  CDescriptionField* times = getField(header, "Times");
  CDescriptionField* grid = getField(header, "Grid");
  setInteger(count, -7);
  EXPECT_TRUE(isSet(count));
  EXPECT_EQ(getInteger(count), -7);
  EXPECT_EQ(RaisedCode([&] { getDouble(count); }), vlr::kCodeFieldType);
  EXPECT_EQ(RaisedCode([&] { setString(count, "x"); }), vlr::kCodeFieldType);

  setNumberOfElements(times, 3);
  setDouble(times, 2, 7159012.345);
  EXPECT_FALSE(isSet(times));  // element 0 never written
  setDouble(times, 0, 1e-6);
  EXPECT_TRUE(isSet(times));
  EXPECT_EQ(getDouble(times, 2), 7159012.345);
  EXPECT_EQ(getDouble(times, 1), 0.0);
  EXPECT_EQ(RaisedCode([&] { getDouble(times, 3); }), vlr::kCodeFieldType);
  EXPECT_EQ(RaisedCode([&] { setDouble(times, -1, 1.0); }), vlr::kCodeFieldType);

  resize(grid, 2, 3);
  setIntegerAt(grid, 1, 2, 12);
  setIntegerAt(grid, 0, 0, 1);
  resize(grid, 3, 4);  // kept elements stay where they were
  EXPECT_EQ(getIntegerAt(grid, 1, 2), 12);
  EXPECT_EQ(getIntegerAt(grid, 0, 0), 1);
  EXPECT_FALSE(grid->isSetAt(2, 3));
  EXPECT_EQ(RaisedCode([&] { resize(grid, -1, 2); }), vlr::kCodeFieldType);
  EXPECT_EQ(RaisedCode([&] { resize(grid, 1 << 15, 1 << 15); }), vlr::kCodeFieldType);

  CDescriptionField* points = getField(header, "Points");
  setNumberOfElements(points, 4);
  EXPECT_EQ(points->subFields()[0].columns(), 4);
  EXPECT_EQ(points->subFields()[1].columns(), 4);
  EXPECT_EQ(RaisedCode([&] { getInteger(points); }), vlr::kCodeFieldType);
  writeKeyFile("Gamma", "[Gamma]\nMixed = 2 (A = VD, B = D)\n");
  CDescriptionHeader mixed("Gamma", nullptr);
  EXPECT_EQ(RaisedCode([&] { setNumberOfElements(getField(mixed, "Mixed"), 2); }),
            vlr::kCodeFieldType);
}

TEST_F(DescriptionModel, CopiesTakeShapeAndValuesOfTheSource) {
  CDescriptionHeader source("Alpha", nullptr);
  CDescriptionHeader target("Alpha", nullptr);
  setNumberOfElements(getField(source, "Times"), 2);
  setDouble(getField(source, "Times"), 0, std::nan(""));
  setDouble(getField(source, "Times"), 1, -0.25);
  resize(getField(source, "Grid"), 2, 2);
  setIntegerAt(getField(source, "Grid"), 1, 1, 5);
  setString(getField(source, "Label"), "<&>");
  CDescriptionField* points = getField(source, "Points");
  setNumberOfElements(points, 2);
  points->subFields()[0].setDoubleAt(0, 1, 45.5);
  points->subFields()[1].setStringAt(0, 0, "north");
  // A target value that the source leaves unset does not survive the copy.
  setIntegerAt(getField(target, "Grid"), 0, 0, 99);

  for (const char* name : {"Times", "Grid", "Label", "Points"})
    copyField(getField(target, name), getField(source, name));
  EXPECT_EQ(getField(target, "Times")->columns(), 2);
  EXPECT_TRUE(std::isnan(getDouble(getField(target, "Times"), 0)));
  EXPECT_EQ(getDouble(getField(target, "Times"), 1), -0.25);
  EXPECT_EQ(getIntegerAt(getField(target, "Grid"), 1, 1), 5);
  EXPECT_FALSE(getField(target, "Grid")->isSetAt(0, 0));
  EXPECT_EQ(getString(getField(target, "Label")), "<&>");
  const auto& copied = getField(target, "Points")->subFields();
  EXPECT_EQ(copied[0].getDoubleAt(0, 1), 45.5);
  EXPECT_EQ(copied[1].getStringAt(0, 0), "north");

  EXPECT_EQ(RaisedCode([&] { copyField(getField(target, "Count"), getField(source, "Scale")); }),
            vlr::kCodeFieldType);
  EXPECT_EQ(RaisedCode([&] { copyField(getField(target, "Times"), points); }), vlr::kCodeFieldType);
}

TEST_F(DescriptionModel, DumpsNameShapeTypeAndFirstValue) {
  CDescriptionHeader header("Alpha", nullptr);
  setNumberOfElements(getField(header, "Times"), 2);
  setDouble(getField(header, "Times"), 0, 0.1);
  setString(getField(header, "Label"), "abc");
  resize(getField(header, "Grid"), 2, 3);
  EXPECT_EQ(getField(header, "Times")->dumpText(),
            "[Times]  [VECTOR]  [Double]  [Number of elements : 2]  =  0.1");
  EXPECT_EQ(getField(header, "Label")->dumpText(), "[Label]  [SCALAR]  [String]  =  [abc]");
  EXPECT_EQ(getField(header, "Grid")->dumpText(),
            "[Grid]  [MARTIX]  [Integer]  [Row Nbr : 2]  [Col Nbr : 3] : EMPTY");
  EXPECT_EQ(findSection(header, "Alpha")->dumpText().substr(0, 53),
            "\n\n << [Alpha]  -  Total number of Fields : 8 >>\n\n[Cou");
}

}  // namespace
