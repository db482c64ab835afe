// Checked forms: a failure of the plain form ends the process with status 1.
#include "profile/profile_checked.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>

#include "profile/profile_values.h"

namespace {

const char* Text(const char* s) {
  return s != nullptr ? s : "";
}

// Prints the message to stderr and ends the process with status 1.
[[noreturn]] __attribute__((format(printf, 1, 2))) void Die(const char* format, ...) {
  va_list args;
  va_start(args, format);
  std::vfprintf(stderr, format, args);
  va_end(args);
  std::exit(1);
}

[[noreturn]] void Fail(const char* operation, const char* section, const char* key,
                       const char* file) {
  Die("Error in %s: section %s, key %s, file %s\n", operation, Text(section), Text(key),
      Text(file));
}

}  // namespace

int GetCheckMyProfileString(const char* section, const char* key, char* buffer, int size,
                            const char* file) {
  if (GetMyProfileString(section, key, buffer, size, file) != 0) {
    Fail("GetMyProfileString", section, key, file);
  }
  return 0;
}

int WriteCheckMyProfileString(const char* section, const char* key, const char* text,
                              const char* file) {
  if (WriteMyProfileString(section, key, text, file) != 0) {
    Die("Error in WriteMyProfileString: section %s, key %s, string %s, file %s\n", Text(section),
        Text(key), Text(text), Text(file));
  }
  return 0;
}

int GetCheckMyProfileStringArray(const char* section, const char* key, char** strings, int n,
                                 int elementSize, const char* file) {
  if (GetMyProfileStringArray(section, key, strings, n, elementSize, file) != 0) {
    Fail("GetMyProfileStringArray", section, key, file);
  }
  return 0;
}

#define VLR_CHECKED_ARRAY(checked, plain, type)                                             \
  int checked(const char* section, const char* key, type values, int n, const char* file) { \
    if (plain(section, key, values, n, file) != 0) Fail(#plain, section, key, file);        \
    return 0;                                                                               \
  }

VLR_CHECKED_ARRAY(GetCheckMyProfileIntArray, GetMyProfileIntArray, int*)
VLR_CHECKED_ARRAY(GetCheckMyProfileInt64Array, GetMyProfileInt64Array, int64_t*)
VLR_CHECKED_ARRAY(GetCheckMyProfileLongArray, GetMyProfileLongArray, long*)
VLR_CHECKED_ARRAY(GetCheckMyProfileFloatArray, GetMyProfileFloatArray, float*)
VLR_CHECKED_ARRAY(GetCheckMyProfileDoubleArray, GetProfileDoubleArray, double*)
VLR_CHECKED_ARRAY(WriteCheckMyProfileIntArray, WriteMyProfileIntArray, const int*)
VLR_CHECKED_ARRAY(WriteCheckMyProfileInt64Array, WriteMyProfileInt64Array, const int64_t*)
VLR_CHECKED_ARRAY(WriteCheckMyProfileLongArray, WriteMyProfileLongArray, const long*)
VLR_CHECKED_ARRAY(WriteCheckMyProfileFloatArray, WriteMyProfileFloatArray, const float*)
VLR_CHECKED_ARRAY(WriteCheckMyProfileDoubleArray, WriteProfileDoubleArray, const double*)

#undef VLR_CHECKED_ARRAY

int WriteCheckMyProfileInt(const char* section, const char* key, int value, const char* file) {
  if (WriteMyProfileInt(section, key, value, file) != 0) {
    Die("Error in WriteMyProfileInt: section %s, key %s, value %d, file %s\n", Text(section),
        Text(key), value, Text(file));
  }
  return 0;
}

int WriteCheckMyProfileInt64(const char* section, const char* key, int64_t value,
                             const char* file) {
  if (WriteMyProfileInt64(section, key, value, file) != 0) {
    Die("Error in WriteMyProfileInt64: section %s, key %s, value %f, file %s\n", Text(section),
        Text(key), static_cast<double>(value), Text(file));
  }
  return 0;
}

int WriteCheckMyProfileDouble(const char* section, const char* key, double value,
                              const char* file) {
  if (WriteMyProfileDouble(section, key, value, file) != 0) {
    Die("Error in WriteMyProfileDouble: section %s, key %s, value %f, file %s\n", Text(section),
        Text(key), value, Text(file));
  }
  return 0;
}
