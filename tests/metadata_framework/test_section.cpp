// Sections read and written through their field descriptors.
#include <climits>
#include <cstring>
#include <vector>

#include "metadata_fixture.h"
#include "metadata_framework/general_sar_base.h"
#include "metadata_framework/tessal_xml.h"

namespace {

// A section with a field of every kind, a nested field, a variable-size
// array sized by another field, and an optional field.
class AllTypes : public GeneralSAR_Base {
 public:
  AllTypes() {
    std::strcpy(text, "NOT_AVAILABLE");
    for (int k = 0; k < 3; ++k) {
      std::strcpy(nameStore[k], "unset");
      names[k] = nameStore[k];
    }
    createElementsVector(11);
  }
  AllTypes(const AllTypes&) = delete;
  AllTypes& operator=(const AllTypes&) = delete;

  int createBuffers() override {
    if (checkCount("Count", count, 1000) != 0) return 1;
    series.assign(static_cast<size_t>(count), 0.0);
    refreshParameters();
    return 0;
  }
  int destroyBuffers() override {
    series.clear();
    return 0;
  }

  int i = -999;
  float f = -999.0f;
  double d = -999.0;
  char text[512];
  int ints[3] = {0, 0, 0};
  double doubles[4] = {0, 0, 0, 0};
  char nameStore[3][512];
  char* names[3];
  double nested = -999.0;
  int count = 0;
  std::vector<double> series;
  int optional = 7;

 protected:
  void refreshParameters() override {
    addElementInt("Int", &i, 1, INT_MIN, INT_MAX, true);
    addElementFloat("Float", &f, 1, -1e30f, 1e30f, true);
    addElementDouble("Double", &d, 1, -1e300, 1e300, true);
    addElementString("Text", text, true);
    addElementInt("Ints", ints, 3, INT_MIN, INT_MAX, true);
    addElementDouble("Doubles", doubles, 4, -1e300, 1e300, true);
    addElementString("Names", names, 3, true);
    addElementDouble("Nested/Deep", &nested, 1, -1e300, 1e300, true);
    addElementInt("Count", &count, 1, 0, 1000, true);
    addElementDouble("Series", series.empty() ? nullptr : series.data(),
                     static_cast<int>(series.size()), -1e300, 1e300, true);
    addElementInt("Optional", &optional, 1, 0, 100, false);
    setAllocationFlag(true);
  }
};

void fill(AllTypes& s) {
  s.i = -42;
  s.f = 0.1f;
  s.d = 1.0 / 3.0;
  std::strcpy(s.text, "Text with <markup> & \"quotes\"");
  s.ints[0] = 1, s.ints[1] = INT_MAX, s.ints[2] = INT_MIN;
  s.doubles[0] = 6378137.0, s.doubles[1] = -1e-300, s.doubles[2] = 0.0,
  s.doubles[3] = 299792458.123456;
  std::strcpy(s.names[0], "first");
  std::strcpy(s.names[1], "");
  std::strcpy(s.names[2], "third one");
  s.nested = 2.5;
  s.count = 3;
  s.createBuffers();
  s.series[0] = 10, s.series[1] = 20, s.series[2] = 30;
  s.optional = 55;
}

// A one-field section.
class Single : public GeneralSAR_Base {
 public:
  explicit Single(double v = 0.0) : value(v) { createElementsVector(1); }
  double value;

 protected:
  void refreshParameters() override {
    addElementDouble("Value", &value, 1, -1e300, 1e300, true);
    setAllocationFlag(true);
  }
};

class SectionTest : public MetadataTest {
 protected:
  // Writes a filled AllTypes section and returns the file's text.
  std::string writeAll(const std::string& file) {
    AllTypes out;
    fill(out);
    EXPECT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
    return slurp(file);
  }
  static void replace(std::string& text, const std::string& from, const std::string& to) {
    const size_t at = text.find(from);
    ASSERT_NE(at, std::string::npos) << from;
    text.replace(at, from.size(), to);
  }
};

// Written and read back: every kind of value exactly (floats and doubles with the digits they
// need), the nested path, and the variable-size array sized by its count.
TEST_F(SectionTest, EveryFieldTypeRoundTrips) {
  const std::string file = path("all.xml");
  const std::string xml = writeAll(file);
  AllTypes out, in;
  fill(out);
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_EQ(in.f, 0.1f);
  EXPECT_EQ(in.d, 1.0 / 3.0);  // exact, although 15 digits do not suffice
  EXPECT_STREQ(in.text, out.text);
  EXPECT_EQ(in.ints[2], INT_MIN);
  for (int k = 0; k < 4; ++k) EXPECT_EQ(in.doubles[k], out.doubles[k]) << k;
  for (int k = 0; k < 3; ++k) EXPECT_STREQ(in.names[k], out.names[k]) << k;
  ASSERT_EQ(in.series.size(), 3u);
  EXPECT_EQ(in.series[2], 30.0);
  EXPECT_EQ(in.optional, 55);
  EXPECT_NE(xml.find("<Float>0.100000001490116</Float>"), std::string::npos) << xml;
  EXPECT_NE(xml.find("<Nested>\n        <Deep>2.5</Deep>"), std::string::npos);
}

// Edited files: an optional field may be missing, a mandatory one not; counts the file cannot back
// fail before any allocation; a text longer than its field is refused, not cut.
TEST_F(SectionTest, EditedFilesReadOrFailWithoutHarm) {
  const std::string file = path("edited.xml");
  const std::string good = writeAll(file);
  struct Case {
    const char* from;
    std::string to;
    bool reads;
    int series;  // values read into the array; -1: not checked
  };
  const Case cases[] = {
      {"<Optional>55</Optional>", "", true, 3},
      {"<Text>Text with", "<Txet>Text with", false, -1},
      {"<Count>3</Count>", "<Count>2147483648</Count>", false, 0},
      {"<Count>3</Count>", "<Count>99999999999999999999</Count>", false, 0},
      {"<Count>3</Count>", "<Count>-5</Count>", false, 0},
      {"<Count>3</Count>", "<Count>1001</Count>", false, 0},
      {"<Count>3</Count>", "<Count>2</Count>", true, 2},    // more values than declared
      {"<Count>3</Count>", "<Count>4</Count>", false, -1},  // fewer
      {">first<", ">" + std::string(511, 'x') + "<", true, 3},
      {">first<", ">" + std::string(512, 'x') + "<", false, -1},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.to.substr(0, 40));
    std::string xml = good;
    replace(xml, c.from, c.to);
    spit(file, xml);
    AllTypes in;
    EXPECT_EQ(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"), c.reads);
    if (c.series >= 0) {
      EXPECT_EQ(in.series.size(), static_cast<size_t>(c.series));
    }
    if (c.to.empty()) {
      EXPECT_EQ(in.optional, 7);
    }
    if (c.from[1] == 'f') {
      EXPECT_EQ(std::strlen(in.names[0]), c.reads ? 511u : 5u);  // or "unset" kept
    }
  }
  AllTypes in;
  EXPECT_FALSE(in.readAuxiliaryFile(file.c_str(), 2, "AllTypes"));
  EXPECT_FALSE(in.readAuxiliaryFile(file.c_str(), 1, "Absent"));
  EXPECT_FALSE(in.readAuxiliaryFile(path("no_such_file").c_str(), 1, "AllTypes"));

  // Bytes that are not valid UTF-8 or not allowed in XML are stored as '?', and the other
  // sections of the file stay readable.
  ASSERT_EQ(Single(1.0).writeAuxiliaryFile(file.c_str(), 1, "Other"), 0);
  AllTypes out;
  fill(out);
  std::strcpy(out.text, "bad\x01 byte \xE9t\xC3\xA9");
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_STREQ(in.text, "bad? byte ?t\xC3\xA9");
  Single other;
  ASSERT_TRUE(other.readAuxiliaryFile(file.c_str(), 1, "Other"));
}

TEST_F(SectionTest, SectionsShareAChannelAndRewritingOneLeavesTheOther) {
  const std::string file = path("two.xml");
  ASSERT_EQ(Single(1.5).writeAuxiliaryFile(file.c_str(), 1, "First"), 0);
  ASSERT_EQ(Single(2.5).writeAuxiliaryFile(file.c_str(), 1, "Second"), 0);
  ASSERT_EQ(Single(3.5).writeAuxiliaryFile(file.c_str(), 2, "First"), 0);
  ASSERT_EQ(Single(4.5).writeAuxiliaryFile(file.c_str(), 1, "First"), 0);
  ASSERT_EQ(Single(5.5).writeAuxiliaryFile(file.c_str(), 1, "First"), 0);

  const std::string xml = slurp(file);
  EXPECT_EQ(occurrences(xml, "<First>"), 2);  // once in each channel
  EXPECT_EQ(occurrences(xml, "<Second>"), 1);
  EXPECT_NE(xml.find("<NumberOfChannels>2</NumberOfChannels>"), std::string::npos);
  Single first, second, other;
  ASSERT_TRUE(first.readAuxiliaryFile(file.c_str(), 1, "First"));
  ASSERT_TRUE(second.readAuxiliaryFile(file.c_str(), 1, "Second"));
  ASSERT_TRUE(other.readAuxiliaryFile(file.c_str(), 2, "First"));
  EXPECT_EQ(first.value, 5.5);
  EXPECT_EQ(second.value, 2.5);
  EXPECT_EQ(other.value, 3.5);
}

// Sections written while the file is held go into one document in memory:
// readers see them, the file is written once at save(), byte for byte as the
// same writes one by one make it, and a hold given up leaves the file alone.
TEST_F(SectionTest, HeldDocumentIsWrittenOnceAsTheSectionsWouldWriteIt) {
  const std::string held = path("held.xml");
  const std::string direct = path("direct.xml");
  const std::string other = path("other.xml");
  const auto writeAll = [](const std::string& f) {
    ASSERT_EQ(Single(2.5).writeAuxiliaryFile(f.c_str(), 1, "First"), 0);
    ASSERT_EQ(Single(3.5).writeAuxiliaryFile(f.c_str(), 2, "First"), 0);
    ASSERT_EQ(Single(4.5).writeAuxiliaryFile(f.c_str(), 1, "Old"), 0);
  };
  for (const std::string& f : {held, direct})
    ASSERT_EQ(Single(1.0).writeAuxiliaryFile(f.c_str(), 1, "Old"), 0);
  const std::string before = slurp(held);
  writeAll(direct);
  {
    HeldXmlDocument hold(held.c_str());
    writeAll(held);
    ASSERT_EQ(Single(9.5).writeAuxiliaryFile(other.c_str(), 1, "First"), 0);
    EXPECT_EQ(slurp(held), before);
    EXPECT_NE(slurp(other).find("<Value>9.5</Value>"), std::string::npos);
    Single seen;
    ASSERT_TRUE(seen.readAuxiliaryFile(held.c_str(), 2, "First"));
    EXPECT_EQ(seen.value, 3.5);
    ASSERT_EQ(hold.save(), 0);
  }
  EXPECT_EQ(slurp(held), slurp(direct));

  {
    HeldXmlDocument abandoned(held.c_str());
    ASSERT_EQ(Single(7.5).writeAuxiliaryFile(held.c_str(), 1, "Old"), 0);
  }
  EXPECT_EQ(slurp(held), slurp(direct));
  ASSERT_EQ(Single(8.5).writeAuxiliaryFile(held.c_str(), 1, "Old"), 0);
  EXPECT_NE(slurp(held).find("<Value>8.5</Value>"), std::string::npos);
}

TEST_F(SectionTest, CopiesReadIntoTheirOwnMembers) {
  const std::string file = path("copy.xml");
  ASSERT_EQ(Single(9.0).writeAuxiliaryFile(file.c_str(), 1, "S"), 0);
  Single original(1.0);
  Single copy = original;
  Single assigned;
  assigned = original;
  ASSERT_TRUE(copy.readAuxiliaryFile(file.c_str(), 1, "S"));
  ASSERT_TRUE(assigned.readAuxiliaryFile(file.c_str(), 1, "S"));
  EXPECT_EQ(copy.value, 9.0);
  EXPECT_EQ(assigned.value, 9.0);
  EXPECT_EQ(original.value, 1.0);
}

}  // namespace
