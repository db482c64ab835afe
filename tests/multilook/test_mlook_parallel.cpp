// The two-thread split of the multilook loops: every item runs exactly once
// whichever thread gets to it, and a task handed to the helper runs once
// whether the helper takes it or the caller takes it back.
#include <gtest/gtest.h>

#include <atomic>
#include <chrono>
#include <thread>
#include <vector>

#include "multilook/mlook_parallel.h"

namespace {

using mlook_detail::HelperThread;
using mlook_detail::ParallelChunks;

TEST(MlookParallel, ChunksCoverEveryItemOnce) {
  HelperThread helper;
  for (HelperThread* h : {&helper, static_cast<HelperThread*>(nullptr)})
    for (int count : {0, 1, 5, 64, 1001})
      for (int chunk : {1, 4, 7}) {
        std::vector<std::atomic<int>> seen(static_cast<size_t>(count));
        bool badThread = false;
        ParallelChunks(h, count, chunk, [&](int from, int to, int thread) {
          if (thread != 0 && thread != 1) badThread = true;
          EXPECT_LE(to - from, chunk);
          for (int i = from; i < to; ++i) ++seen[static_cast<size_t>(i)];
        });
        EXPECT_FALSE(badThread);
        for (int i = 0; i < count; ++i)
          ASSERT_EQ(seen[static_cast<size_t>(i)].load(), 1)
              << "item " << i << " of " << count << ", chunks of " << chunk;
      }
}

// Short callers race the helper for the task (it is often taken back);
// slow callers leave it to the helper.
TEST(MlookParallel, HandedTaskRunsOnceWhoeverTakesIt) {
  HelperThread helper;
  std::atomic<int> theirs{0}, mine{0};
  const int rounds = 3000;
  for (int r = 0; r < rounds; ++r) {
    const bool slow = r % 100 == 0;
    helper.run([&theirs] { ++theirs; },
               [&mine, slow] {
                 if (slow) std::this_thread::sleep_for(std::chrono::milliseconds(1));
                 ++mine;
               });
    ASSERT_EQ(theirs.load(), r + 1) << "round " << r;
    ASSERT_EQ(mine.load(), r + 1) << "round " << r;
  }
}

}  // namespace
