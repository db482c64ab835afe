// An open C stream that is closed when its owner goes away.
#pragma once

#include <cstdio>
#include <utility>

class FileHandle {
 public:
  FileHandle() = default;
  // Opens `path` with fopen's `mode`; not valid() when it cannot be opened.
  FileHandle(const char* path, const char* mode)
      : f_(path != nullptr ? std::fopen(path, mode) : nullptr) {}
  // Takes over a stream already open (or nullptr).
  explicit FileHandle(std::FILE* f) : f_(f) {}
  ~FileHandle() { reset(); }
  FileHandle(FileHandle&& other) noexcept : f_(std::exchange(other.f_, nullptr)) {}
  FileHandle& operator=(FileHandle&& other) noexcept {
    if (this != &other) {
      reset();
      f_ = std::exchange(other.f_, nullptr);
    }
    return *this;
  }
  FileHandle(const FileHandle&) = delete;
  FileHandle& operator=(const FileHandle&) = delete;

  bool valid() const { return f_ != nullptr; }
  explicit operator bool() const { return f_ != nullptr; }
  std::FILE* get() const { return f_; }

  // Closes now.  False when the close fails: the last buffered writes may
  // not have reached the file.  True when nothing was open.
  bool close() { return f_ == nullptr || std::fclose(std::exchange(f_, nullptr)) == 0; }
  // Closes whatever is open, ignoring the result.
  void reset() {
    if (f_ != nullptr) std::fclose(std::exchange(f_, nullptr));
  }

 private:
  std::FILE* f_ = nullptr;
};
