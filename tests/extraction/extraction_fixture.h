// What every extraction test needs from its host: the working file through
// which the line copy reports its progress.  Registered once for the whole
// test program, whichever of its files include this header.
#pragma once

#include <gtest/gtest.h>
#include <stdlib.h>

#include <cstdio>
#include <string>

#include "runtime/suite_state.h"
#include "synth_run.h"

namespace extraction_test {

// The host's side of the progress protocol: a working file and its
// "_batch_ok" companion, so that the copy's progress bar can report.
class HostWorkingFile : public ::testing::Environment {
 public:
  void SetUp() override {
    char pattern[] = "/tmp/vlr_extraction_XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    dir_ = pattern;
    const std::string working = dir_ + "/Process.working";
    std::FILE* f = std::fopen(working.c_str(), "w");
    ASSERT_NE(f, nullptr);
    std::fputs("0\nStarting\n", f);
    std::fclose(f);
    f = std::fopen((working + "_batch_ok").c_str(), "w");
    ASSERT_NE(f, nullptr);
    std::fclose(f);
    vlr_detail::suite().workingFile = working;
  }
  void TearDown() override { synth_test::shell("rm -rf '" + dir_ + "'"); }

 private:
  std::string dir_;
};

// One object for the whole program (an inline variable is initialised once).
inline ::testing::Environment* const kHostWorkingFile =
    ::testing::AddGlobalTestEnvironment(new HostWorkingFile);

}  // namespace extraction_test
