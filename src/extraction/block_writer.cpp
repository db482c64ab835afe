#include "extraction/block_writer.h"

#include <unistd.h>

#include <cerrno>

BlockWriter::BlockWriter(int fd) : fd_(fd), thread_(&BlockWriter::loop, this) {}

BlockWriter::~BlockWriter() {
  finish();
}

uint64_t BlockWriter::submit(const char* data, size_t n, int64_t offset) {
  std::lock_guard<std::mutex> lock(mutex_);
  jobs_.push_back(Job{data, n, offset});
  changed_.notify_all();
  return ++submitted_;
}

void BlockWriter::wait(uint64_t ticket) {
  std::unique_lock<std::mutex> lock(mutex_);
  changed_.wait(lock, [&] { return completed_ >= ticket; });
}

int BlockWriter::finish() {
  {
    std::unique_lock<std::mutex> lock(mutex_);
    changed_.wait(lock, [&] { return completed_ >= submitted_; });
    stopping_ = true;
    changed_.notify_all();
  }
  if (thread_.joinable()) thread_.join();
  return error_;
}

void BlockWriter::loop() {
  std::unique_lock<std::mutex> lock(mutex_);
  for (;;) {
    changed_.wait(lock, [&] { return stopping_ || !jobs_.empty(); });
    if (jobs_.empty()) return;
    const Job job = jobs_.front();
    jobs_.pop_front();
    const bool skip = error_ != 0;
    lock.unlock();
    int error = 0;
    const char* p = job.data;
    size_t left = job.n;
    int64_t offset = job.offset;
    while (!skip && left > 0) {
      const ssize_t put = pwrite(fd_, p, left, static_cast<off_t>(offset));
      if (put < 0 && errno == EINTR) continue;
      if (put <= 0) {
        error = put < 0 ? errno : EIO;
        break;
      }
      p += put;
      left -= static_cast<size_t>(put);
      offset += put;
    }
    lock.lock();
    if (error != 0 && error_ == 0) error_ = error;
    ++completed_;
    changed_.notify_all();
  }
}
