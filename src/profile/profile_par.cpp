// Parameter forms: file first, section last.
#include "profile/profile_par.h"

#include "profile/profile_values.h"

int GetParString(const char* file, const char* key, int /*count*/, char* buffer, int /*flag*/,
                 const char* section) {
  return GetMyProfileString(section, key, buffer, kProfileBufferSize, file);
}

int GetParInt(const char* file, const char* key, int n, int* values, int /*flag*/,
              const char* section) {
  return GetMyProfileIntArray(section, key, values, n, file);
}

int GetParFloat(const char* file, const char* key, int n, float* values, int /*flag*/,
                const char* section) {
  return GetMyProfileFloatArray(section, key, values, n, file);
}

int GetParDouble(const char* file, const char* key, int n, double* values, int /*flag*/,
                 const char* section) {
  return GetProfileDoubleArray(section, key, values, n, file);
}

int SetParString(const char* file, const char* key, int /*count*/, const char* text, int /*flag*/,
                 const char* section) {
  const int result = WriteMyProfileString(section, key, text, file);
  SyncProfile(file);
  return result;
}

int SetParInt(const char* file, const char* key, int n, const int* values, int /*flag*/,
              const char* section) {
  const int result = WriteMyProfileIntArray(section, key, values, n, file);
  SyncProfile(file);
  return result;
}

int SetParFloat(const char* file, const char* key, int n, const float* values, int /*flag*/,
                const char* section) {
  const int result = WriteMyProfileFloatArray(section, key, values, n, file);
  SyncProfile(file);
  return result;
}

int SetParDouble(const char* file, const char* key, int n, const double* values, int /*flag*/,
                 const char* section) {
  const int result = WriteProfileDoubleArray(section, key, values, n, file);
  SyncProfile(file);
  return result;
}
