// Typed readers and writers of parameter-file values.
#include "profile/profile_values.h"

#include <algorithm>
#include <cerrno>
#include <climits>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>

#include "profile/profile_cache.h"
#include "profile/profile_store.h"
#include "runtime/ckerr.h"
#include "runtime/file_utility.h"

namespace {

constexpr const char* kModule = "profilelib";

const char* Text(const char* s) {
  return s != nullptr ? s : "";
}

// Result of a reader that found no value: the key is absent (10), or the
// whole file was refused.
int Absent(const char* file) {
  return ProfileFileRefused(file) ? kProfileFileRefused : 10;
}

void WarnShortRead(const char* function, int line, int got, int n, const char* section,
                   const char* key, const char* file) {
  const std::string message =
      NVLR_UTILITY_Format("Read only %d elements of %d - SEC: %s, KEY: %s, FILE: %s", got, n,
                          Text(section), Text(key), Text(file));
  are_add_report(message.c_str(), ARE_WARNING, line, function, kModule);
}

// Keeps errno as the caller left it: number scanning must not leave ERANGE
// behind for the next library call to report.
class ErrnoGuard {
 public:
  ErrnoGuard() : saved_(errno) {}
  ~ErrnoGuard() { errno = saved_; }

 private:
  int saved_;
};

// Token scanners: true when the token starts with a number of the type (the
// rest of the token, e.g. a glued '}', is ignored).  Integers out of the
// type's range do not scan.
bool Scan(const char* token, int* out) {
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(token, &end, 10);
  if (end == token || errno == ERANGE || v < INT_MIN || v > INT_MAX) return false;
  *out = static_cast<int>(v);
  return true;
}
bool Scan(const char* token, long* out) {
  char* end = nullptr;
  errno = 0;
  const long v = std::strtol(token, &end, 10);
  if (end == token || errno == ERANGE) return false;
  *out = v;
  return true;
}
[[maybe_unused]] bool Scan(const char* token, long long* out) {
  char* end = nullptr;
  errno = 0;
  const long long v = std::strtoll(token, &end, 10);
  if (end == token || errno == ERANGE) return false;
  *out = v;
  return true;
}
bool Scan(const char* token, float* out) {
  char* end = nullptr;
  const float v = std::strtof(token, &end);
  if (end == token) return false;
  *out = v;
  return true;
}
bool Scan(const char* token, double* out) {
  char* end = nullptr;
  const double v = std::strtod(token, &end);
  if (end == token) return false;
  *out = v;
  return true;
}

bool IsSeparator(char c) {
  return c == ' ' || c == '\t';
}

template <class T>
int ReadNumbers(const char* function, int line, const char* section, const char* key, T* values,
                int n, const char* file) {
  const char* value = GetSetProfileChar(kProfileGet, section, key, nullptr, file);
  if (value == nullptr) return Absent(file);
  if (n < 0 || (n > 0 && values == nullptr)) return 10;
  ErrnoGuard guard;
  try {
    std::string copy(value);
    size_t pos = copy.empty() || copy[0] != '{' ? 0 : 1;
    int count = 0;
    while (count < n) {
      while (pos < copy.size() && IsSeparator(copy[pos])) ++pos;
      if (pos >= copy.size()) break;
      size_t end = pos;
      while (end < copy.size() && !IsSeparator(copy[end])) ++end;
      if (end < copy.size()) copy[end] = '\0';
      if (!Scan(copy.c_str() + pos, &values[count])) break;
      ++count;
      pos = end + 1;
    }
    if (count == n) return 0;
    WarnShortRead(function, line, count, n, section, key, file);
  } catch (const std::bad_alloc&) {
    vlr::profile::ProfileOutOfMemory(false);
  }
  return 10;
}

int Store(const char* function, int line, const char* section, const char* key, const char* value,
          const char* file) {
  if (GetSetProfileChar(kProfileSet, section, key, value, file) != nullptr) return 0;
  const std::string message =
      NVLR_UTILITY_Format("Parameter writing failed - SEC: %s, KEY: %s, FILE: %s", Text(section),
                          Text(key), Text(file));
  are_add_report(message.c_str(), ARE_WARNING, line, function, kModule);
  return 10;
}

std::string FormatOne(int v) {
  return NVLR_UTILITY_Format("%d", v);
}
// int64_t is long or long long depending on the platform; one of the two
// 64-bit overloads may go unused.
[[maybe_unused]] std::string FormatOne(long long v) {
  return NVLR_UTILITY_Format("%lld", v);
}
std::string FormatOne(long v) {
  return NVLR_UTILITY_Format("%ld", v);
}
std::string FormatOne(float v) {
  return NVLR_UTILITY_Format("%.*g", 7, static_cast<double>(v));
}
std::string FormatOne(double v) {
  return NVLR_UTILITY_Format("%.*g", 15, v);
}
std::string FormatOne(const char* v) {
  return "\"" + std::string(Text(v)) + "\"";
}

// One brace group of elements at first, first + stride, ...: each element
// followed by a space, trailing spaces removed before the closing brace.
template <class T>
std::string BraceGroup(const T* values, int count, int first, int stride) {
  std::string text = "{";
  for (int i = 0; i < count; ++i) {
    text += FormatOne(values[first + static_cast<long>(i) * stride]);
    text += ' ';
  }
  while (text.size() > 1 && text.back() == ' ') text.pop_back();
  text += '}';
  return text;
}

template <class T>
int WriteArray(const char* function, int line, const char* section, const char* key,
               const T* values, int n, const char* file) {
  if (n < 0 || (n > 0 && values == nullptr)) {
    return Store(function, line, section, key, nullptr, file);
  }
  try {
    return Store(function, line, section, key, BraceGroup(values, n, 0, 1).c_str(), file);
  } catch (const std::bad_alloc&) {
    vlr::profile::ProfileOutOfMemory(true);
  }
}

// Rows of a column-major matrix, one brace group per row, rows after the
// first preceded by a line feed and a tab.
template <class T>
int WriteMatrix(const char* function, int line, const char* section, const char* key,
                const T* values, int rows, int columns, const char* file) {
  if (rows < 0 || columns < 0 || (rows > 0 && columns > 0 && values == nullptr)) {
    return Store(function, line, section, key, nullptr, file);
  }
  try {
    std::string text;
    if (rows == 0) text = "{}";
    for (int i = 0; i < rows; ++i) {
      if (i > 0) text += "\n\t";
      text += BraceGroup(values, columns, i, rows);
    }
    return Store(function, line, section, key, text.c_str(), file);
  } catch (const std::bad_alloc&) {
    vlr::profile::ProfileOutOfMemory(true);
  }
}

}  // namespace

int GetMyProfileString(const char* section, const char* key, char* buffer, int size,
                       const char* file) {
  const char* value = GetSetProfileChar(kProfileGet, section, key, nullptr, file);
  if (value == nullptr) return Absent(file);
  if (buffer == nullptr || size < 1) return 10;
  const size_t length = std::min(std::strlen(value), static_cast<size_t>(size) - 1);
  std::memcpy(buffer, value, length);
  buffer[length] = '\0';
  return 0;
}

int GetMyProfileStringArray(const char* section, const char* key, char** strings, int n,
                            int elementSize, const char* file) {
  const char* value = GetSetProfileChar(kProfileGet, section, key, nullptr, file);
  if (value == nullptr) return Absent(file);
  if (n < 0 || (n > 0 && strings == nullptr)) return 10;
  const size_t capacity = elementSize > 0 ? static_cast<size_t>(elementSize) : kProfileBufferSize;
  if (value[0] != '{') return 0;
  int count = 0;
  bool truncated = false;
  const char* p = value + 1;
  while (count < n) {
    while (*p == ' ' || *p == '\t') ++p;
    if (*p == '}') return count;
    if (*p != '"') {
      if (*p != '\0') return 0;
      break;
    }
    const char* start = ++p;
    const char* close = std::strchr(start, '"');
    if (close == nullptr) break;  // unclosed quote: the element is not read
    size_t length = static_cast<size_t>(close - start);
    if (strings[count] == nullptr) return 10;
    if (length > capacity - 1) {
      length = capacity - 1;
      truncated = true;
    }
    std::memcpy(strings[count], start, length);
    strings[count][length] = '\0';
    ++count;
    p = close + 1;
  }
  if (count < n) {
    WarnShortRead("GetMyProfileStringArray", __LINE__, count, n, section, key, file);
    return 10;
  }
  if (truncated) {
    const std::string message = NVLR_UTILITY_Format(
        "String element longer than %zu characters - SEC: %s, KEY: %s, FILE: %s", capacity - 1,
        Text(section), Text(key), Text(file));
    are_add_report(message.c_str(), ARE_WARNING, __LINE__, "GetMyProfileStringArray", kModule);
    return 10;
  }
  return 0;
}

int GetMyProfileIntArray(const char* section, const char* key, int* values, int n,
                         const char* file) {
  return ReadNumbers("GetMyProfileIntArray", __LINE__, section, key, values, n, file);
}
int GetMyProfileInt64Array(const char* section, const char* key, int64_t* values, int n,
                           const char* file) {
  return ReadNumbers("GetMyProfileInt64Array", __LINE__, section, key, values, n, file);
}
int GetMyProfileLongArray(const char* section, const char* key, long* values, int n,
                          const char* file) {
  return ReadNumbers("GetMyProfileLongArray", __LINE__, section, key, values, n, file);
}
int GetMyProfileFloatArray(const char* section, const char* key, float* values, int n,
                           const char* file) {
  return ReadNumbers("GetMyProfileFloatArray", __LINE__, section, key, values, n, file);
}
int GetProfileDoubleArray(const char* section, const char* key, double* values, int n,
                          const char* file) {
  return ReadNumbers("GetProfileDoubleArray", __LINE__, section, key, values, n, file);
}

int WriteMyProfileString(const char* section, const char* key, const char* text, const char* file) {
  return Store("WriteMyProfileString", __LINE__, section, key, text, file);
}
int WriteMyProfileStringQuote(const char* section, const char* key, const char* text,
                              const char* file) {
  if (text == nullptr)
    return Store("WriteMyProfileStringQuote", __LINE__, section, key, nullptr, file);
  return Store("WriteMyProfileStringQuote", __LINE__, section, key, FormatOne(text).c_str(), file);
}
int WriteMyProfileStringArray(const char* section, const char* key, const char* const* strings,
                              int n, const char* file) {
  return WriteArray("WriteMyProfileStringArray", __LINE__, section, key, strings, n, file);
}
int WriteMyProfileStringMatrix(const char* section, const char* key, const char* const* strings,
                               int rows, int columns, const char* file) {
  return WriteMatrix("WriteMyProfileStringMatrix", __LINE__, section, key, strings, rows, columns,
                     file);
}
int WriteMyProfileInt(const char* section, const char* key, int value, const char* file) {
  return Store("WriteMyProfileInt", __LINE__, section, key, FormatOne(value).c_str(), file);
}
int WriteMyProfileInt64(const char* section, const char* key, int64_t value, const char* file) {
  return Store("WriteMyProfileInt64", __LINE__, section, key, FormatOne(value).c_str(), file);
}
int WriteMyProfileDouble(const char* section, const char* key, double value, const char* file) {
  return Store("WriteMyProfileDouble", __LINE__, section, key, FormatOne(value).c_str(), file);
}
int WriteMyProfileIntArray(const char* section, const char* key, const int* values, int n,
                           const char* file) {
  return WriteArray("WriteMyProfileIntArray", __LINE__, section, key, values, n, file);
}
int WriteMyProfileInt64Array(const char* section, const char* key, const int64_t* values, int n,
                             const char* file) {
  return WriteArray("WriteMyProfileInt64Array", __LINE__, section, key, values, n, file);
}
int WriteMyProfileLongArray(const char* section, const char* key, const long* values, int n,
                            const char* file) {
  return WriteArray("WriteMyProfileLongArray", __LINE__, section, key, values, n, file);
}
int WriteMyProfileFloatArray(const char* section, const char* key, const float* values, int n,
                             const char* file) {
  return WriteArray("WriteMyProfileFloatArray", __LINE__, section, key, values, n, file);
}
int WriteProfileDoubleArray(const char* section, const char* key, const double* values, int n,
                            const char* file) {
  return WriteArray("WriteProfileDoubleArray", __LINE__, section, key, values, n, file);
}
int WriteMyProfileDoubleMatrix(const char* section, const char* key, const double* values, int rows,
                               int columns, const char* file) {
  return WriteMatrix("WriteMyProfileDoubleMatrix", __LINE__, section, key, values, rows, columns,
                     file);
}
