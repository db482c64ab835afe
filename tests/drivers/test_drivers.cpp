// Choice of auxiliary files and the drivers' checks of their inputs.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <filesystem>
#include <string>
#include <vector>

#include "drivers/find_aux.h"
#include "installation.h"
#include "profile/profile.h"
#include "synth_run.h"

using vlr_test::ReadFile;
using vlr_test::RunResult;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

class FindAux : public ::testing::Test {
 protected:
  static void SetUpTestSuite() { run_ = new synth_test::SynthRun(synth_test::run_synth("")); }
  static void TearDownTestSuite() {
    synth_test::remove_run(*run_);
    delete run_;
  }
  void TearDown() override { FreeProfile(); }
  // Replaces the auxiliary list with the given text.
  void list(const std::string& text) {
    FreeProfile();
    WriteFile(run_->dir + "ASA_AUX_list.dat", text);
  }
  std::string sensingStart() const { return run_->truth.at("Scene").at("SensingStartText"); }
  static synth_test::SynthRun* run_;
};
synth_test::SynthRun* FindAux::run_ = nullptr;

TEST_F(FindAux, ChoosesTheEntryValidAtTheSensingStart) {
  ASSERT_EQ(run_->exit_code, 0);
  std::string xca, ins;
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_XCA", xca), 0);
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_INS", ins), 0);
  EXPECT_EQ(xca.rfind(run_->dir + "ASA_XCA_", 0), 0u) << xca;
  EXPECT_EQ(ins.rfind(run_->dir + "ASA_INS_", 0), 0u) << ins;
}

TEST_F(FindAux, BoundsAndGapsOfTheList) {
  const std::string start = sensingStart();
  const std::string xcaName = run_->truth.at("Scene").at("XcaFile");
  std::string result;
  // A section ending exactly at the product date is not chosen; one starting
  // there is.
  list("[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = " + start +
       "\nFileName = " + xcaName + "\n[ASA_XCA_1]\nStartDate = " + start +
       "\nStopDate = 01-JAN-2020 00:00:00\nFileName = " + xcaName + "\n");
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_XCA", result), 0);
  // A gap in the running numbers ends the search.
  list(
      "[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2001 00:00:00\n"
      "FileName = x\n[ASA_XCA_2]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2020 "
      "00:00:00\nFileName = " +
      xcaName + "\n");
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_XCA", result), 10);
  // The chosen file must exist.
  list(
      "[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2020 00:00:00\n"
      "FileName = no_such_file\n");
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_XCA", result), 10);
  // A name that would not fit the drivers' path buffer is refused.
  list(
      "[ASA_XCA_0]\nStartDate = 01-JAN-2000 00:00:00\nStopDate = 01-JAN-2020 00:00:00\n"
      "FileName = " +
      std::string(505, 'n') + "\n");
  EXPECT_EQ(find_aux(run_->product.c_str(), run_->dir.c_str(), "ASA_XCA", result), 10);
}

TEST_F(FindAux, UnreadableProducts) {
  std::string result;
  EXPECT_EQ(find_aux("/no/such/product", run_->dir.c_str(), "ASA_XCA", result), 9);
  const std::string shortProduct = run_->dir + "short.N1";
  WriteFile(shortProduct, std::string(360, 'x'));
  EXPECT_EQ(find_aux(shortProduct.c_str(), run_->dir.c_str(), "ASA_XCA", result), 4);
}

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
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(c.what);
    std::string result = "unset";
    EXPECT_EQ(find(c.list, &result), c.code);
    EXPECT_EQ(result, c.code == 0 ? dir_ + "ASA_XCA_good" : "unset");
  }
}

TEST_F(AuxList, AProductWithoutASensingStartDateFails) {
  const std::string list = section(0, "01-JAN-1980", "01-JAN-2020", "FileName = ASA_XCA_good\n");
  for (const char* start : {"                           ", "xx-MAR-2008 10:00:00.000000",
                            "02-MAR-2008 99:00:00.000000"}) {
    SCOPED_TRACE(start);
    product_ = product(start);
    std::string result = "unset";
    EXPECT_EQ(find(list, &result), 4);
    EXPECT_EQ(result, "unset");
  }
}

TEST_F(AuxList, AMissingListIsNotOpened) {
  std::string result = "unset";
  EXPECT_EQ(find_aux(product_.c_str(), dir_.c_str(), "ASA_XCA", result), 9);
  EXPECT_EQ(result, "unset");
}

TEST_F(AuxList, AListBeyondTheSizeLimitIsNotRead) {
  const std::string list =
      section(0, "01-JAN-2008", "01-JAN-2009", "FileName = ASA_XCA_good\n") + "\n";
  FreeProfile();
  WriteFile(dir_ + "ASA_AUX_list.dat", list);
  std::filesystem::resize_file(dir_ + "ASA_AUX_list.dat", kProfileMaxFileSize + 1);
  std::string result = "unset";
  EXPECT_EQ(find_aux(product_.c_str(), dir_.c_str(), "ASA_XCA", result), 4);
  EXPECT_EQ(result, "unset");
}

// The host's view of the input checks that need the product.
class DriverChecks : public ::testing::Test {
 protected:
  void SetUp() override {
    run_ = synth_test::run_synth("");
    ASSERT_EQ(run_.exit_code, 0);
    inst_.hostFiles();
    // The auxiliary list and files go into the installation's description folder.
    const std::string des = inst_.root() + "/des/";
    synth_test::shell("cp " + run_.dir + "ASA_AUX_list.dat " + run_.dir + "ASA_XCA_* " + run_.dir +
                      "ASA_INS_* " + des);
    orbit_ = run_.dir + run_.truth.at("Scene").at("OrbitFile");
  }
  void TearDown() override { synth_test::remove_run(run_); }
  RunResult run(const std::string& word, const std::vector<std::string>& args) {
    return inst_.run(word + inst_.writeArguments(args));
  }
  std::string errorFile() const { return ReadFile(inst_.workingFile() + "_error"); }
  std::vector<std::string> multilookArgs() const {
    std::vector<std::string> a(14, "NotOK");
    a[0] = run_.product;
    a[1] = run_.dir + "R";
    a[2] = orbit_;
    return a;
  }
  synth_test::SynthRun run_;
  std::string orbit_;
  TempInstallation inst_;
};

TEST_F(DriverChecks, MultilookChecksProductOutputAndOrbit) {
  std::vector<std::string> a = multilookArgs();
  a[0] = orbit_;  // not a wide-swath product
  EXPECT_EQ(run("main_multilook_WSS#", a).status, 255);
  EXPECT_NE(errorFile().find("[EC : 456962]\nWSS\n"), std::string::npos);
  a = multilookArgs();
  a[2] = run_.product;  // not an orbit file
  run("main_multilook_WSS#", a);
  EXPECT_NE(errorFile().find("[EC : 456962]\nDOR_VOR\n"), std::string::npos);
  a = multilookArgs();
  a[1] = "NotOK";
  run("main_multilook_WSS#", a);
  EXPECT_NE(errorFile().find("[EC : 456962]\nOUTNAME\n"), std::string::npos);
  EXPECT_NE(ReadFile(inst_.working() + "Process.log")
                .find("\nINPUT ASA_RS : [ " + run_.product +
                      " ]\nOUTPUT ROOT NAME : [ NotOK ]\nINPUT DORIS : [ " + orbit_ + " ]\n"),
            std::string::npos);
  // A preliminary orbit is accepted: the run gets past the checks.
  a = multilookArgs();
  a[2] = vlr_test::kSamplePor;
  run("main_multilook_WSS#", a);
  EXPECT_EQ(errorFile().find("[EC : 456962]"), std::string::npos);
  // No auxiliary file valid at the product date.
  WriteFile(inst_.root() + "/des/ASA_AUX_list.dat", "[ASA_XCA_0]\n");
  run("main_multilook_WSS#", multilookArgs());
  EXPECT_NE(errorFile().find("[EC : 130560]\nfindaux()\n"), std::string::npos);
}

// A named orbit file that is missing or cannot be read fails both commands,
// naming the file, before any output is written.
TEST_F(DriverChecks, AnOrbitFileThatCannotBeReadFailsTheRun) {
  const std::string folder = run_.dir + "orbit_folder";
  ASSERT_EQ(mkdir(folder.c_str(), 0755), 0);
  const std::string root = run_.dir + "R";
  std::vector<std::string> importArgs(14, "NotOK");
  importArgs[0] = run_.product;
  importArgs[3] = root;
  const struct {
    const char* word;
    const char* orbit;
    int status;
    const char* error;
  } cases[] = {
      {"main_import_ESA#", "missing", 9, "[EC : 9]\n"},
      {"main_import_ESA#", "folder", 4, "[EC : 4]\n"},
      {"main_multilook_WSS#", "missing", 255, "[EC : 456962]\nDOR_VOR\n"},
      {"main_multilook_WSS#", "folder", 255, "[EC : 456962]\nDOR_VOR\n"},
  };
  for (const auto& c : cases) {
    SCOPED_TRACE(std::string(c.word) + " " + c.orbit);
    const std::string orbit =
        std::string(c.orbit) == "folder" ? folder : run_.dir + "DOR_VOR_AXVF-P_missing";
    const bool import = std::string(c.word) == "main_import_ESA#";
    std::vector<std::string> a = import ? importArgs : multilookArgs();
    a[import ? 1 : 2] = orbit;
    const std::string logPath = inst_.working() + "Process.log";
    const size_t logBefore = ReadFile(logPath).size();
    EXPECT_EQ(run(c.word, a).status, c.status);
    EXPECT_NE(errorFile().find(c.error), std::string::npos) << errorFile();
    const std::string log = ReadFile(logPath).substr(logBefore);
    EXPECT_NE(log.find("PROCESSING ERROR: Orbit file " + orbit + ": "), std::string::npos) << log;
    EXPECT_FALSE(vlr_test::Exists(root));
    EXPECT_FALSE(vlr_test::Exists(root + "1"));
    EXPECT_FALSE(vlr_test::Exists(root + "1.hdr"));
  }
}

TEST_F(DriverChecks, ImportRefusesOtherProductTypes) {
  synth_test::SynthRun ims = synth_test::run_synth("--wrong-type ASA_IMS_1P");
  std::vector<std::string> a(14, "NotOK");
  a[0] = ims.product;
  a[3] = run_.dir + "R";
  EXPECT_EQ(run("main_import_ESA#", a).status, 255);
  EXPECT_NE(errorFile().find("[EC : 456962]\nWSS\n"), std::string::npos);
  const std::string log = ReadFile(inst_.working() + "Process.log");
  EXPECT_NE(log.find("PROCESSING ERROR: Input file is not a ASA_WSS dataset"), std::string::npos);
  EXPECT_EQ(log.find("SUCCESSFUL"), std::string::npos);
  synth_test::remove_run(ims);
  // An auxiliary list without a valid entry ends the import with code 10.
  WriteFile(inst_.root() + "/des/ASA_AUX_list.dat", "");
  a[0] = run_.product;
  EXPECT_EQ(run("main_import_ESA#", a).status, 10);
  EXPECT_NE(errorFile().find("[EC : 10]"), std::string::npos);
}

}  // namespace
