// Parser layouts and the written form of parameter files.
#include <utility>
#include <vector>

#include "profile_fixture.h"

namespace {

using ProfileParser = ProfileTest;

// A file's text, the values its keys read as ("<absent>" when not found),
// and the file SyncProfile writes from it (nothing checked when empty).
struct Layout {
  const char* text;
  std::vector<std::pair<std::string, std::string>> values;  // "section/key", value
  const char* written;
};

TEST_F(ProfileParser, Layouts) {
  // clang-format off
  const std::vector<Layout> layouts = {
      // Blanks around key and value are trimmed, tabs after '=' kept;
      // matching is exact and case-sensitive.
      {"[S]\nK1=Value\nK2 = Value\n   K3    =    Value   \nK4 =\tValue\nK5 = two  words \n",
       {{"S/K1", "Value"}, {"S/K3", "Value"}, {"S/K4", "\tValue"}, {"S/K5", "two  words"},
        {"s/K1", "<absent>"}, {"S/k1", "<absent>"}},
       ""},
      // Text before any section and after ']' is ignored; '=' and brackets
      // inside a value are part of it.
      {"K = before any section\n[ S ] rest = ignored\n= a line starting with equals\n"
       "E = a=b [c] d\nEmpty =\n",
       {{"S/K", "<absent>"}, {"S/rest", "<absent>"}, {"S/E", "a=b [c] d"}, {"S/Empty", ""}},
       ""},
      // Other lines without '=' join the next key, and are written back as
      // they were; a blank line is dropped.
      {"[S]\nA = 1\na comment\nB = 2\n\nC = 3\n",
       {{"S/A", "1"}, {"S/B", "<absent>"}, {"S/a comment\nB", "2"}, {"S/C", "3"}},
       "\n[S]\nA = 1\na comment\nB = 2\nC = 3\n"},
      // A '[' inside a key starts a section.
      {"[S]\nA[T] = 1\nC = 2\n", {{"S/A", "<absent>"}, {"T/C", "2"}, {"S/C", "<absent>"}}, ""},
      // A carriage return before a newline is dropped, elsewhere kept.
      {"[S]\r\nA = 1\r\nB = x\ry\r\n", {{"S/A", "1"}, {"S/B", "x\ry"}}, ""},
      // At the end: a value in progress is kept, a key without '=' dropped,
      // a section without ']' neither matched nor written.
      {"[S]\nA = last", {{"S/A", "last"}}, ""},
      {"[S]\nA = 1\nB\n[T", {{"S/B", "<absent>"}, {"T/A", "<absent>"}}, "\n[S]\nA = 1\n"},
  };
  // clang-format on
  for (const Layout& layout : layouts) {
    SCOPED_TRACE(layout.text);
    FreeProfile();
    const std::string f = WriteFile("a.par", layout.text);
    for (const auto& [where, value] : layout.values) {
      const size_t slash = where.find('/');
      EXPECT_EQ(Value(f, where.substr(0, slash).c_str(), where.substr(slash + 1).c_str()), value)
          << where;
    }
    if (layout.written[0] != '\0') {
      ASSERT_EQ(SyncProfile(f.c_str()), 0);
      EXPECT_EQ(ReadFile(f), layout.written);
    }
  }
}

// Parameter files edited by hand: blank lines, lines of blanks and comment
// lines never change the name of the key that follows them.
TEST_F(ProfileParser, BlankAndCommentLinesAreSkipped) {
  const std::vector<std::pair<std::string, const char*>> layouts = {
      {"\t \t\n", "a line of tabs and spaces"},
      {"\r\n", "an empty line with a carriage return"},
      {"   # Key = commented out\n", "an indented comment holding '='"},
      {"\t; see [Other] below\n", "a comment holding a section name"},
      {"\n# one\n\n;two\n  \n", "several of them"},
  };
  for (const auto& [lines, what] : layouts) {
    SCOPED_TRACE(what);
    FreeProfile();
    const std::string f = WriteFile(
        "h.par", "; file comment naming [Not] a section\nKey = 0\n[S]\n" + lines + "Key = 1\n" +
                     lines + "Next = 2\n" + lines + "[Other]\n" + lines + "Last = 3\n" + lines);
    EXPECT_EQ(Value(f, "S", "Key"), "1");
    EXPECT_EQ(Value(f, "S", "Next"), "2");
    EXPECT_EQ(Value(f, "Other", "Last"), "3");
    EXPECT_EQ(Value(f, "Not", "Key"), "<absent>");
    int key = 0;
    EXPECT_EQ(GetParInt(f.c_str(), "Next", 1, &key, 1, "S"), 0);
    EXPECT_EQ(key, 2);
  }
}

TEST_F(ProfileParser, SectionsOfTheSameNameSearchTheLaterFirst) {
  const std::string f = WriteFile("a.par", "[S]\nA = 1\nB = 1\n[Other]\nA = x\n[S]\nA = 2\n");
  EXPECT_EQ(Value(f, "S", "A"), "2");
  EXPECT_EQ(Value(f, "S", "B"), "1");
  // A key absent from the later section is written there, even when an
  // earlier section of the name holds it; reads then see the new value.
  EXPECT_EQ(WriteMyProfileString("S", "New", "n", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("S", "B", "b", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("S", "A", "3", f.c_str()), 0);
  EXPECT_EQ(Value(f, "S", "B"), "b");
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f), "\n[S]\nA = 1\nB = 1\n\n[Other]\nA = x\n\n[S]\nA = 3\nNew = n\nB = b\n");
}

TEST_F(ProfileParser, WrittenFormByteForByte) {
  const std::string f =
      WriteFile("w.par", "# header text\n[First]\nA = 1\nB=2\n\n[Second]\nX = y\n");
  EXPECT_EQ(WriteMyProfileInt("First", "C", 3, f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileInt("First", "A", 10, f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("Third", "K", "v", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileInt("First", "A", 11, f.c_str()), 0);
  // Writers change only the cache.
  EXPECT_EQ(ReadFile(f).substr(0, 13), "# header text");
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f), "\n[First]\nA = 11\nB = 2\nC = 3\n\n[Second]\nX = y\n\n[Third]\nK = v\n");
}

TEST_F(ProfileParser, CacheIsNotReReadUntilFreed) {
  const std::string f = WriteFile("c.par", "[S]\nA = 1\n");
  EXPECT_EQ(Value(f, "S", "A"), "1");
  WriteFile("c.par", "[S]\nA = 2\n");
  EXPECT_EQ(Value(f, "S", "A"), "1");
  FreeProfile(f.c_str());
  EXPECT_EQ(Value(f, "S", "A"), "2");
}

TEST_F(ProfileParser, MissingFilesAndSyncResults) {
  // A missing file starts empty and SyncProfile creates it.
  const std::string f = Path("new.par");
  EXPECT_EQ(Value(f, "S", "A"), "<absent>");
  EXPECT_EQ(errno, 0);
  EXPECT_EQ(WriteMyProfileString("S", "A", "1", f.c_str()), 0);
  EXPECT_EQ(SyncProfile(Path("never_accessed.par").c_str()), 0);
  // One file that cannot be written fails the sync of all, not the others.
  const std::string bad = dir_ + "/no_such_dir/x.par";
  EXPECT_EQ(WriteMyProfileString("S", "A", "1", bad.c_str()), 0);
  EXPECT_EQ(SyncProfile(bad.c_str()), 1);
  EXPECT_EQ(SyncProfile(), -1);
  EXPECT_EQ(ReadFile(f), "\n[S]\nA = 1\n");
  FreeProfile(bad.c_str());
  EXPECT_EQ(SyncProfile(), 0);
}
TEST_F(ProfileParser, DeleteKeyAndSection) {
  const std::string f = WriteFile("d.par", "[S]\nA = 1\nB = 2\n[T]\nC = 3\n[S]\nA = 4\n");
  testing::internal::CaptureStderr();
  EXPECT_EQ(DelProfileKey("S", "A", f.c_str()), 10);
  EXPECT_EQ(DelProfileSection("S", f.c_str()), 10);
  EXPECT_EQ(testing::internal::GetCapturedStderr(),
            "Warning: DelProfileKey called before init\n"
            "Warning: DelProfileSection called before init\n");
  EXPECT_EQ(Value(f, "S", "A"), "4");
  EXPECT_EQ(DelProfileKey("S", "A", f.c_str()), 0);
  EXPECT_EQ(Value(f, "S", "A"), "1");
  // Only the first matching section is searched.
  EXPECT_EQ(DelProfileKey("S", "B", f.c_str()), 10);
  EXPECT_EQ(DelProfileSection("T", f.c_str()), 0);
  EXPECT_EQ(DelProfileSection("T", f.c_str()), 10);
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f), "\n[S]\nA = 1\nB = 2\n\n[S]\n");
}

}  // namespace
