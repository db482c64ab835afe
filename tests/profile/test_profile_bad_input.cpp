// Parameter files we did not write: arbitrary bytes, absurd counts and
// over-long values end in the documented results, never in a crash.
#include <climits>
#include <cstdint>
#include <cstring>
#include <filesystem>
#include <random>

#include "profile_fixture.h"

namespace {

using ProfileBadInput = ProfileTest;

TEST_F(ProfileBadInput, ArbitraryBytesParseAndWriteBack) {
  std::mt19937 random(12345);
  const char alphabet[] = "[]= \n\r\t{}\"aK0";
  for (int round = 0; round < 200; ++round) {
    std::string text(random() % 3000, '\0');
    for (char& c : text) {
      // Half structural characters, half any byte (NUL included).
      c = (random() & 1) ? alphabet[random() % (sizeof alphabet - 1)]
                         : static_cast<char>(random() & 0xff);
    }
    const std::string f = WriteFile("random.par", text);
    char buffer[32];
    int ints[4];
    char e0[8], e1[8];
    char* strings[2] = {e0, e1};
    GetMyProfileString("a", "K", buffer, sizeof buffer, f.c_str());
    GetMyProfileIntArray("a", "K", ints, 4, f.c_str());
    GetMyProfileStringArray("a", "K", strings, 2, 8, f.c_str());
    WriteMyProfileString("a", "K", "v", f.c_str());
    ASSERT_EQ(SyncProfile(f.c_str()), 0);
    EXPECT_EQ(Value(f, "a", "K"), "v");
    // The written file parses again.
    FreeProfile();
    Value(f, "a", "K");
    ASSERT_EQ(SyncProfile(f.c_str()), 0);
    FreeProfile();
  }
}

TEST_F(ProfileBadInput, AbsurdCountsAreRefusedOrBoundedByTheValue) {
  const std::string f = WriteFile("n.par", "[S]\nK = {1 2}\nS = {\"a\"}\n");
  int v[2] = {0, 0};
  EXPECT_EQ(GetMyProfileIntArray("S", "K", v, -5, f.c_str()), 10);
  EXPECT_EQ(GetMyProfileIntArray("S", "K", nullptr, 2, f.c_str()), 10);
  // A huge count reads what the value holds and reports the short read.
  EXPECT_EQ(GetMyProfileIntArray("S", "K", v, INT_MAX, f.c_str()), 10);
  EXPECT_EQ(v[1], 2);
  char e[8];
  char* strings[1] = {e};
  EXPECT_EQ(GetMyProfileStringArray("S", "S", strings, INT_MAX, 8, f.c_str()), 1);
  EXPECT_EQ(GetMyProfileStringArray("S", "S", strings, -1, 8, f.c_str()), 10);
  const double d[1] = {1.0};
  EXPECT_EQ(WriteProfileDoubleArray("S", "D", d, -1, f.c_str()), 10);
  EXPECT_EQ(WriteMyProfileDoubleMatrix("S", "M", d, -1, 2, f.c_str()), 10);
  EXPECT_EQ(Value(f, "S", "D"), "<absent>");
}

TEST_F(ProfileBadInput, OverLongValuesAndNamesStayBounded) {
  const std::string longValue(1 << 20, 'v');
  const std::string longName(100000, 'k');
  const std::string f = WriteFile(
      "l.par", "[S]\nK = " + longValue + "\n" + longName + " = 1\n[" + longName + "]\nA = 2\n");
  char buffer[kProfileBufferSize + 8];
  std::memset(buffer, '#', sizeof buffer);
  ASSERT_EQ(GetParString(f.c_str(), "K", 0, buffer, 1, "S"), 0);
  EXPECT_EQ(std::strlen(buffer), static_cast<size_t>(kProfileBufferSize - 1));
  EXPECT_EQ(buffer[kProfileBufferSize], '#');
  EXPECT_EQ(Value(f, "S", longName.c_str()), "1");
  EXPECT_EQ(Value(f, longName.c_str(), "A"), "2");
  int n[1];
  EXPECT_EQ(GetMyProfileIntArray("S", "K", n, 1, f.c_str()), 10);
}

// A parameter file beyond the size limit is not read at all: its keys
// answer "refused", writes fail, and the file on disk stays as it is.
TEST_F(ProfileBadInput, FilesBeyondTheSizeLimitAreRefused) {
  const std::string head = "[S]\nK = 1\n";
  const struct {
    const char* name;
    long long size;  // padded with NUL bytes to this size; 0: /dev/zero
    bool refused;
  } cases[] = {
      {"at_limit.par", kProfileMaxFileSize, false},
      {"over_limit.par", kProfileMaxFileSize + 1, true},
      {"/dev/zero", 0, true},  // no size known beforehand, no end
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.name);
    FreeProfile();
    std::string f = c.name;
    if (c.size > 0) {
      f = WriteFile(c.name, head);
      std::filesystem::resize_file(f, static_cast<uintmax_t>(c.size));
    }
    char buffer[8] = "unset";
    int n = 0;
    if (!c.refused) {
      EXPECT_EQ(GetMyProfileString("S", "K", buffer, sizeof buffer, f.c_str()), 0);
      EXPECT_STREQ(buffer, "1");
      continue;
    }
    const int reports = ReportsDuring(
        [&] { EXPECT_EQ(GetMyProfileString("S", "K", buffer, sizeof buffer, f.c_str()), 4); });
    EXPECT_EQ(reports, 1);
    EXPECT_STREQ(buffer, "unset");
    EXPECT_EQ(GetParInt(f.c_str(), "K", 1, &n, 1, "S"), 4);
    EXPECT_EQ(WriteMyProfileString("S", "K", "2", f.c_str()), 10);
    EXPECT_EQ(SyncProfile(f.c_str()), 0);
    if (c.size > 0) {
      EXPECT_EQ(std::filesystem::file_size(f), static_cast<uintmax_t>(c.size));
      EXPECT_EQ(ReadFile(f).substr(0, head.size()), head);
    }
  }
}

}  // namespace
