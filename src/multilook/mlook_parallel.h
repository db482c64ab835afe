// Two-way split of a loop between the calling thread and one helper thread
// that lives as long as its owner, so that short loops do not pay for
// starting a thread each time.
#pragma once

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
  // when both have finished.
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
    // The halves take about as long: wait briefly before sleeping.
    for (int i = 0; i < kSpins && !done_.load(std::memory_order_acquire); ++i) Relax();
    if (done_.load(std::memory_order_acquire)) return;
    std::unique_lock<std::mutex> lock(mutex_);
    finished_.wait(lock, [this] { return done_.load(std::memory_order_acquire); });
  }

 private:
  // Polls before a thread goes to sleep: waking a sleeping thread costs
  // more than the short loops it runs.
  static constexpr int kSpins = 1 << 15;

  void loop() {
    for (;;) {
      const std::function<void()>* task = nullptr;
      for (int i = 0; i < kSpins && task == nullptr && !stop_.load(std::memory_order_acquire);
           ++i) {
        task = task_.load(std::memory_order_acquire);
        if (task == nullptr) Relax();
      }
      if (task == nullptr) {
        std::unique_lock<std::mutex> lock(mutex_);
        wake_.wait(lock, [this] {
          return stop_.load(std::memory_order_acquire) ||
                 task_.load(std::memory_order_acquire) != nullptr;
        });
        task = task_.load(std::memory_order_acquire);
      }
      if (stop_.load(std::memory_order_acquire)) return;
      (*task)();
      task_.store(nullptr, std::memory_order_relaxed);
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

// Runs body(first, last) over [0, count), the upper half on the helper.
// The body must only compute: no report, no call graph, no checked
// allocation.
template <class Body>
void ParallelRange(HelperThread* helper, int count, const Body& body) {
  const int half = count / 2;
  if (half < 1 || helper == nullptr) {
    body(0, count);
    return;
  }
  helper->run([&body, half, count] { body(half, count); }, [&body, half] { body(0, half); });
}

}  // namespace mlook_detail
