// DORIS files that are damaged or inconsistent: every one gives a code and
// none makes the reader read past the end of the file.
#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <vector>

#include "orbit/interp_orb_l.h"
#include "orbit_test_files.h"

using namespace orbit_test;

namespace {

// A file built from the real header and its first 40 records, then damaged.
struct Doris {
  std::string header;
  std::vector<std::string> records;
  long long count = -1;  // the record count written, -1: the true one
  std::string text;      // when not empty, the file's whole content
};

class BadDoris : public ScratchTest {
 protected:
  void SetUp() override {
    ScratchTest::SetUp();
    vor_ = SplitDoris(kVor);
  }
  double time(int i) const { return ParseRecord(vor_.records[i]).t; }
  std::string Write(const std::function<void(Doris*)>& damage) {
    Doris d;
    d.header = vor_.header;
    d.records.assign(vor_.records.begin(), vor_.records.begin() + 40);
    damage(&d);
    if (d.text.empty()) return WriteDoris("damaged", d.header, d.records, d.count);
    spit(path("damaged"), d.text);
    return path("damaged");
  }
  // Reads n vectors dt apart around time tc.
  static int Read(const std::string& file, double tc, int n = 3, double dt = 10.0) {
    std::vector<double> p(3 * n + 3), v(3 * n + 3);
    return interp_orb_l(file.c_str(), tc, n, dt, p.data(), v.data(), nullptr, 0, nullptr);
  }
  static void Damage(Doris* d, int record, size_t offset, const std::string& text) {
    d->records[record].replace(offset, text.size(), text);
  }

  DorisText vor_;
};

TEST_F(BadDoris, HostileFilesGiveTheirCodes) {
  const auto swap = [](int a) {
    return [a](Doris* d) { std::swap(d->records[a], d->records[a + 1]); };
  };
  // The last record cut short, the count still claiming it.
  const auto cut = [](Doris* d) {
    d->records.back().resize(100);
    d->count = 40;
  };
  const auto header = [](const char* key, const char* value) {
    return [key, value](Doris* d) {
      SetHeaderValue(&d->header, "NUM_DSR", CountText(static_cast<long long>(d->records.size())));
      SetHeaderValue(&d->header, key, value);
      d->text = d->header;
      for (const std::string& r : d->records) d->text += r;
    };
  };
  const struct {
    const char* what;
    std::function<void(Doris*)> damage;
    int at;  // record of the real file at the requested time
  } cases[] = {
      {"no records", [](Doris* d) { d->records.clear(); }, 0},
      {"one record", [](Doris* d) { d->records.resize(1); }, 0},
      {"eight records", [](Doris* d) { d->records.resize(8); }, 0},
      {"x position", [](Doris* d) { Damage(d, 10, 44, "+649x931.106"); }, 20},
      {"a blank inside z", [](Doris* d) { Damage(d, 23, 75, " "); }, 20},
      {"vz", [](Doris* d) { Damage(d, 10, 109, "++692.698996"); }, 20},
      {"orbit number", [](Doris* d) { Damage(d, 23, 37, "+3l388"); }, 20},
      {"day of the date", [](Doris* d) { Damage(d, 10, 0, "3X"); }, 20},
      {"month of the date", [](Doris* d) { Damage(d, 23, 3, "XYZ"); }, 20},
      {"empty vx", [](Doris* d) { Damage(d, 10, 83, "            "); }, 20},
      {"records swapped", swap(15), 20},
      {"records swapped after tc", swap(22), 20},
      {"a record repeated", [](Doris* d) { d->records[12] = d->records[11]; }, 20},
      {"a gap", [](Doris* d) { d->records.erase(d->records.begin() + 19); }, 18},
      {"last record cut", cut, 20},
      {"last record cut, early tc", cut, 2},
      {"count 41", [](Doris* d) { d->count = 41; }, 20},
      {"count 1589", [](Doris* d) { d->count = 1589; }, 20},
      {"count 2^31 - 1", [](Doris* d) { d->count = 2147483647LL; }, 20},
      {"count 9999999999", [](Doris* d) { d->count = 9999999999LL; }, 20},
      {"records end before tc", [](Doris*) {}, 100},
      {"header cut in the MPH", [](Doris* d) { d->text = d->header.substr(0, 1000); }, 20},
      {"header cut in the SPH", [](Doris* d) { d->text = d->header.substr(0, 1400); }, 20},
      {"negative count", header("NUM_DSR", "-0000000005"), 20},
      {"count not a number", header("NUM_DSR", "+00000x0040"), 20},
      {"blank count", header("NUM_DSR", "           "), 20},
      {"offset beyond the file", header("DS_OFFSET", "+00000000000099999999"), 20},
      {"sensing start not a date", header("SENSING_START", "\"xx-MAR-2008"), 20},
      {"blank sensing stop", header("SENSING_STOP", "\"                           "), 20},
  };
  for (const auto& c : cases) EXPECT_EQ(Read(Write(c.damage), time(c.at)), 4) << c.what;
  // An empty file.
  spit(path("empty"), "");
  EXPECT_EQ(Read(path("empty"), time(20)), 4);
  // Nine records are enough.
  EXPECT_EQ(Read(Write([](Doris* d) { d->records.resize(9); }), time(4)), 0);
  // Only the four orbit products are read.
  const struct {
    const char* name;
    int code;
  } names[] = {{"DOR_VOR_AX", 0},  {"DOR_POR_AX", 0},  {"AUX_FRO_AX", 0},  {"AUX_FPO_AX", 0},
               {"DOR_NL__AX", 12}, {"ASA_WSS_1P", 12}, {"dor_vor_ax", 12}, {"DOR_VOR_1P", 12}};
  for (const auto& c : names) {
    const std::string file = Write([&c](Doris* d) { d->header.replace(9, 10, c.name); });
    EXPECT_EQ(Read(file, time(20)), c.code) << c.name;
  }
  EXPECT_EQ(Read(kXca, time(20)), 12);
  EXPECT_EQ(Read(path("absent"), time(20)), 9);
}

// Every vector of a long grid reads the records around its own time, so
// damage there is found, while a short grid around the same time does not
// reach it.
TEST_F(BadDoris, DamageWithinTheGridsReachGives4) {
  const struct {
    const char* what;
    std::function<void(Doris*)> damage;
  } cases[] = {
      {"a date", [](Doris* d) { Damage(d, 33, 0, "3X"); }},
      {"a position", [](Doris* d) { Damage(d, 27, 44, "+649x931.106"); }},
      {"a velocity", [](Doris* d) { Damage(d, 31, 109, "++692.698996"); }},
      {"records out of order", [](Doris* d) { std::swap(d->records[28], d->records[29]); }},
  };
  for (const auto& c : cases) {
    const std::string file = Write(c.damage);
    // 41 vectors 30 s apart span records 10 to 30 around record 20.
    EXPECT_EQ(Read(file, time(20), 41, 30.0), 4) << c.what;
    EXPECT_EQ(Read(file, time(20)), 0) << c.what;
  }
}

TEST_F(BadDoris, InvalidRequestsGive1) {
  const std::string file = Write([](Doris*) {});
  double p[3];
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), -1, 5.0, p, nullptr, nullptr, 0, nullptr), 1);
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 1, 5.0, nullptr, nullptr, nullptr, 0, nullptr), 1);
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 1, 5.0, p, nullptr, nullptr, 1, nullptr), 1);
  // No vectors asked for: the file is still checked.
  EXPECT_EQ(interp_orb_l(file.c_str(), time(20), 0, 5.0, nullptr, nullptr, nullptr, 0, nullptr), 0);
}

}  // namespace
