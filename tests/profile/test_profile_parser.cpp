// Parser layouts and the written form of parameter files.
#include "profile_fixture.h"

namespace {

using ProfileParser = ProfileTest;

TEST_F(ProfileParser, BlanksAroundKeyAndValueAreTrimmedTabsKept) {
  const std::string f = WriteFile("a.par",
                                  "[S]\n"
                                  "K1=Value\n"
                                  "K2 = Value\n"
                                  "   K3    =    Value   \n"
                                  "K4 =\tValue\n"
                                  "K5 = two  words \n");
  EXPECT_EQ(Value(f, "S", "K1"), "Value");
  EXPECT_EQ(Value(f, "S", "K2"), "Value");
  EXPECT_EQ(Value(f, "S", "K3"), "Value");
  EXPECT_EQ(Value(f, "S", "K4"), "\tValue");
  EXPECT_EQ(Value(f, "S", "K5"), "two  words");
  // Matching is exact and case-sensitive.
  EXPECT_EQ(Value(f, "s", "K1"), "<absent>");
  EXPECT_EQ(Value(f, "S", "k1"), "<absent>");
}

TEST_F(ProfileParser, IgnoredTextAndSpecialCharactersInValues) {
  const std::string f = WriteFile("a.par",
                                  "K = before any section\n"
                                  "[ S ] rest = ignored\n"
                                  "= a line starting with equals\n"
                                  "E = a=b [c] d\n"
                                  "Empty =\n");
  EXPECT_EQ(Value(f, "S", "K"), "<absent>");
  EXPECT_EQ(Value(f, "S", "rest"), "<absent>");
  EXPECT_EQ(Value(f, "S", "E"), "a=b [c] d");
  EXPECT_EQ(Value(f, "S", "Empty"), "");
}

TEST_F(ProfileParser, LinesWithoutEqualsJoinTheNextKey) {
  const std::string f = WriteFile("a.par",
                                  "[S]\n"
                                  "A = 1\n"
                                  "a comment\n"
                                  "B = 2\n"
                                  "\n"
                                  "C = 3\n");
  EXPECT_EQ(Value(f, "S", "A"), "1");
  EXPECT_EQ(Value(f, "S", "B"), "<absent>");
  EXPECT_EQ(Value(f, "S", "a comment\nB"), "2");
  EXPECT_EQ(Value(f, "S", "\nC"), "3");
  // Written back, the joined lines come out as they were.
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f), "\n[S]\nA = 1\na comment\nB = 2\n\nC = 3\n");
}

TEST_F(ProfileParser, BracketInsideKeyStartsSection) {
  const std::string f = WriteFile("a.par",
                                  "[S]\n"
                                  "A[T] = 1\n"
                                  "C = 2\n");
  EXPECT_EQ(Value(f, "S", "A"), "<absent>");
  EXPECT_EQ(Value(f, "T", "C"), "2");
  EXPECT_EQ(Value(f, "S", "C"), "<absent>");
}

TEST_F(ProfileParser, SectionsOfTheSameNameSearchTheLaterFirst) {
  const std::string f = WriteFile("a.par",
                                  "[S]\nA = 1\nB = 1\n"
                                  "[Other]\nA = x\n"
                                  "[S]\nA = 2\n");
  EXPECT_EQ(Value(f, "S", "A"), "2");
  EXPECT_EQ(Value(f, "S", "B"), "1");
  // A key absent from the later section is written there, even when an
  // earlier section of the name holds it; reads then see the new value.
  EXPECT_EQ(WriteMyProfileString("S", "New", "n", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("S", "B", "b", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("S", "A", "3", f.c_str()), 0);
  EXPECT_EQ(Value(f, "S", "B"), "b");
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f),
            "\n[S]\nA = 1\nB = 1\n"
            "\n[Other]\nA = x\n"
            "\n[S]\nA = 3\nNew = n\nB = b\n");
}

TEST_F(ProfileParser, LineEndsAndEndOfFile) {
  const std::string crlf = WriteFile("crlf.par", "[S]\r\nA = 1\r\nB = x\ry\r\n");
  EXPECT_EQ(Value(crlf, "S", "A"), "1");
  EXPECT_EQ(Value(crlf, "S", "B"), "x\ry");
  // A value in progress at the end is kept, a key without '=' dropped, a
  // section without ']' neither matched nor written.
  const std::string open = WriteFile("open.par", "[S]\nA = last");
  EXPECT_EQ(Value(open, "S", "A"), "last");
  const std::string dangling = WriteFile("dangling.par", "[S]\nA = 1\nB\n[T");
  EXPECT_EQ(Value(dangling, "S", "B"), "<absent>");
  EXPECT_EQ(Value(dangling, "T", "A"), "<absent>");
  ASSERT_EQ(SyncProfile(dangling.c_str()), 0);
  EXPECT_EQ(ReadFile(dangling), "\n[S]\nA = 1\n");
}

TEST_F(ProfileParser, WrittenFormByteForByte) {
  const std::string f = WriteFile("w.par",
                                  "# header text\n"
                                  "[First]\n"
                                  "A = 1\n"
                                  "B=2\n"
                                  "\n"
                                  "[Second]\n"
                                  "X = y\n");
  EXPECT_EQ(WriteMyProfileInt("First", "C", 3, f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileInt("First", "A", 10, f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("Third", "K", "v", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileInt("First", "A", 11, f.c_str()), 0);
  // Writers change only the cache.
  EXPECT_EQ(ReadFile(f).substr(0, 13), "# header text");
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f),
            "\n[First]\nA = 11\nB = 2\nC = 3\n"
            "\n[Second]\nX = y\n"
            "\n[Third]\nK = v\n");
}

TEST_F(ProfileParser, CacheIsNotReReadUntilFreed) {
  const std::string f = WriteFile("c.par", "[S]\nA = 1\n");
  EXPECT_EQ(Value(f, "S", "A"), "1");
  WriteFile("c.par", "[S]\nA = 2\n");
  EXPECT_EQ(Value(f, "S", "A"), "1");
  FreeProfile(f.c_str());
  EXPECT_EQ(Value(f, "S", "A"), "2");
}

TEST_F(ProfileParser, MissingFileStartsEmptyAndSyncCreatesIt) {
  const std::string f = Path("new.par");
  EXPECT_EQ(Value(f, "S", "A"), "<absent>");
  EXPECT_EQ(errno, 0);
  EXPECT_EQ(WriteMyProfileString("S", "A", "1", f.c_str()), 0);
  EXPECT_EQ(WriteMyProfileString("S", "B", "2", f.c_str()), 0);
  ASSERT_EQ(SyncProfile(f.c_str()), 0);
  EXPECT_EQ(ReadFile(f), "\n[S]\nA = 1\nB = 2\n");
}

TEST_F(ProfileParser, SyncResults) {
  EXPECT_EQ(SyncProfile(Path("never_accessed.par").c_str()), 0);
  const std::string bad = dir_ + "/no_such_dir/x.par";
  EXPECT_EQ(WriteMyProfileString("S", "A", "1", bad.c_str()), 0);
  EXPECT_EQ(SyncProfile(bad.c_str()), 1);
  const std::string good = Path("good.par");
  EXPECT_EQ(WriteMyProfileString("S", "A", "1", good.c_str()), 0);
  EXPECT_EQ(SyncProfile(), -1);
  EXPECT_EQ(ReadFile(good), "\n[S]\nA = 1\n");
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
