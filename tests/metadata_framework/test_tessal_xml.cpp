// The XML auxiliary document on its own: layout, list form, damaged files.
#include <string>
#include <vector>

#include "metadata_fixture.h"
#include "metadata_framework/tessal_xml.h"

namespace {

class TessalXmlTest : public MetadataTest {
 protected:
  // A document of ours with the given channel content.
  std::string withChannel(const std::string& content) {
    return "<?xml version=\"1.0\"?>\n<TessalXmlDoc><NumberOfChannels>1</NumberOfChannels>"
           "<Description>d</Description><Channel Number=\"1\">" +
           content + "</Channel></TessalXmlDoc>\n";
  }
};

TEST_F(TessalXmlTest, NewDocumentIsWrittenInTheExpectedForm) {
  const std::string file = path("new.xml");
  tessalxml doc(file.c_str());
  const int ints[2] = {4, -5};
  ASSERT_EQ(doc.writeInt(1, "Sec/Count", ints, 1), 0);
  ASSERT_EQ(doc.writeInt(1, "Sec/Pair", ints, 2), 0);
  ASSERT_EQ(doc.writeString(1, "Sec/Name", "a & b"), 0);
  ASSERT_EQ(doc.write(), 0);
  EXPECT_EQ(slurp(file),
            "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"
            "<TessalXmlDoc>\n"
            "  <NumberOfChannels>1</NumberOfChannels>\n"
            "  <Description>My description</Description>\n"
            "  <Channel Number=\"1\">\n"
            "    <Sec>\n"
            "      <Count>4</Count>\n"
            "      <Pair>\n"
            "        <val N=\"1\">4</val>\n"
            "        <val N=\"2\">-5</val>\n"
            "      </Pair>\n"
            "      <Name>a &amp; b</Name>\n"
            "    </Sec>\n"
            "  </Channel>\n"
            "</TessalXmlDoc>\n");
  EXPECT_EQ(doc.numberOfChannels(), 1);

  ASSERT_EQ(doc.setDescription(file.c_str(), "Sub-swath 1"), 0);
  tessalxml again(file.c_str());
  EXPECT_NE(slurp(file).find("<Description>Sub-swath 1</Description>"), std::string::npos);
  int count = 0;
  EXPECT_EQ(again.readInt(1, "Sec/Count", &count, 1), 0);
  EXPECT_EQ(count, 4);
}

TEST_F(TessalXmlTest, OlderListFormIsReadLikeValChildren) {
  const std::string file = path("list.xml");
  spit(file, withChannel("<S><D>1.5, -2.5e3,3</D><I>7, 8, 9</I><One>12abc</One>"
                         "<None>abc</None><T>alpha, beta gamma ,delta</T>"
                         "<Short>1, 2</Short><Unordered><val N=\"2\">b</val><val>x</val>"
                         "<val N=\"1\">5</val><val N=\"9\">9</val></Unordered></S>"));
  tessalxml doc(file.c_str());
  double d[3] = {0, 0, 0};
  ASSERT_EQ(doc.readDouble(1, "S/D", d, 3), 0);
  EXPECT_EQ(std::vector<double>(d, d + 3), (std::vector<double>{1.5, -2500.0, 3.0}));
  int i[3] = {0, 0, 0};
  ASSERT_EQ(doc.readInt(1, "S/I", i, 3), 0);
  EXPECT_EQ(i[2], 9);
  int one = -1, none = -1;
  EXPECT_EQ(doc.readInt(1, "S/One", &one, 1), 0);
  EXPECT_EQ(one, 12);
  EXPECT_EQ(doc.readInt(1, "S/None", &none, 1), 0);
  EXPECT_EQ(none, 0);
  char a[16], b[16], c[16];
  char* t[3] = {a, b, c};
  ASSERT_EQ(doc.readString(1, "S/T", t, 3, sizeof a), 0);
  EXPECT_EQ(std::vector<std::string>(t, t + 3),
            (std::vector<std::string>{"alpha", "beta gamma", "delta"}));
  // Fewer items than asked: the items present are stored, the rest kept.
  float f[3] = {-1, -1, -1};
  EXPECT_EQ(doc.readFloat(1, "S/Short", f, 3), 1);
  EXPECT_EQ(std::vector<float>(f, f + 3), (std::vector<float>{1, 2, -1}));
  // val children are placed by N; without N by their order; out-of-range N ignored.
  int u[2] = {0, 0};
  ASSERT_EQ(doc.readInt(1, "S/Unordered", u, 2), 0);
  EXPECT_EQ(u[0], 5);
  EXPECT_EQ(u[1], 0);
}

TEST_F(TessalXmlTest, DamagedOrForeignFilesAreTreatedAsAbsent) {
  const std::string file = path("damaged.xml");
  const std::string good = withChannel("<S><V>1</V></S>");
  const std::string cases[] = {
      good.substr(0, good.size() / 2),
      std::string("\0\x01\xff\xfe garbage", 13),
      "",
      "<?xml version=\"1.0\"?><Other><NumberOfChannels>1</NumberOfChannels>"
      "<Description>d</Description></Other>",
      "<?xml version=\"1.0\"?><TessalXmlDoc><Description>d</Description></TessalXmlDoc>",
      "<?xml version=\"1.0\"?><TessalXmlDoc><NumberOfChannels>1</NumberOfChannels>"
      "</TessalXmlDoc>",
      "<?xml version=\"1.0\"?><!DOCTYPE TessalXmlDoc [<!ENTITY a \"aaaaaaaaaa\">"
      "<!ENTITY b \"&a;&a;&a;&a;&a;&a;&a;&a;&a;&a;\">]>"
      "<TessalXmlDoc><NumberOfChannels>1</NumberOfChannels><Description>d</Description>"
      "<Channel Number=\"1\"><S><V>&b;</V></S></Channel></TessalXmlDoc>",
  };
  for (const std::string& content : cases) {
    spit(file, content);
    tessalxml doc;
    EXPECT_EQ(doc.initXmlFile(file.c_str()), 1) << content;
    char v[512] = "unchanged";
    EXPECT_EQ(doc.readString(1, "S/V", v), 1);
    EXPECT_STREQ(v, "unchanged");
    // The next write starts a new document.
    const int one = 1;
    ASSERT_EQ(doc.writeInt(2, "S/W", &one, 1), 0);
    ASSERT_EQ(doc.write(), 0);
    tessalxml reread;
    EXPECT_EQ(reread.initXmlFile(file.c_str()), 0);
    EXPECT_EQ(reread.numberOfChannels(), 1);
  }
  spit(file, good);
  tessalxml doc;
  EXPECT_EQ(doc.initXmlFile(file.c_str()), 0);
  EXPECT_EQ(doc.initXmlFile(path("absent.xml").c_str()), 1);
  EXPECT_EQ(doc.initXmlFile(dir_.c_str()), 1);
}

TEST_F(TessalXmlTest, BadPathsAndUnwritableFilesFail) {
  tessalxml doc(path("p.xml").c_str());
  const double v = 1.0;
  EXPECT_EQ(doc.writeDouble(1, "Bad name/V", &v, 1), 1);
  EXPECT_EQ(doc.writeDouble(1, "S/1V", &v, 1), 1);
  EXPECT_EQ(doc.writeDouble(1, "", &v, 1), 1);
  spit(path("n.xml"),
       "<TessalXmlDoc><NumberOfChannels>2147483647</NumberOfChannels>"
       "<Description/></TessalXmlDoc>");
  tessalxml full(path("n.xml").c_str());
  EXPECT_EQ(full.writeDouble(5, "S/V", &v, 1), 0);
  EXPECT_EQ(full.numberOfChannels(), 2147483647);
  tessalxml nowhere(path("missing_dir/x.xml").c_str());
  ASSERT_EQ(nowhere.writeDouble(1, "S/V", &v, 1), 0);
  EXPECT_EQ(nowhere.write(), 5);
}

}  // namespace
