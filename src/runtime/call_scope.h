// RAII form of the processing libraries' calling convention.
//
// A CallScope registers the function with the call graph on construction and
// leaves it on destruction, on every return path.  CkBuffer owns a checked
// block and hands it back through free_ckerr when it goes out of scope.
#pragma once

#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <type_traits>
#include <utility>

#include "runtime/ckerr.h"

namespace vlr {

class CallScope {
 public:
  CallScope(const char* function, const char* module, int line)
      : function_(function), module_(module) {
    are_check(errno, line, function_, module_);
    errno = 0;
    set_ckerr_fun(function_);
  }
  ~CallScope() { deccurdep(); }
  CallScope(const CallScope&) = delete;
  CallScope& operator=(const CallScope&) = delete;

  // After a called library function: keeps its code, reports a non-zero code
  // at the call-tree level and checks errno.  Returns the code.
  int callee(int code, int line) {
    ckerr_last_code = code;
    if (code != 0)
      are_add_report("Called function returned ERROR", ARE_ERROR_CALL_TREE, line, function_,
                     module_);
    are_check(errno, line, function_, module_);
    errno = 0;
    return code;
  }
  // A failure of this function: reports the message and returns the code.
  int fail(const char* message, int code, int line) {
    are_add_report(message, ARE_ERROR, line, function_, module_);
    return code;
  }
  void report(const char* message, int level, int line) {
    are_add_report(message, level, line, function_, module_);
  }
  const char* function() const { return function_; }
  const char* module() const { return module_; }

 private:
  const char* function_;
  const char* module_;
};

// A checked block of n elements of T, released on destruction.
template <class T>
class CkBuffer {
  static_assert(std::is_trivially_copyable<T>::value, "checked buffers hold plain data");

 public:
  CkBuffer() = default;
  ~CkBuffer() { reset(); }
  CkBuffer(const CkBuffer&) = delete;
  CkBuffer& operator=(const CkBuffer&) = delete;
  CkBuffer(CkBuffer&& other) noexcept
      : data_(std::exchange(other.data_, nullptr)), size_(std::exchange(other.size_, 0)) {}
  CkBuffer& operator=(CkBuffer&& other) noexcept {
    if (this != &other) {
      reset();
      data_ = std::exchange(other.data_, nullptr);
      size_ = std::exchange(other.size_, 0);
    }
    return *this;
  }

  // Allocates n zeroed elements; false (and empty) when the size overflows or
  // the allocation fails.
  bool allocate(size_t n) {
    reset();
    if (n == 0) return true;
    if (n > std::numeric_limits<size_t>::max() / sizeof(T)) return false;
    data_ = static_cast<T*>(calloc_ckerr(n, sizeof(T)));
    if (data_ == nullptr) {
      free_ckerr(nullptr);
      return false;
    }
    size_ = n;
    return true;
  }
  void reset() {
    if (data_ != nullptr) free_ckerr(data_);
    data_ = nullptr;
    size_ = 0;
  }
  // Gives up ownership; the caller frees with free_ckerr.
  T* release() {
    size_ = 0;
    return std::exchange(data_, nullptr);
  }

  T* data() { return data_; }
  const T* data() const { return data_; }
  size_t size() const { return size_; }
  bool empty() const { return size_ == 0; }
  T& operator[](size_t i) { return data_[i]; }
  const T& operator[](size_t i) const { return data_[i]; }
  T* begin() { return data_; }
  T* end() { return data_ + size_; }
  const T* begin() const { return data_; }
  const T* end() const { return data_ + size_; }

 private:
  T* data_ = nullptr;
  size_t size_ = 0;
};

}  // namespace vlr

// Opens the call scope of the enclosing function; `module` is the source
// module name that reports show.
#define VLR_SCOPE(function, module) ::vlr::CallScope vlr_scope_((function), (module), __LINE__)
// Runs a library call and returns its code from the enclosing function when
// it failed.
#define VLR_CALL(expr)                                                       \
  do {                                                                       \
    const int vlr_rc_ = vlr_scope_.callee(static_cast<int>(expr), __LINE__); \
    if (vlr_rc_ != 0) return vlr_rc_;                                        \
  } while (0)
// Reports a failure of the enclosing function and returns code.
#define VLR_FAIL(message, code) return vlr_scope_.fail((message), (code), __LINE__)
#define VLR_REPORT(message, level) vlr_scope_.report((message), (level), __LINE__)
