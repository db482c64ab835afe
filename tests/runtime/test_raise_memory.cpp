// The raise sequence when memory is exhausted.  This file replaces the global
// allocation functions of the test program by ones that can be told to
// refuse every request, as an exhausted heap does.
#include <gtest/gtest.h>

#include <cstdlib>
#include <new>

#include "installation.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/raise.h"

namespace {

volatile bool gRefuseAllocations = false;
void* volatile gBlock = nullptr;

}  // namespace

void* operator new(std::size_t size) {
  for (;;) {
    if (!gRefuseAllocations) {
      if (void* p = std::malloc(size == 0 ? 1 : size)) return p;
    }
    const std::new_handler handler = std::get_new_handler();
    if (handler == nullptr) throw std::bad_alloc();
    handler();
  }
}

// Not inlined: the compiler would otherwise see free() applied to the result
// of a new-expression and warn about a mismatch that is none here.
__attribute__((noinline)) void operator delete(void* p) noexcept {
  std::free(p);
}

__attribute__((noinline)) void operator delete(void* p, std::size_t) noexcept {
  std::free(p);
}

namespace {

TEST(RaiseUnderMemoryExhaustion, EndsWithTheFirstCode) {
  NVLR_UTILITY_ResetForTesting();
  vlr_test::TempInstallation inst;
  inst.useInProcess();
  inst.hostFiles();
  // The suite's allocation-failure handler raises 195840; the raise itself
  // needs memory for its texts.
  NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
  EXPECT_EXIT(
      {
        gRefuseAllocations = true;
        NVLR_UTILITY_RaiseError(4, "first", 1, nullptr);
      },
      ::testing::ExitedWithCode(4), "");
  EXPECT_EXIT(
      {
        gRefuseAllocations = true;
        // A direct call: a new-expression whose result is unused may be
        // left out altogether.
        gBlock = ::operator new(16);
      },
      ::testing::ExitedWithCode(vlr::ExitStatusFor(vlr::kCodeMemory)), "");
  NVLR_UTILITY_ResetForTesting();
}

}  // namespace
