// Parameter forms: the file comes first, the section last.  The `flag`
// argument (callers pass 1) and the `count` of the string forms are not read.
#pragma once

#include "profile/profile_cache.h"

// GetMyProfileString into a buffer of kProfileBufferSize (512) characters.
int GetParString(const char* file, const char* key, int count, char* buffer, int flag,
                 const char* section);
// GetMyProfileIntArray / GetMyProfileFloatArray / GetProfileDoubleArray.
int GetParInt(const char* file, const char* key, int n, int* values, int flag, const char* section);
int GetParFloat(const char* file, const char* key, int n, float* values, int flag,
                const char* section);
int GetParDouble(const char* file, const char* key, int n, double* values, int flag,
                 const char* section);

// The writer, then SyncProfile(file); the writer's result is returned, the
// synchronisation's is not.
int SetParString(const char* file, const char* key, int count, const char* text, int flag,
                 const char* section);
int SetParInt(const char* file, const char* key, int n, const int* values, int flag,
              const char* section);
int SetParFloat(const char* file, const char* key, int n, const float* values, int flag,
                const char* section);
int SetParDouble(const char* file, const char* key, int n, const double* values, int flag,
                 const char* section);
