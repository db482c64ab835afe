// Sections read and written through their field descriptors.
#include <climits>
#include <cstring>
#include <vector>

#include "metadata/general_sar_base.h"
#include "metadata_fixture.h"

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
    createElementsVector(12);
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
  float floats[2] = {0, 0};
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
    addElementFloat("Floats", floats, 2, -1e30f, 1e30f, true);
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
  s.floats[0] = 1.5f, s.floats[1] = -2.25e-20f;
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

class SectionTest : public MetadataTest {};

TEST_F(SectionTest, EveryFieldTypeRoundTrips) {
  const std::string file = path("all.xml");
  AllTypes out;
  fill(out);
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);

  AllTypes in;
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_EQ(in.i, -42);
  EXPECT_EQ(in.f, 0.1f);
  EXPECT_EQ(in.d, 1.0 / 3.0);
  EXPECT_STREQ(in.text, out.text);
  EXPECT_EQ(in.ints[1], INT_MAX);
  EXPECT_EQ(in.ints[2], INT_MIN);
  EXPECT_EQ(in.floats[1], -2.25e-20f);
  for (int k = 0; k < 4; ++k) EXPECT_EQ(in.doubles[k], out.doubles[k]) << k;
  EXPECT_STREQ(in.names[0], "first");
  EXPECT_STREQ(in.names[1], "");
  EXPECT_STREQ(in.names[2], "third one");
  EXPECT_EQ(in.nested, 2.5);
  ASSERT_EQ(in.series.size(), 3u);
  EXPECT_EQ(in.series[2], 30.0);
  EXPECT_EQ(in.optional, 55);

  const std::string xml = slurp(file);
  EXPECT_EQ(xml.rfind("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<TessalXmlDoc>\n", 0), 0u)
      << xml;
  EXPECT_NE(xml.find("<NumberOfChannels>1</NumberOfChannels>"), std::string::npos);
  EXPECT_NE(xml.find("<Description>My description</Description>"), std::string::npos);
  EXPECT_NE(xml.find("<Channel Number=\"1\">"), std::string::npos);
  EXPECT_NE(xml.find("    <AllTypes>\n      <Int>-42</Int>\n"), std::string::npos) << xml;
  EXPECT_NE(xml.find("<Float>0.100000001490116</Float>"), std::string::npos);
  EXPECT_NE(xml.find("<val N=\"2\">2147483647</val>"), std::string::npos);
  EXPECT_NE(xml.find("<Names N=\"3\">third one</Names>"), std::string::npos);
  EXPECT_NE(xml.find("<Nested>\n        <Deep>2.5</Deep>"), std::string::npos) << xml;
}

TEST_F(SectionTest, OptionalFieldMissingKeepsDefaultMandatoryMissingFails) {
  const std::string file = path("partial.xml");
  AllTypes out;
  fill(out);
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
  std::string xml = slurp(file);
  const size_t at = xml.find("<Optional>55</Optional>");
  ASSERT_NE(at, std::string::npos);
  spit(file, xml.erase(at, std::strlen("<Optional>55</Optional>")));

  AllTypes in;
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_EQ(in.optional, 7);
  EXPECT_EQ(in.i, -42);

  xml = slurp(file);
  const size_t text = xml.find("<Text>");
  spit(file, xml.replace(text, 6, "<Txet>").replace(xml.find("</Text>"), 7, "</Txet>"));
  AllTypes missing;
  EXPECT_FALSE(missing.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_FALSE(missing.readAuxiliaryFile(file.c_str(), 2, "AllTypes"));
  EXPECT_FALSE(missing.readAuxiliaryFile(file.c_str(), 1, "Absent"));
  EXPECT_FALSE(missing.readAuxiliaryFile(path("no_such_file").c_str(), 1, "AllTypes"));
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
  EXPECT_EQ(occurrences(xml, "<Channel "), 2);
  EXPECT_NE(xml.find("<NumberOfChannels>2</NumberOfChannels>"), std::string::npos);

  Single first, second, other;
  ASSERT_TRUE(first.readAuxiliaryFile(file.c_str(), 1, "First"));
  ASSERT_TRUE(second.readAuxiliaryFile(file.c_str(), 1, "Second"));
  ASSERT_TRUE(other.readAuxiliaryFile(file.c_str(), 2, "First"));
  EXPECT_EQ(first.value, 5.5);
  EXPECT_EQ(second.value, 2.5);
  EXPECT_EQ(other.value, 3.5);
}

TEST_F(SectionTest, OneObjectReadsAndWritesSeveralSectionsOfAFile) {
  const std::string file = path("set.xml");
  Single s(8.0);
  s.setAuxiliaryFile(file.c_str(), 3, "Block/Inner");
  ASSERT_EQ(s.writeAuxiliaryFile(), 0);
  s.value = 0.0;
  ASSERT_EQ(s.readAuxiliaryFile(), 0);
  EXPECT_EQ(s.value, 8.0);
  s.unsetAuxiliaryFile();
  EXPECT_NE(s.readAuxiliaryFile(), 0);
  EXPECT_NE(slurp(file).find("<Block>\n      <Inner>\n        <Value>8</Value>"), std::string::npos)
      << slurp(file);
}

TEST_F(SectionTest, CopiesReadIntoTheirOwnMembers) {
  const std::string file = path("copy.xml");
  ASSERT_EQ(Single(9.0).writeAuxiliaryFile(file.c_str(), 1, "S"), 0);
  Single original(1.0);
  Single copy = original;
  ASSERT_TRUE(copy.readAuxiliaryFile(file.c_str(), 1, "S"));
  EXPECT_EQ(copy.value, 9.0);
  EXPECT_EQ(original.value, 1.0);
  Single assigned;
  assigned = original;
  ASSERT_TRUE(assigned.readAuxiliaryFile(file.c_str(), 1, "S"));
  EXPECT_EQ(assigned.value, 9.0);
  EXPECT_EQ(original.value, 1.0);
  EXPECT_EQ(copy.element(0).value, &copy.value);
}

TEST_F(SectionTest, HostileSizesFailBeforeAnyAllocation) {
  const std::string file = path("hostile.xml");
  AllTypes out;
  fill(out);
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
  const std::string good = slurp(file);
  auto withCount = [&](const std::string& count) {
    std::string xml = good;
    xml.replace(xml.find("<Count>3</Count>"), 16, "<Count>" + count + "</Count>");
    spit(file, xml);
  };
  for (const char* count : {"2147483648", "99999999999999999999", "-5", "1001"}) {
    withCount(count);
    AllTypes in;
    EXPECT_FALSE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes")) << count;
    EXPECT_TRUE(in.series.empty()) << count;
  }
  // More values in the file than the field holds: only the declared ones are read.
  withCount("2");
  AllTypes in;
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_EQ(in.series.size(), 2u);
  EXPECT_EQ(in.series[1], 20.0);
  // A declared size with fewer values in the file fails.
  withCount("4");
  AllTypes shortRead;
  EXPECT_FALSE(shortRead.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
}

TEST_F(SectionTest, OverlongStringFailsInsteadOfOverflowing) {
  const std::string file = path("long.xml");
  AllTypes out;
  fill(out);
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
  std::string xml = slurp(file);
  const std::string original = "<Names N=\"1\">first</Names>";
  xml.replace(xml.find(original), original.size(),
              "<Names N=\"1\">" + std::string(511, 'x') + "</Names>");
  spit(file, xml);
  AllTypes fits;
  ASSERT_TRUE(fits.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_EQ(std::strlen(fits.names[0]), 511u);

  xml.replace(xml.find("xxx"), 0, "x");
  spit(file, xml);
  AllTypes tooLong;
  EXPECT_FALSE(tooLong.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_STREQ(tooLong.names[0], "unset");
}

TEST_F(SectionTest, UnsafeTextIsStoredAsAReadableDocument) {
  const std::string file = path("bytes.xml");
  ASSERT_EQ(Single(1.0).writeAuxiliaryFile(file.c_str(), 1, "Other"), 0);
  AllTypes out;
  fill(out);
  std::strcpy(out.text, "bad\x01 byte \xE9t\xC3\xA9");
  ASSERT_EQ(out.writeAuxiliaryFile(file.c_str(), 1, "AllTypes"), 0);
  AllTypes in;
  ASSERT_TRUE(in.readAuxiliaryFile(file.c_str(), 1, "AllTypes"));
  EXPECT_STREQ(in.text, "bad? byte ?t\xC3\xA9");
  Single other;
  ASSERT_TRUE(other.readAuxiliaryFile(file.c_str(), 1, "Other"));
  EXPECT_EQ(other.value, 1.0);
}

TEST_F(SectionTest, SectionWithoutBuffersIsNotWritten) {
  class NoBuffers : public Single {
   public:
    NoBuffers() { setAllocationFlag(false); }
  };
  const std::string file = path("nobuf.xml");
  ASSERT_EQ(Single(1.0).writeAuxiliaryFile(file.c_str(), 1, "S"), 0);
  const std::string before = slurp(file);
  NoBuffers s;
  EXPECT_EQ(s.writeAuxiliaryFile(file.c_str(), 1, "S"), 1);
  EXPECT_EQ(slurp(file), before);
  EXPECT_FALSE(s.readAuxiliaryFile(file.c_str(), 1, "S"));
}

TEST_F(SectionTest, RegistrationMustMatchTheDeclaredCount) {
  class Miscounted : public GeneralSAR_Base {
   public:
    int declare(int n) { return createElementsVector(n); }
    int overflow() { return addElementInt("Extra", &x, 1, 0, 1, true); }
    int x = 0, y = 0;

   protected:
    void refreshParameters() override {
      addElementInt("X", &x, 1, 0, 1, true);
      addElementInt("Y", &y, 1, 0, 1, true);
    }
  };
  Miscounted m;
  EXPECT_EQ(m.overflow(), 1);  // no vector yet
  EXPECT_EQ(m.declare(2), 0);
  EXPECT_EQ(m.declare(3), 1);
  EXPECT_EQ(m.declare(1), 1);
  EXPECT_EQ(m.elementCount(), 1);
}

TEST_F(SectionTest, ConfigurationFileIsReadFromTheSection) {
  const std::string file = path("conf.xml");
  tessalxml doc(file.c_str());
  ASSERT_EQ(doc.writeString(1, "Proc/ConfigurationFile", "/etc/proc.ini"), 0);
  ASSERT_EQ(doc.write(), 0);
  Single s;
  char out[512] = "";
  EXPECT_TRUE(s.getConfigurationFile(file.c_str(), 1, "Proc", out));
  EXPECT_STREQ(out, "/etc/proc.ini");
  EXPECT_FALSE(s.getConfigurationFile(file.c_str(), 1, "Other", out));
}

}  // namespace
