// Value encodings, typed readers and writers, checked and parameter forms.
#include <cstdint>
#include <utility>
#include <vector>

#include "profile_fixture.h"

namespace {

using ProfileValues = ProfileTest;

TEST_F(ProfileValues, ScalarArrayAndMatrixEncodings) {
  const std::string f = Path("enc.par");
  const char* p = f.c_str();
  const int ints[3] = {1, -2, 300};
  const int64_t big[2] = {INT64_C(1) << 40, -7};
  const long longs[1] = {-5};
  const float floats[3] = {0.1f, 1.0f / 3.0f, 1e-20f};
  const double doubles[6] = {0.1, 2, 1.0 / 3.0, 4, 5, 6};
  const char* strings[4] = {"a b", "", "c", "d"};
  ASSERT_EQ(WriteMyProfileInt("S", "Int", -42, p), 0);
  ASSERT_EQ(WriteMyProfileInt64("S", "Int64", -(INT64_C(1) << 40), p), 0);
  ASSERT_EQ(WriteMyProfileDouble("S", "Double", 1.0 / 3.0, p), 0);
  ASSERT_EQ(WriteMyProfileIntArray("S", "Ints", ints, 3, p), 0);
  ASSERT_EQ(WriteMyProfileIntArray("S", "One", ints, 1, p), 0);
  ASSERT_EQ(WriteMyProfileInt64Array("S", "Big", big, 2, p), 0);
  ASSERT_EQ(WriteMyProfileLongArray("S", "Longs", longs, 1, p), 0);
  ASSERT_EQ(WriteMyProfileFloatArray("S", "Floats", floats, 3, p), 0);
  ASSERT_EQ(WriteProfileDoubleArray("S", "Doubles", doubles, 2, p), 0);
  ASSERT_EQ(WriteProfileDoubleArray("S", "NoDoubles", doubles, 0, p), 0);
  ASSERT_EQ(WriteMyProfileStringArray("S", "Strings", strings, 3, p), 0);
  ASSERT_EQ(WriteMyProfileStringQuote("S", "Quoted", "x y", p), 0);
  // Matrices: rows written one by one from column-major memory.
  ASSERT_EQ(WriteMyProfileDoubleMatrix("S", "Matrix", doubles, 2, 3, p), 0);
  ASSERT_EQ(WriteMyProfileStringMatrix("S", "Names", strings, 2, 2, p), 0);
  ASSERT_EQ(SyncProfile(p), 0);
  EXPECT_EQ(
      ReadFile(f),
      "\n[S]\nInt = -42\nInt64 = -1099511627776\nDouble = 0.333333333333333\n"
      "Ints = {1 -2 300}\nOne = {1}\nBig = {1099511627776 -7}\nLongs = {-5}\n"
      "Floats = {0.1 0.3333333 1e-20}\nDoubles = {0.1 2}\nNoDoubles = {}\n"
      "Strings = {\"a b\" \"\" \"c\"}\nQuoted = \"x y\"\n"
      "Matrix = {0.1 0.333333333333333 5}\n\t{2 4 6}\nNames = {\"a b\" \"c\"}\n\t{\"\" \"d\"}\n");
  // Only the string array reader strips quotes.
  char buffer[16];
  ASSERT_EQ(GetMyProfileString("S", "Quoted", buffer, sizeof buffer, p), 0);
  EXPECT_STREQ(buffer, "\"x y\"");
}

TEST_F(ProfileValues, NumericArraysWithAndWithoutBraces) {
  const std::string f =
      WriteFile("n.par",
                "[S]\nBraced = {1 2 3}\nPlain = 1\t2   3\nSpaced = { 1 2 3 }\n"
                "Single = 9\nDoubles = {1.5e3 -2.25 0x10}\nBig = {1099511627776}\n");
  for (const char* key : {"Braced", "Plain", "Spaced"}) {
    int a[3] = {0, 0, 0};
    ASSERT_EQ(GetMyProfileIntArray("S", key, a, 3, f.c_str()), 0);
    EXPECT_EQ(std::vector<int>(a, a + 3), std::vector<int>({1, 2, 3})) << key;
  }
  int single = 0;
  ASSERT_EQ(GetParInt(f.c_str(), "Single", 1, &single, 1, "S"), 0);
  EXPECT_EQ(single, 9);
  double d[3];
  ASSERT_EQ(GetParDouble(f.c_str(), "Doubles", 3, d, 1, "S"), 0);
  EXPECT_EQ(d[1], -2.25);
  float fl[2];
  ASSERT_EQ(GetParFloat(f.c_str(), "Doubles", 2, fl, 1, "S"), 0);
  EXPECT_EQ(fl[0], 1500.0f);
  int64_t big = 0;
  long lg = 0;
  ASSERT_EQ(GetMyProfileInt64Array("S", "Big", &big, 1, f.c_str()), 0);
  ASSERT_EQ(GetMyProfileLongArray("S", "Big", &lg, 1, f.c_str()), 0);
  EXPECT_EQ(big, INT64_C(1) << 40);
  EXPECT_EQ(lg, 1L << 40);
}

TEST_F(ProfileValues, ShortReadsFillWhatTheyReadAndWarn) {
  const std::string f = WriteFile(
      "n.par", "[S]\nTwo = {1 2}\nBroken = 5 abc 7\nEmpty =\nTooBig = {1 99999999999 3}\n");
  // The elements read are filled, the rest keep their values; one warning.
  const std::vector<std::pair<const char*, std::vector<int>>> cases = {
      {"Two", {1, 2, -1}}, {"Broken", {5, -1, -1}}, {"TooBig", {1, -1, -1}}};
  for (const auto& [key, expected] : cases) {
    int v[3] = {-1, -1, -1};
    EXPECT_EQ(
        ReportsDuring([&] { EXPECT_EQ(GetMyProfileIntArray("S", key, v, 3, f.c_str()), 10); }), 1)
        << key;
    EXPECT_EQ(std::vector<int>(v, v + 3), expected) << key;  // never a wrapped value
  }
  // An empty value reads zero elements.
  int w[1];
  EXPECT_EQ(GetMyProfileIntArray("S", "Empty", w, 0, f.c_str()), 0);
  EXPECT_EQ(GetMyProfileIntArray("S", "Empty", w, 1, f.c_str()), 10);
  // An absent key leaves the defaults and reports nothing.
  int kept = 77;
  EXPECT_EQ(ReportsDuring([&] { EXPECT_EQ(GetParInt(f.c_str(), "None", 1, &kept, 1, "S"), 10); }),
            0);
  EXPECT_EQ(kept, 77);
}

TEST_F(ProfileValues, StringArraysStripQuotes) {
  const std::string f = WriteFile("s.par",
                                  "[S]\nThree = {\"a\"  \"b c\" \"\"}\nNoBrace = \"a\" \"b\"\n"
                                  "Unclosed = {\"a\" \"b\nBare = {abc}\nLong = {\"abcdefgh\"}\n");
  char e0[16] = "-", e1[16] = "-", e2[16] = "-", e3[16] = "-";
  char* out[4] = {e0, e1, e2, e3};
  ASSERT_EQ(GetMyProfileStringArray("S", "Three", out, 3, 16, f.c_str()), 0);
  EXPECT_STREQ(e0, "a");
  EXPECT_STREQ(e1, "b c");
  EXPECT_STREQ(e2, "");
  EXPECT_STREQ(e3, "-");
  // More requested: the closing brace ends the scan and the count is the
  // result, without a warning.
  EXPECT_EQ(ReportsDuring([&] {
              EXPECT_EQ(GetMyProfileStringArray("S", "Three", out, 4, 16, f.c_str()), 3);
            }),
            0);
  EXPECT_EQ(GetMyProfileStringArray("S", "NoBrace", out, 2, 16, f.c_str()), 0);
  EXPECT_EQ(GetMyProfileStringArray("S", "Bare", out, 2, 16, f.c_str()), 0);
  EXPECT_EQ(ReportsDuring([&] {
              EXPECT_EQ(GetMyProfileStringArray("S", "Unclosed", out, 2, 16, f.c_str()), 10);
            }),
            1);
  // An element longer than its buffer is cut to fit and reported.
  char small[4] = "xyz";
  char canary[4] = "!!!";
  char* one[2] = {small, canary};
  EXPECT_EQ(GetMyProfileStringArray("S", "Long", one, 1, 4, f.c_str()), 10);
  EXPECT_STREQ(small, "abc");
  EXPECT_STREQ(canary, "!!!");
  EXPECT_EQ(GetMyProfileStringArray("S", "Missing", one, 1, 4, f.c_str()), 10);
}

TEST_F(ProfileValues, ParameterFormsWriteThrough) {
  const std::string f = Path("par.par");
  const int ints[2] = {3, 4};
  const float floats[1] = {2.5f};
  const double doubles[1] = {0.25};
  EXPECT_EQ(SetParString(f.c_str(), "Name", 0, "value", 1, "P"), 0);
  EXPECT_EQ(SetParInt(f.c_str(), "Ints", 2, ints, 1, "P"), 0);
  EXPECT_EQ(SetParFloat(f.c_str(), "Float", 1, floats, 1, "P"), 0);
  EXPECT_EQ(SetParDouble(f.c_str(), "Double", 1, doubles, 1, "P"), 0);
  EXPECT_EQ(ReadFile(f), "\n[P]\nName = value\nInts = {3 4}\nFloat = {2.5}\nDouble = {0.25}\n");
  // A store that cannot happen is reported and fails.
  EXPECT_EQ(ReportsDuring([&] { EXPECT_EQ(SetParString(f.c_str(), "K", 0, nullptr, 1, "P"), 10); }),
            1);
}

using ProfileCheckedDeathTest = ProfileTest;

TEST_F(ProfileCheckedDeathTest, FailuresEndTheProcessWithStatusOne) {
  const std::string f = WriteFile("c.par", "[S]\nK = {1}\n");
  const char* p = f.c_str();
  int v[2];
  char buffer[8];
  EXPECT_EQ(GetCheckMyProfileIntArray("S", "K", v, 1, p), 0);
  EXPECT_EXIT(GetCheckMyProfileString("S", "None", buffer, 8, p), testing::ExitedWithCode(1),
              "Error in GetMyProfileString: section S, key None, file " + f);
  EXPECT_EXIT(WriteCheckMyProfileInt("S", nullptr, 5, p), testing::ExitedWithCode(1),
              "Error in WriteMyProfileInt: section S, key , value 5, file ");
  EXPECT_EXIT(WriteCheckMyProfileString("S", "K", nullptr, p), testing::ExitedWithCode(1),
              "Error in WriteMyProfileString: section S, key K, string , file ");
}

}  // namespace
