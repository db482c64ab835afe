// Sequential writing of whole blocks on a thread of its own, so that
// filling the next block (reading and converting samples) overlaps with
// handing the previous one to the file system.
//
// The thread touches nothing but the file descriptor and the blocks it is
// given: no report, no checked allocation, no other shared state.  Its only
// failure is the errno of a write, which finish() returns.
#pragma once

#include <condition_variable>
#include <cstddef>
#include <cstdint>
#include <deque>
#include <mutex>
#include <thread>

class BlockWriter {
 public:
  // Writes to `fd` (not owned; it must stay open until finish()).
  explicit BlockWriter(int fd);
  ~BlockWriter();
  BlockWriter(const BlockWriter&) = delete;
  BlockWriter& operator=(const BlockWriter&) = delete;

  // Queues n bytes at `data` for the file offset `offset`, and returns the
  // ticket of that write.  The bytes must stay untouched until done(ticket).
  uint64_t submit(const char* data, size_t n, int64_t offset);
  // Waits until the write of `ticket` (and every earlier one) is complete.
  void wait(uint64_t ticket);
  // Waits for every queued write and stops the thread.  0, or the errno of
  // the first write that failed (later writes are then skipped).
  int finish();

 private:
  struct Job {
    const char* data;
    size_t n;
    int64_t offset;
  };
  void loop();

  int fd_;
  std::mutex mutex_;
  std::condition_variable changed_;
  std::deque<Job> jobs_;
  uint64_t submitted_ = 0;
  uint64_t completed_ = 0;
  int error_ = 0;
  bool stopping_ = false;
  std::thread thread_;
};
