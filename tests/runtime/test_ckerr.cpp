// Report levels, call graph and the checked-allocation table.
#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"

namespace {

class CheckedAllocation : public ::testing::Test {
 protected:
  void SetUp() override {
    NVLR_UTILITY_ResetForTesting();
    init_ckerr_locking();
  }
  void TearDown() override {
    while (ckerr_count() > 0) free_ckerr(ckerr_entry(0)->address);
    while (ckerr_depth() > 0) deccurdep();
    // Ending the tracking runs the closing sequence with code 0, which only
    // writes where an environment exists.
    exit_ckerr();
  }
};

TEST_F(CheckedAllocation, BlocksAreSixteenByteAlignedAndRecorded) {
  void* blocks[4];
  const size_t sizes[4] = {1, 3, 17, 4096};
  for (int i = 0; i < 4; ++i) {
    blocks[i] = malloc_ckerr(sizes[i]);
    ASSERT_NE(blocks[i], nullptr);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(blocks[i]) % 16, 0u);
  }
  auto* zeros = static_cast<unsigned char*>(calloc_ckerr(7, 9));
  ASSERT_NE(zeros, nullptr);
  EXPECT_EQ(reinterpret_cast<uintptr_t>(zeros) % 16, 0u);
  for (int i = 0; i < 63; ++i) EXPECT_EQ(zeros[i], 0);
  EXPECT_EQ(ckerr_count(), 5);
  for (void* b : blocks) free_ckerr(b);
  free_ckerr(zeros);
  EXPECT_EQ(ckerr_count(), 0);
}

TEST_F(CheckedAllocation, FreeMovesLastEntryIntoTheGap) {
  void* a = malloc_ckerr(8);
  void* b = malloc_ckerr(8);
  void* c = malloc_ckerr(8);
  free_ckerr(a);
  ASSERT_EQ(ckerr_count(), 2);
  EXPECT_EQ(ckerr_entry(0)->address, c);
  EXPECT_EQ(ckerr_entry(1)->address, b);
  // An address the table does not hold is left alone.
  int local = 0;
  free_ckerr(&local);
  EXPECT_EQ(ckerr_count(), 2);
}

TEST_F(CheckedAllocation, FreeAllReleasesOnlyTheCurrentCallAndItsCallees) {
  set_ckerr_fun("caller");  // depth 1
  void* callerBlock = malloc_ckerr(32);
  set_ckerr_fun("callee");  // depth 2
  void* own = malloc_ckerr(32);
  set_ckerr_fun("grandchild");  // depth 3
  void* deeper = malloc_ckerr(32);
  deccurdep();
  ASSERT_EQ(ckerr_depth(), 2);
  freeall_ckerr();
  ASSERT_EQ(ckerr_count(), 1);
  EXPECT_EQ(ckerr_entry(0)->address, callerBlock);
  EXPECT_STREQ(ckerr_entry(0)->owner, "caller");
  (void)own;
  (void)deeper;
  deccurdep();
  // A second call at depth 2 is a new instance: the caller's block stays.
  set_ckerr_fun("second");
  void* second = malloc_ckerr(4);
  freeall_ckerr();
  ASSERT_EQ(ckerr_count(), 1);
  EXPECT_NE(ckerr_entry(0)->address, second);
  deccurdep();
  freeall_ckerr();  // depth 1 releases the caller's block
  EXPECT_EQ(ckerr_count(), 0);
}

TEST_F(CheckedAllocation, LeakReportListsOwnersAndCoordinates) {
  set_ckerr_fun("reader");
  void* outer = malloc_ckerr(10);
  set_ckerr_fun("inner");
  void* inner = malloc_ckerr(10);
  ::testing::internal::CaptureStderr();
  exit_ckerr();
  const std::string report = ::testing::internal::GetCapturedStderr();
  EXPECT_EQ(report,
            "\nPotential memory leaks detected!\n"
            "\n2 buffers left to be de-allocated.!\n"
            "--------------------------------\n"
            "ML call graph coordinates: \n"
            "reader : 0\t1\t\n"
            "inner : 0\t1\t1\t\n");
  EXPECT_EQ(ckflg_ckerr(), 0);
  // Leaked blocks stay allocated; with tracking off they are released directly.
  free_ckerr(outer);
  free_ckerr(inner);
  init_ckerr_locking();
}

TEST_F(CheckedAllocation, MatrixRowsAreZeroedAndFreed) {
  void** m = matalloc_ckerr(3, 20);
  ASSERT_NE(m, nullptr);
  EXPECT_EQ(ckerr_count(), 4);
  for (int r = 0; r < 3; ++r) {
    for (int i = 0; i < 20; ++i) EXPECT_EQ(static_cast<char*>(m[r])[i], 0);
  }
  matfree_ckerr(m, 3);
  EXPECT_EQ(ckerr_count(), 0);
  void** empty = matalloc_ckerr(0, 20);
  EXPECT_NE(empty, nullptr);
  matfree_ckerr(empty, 0);
  EXPECT_EQ(ckerr_count(), 0);
}

TEST_F(CheckedAllocation, OwnedBuffersReturnOnEveryPath) {
  auto fails = []() -> int {
    VLR_SCOPE("fails", "test");
    vlr::CkBuffer<float> samples;
    if (!samples.allocate(100)) VLR_FAIL("Memory allocation failed!", 7);
    EXPECT_EQ(ckerr_count(), 1);
    EXPECT_EQ(ckerr_depth(), 1);
    VLR_CALL(4);
    return 0;
  };
  EXPECT_EQ(fails(), 4);
  EXPECT_EQ(ckerr_count(), 0);
  EXPECT_EQ(ckerr_depth(), 0);
  EXPECT_EQ(ckerr_last_code, 4);
  vlr::CkBuffer<double> huge;
  EXPECT_FALSE(huge.allocate(SIZE_MAX / 4));
  EXPECT_EQ(ckerr_count(), 0);
}

// A count and size whose product does not fit in size_t are refused, not
// wrapped round to a small block.
TEST(CheckedAllocationSize, OverflowingCountIsRefused) {
  NVLR_UTILITY_ResetForTesting();
  void* block = calloc_ckerr(SIZE_MAX / 8 + 1, 16);
  EXPECT_EQ(block, nullptr);
  free_ckerr(block);
}

TEST(Report, LevelsAreSilentUntilReportsAreOnAndCountOtherwise) {
  NVLR_UTILITY_ResetForTesting();
  set_flg_report(0);
  // A fatal level while reports are off neither writes nor ends the process.
  are_add_report("no calibration", ARE_XCA_NOT_EXIST, 1, "f", "m");
  set_flg_report(1);
  const int before = ckcnt_report();
  are_add_report("just a note", ARE_WARNING, 2, "f", "m");
  EXPECT_EQ(ckcnt_report(), before + 1);
  EXPECT_EQ(are_add_report("x", ARE_MESSAGE, 12, "fun", "file"),
            static_cast<int>(std::string("x - line : 12 - function : fun - file : file").size()));
  set_flg_report(0);
}

TEST(Report, InitReportKeepsAnActiveLevelAndNeedsTracking) {
  NVLR_UTILITY_ResetForTesting();
  set_flg_report(0);
  init_report(0, "t", 2);  // tracking off: no effect
  EXPECT_EQ(ckflg_report(), 0);
  init_ckerr_locking();
  init_report(0, "t", 2);
  EXPECT_EQ(ckflg_report(), 2);
  init_report(0, "t", 3);
  EXPECT_EQ(ckflg_report(), 2);
  exit_ckerr();
  set_flg_report(0);
}

}  // namespace
