// Run-time paths whose results the host reads: warning records, the progress
// percent, the operator's interruption, failed copies, the delete helper, the
// end of a run whose working file stays, and raises inside a raise.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <chrono>
#include <climits>
#include <cmath>
#include <cstdio>
#include <cstdlib>
#include <limits>
#include <string>
#include <thread>

#include "installation.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"
#include "runtime/raise.h"

using vlr_test::Exists;
using vlr_test::MaskLocalTimes;
using vlr_test::ReadFile;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

const std::string kId = "Veloran Base ENVI 4.2.000 Aug 30 2010 ";
const std::string kStars(160, '*');
// The empty line and the two blank lines that close the error lines.
const std::string kErrorTail = "\n" + std::string(66, ' ') + "\n" + std::string(66, ' ') + "\n";

class HostPaths : public ::testing::Test {
 protected:
  explicit HostPaths(bool trace = false) : inst_(trace) {}
  void SetUp() override {
    NVLR_UTILITY_ResetForTesting();
    inst_.useInProcess();
  }
  void TearDown() override { NVLR_UTILITY_ResetForTesting(); }
  void init() { NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1); }
  std::string log() const { return ReadFile(inst_.working() + "Process.log"); }
  std::string trace() const { return ReadFile(inst_.working() + "Process.trace"); }
  std::string working() const { return ReadFile(inst_.workingFile()); }
  std::string errorFile() const { return ReadFile(inst_.workingFile() + "_error"); }
  TempInstallation inst_;
};

// With the trace on, the standard streams of the process are redirected into
// the working folder; these tests therefore act in a child process.
class TracedHostPaths : public HostPaths {
 protected:
  TracedHostPaths() : HostPaths(/*trace=*/true) {}
};

TEST_F(TracedHostPaths, WarningsAreRecordedAndProcessingGoesOn) {
  inst_.hostFiles(12, "Extracting");
  EXPECT_EXIT(
      {
        init();
        NVLR_UTILITY_WriteStart({}, "Import ESA Products", "");
        errno = 0;
        NVLR_UTILITY_RaiseWarning(vlr::kCodeRasterNotComplete, "vlr_raster", 77, "/data/R1_slc");
        // A text the warning catalog does not hold.
        NVLR_UTILITY_RaiseWarning(2 * vlr::kGroupSize + 5, "vlr_raster", 78, nullptr);
        std::_Exit(0);
      },
      ::testing::ExitedWithCode(0), "");
  const std::string text =
      "A raster file was closed before all its lines were written; the missing lines hold no data";
  EXPECT_NE(log().find("\n\nWARNING : [ERROR ID : 130561] PROCESSING WARNING [" + text +
                       "]\n  /data/R1_slc \n\n"),
            std::string::npos)
      << log();
  EXPECT_NE(log().find("\n\nWARNING : [ERROR ID : 130565] PROCESSING WARNING [GENERIC ERROR WRONG "
                       "CODE]\n   \n\n"),
            std::string::npos)
      << log();
  EXPECT_NE(trace().find("\nWARNING : PROCESSING WARNING [" + text +
                         "] (/data/R1_slc) \n  Import ESA Products   " + kId +
                         "\n    FILE=vlr_raster   LINE=77  (errno = 0)"),
            std::string::npos)
      << trace();
  // A warning is no error: the host's files keep their state.
  EXPECT_EQ(log().find("[ERROR ID : 130561]\n"), std::string::npos);
  EXPECT_EQ(working(), "12\nExtracting\n");
  EXPECT_FALSE(Exists(inst_.workingFile() + "_error"));
}

// A missing working file is created, with an empty message when none is given.
TEST_F(TracedHostPaths, ProgressCreatesAMissingWorkingFile) {
  WriteFile(inst_.workingFile() + "_batch_ok", "");
  EXPECT_EXIT(
      {
        init();
        std::_Exit(getAndSetPerc(0, 42, nullptr) == 1 ? 0 : 1);
      },
      ::testing::ExitedWithCode(0), "");
  EXPECT_EQ(working(), "42\n\n");
  EXPECT_NE(trace().find("getAndSetPerc - Not found the file : " + inst_.workingFile() + "\n"),
            std::string::npos)
      << trace();
  EXPECT_NE(trace().find(" attempt create : 1"), std::string::npos) << trace();
}

TEST_F(HostPaths, PercentWrittenForTheHostStaysWithinZeroTo99) {
  // The host reads -1 and -2 on line 1 as error and warning status: no
  // percent may ever look like them.
  init();
  inst_.hostFiles(0, "keep");
  struct IntCase {
    int percent;
    const char* line;
  };
  for (const IntCase& c :
       {IntCase{57, "57\n"}, IntCase{-1, "0\n"}, IntCase{-2, "0\n"}, IntCase{-40, "0\n"},
        IntCase{INT_MIN, "0\n"}, IntCase{100, "99\n"}, IntCase{INT_MAX, "99\n"}}) {
    SCOPED_TRACE(c.percent);
    WriteFile(inst_.workingFile(), "5\nkeep\n");
    EXPECT_EQ(getAndSetPerc(5, c.percent, nullptr), 1);
    EXPECT_EQ(working(), std::string(c.line) + "keep\n");
  }
  // The progress bar forwards its single-precision percent the same way.
  struct BarCase {
    float percent;
    const char* line;
  };
  const float inf = std::numeric_limits<float>::infinity();
  for (const BarCase& c : {BarCase{42.9f, "42\n"}, BarCase{std::nanf(""), "0\n"},
                           BarCase{-3.0f, "0\n"}, BarCase{-inf, "0\n"}, BarCase{-1e30f, "0\n"},
                           BarCase{150.0f, "99\n"}, BarCase{inf, "99\n"}}) {
    SCOPED_TRACE(c.percent);
    waitbar_update(0, 50.0f);
    WriteFile(inst_.workingFile(), "5\nkeep\n");
    waitbar_update(0, c.percent);
    EXPECT_EQ(working(), std::string(c.line) + "keep\n");
  }
  // The bar forwards only changes of the whole percent.
  waitbar_update(0, 42.3f);
  WriteFile(inst_.workingFile(), "5\nkeep\n");
  waitbar_update(0, 42.9f);
  EXPECT_EQ(working(), "5\nkeep\n");
}

TEST_F(HostPaths, OperatorInterruptsThroughTheProgressBar) {
  init();
  inst_.hostFiles(0, "Starting");
  const std::string path = inst_.workingFile();
  EXPECT_EXIT(
      {
        waitbar_update(0, 1.0f);
        waitbar_open("Extracting");
        waitbar_update(0, 10.0f);
        // The host withdraws the run while the bar is shown.
        std::remove((path + "_batch_ok").c_str());
        waitbar_update(0, 20.0f);
        std::_Exit(0);
      },
      ::testing::ExitedWithCode(255), "");
  const std::string lines = "BATCH RUN INTERRUPTED\n [EC : 326400]\n" + path + "\n" + kErrorTail;
  EXPECT_EQ(working(), "-1\nExtracting\n" + lines);
  EXPECT_EQ(errorFile(), "-1\n" + lines);
  EXPECT_NE(log().find("\n\n" + kId + " [ERROR ID : 326400]\n  BATCH RUN INTERRUPTED []\n  " +
                       path + " \n\n"),
            std::string::npos)
      << log();
  EXPECT_NE(log().find("\nEND :  Extracting  -  "), std::string::npos) << log();
}

TEST_F(HostPaths, FailedCopyRaises261123) {
  init();
  inst_.hostFiles();
  WriteFile(inst_.working() + "present.dat", "data");
  struct Case {
    const char* name;
    std::string source;
    std::string destination;
  };
  const Case cases[] = {
      {"missing source", inst_.working() + "absent.dat", inst_.working() + "copy.dat"},
      {"missing destination folder", inst_.working() + "present.dat",
       inst_.working() + "no/such/copy.dat"},
  };
  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    EXPECT_EXIT(NVLR_UTILITY_CopyFile(c.source.c_str(), c.destination.c_str()),
                ::testing::ExitedWithCode(255), "");
    EXPECT_FALSE(Exists(c.destination));
    const std::string head =
        "-1\nFILE ERROR\nA file copy failed; check disk space and permissions [EC : 261123]\n";
    EXPECT_EQ(errorFile().substr(0, head.size()), head);
    EXPECT_NE(log().find("\n\n" + kId +
                         " [ERROR ID : 261123]\n  FILE ERROR [A file copy failed; check disk "
                         "space and permissions]\n  " +
                         c.source + " -> " + c.destination + " \n\n"),
              std::string::npos)
        << log();
  }
}

TEST_F(HostPaths, DeleteHelperRunsWithoutBeingWaitedFor) {
  init();
  // A folder that still holds a file cannot be removed: the helper keeps
  // trying, and the call has to come back while it does.
  const std::string target = inst_.working() + "held";
  ASSERT_EQ(mkdir(target.c_str(), 0755), 0);
  WriteFile(target + "/inside", "x");
  ASSERT_TRUE(Exists(inst_.root() + "/bin/main_delete_file"));
  EXPECT_EQ(NVLR_UTILITY_SpawnDeleteFile(target.c_str()), 0);
  EXPECT_TRUE(Exists(target));
  std::remove((target + "/inside").c_str());
  for (int i = 0; i < 100 && Exists(target); ++i) {
    std::this_thread::sleep_for(std::chrono::milliseconds(100));
  }
  EXPECT_FALSE(Exists(target));

  // Without the helper in the executable folder the start fails with the
  // system's error number.
  const std::string kept = inst_.working() + "kept.dat";
  WriteFile(kept, "x");
  NVLR_UTILITY_SetEnv((inst_.root() + "/keys/").c_str(), "VELORAN_EXE_DIR");
  EXPECT_EQ(NVLR_UTILITY_SpawnDeleteFile(kept.c_str()), ENOENT);
  EXPECT_TRUE(Exists(kept));
}

TEST_F(HostPaths, UndeletableWorkingFileFailsTheRunWithoutSuccess) {
  // A folder with a file in it stands for a working file that cannot be
  // deleted; the closing sequence retries for about half a minute.
  const std::string path = inst_.workingFile();
  ASSERT_EQ(mkdir(path.c_str(), 0755), 0);
  WriteFile(path + "/held", "x");
  init();
  EXPECT_EXIT(
      {
        NVLR_UTILITY_WriteStart({"a"}, "Import ESA Products", nullptr);
        NVLR_UTILITY_EndProcess(0, 1, 1);
        std::_Exit(0);
      },
      ::testing::ExitedWithCode(255), "");
  const std::string expected = "\n\n\n" + kStars + "\nSTART : Import ESA Products  [ " + kId +
                               " ]\n<TIME>\n" + kStars + "\n\n Parameter 0 (a)\n\n" + kStars +
                               "\n\n" + "\n\n" + kId + " [ERROR ID : 261120]\n  FILE ERROR []\n  " +
                               path + " \n\n" + "\n\n- Import ESA Products   " + kId +
                               "\n\n<TIME>\n\nERROR :\n   \n\n" + "\n" + kStars +
                               "\nEND :  Import ESA Products  -  <TIME>\n" + kStars + "\n\n";
  EXPECT_EQ(MaskLocalTimes(log()), expected);
  EXPECT_EQ(log().find("SUCCESSFUL"), std::string::npos);
  EXPECT_EQ(errorFile(), "-1\nFILE ERROR\n [EC : 261120]\n" + path + "\n" + kErrorTail);
  // The working file itself cannot take the error lines; they go beside it.
  EXPECT_EQ(ReadFile(path + "_tmp"),
            "-1\n\nFILE ERROR\n [EC : 261120]\n" + path + "\n" + kErrorTail);
}

void raiseAgain(int) {
  NVLR_UTILITY_RaiseError(7, "hook", 1, nullptr);
}

TEST_F(HostPaths, RaiseInsideTheRaiseKeepsTheFirstCode) {
  init();
  inst_.hostFiles();
  NVLR_UTILITY_SetErrorHook(raiseAgain);
  EXPECT_EXIT(NVLR_UTILITY_RaiseError(4, "first", 1, nullptr), ::testing::ExitedWithCode(4), "");
}

}  // namespace
