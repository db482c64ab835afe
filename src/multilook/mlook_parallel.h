// Two-way split of a loop between the calling thread and one helper thread
// that lives as long as its owner, so that short loops do not pay for
// starting a thread each time.
#pragma once

#include <algorithm>
#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <system_error>
#include <thread>

namespace mlook_detail {

// One step of a busy wait.
inline void Relax() {
#if defined(__x86_64__) || defined(__i386__)
  __builtin_ia32_pause();
#else
  std::this_thread::yield();
#endif
}

class HelperThread {
 public:
  HelperThread() {
    try {
      thread_ = std::thread([this] { loop(); });
    } catch (const std::system_error&) {
      // Without a helper every task runs on the calling thread.
    }
  }
  ~HelperThread() {
    if (!thread_.joinable()) return;
    {
      std::lock_guard<std::mutex> lock(mutex_);
      stop_.store(true, std::memory_order_release);
    }
    wake_.notify_one();
    thread_.join();
  }
  HelperThread(const HelperThread&) = delete;
  HelperThread& operator=(const HelperThread&) = delete;

  // Runs `theirs` on the helper and `mine` on the calling thread; returns
  // when both have finished.  When the helper has not taken `theirs` by the
  // time `mine` is done (it was asleep or not scheduled), the calling thread
  // takes it back and runs it itself rather than wait for the helper.
  void run(const std::function<void()>& theirs, const std::function<void()>& mine) {
    if (!thread_.joinable()) {
      mine();
      theirs();
      return;
    }
    done_.store(false, std::memory_order_relaxed);
    {
      std::lock_guard<std::mutex> lock(mutex_);
      task_.store(&theirs, std::memory_order_release);
    }
    wake_.notify_one();
    mine();
    if (task_.exchange(nullptr, std::memory_order_acq_rel) != nullptr) {
      theirs();
      return;
    }
    // The helper took the task: the halves take about as long, so wait
    // briefly before sleeping.
    for (int i = 0; i < kSpins && !done_.load(std::memory_order_acquire); ++i) Relax();
    if (done_.load(std::memory_order_acquire)) return;
    std::unique_lock<std::mutex> lock(mutex_);
    finished_.wait(lock, [this] { return done_.load(std::memory_order_acquire); });
  }

 private:
  // Polls before a thread goes to sleep: waking a sleeping thread costs
  // more than the short loops it runs.
  static constexpr int kSpins = 1 << 15;

  // A task is claimed by whoever takes it out of task_ first: the helper
  // here, or the calling thread in run() when the helper came too late.
  void loop() {
    for (;;) {
      const std::function<void()>* task = nullptr;
      for (int i = 0; i < kSpins && task == nullptr && !stop_.load(std::memory_order_acquire);
           ++i) {
        if (task_.load(std::memory_order_acquire) != nullptr)
          task = task_.exchange(nullptr, std::memory_order_acq_rel);
        if (task == nullptr) Relax();
      }
      if (task == nullptr && !stop_.load(std::memory_order_acquire)) {
        std::unique_lock<std::mutex> lock(mutex_);
        wake_.wait(lock, [this] {
          return stop_.load(std::memory_order_acquire) ||
                 task_.load(std::memory_order_acquire) != nullptr;
        });
        task = task_.exchange(nullptr, std::memory_order_acq_rel);
      }
      if (stop_.load(std::memory_order_acquire)) return;
      if (task == nullptr) continue;
      (*task)();
      {
        std::lock_guard<std::mutex> lock(mutex_);
        done_.store(true, std::memory_order_release);
      }
      finished_.notify_one();
    }
  }

  std::mutex mutex_;
  std::condition_variable wake_, finished_;
  std::atomic<const std::function<void()>*> task_{nullptr};
  std::atomic<bool> done_{true};
  std::atomic<bool> stop_{false};
  std::thread thread_;
};

// Runs body(first, last, thread) over [0, count) in pieces of `chunk`
// items that the calling thread (thread 0) and the helper (thread 1) take in
// turn as they become free, so that a late or slowed helper leaves its share
// to the calling thread.  The body must only compute: no report, no call
// graph, no checked allocation.
//
// `first`, when given, runs on the calling thread before it takes any
// piece; it may do what the body may not, but must not touch what the body
// works on.
template <class Body, class First>
void ParallelChunks(HelperThread* helper, int count, int chunk, const Body& body,
                    const First& first) {
  std::atomic<int> next{0};
  auto work = [&next, &body, count, chunk](int thread) {
    for (;;) {
      const int from = next.fetch_add(chunk, std::memory_order_relaxed);
      if (from >= count) return;
      body(from, std::min(from + chunk, count), thread);
    }
  };
  if (count <= chunk || helper == nullptr) {
    first();
    work(0);
    return;
  }
  helper->run([&work] { work(1); },
              [&work, &first] {
                first();
                work(0);
              });
}

template <class Body>
void ParallelChunks(HelperThread* helper, int count, int chunk, const Body& body) {
  ParallelChunks(helper, count, chunk, body, [] {});
}

}  // namespace mlook_detail
