// DORIS files that are damaged or inconsistent: every one gives a code and
// none makes the reader read past the end of the file.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "orbit/interp_orb_l.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

class BadDoris : public ScratchTest {
 protected:
  void SetUp() override {
    ScratchTest::SetUp();
    vor_ = SplitDoris(kVor);
    records_.assign(vor_.records.begin(), vor_.records.begin() + 40);
  }
  double time(int i) const { return ParseRecord(vor_.records[i]).t; }
  int read(const std::string& file, double tc, int wantAnx = 0) {
    double p[9], v[9], anx = 0.0;
    int orbit = 0;
    return interp_orb_l(file.c_str(), tc, 3, 10.0, p, v, &orbit, wantAnx, &anx);
  }

  DorisText vor_;
  std::vector<std::string> records_;
};

TEST_F(BadDoris, OnlyTheFourOrbitProductNamesAreRead) {
  const struct {
    const char* name;
    int code;
  } cases[] = {{"DOR_VOR_AX", 0},  {"DOR_POR_AX", 0},  {"AUX_FRO_AX", 0},  {"AUX_FPO_AX", 0},
               {"DOR_NL__AX", 12}, {"ASA_WSS_1P", 12}, {"dor_vor_ax", 12}, {"DOR_VOR_1P", 12}};
  for (const auto& c : cases) {
    std::string header = vor_.header;
    header.replace(9, 10, c.name);
    EXPECT_EQ(read(WriteDoris(c.name, header, records_), time(20)), c.code) << c.name;
  }
  EXPECT_EQ(read(kXca, time(20)), 12);
  EXPECT_EQ(read(path("absent"), time(20)), 9);
}

TEST_F(BadDoris, FewerThanNineRecordsGive4) {
  for (int n : {0, 1, 8}) {
    const std::vector<std::string> few(records_.begin(), records_.begin() + n);
    EXPECT_EQ(read(WriteDoris("few" + std::to_string(n), vor_.header, few), time(0)), 4) << n;
  }
  const std::vector<std::string> nine(records_.begin(), records_.begin() + 9);
  EXPECT_EQ(read(WriteDoris("nine", vor_.header, nine), time(4)), 0);
}

TEST_F(BadDoris, MalformedNumbersGive4) {
  struct Damage {
    size_t offset;
    std::string text;
  };
  const Damage damages[] = {
      {44, "+649x931.106"},   // x position
      {75, " "},              // a blank inside z
      {109, "++692.698996"},  // vz
      {37, "+3l388"},         // orbit number
      {0, "3X"},              // day of the date
      {3, "XYZ"},             // month of the date
      {83, "            "},   // empty vx
  };
  for (const Damage& d : damages) {
    // In the scanned part and in the part only the window reaches.
    for (int at : {10, 23}) {
      std::vector<std::string> damaged = records_;
      damaged[at].replace(d.offset, d.text.size(), d.text);
      const std::string file = WriteDoris("damaged", vor_.header, damaged);
      EXPECT_EQ(read(file, time(20)), 4) << d.text << " in record " << at;
    }
  }
}

TEST_F(BadDoris, RecordsOutOfTimeOrderGive4) {
  std::vector<std::string> swapped = records_;
  std::swap(swapped[15], swapped[16]);
  EXPECT_EQ(read(WriteDoris("swapped", vor_.header, swapped), time(20)), 4);
  // Out of order only inside the window after tc.
  swapped = records_;
  std::swap(swapped[22], swapped[23]);
  EXPECT_EQ(read(WriteDoris("swapped_late", vor_.header, swapped), time(20)), 4);
  // A record repeated.
  std::vector<std::string> repeated = records_;
  repeated[12] = repeated[11];
  EXPECT_EQ(read(WriteDoris("repeated", vor_.header, repeated), time(20)), 4);
  // A gap: the window is no longer equally spaced.
  std::vector<std::string> gap = records_;
  gap.erase(gap.begin() + 19);
  EXPECT_EQ(read(WriteDoris("gap", vor_.header, gap), time(18)), 4);
}

// Every vector of a long grid reads the records around its own time, so
// damage there is found, while a short grid around the same time does not
// reach it.
TEST_F(BadDoris, DamageWithinTheGridsReachGives4) {
  struct Damage {
    const char* what;
    int record;
    size_t offset;
    std::string text;
  };
  const Damage damages[] = {
      {"a date", 33, 0, "3X"},
      {"a position", 27, 44, "+649x931.106"},
      {"a velocity", 31, 109, "++692.698996"},
  };
  for (const Damage& d : damages) {
    std::vector<std::string> damaged = records_;
    damaged[d.record].replace(d.offset, d.text.size(), d.text);
    const std::string file = WriteDoris("damaged", vor_.header, damaged);
    // 41 vectors 30 s apart span records 10 to 30 around record 20.
    double p[3 * 41], v[3 * 41];
    EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 41, 30.0, p, v, nullptr, 0, nullptr), 4)
        << d.what;
    EXPECT_EQ(read(file, time(20)), 0) << d.what;
  }
  // Records out of order after the requested time.
  std::vector<std::string> swapped = records_;
  std::swap(swapped[28], swapped[29]);
  const std::string file = WriteDoris("swapped", vor_.header, swapped);
  double p[3 * 41];
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 41, 30.0, p, nullptr, nullptr, 0, nullptr), 4);
  EXPECT_EQ(read(file, time(20)), 0);
}

TEST_F(BadDoris, TruncatedFilesAndOverstatedCountsGive4) {
  // The last record cut short, the count still claiming it.
  std::vector<std::string> cut = records_;
  cut.back().resize(100);
  EXPECT_EQ(read(WriteDoris("cut", vor_.header, cut, 40), time(20)), 4);
  EXPECT_EQ(read(WriteDoris("cut_early", vor_.header, cut, 40), time(2)), 4);
  // A count larger than the file, small and huge.
  for (long long count : {41LL, 1589LL, 2147483647LL, 9999999999LL}) {
    EXPECT_EQ(read(WriteDoris("over", vor_.header, records_, count), time(20)), 4) << count;
  }
  // Records that end before the requested time, which the header's validity
  // still covers.
  EXPECT_EQ(read(WriteDoris("short", vor_.header, records_), time(100)), 4);
  // Headers cut short: empty, inside the MPH, inside the SPH.
  for (size_t size : {0, 1000, 1400}) {
    Spit(path("short_header"), vor_.header.substr(0, size));
    EXPECT_EQ(read(path("short_header"), time(20)), 4) << size;
  }
}

TEST_F(BadDoris, MalformedHeaderValuesGive4) {
  const struct {
    const char* key;
    const char* value;
  } cases[] = {{"NUM_DSR", "-0000000005"},
               {"NUM_DSR", "+00000x0040"},
               {"NUM_DSR", "           "},
               {"DS_OFFSET", "+00000000000099999999"},  // beyond the file
               {"SENSING_START", "\"xx-MAR-2008"},
               {"SENSING_STOP", "\"                           "}};
  for (const auto& c : cases) {
    std::string header = vor_.header;
    SetHeaderValue(&header, "NUM_DSR", CountText(static_cast<long long>(records_.size())));
    SetHeaderValue(&header, c.key, c.value);
    for (const std::string& r : records_) header += r;
    Spit(path("bad_header"), header);
    EXPECT_EQ(read(path("bad_header"), time(20)), 4) << c.key << c.value;
  }
}

TEST_F(BadDoris, InvalidRequestsGive1) {
  const std::string file = WriteDoris("good", vor_.header, records_);
  double p[3];
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), -1, 5.0, p, nullptr, nullptr, 0, nullptr), 1);
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 1, 5.0, nullptr, nullptr, nullptr, 0, nullptr), 1);
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 1, 5.0, p, nullptr, nullptr, 1, nullptr), 1);
  // No vectors asked for: the file is still checked.
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 0, 5.0, nullptr, nullptr, nullptr, 0, nullptr), 0);
}

}  // namespace
