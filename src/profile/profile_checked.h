// Checked forms of the parameter-file readers and writers.
//
// Same arguments as the plain forms.  When the plain form fails they print
// "Error in <plain name>: section ..., key ..., file ...\n" (the single-value
// writers name the value too) to stderr and end the process with exit
// status 1.  They return 0 otherwise.
#pragma once

#include <cstdint>

int GetCheckMyProfileString(const char* section, const char* key, char* buffer, int size,
                            const char* file);
int WriteCheckMyProfileString(const char* section, const char* key, const char* text,
                              const char* file);
int GetCheckMyProfileStringArray(const char* section, const char* key, char** strings, int n,
                                 int elementSize, const char* file);
int GetCheckMyProfileIntArray(const char* section, const char* key, int* values, int n,
                              const char* file);
int GetCheckMyProfileInt64Array(const char* section, const char* key, int64_t* values, int n,
                                const char* file);
int GetCheckMyProfileLongArray(const char* section, const char* key, long* values, int n,
                               const char* file);
int GetCheckMyProfileFloatArray(const char* section, const char* key, float* values, int n,
                                const char* file);
int GetCheckMyProfileDoubleArray(const char* section, const char* key, double* values, int n,
                                 const char* file);
int WriteCheckMyProfileIntArray(const char* section, const char* key, const int* values, int n,
                                const char* file);
int WriteCheckMyProfileInt64Array(const char* section, const char* key, const int64_t* values,
                                  int n, const char* file);
int WriteCheckMyProfileLongArray(const char* section, const char* key, const long* values, int n,
                                 const char* file);
int WriteCheckMyProfileFloatArray(const char* section, const char* key, const float* values, int n,
                                  const char* file);
int WriteCheckMyProfileDoubleArray(const char* section, const char* key, const double* values,
                                   int n, const char* file);
int WriteCheckMyProfileInt(const char* section, const char* key, int value, const char* file);
int WriteCheckMyProfileInt64(const char* section, const char* key, int64_t value, const char* file);
int WriteCheckMyProfileDouble(const char* section, const char* key, double value, const char* file);
