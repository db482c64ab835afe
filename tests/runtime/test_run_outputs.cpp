// The files a run began.  The host-level tests cover the raise and the
// withdrawal; here: nothing is recorded for library code used on its own,
// and a run ending through exit() also takes its files, under their last
// names, while files it did not write stay.
#include <gtest/gtest.h>

#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <string>

#include "installation.h"
#include "runtime/run_outputs.h"

using vlr_test::Exists;
using vlr_test::WriteFile;

namespace {

class RunOutputs : public ::testing::Test {
 protected:
  void SetUp() override {
    dir_ = inst_.root() + "/out/";
    std::filesystem::create_directories(dir_);
    for (const char* name : {"keep", "a", "b", "temporary"}) WriteFile(path(name), name);
  }
  void TearDown() override { VlrRunOutputsCommit(); }
  std::string path(const char* name) const { return dir_ + name; }
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

TEST_F(RunOutputs, ARunEndingThroughExitRemovesWhatItBegan) {
  EXPECT_EXIT(
      {
        VlrRunOutputsTrack();
        VlrRunOutputBegun(path("a").c_str());
        VlrRunOutputBegun(path("b").c_str());
        std::rename(path("b").c_str(), path("b2").c_str());
        VlrRunOutputMoved(path("b").c_str(), path("b2").c_str());
        // A temporary the run removed; "temporary" is written again by
        // someone else and must stay.
        VlrRunOutputBegun(path("temporary").c_str());
        VlrRunOutputRemoved(path("temporary").c_str());
        std::exit(1);
      },
      ::testing::ExitedWithCode(1), "");
  EXPECT_FALSE(Exists(path("a")));
  EXPECT_FALSE(Exists(path("b2")));
  EXPECT_TRUE(Exists(path("temporary")));
  EXPECT_TRUE(Exists(path("keep")));
}

}  // namespace
