#include <gtest/gtest.h>

#include <cstdint>

#include "runtime/call_scope.h"
#include "runtime/ckerr.h"

TEST(CheckedAllocation, BlocksAreSixteenByteAligned) {
  for (size_t n : {1u, 3u, 17u, 4096u}) {
    void* p = malloc_ckerr(n);
    ASSERT_NE(p, nullptr);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 16, 0u);
    free_ckerr(p);
  }
}
