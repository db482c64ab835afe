// Process-wide cache of the processing libraries' parameter files.
//
// A parameter file is a text file of bracketed sections holding one
// "key = value" record per line.  Blank lines and comment lines (first
// non-blank character '#' or ';') are skipped; any other line without '='
// inside a section stays in front of the next key, line feed included.  Every access goes through
// one in-memory cache: a file is parsed on its first access (a file that cannot be opened counts as
// empty) and all later reads and writes work on the cached copy. The disk copy changes only through
// SyncProfile.  The cache is for one thread only.
#pragma once

// Modes of GetSetProfileChar.
constexpr int kProfileGet = 0;
constexpr int kProfileSet = 1;

// Length of the text buffers of the parameter forms (GetParString).
constexpr int kProfileBufferSize = 512;

// Largest parameter file the cache reads: 16 MiB, far beyond any file of the
// installation.  A larger file is refused on its first access with the
// error report "Parameter file <name> is larger than 16777216 bytes: not
// read"; its cache entry stays empty, the readers answer
// kProfileFileRefused for every key, the writers fail and SyncProfile
// leaves the file on disk as it is.
constexpr long long kProfileMaxFileSize = 16LL * 1024 * 1024;
// Result of the readers for a file that was refused ("File reading failed").
constexpr int kProfileFileRefused = 4;

// True when `file` is cached as refused (see kProfileMaxFileSize).
bool ProfileFileRefused(const char* file);

// The single access primitive.  Get mode (0): returns the cached value of
// `key` in `section` of `file`, or nullptr when it is absent.  Set mode (1):
// stores a copy of `value` (adding the record, and the section, when needed)
// and returns the cached copy; nullptr when an argument is missing or the
// file was refused.  Section
// names and keys match exactly; when a file has several sections of the same
// name the later one is searched first.  The returned pointer stays valid
// until the value is changed or the record, section or file entry is removed.
const char* GetSetProfileChar(int mode, const char* section, const char* key, const char* value,
                              const char* file);

// Writes the cached copy of `file` to disk in the written form: for each
// section in file order "\n[name]\n", then one "key = value\n" per record.
// 0 when written (or when the file is not cached or was refused, which
// leaves it untouched), 1 when the file cannot be opened, -1 when writing or
// closing failed.  With no file (nullptr) writes
// every cached file, oldest first: 0 when all succeeded, else -1.
int SyncProfile(const char* file = nullptr);

// Drops the cache entry of `file` without writing it; with no file (nullptr)
// empties the whole cache.  A later access parses the file again.
void FreeProfile(const char* file = nullptr);

// Removes the first matching record of the first matching section (the later
// section of a name comes first).  0 when removed, 10 when not found.  On a
// file that is not cached: prints "Warning: DelProfileKey called before init"
// to stderr and returns 10.
int DelProfileKey(const char* section, const char* key, const char* file);

// Removes the first matching section with all its records.  0 when removed,
// 10 when not found.  On a file that is not cached: prints "Warning:
// DelProfileSection called before init" to stderr and returns 10.
int DelProfileSection(const char* section, const char* file);

// ASCII case-insensitive comparison (only 'A'..'Z' are folded): the
// difference of the folded bytes at the first mismatch, 0 when equal or when
// both arguments are the same pointer.
int mystrcasecmp(const char* a, const char* b);
