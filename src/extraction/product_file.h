// Small file helpers of the extraction: a descriptor closed on every path,
// exact positioned reads, and UTC texts of the product headers.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

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

// A UTC text ("02-MAR-2008 10:00:00.000000") as sec85; false when it is not
// a date.
bool ParseUtcText(const std::string& text, double* t);

}  // namespace asar
