// Small file helpers of the extraction: a descriptor closed on every path
// and exact positioned reads.
#pragma once

#include <cstddef>
#include <cstdint>

namespace asar {

// Owns an open file descriptor (or -1) and closes it on destruction.
class ScopedFd {
 public:
  explicit ScopedFd(int fd) : fd_(fd) {}
  ~ScopedFd();
  ScopedFd(const ScopedFd&) = delete;
  ScopedFd& operator=(const ScopedFd&) = delete;
  int get() const { return fd_; }
  bool valid() const { return fd_ >= 0; }
  // Closes now: 0, or -1 when the close failed (a late write error).
  int close();

 private:
  int fd_;
};

// Reads exactly n bytes at `offset`, retrying short and interrupted reads;
// false on an error or the end of the file.
bool ReadFullyAt(int fd, void* out, size_t n, int64_t offset);

}  // namespace asar
