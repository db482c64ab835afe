// The files a run began: removed when it ends with a code, kept when it
// succeeds, and nothing else is ever removed.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "installation.h"
#include "runtime/environment.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"

using vlr_test::Exists;
using vlr_test::WriteFile;

namespace {

class RunOutputs : public ::testing::Test {
 protected:
  void SetUp() override {
    dir_ = inst_.root() + "/out/";
    std::filesystem::create_directories(dir_);
    WriteFile(dir_ + "keep", "not written by the run");
    for (const char* name : {"a", "b", "temporary"}) WriteFile(dir_ + name, name);
  }
  void TearDown() override {
    VlrRunOutputsCommit();
    NVLR_UTILITY_ResetForTesting();
  }
  std::string path(const char* name) const { return dir_ + name; }
  // Records a, b (renamed to b2) and a temporary removed by the run.
  void beginRun() {
    VlrRunOutputsTrack();
    EXPECT_TRUE(VlrRunOutputBegun(path("a").c_str()));
    EXPECT_TRUE(VlrRunOutputBegun(path("a").c_str()));
    EXPECT_TRUE(VlrRunOutputBegun(path("b").c_str()));
    ASSERT_EQ(std::rename(path("b").c_str(), path("b2").c_str()), 0);
    VlrRunOutputMoved(path("b").c_str(), path("b2").c_str());
    EXPECT_TRUE(VlrRunOutputBegun(path("temporary").c_str()));
    ASSERT_EQ(std::remove(path("temporary").c_str()), 0);
    VlrRunOutputRemoved(path("temporary").c_str());
    EXPECT_EQ(VlrRunOutputsCount(), 2);
  }
  void expectRemoved() const {
    EXPECT_FALSE(Exists(path("a")));
    EXPECT_FALSE(Exists(path("b2")));
    EXPECT_TRUE(Exists(path("keep")));
  }
  vlr_test::TempInstallation inst_;
  std::string dir_;
};

TEST_F(RunOutputs, NothingIsRecordedUnlessARunTracksItsFiles) {
  EXPECT_FALSE(VlrRunOutputBegun(path("a").c_str()));
  VlrRunOutputsDiscard();
  EXPECT_TRUE(Exists(path("a")));
  VlrRunOutputsTrack();
  EXPECT_FALSE(VlrRunOutputBegun(("/" + std::string(2000, 'n')).c_str()));
  EXPECT_EQ(VlrRunOutputsCount(), 0);
}

TEST_F(RunOutputs, DiscardRemovesWhatTheRunBeganUnderItsLastName) {
  beginRun();
  VlrRunOutputsDiscard();
  expectRemoved();
  // Recording has stopped: a later file stays.
  EXPECT_FALSE(VlrRunOutputBegun(path("keep").c_str()));
}

TEST_F(RunOutputs, ASucceededRunKeepsEverything) {
  beginRun();
  VlrRunOutputsCommit();
  VlrRunOutputsDiscard();
  EXPECT_TRUE(Exists(path("a")));
  EXPECT_TRUE(Exists(path("b2")));
}

// Every way a failing run ends the process takes its files with it.
TEST_F(RunOutputs, EveryFailingEndRemovesThem) {
  inst_.useInProcess();
  inst_.hostFiles();
  NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
  EXPECT_EXIT(
      {
        beginRun();
        NVLR_UTILITY_RaiseError(4, "test", __LINE__, nullptr);
      },
      ::testing::ExitedWithCode(4), "");
  expectRemoved();
  WriteFile(path("a"), "a");
  WriteFile(path("b"), "b");
  EXPECT_EXIT(
      {
        beginRun();
        std::exit(1);
      },
      ::testing::ExitedWithCode(1), "");
  expectRemoved();
}

}  // namespace
