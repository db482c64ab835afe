// Choice of auxiliary files from the auxiliary list by the product's sensing start.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <string>
#include <vector>

#include "drivers/find_aux.h"
#include "installation.h"
#include "profile/profile.h"

using vlr_test::WriteFile;

namespace {

// Auxiliary lists as they are edited by hand, against a product header that
// holds nothing but its sensing start (02-MAR-2008 10:00:00).
class AuxList : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/vlr_aux_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = std::string(pattern) + "/";
    product_ = product("02-MAR-2008 10:00:00.000000");
    WriteFile(dir_ + "ASA_XCA_good", "calibration");
    ASSERT_EQ(mkdir((dir_ + "folder").c_str(), 0755), 0);
  }
  void TearDown() override {
    FreeProfile();
    std::filesystem::remove_all(dir_);
  }
  // A product whose main product header holds `start` as its sensing start.
  std::string product(const std::string& start) const {
    const std::string path = dir_ + "ASA_WSS_1P";
    WriteFile(path, std::string(351, ' ') + start + std::string(1000, ' '));
    return path;
  }
  int find(const std::string& list, std::string* result) const {
    FreeProfile();
    FreeProfile();
    WriteFile(dir_ + "ASA_AUX_list.dat", list);
    return find_aux(product_.c_str(), dir_.c_str(), "ASA_XCA", *result);
  }
  static std::string section(int n, const std::string& start, const std::string& stop,
                             const std::string& fileLine) {
    return "[ASA_XCA_" + std::to_string(n) + "]\nStartDate = " + start + "\nStopDate = " + stop +
           "\n" + fileLine;
  }
  std::string dir_;
  std::string product_;
};

TEST_F(AuxList, EntriesThatCannotBeUsedFailTheSearch) {
  const std::string from = "01-JAN-2008 00:00:00";
  const std::string to = "01-JAN-2009 00:00:00";
  const std::string good = "FileName = ASA_XCA_good\n";
  const std::string start = "02-MAR-2008 10:00:00.000000";
  const struct {
    const char* what;
    std::string list;
    int code;
  } cases[] = {
      {"a usable entry", section(0, from, to, good), 0},
      {"comments and blank lines inside the section",
       "# calibration files\n[ASA_XCA_0]\n; valid for 2008\n\nStartDate = " + from +
           "\n \t \n  StopDate = " + to + "\n# FileName = old\n\n" + good,
       0},
      {"no FileName", section(0, from, to, ""), 10},
      {"an empty FileName", section(0, from, to, "FileName =\n"), 10},
      {"a FileName of blanks", section(0, from, to, "FileName =    \n"), 10},
      {"a FileName naming a folder", section(0, from, to, "FileName = folder\n"), 10},
      {"a FileName naming no file", section(0, from, to, "FileName = missing\n"), 10},
      {"a StartDate that is not a date", section(0, "garbage", to, good), 10},
      {"a StartDate without a month", section(0, "01-XXX-2008", to, good), 10},
      {"an earlier entry with a broken StopDate",
       section(0, "01-JAN-2000 00:00:00", "never", good) + section(1, from, to, good), 10},
      {"an earlier entry without a StopDate",
       "[ASA_XCA_0]\nStartDate = 01-JAN-2000\n" + good + section(1, from, to, good), 10},
      // An entry ending exactly at the sensing start is passed over (its file
      // does not exist, so choosing it would fail); the next, starting there,
      // is chosen.
      {"entries ending and starting at the sensing start",
       section(0, from, start, "FileName = missing\n") + section(1, start, to, good), 0},
      {"a gap in the running numbers ends the search",
       section(0, from, "01-FEB-2008", good) + section(2, from, to, good), 10},
      {"a name too long for the drivers' path buffer",
       section(0, from, to, "FileName = " + std::string(505, 'n') + "\n"), 10},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    std::string result = "unset";
    EXPECT_EQ(find(c.list, &result), c.code);
    EXPECT_EQ(result, c.code == 0 ? dir_ + "ASA_XCA_good" : "unset");
  }
}

// A list or product that cannot be opened, a list beyond the size limit and
// a product without a readable sensing start date fail without a result.
TEST_F(AuxList, UnreadableListsAndProductsFail) {
  const std::string list = section(0, "01-JAN-1980", "01-JAN-2020", "FileName = ASA_XCA_good\n");
  std::string result = "unset";
  EXPECT_EQ(find_aux(product_.c_str(), dir_.c_str(), "ASA_XCA", result), 9);
  WriteFile(dir_ + "ASA_AUX_list.dat", list);
  EXPECT_EQ(find_aux((dir_ + "missing").c_str(), dir_.c_str(), "ASA_XCA", result), 9);
  std::filesystem::resize_file(dir_ + "ASA_AUX_list.dat", kProfileMaxFileSize + 1);
  FreeProfile();
  EXPECT_EQ(find_aux(product_.c_str(), dir_.c_str(), "ASA_XCA", result), 4);
  for (const char* start : {"                           ", "xx-MAR-2008 10:00:00.000000",
                            "02-MAR-2008 99:00:00.000000"}) {
    SCOPED_TRACE(start);
    product_ = product(start);
    EXPECT_EQ(find(list, &result), 4);
  }
  // A product too short to hold its sensing start.
  WriteFile(product_, std::string(360, 'x'));
  EXPECT_EQ(find(list, &result), 4);
  EXPECT_EQ(result, "unset");
}

}  // namespace
