// File and string utilities of the suite.
#pragma once

#include <cstdint>
#include <string>

bool NVLR_UTILITY_FileExists(const char* path);
bool NVLR_UTILITY_IsRegularFile(const char* path);
// -1 when the file does not exist.
int64_t NVLR_UTILITY_FileSize(const char* path);
bool NVLR_UTILITY_CopyFile(const char* source, const char* destination);
bool NVLR_UTILITY_CreateDir(const char* path);
bool NVLR_UTILITY_EndsWith(const char* name, const char* suffix);
void NVLR_UTILITY_RemoveSuffix(std::string& name, const char* suffix);
std::string NVLR_UTILITY_Concat(const char* a, const char* b);
std::string NVLR_UTILITY_Format(const char* format, ...) __attribute__((format(printf, 1, 2)));
int NVLR_UTILITY_SpawnDeleteFile(const char* file);
uint64_t NVLR_UTILITY_MemoryStatus();
std::string NVLR_UTILITY_Timestamp();
std::string NVLR_UTILITY_TimestampText();
// Resolves a suite header name: appends "_hdr" unless a header suffix is
// present, then falls back to the other suffixes when that file is absent.
std::string NVLR_UTILITY_ResolveHeaderName(const char* name);
// The file-name part of a path.
std::string NVLR_UTILITY_BaseName(const std::string& path);
