// Runs side by side in one working folder: a working file that another run
// writes anew while this one ends, and whole records in a shared process log.
#include <dlfcn.h>
#include <gtest/gtest.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "installation.h"
#include "runtime/environment.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"

using vlr_test::Exists;
using vlr_test::ReadFile;
using vlr_test::TempInstallation;
using vlr_test::WriteFile;

namespace {

// What the other run writes into the shared working file right after this
// run deleted it; armed by a test, empty otherwise.
std::string gRecreatePath;
const char* const kOtherRunProgress = "57\nOther run\n";

}  // namespace

// Every unlink of this test program passes through here.  When armed, the
// deletion of the working file is followed at once by the other run's
// progress update, so the interleaving that used to fail a complete run
// happens on every run of the test rather than now and then.
extern "C" int unlink(const char* path) noexcept {
  using Unlink = int (*)(const char*);
  static const Unlink real = reinterpret_cast<Unlink>(dlsym(RTLD_NEXT, "unlink"));
  const int rc = real(path);
  if (rc == 0 && !gRecreatePath.empty() && gRecreatePath == path) {
    if (FILE* f = std::fopen(path, "w")) {
      std::fputs(kOtherRunProgress, f);
      std::fclose(f);
    }
  }
  return rc;
}

namespace {

class SideBySide : public ::testing::Test {
 protected:
  void SetUp() override {
    NVLR_UTILITY_ResetForTesting();
    inst_.useInProcess();
  }
  void TearDown() override {
    gRecreatePath.clear();
    NVLR_UTILITY_ResetForTesting();
  }
  TempInstallation inst_;
};

TEST_F(SideBySide, WorkingFileWrittenAnewByAnotherRunDoesNotFailACompleteRun) {
  inst_.hostFiles();
  const std::string working = inst_.workingFile();
  gRecreatePath = working;
  EXPECT_EXIT(
      {
        NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
        NVLR_UTILITY_WriteStart({"a"}, "Import ESA Products", nullptr);
        getAndSetPerc(0, 40, "Extracting");
        NVLR_UTILITY_EndProcess(0, 1, 1);
        std::_Exit(0);
      },
      ::testing::ExitedWithCode(0), "");
  const std::string log = ReadFile(inst_.working() + "Process.log");
  EXPECT_NE(log.find("\n\nSUCCESSFUL\n\n"), std::string::npos) << log;
  EXPECT_EQ(log.find("ERROR"), std::string::npos) << log;
  EXPECT_FALSE(Exists(working + "_error"));
  // The other run's file is left as it wrote it.
  EXPECT_EQ(ReadFile(working), kOtherRunProgress);
}

// Runs in separate processes append records larger than any stream buffer to
// one log; each record must arrive whole.
TEST_F(SideBySide, SharedProcessLogHoldsWholeRecords) {
  constexpr int kRuns = 3, kRecords = 300;
  constexpr size_t kParameterSize = 20000;
  // The runs start writing together once all of them are ready.
  int gate[2];
  ASSERT_EQ(pipe(gate), 0);
  pid_t children[kRuns];
  for (int r = 0; r < kRuns; ++r) {
    children[r] = fork();
    ASSERT_GE(children[r], 0);
    if (children[r] == 0) {
      NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
      close(gate[1]);
      char go;
      if (read(gate[0], &go, 1) != 0) std::_Exit(2);
      const std::string parameters = "<" + std::string(kParameterSize, 'a' + r) + ">";
      for (int i = 0; i < kRecords; ++i)
        NVLR_UTILITY_WriteStart({}, "Import ESA Products", parameters.c_str());
      std::_Exit(0);
    }
  }
  close(gate[0]);
  close(gate[1]);
  for (pid_t child : children) {
    int status = 0;
    ASSERT_EQ(waitpid(child, &status, 0), child);
    ASSERT_TRUE(WIFEXITED(status) && WEXITSTATUS(status) == 0);
  }
  const std::string log = ReadFile(inst_.working() + "Process.log");
  int whole[kRuns] = {};
  size_t at = 0;
  while ((at = log.find('<', at)) != std::string::npos) {
    const size_t close = log.find('>', at);
    ASSERT_NE(close, std::string::npos);
    const std::string block = log.substr(at + 1, close - at - 1);
    ASSERT_EQ(block.size(), kParameterSize) << "a record was split by another run's record";
    const int run = block[0] - 'a';
    ASSERT_TRUE(run >= 0 && run < kRuns);
    ASSERT_EQ(block.find_first_not_of(block[0]), std::string::npos);
    ++whole[run];
    at = close;
  }
  for (int r = 0; r < kRuns; ++r) EXPECT_EQ(whole[r], kRecords);
}

}  // namespace
