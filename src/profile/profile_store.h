// In-memory form of a cached parameter file, shared by the profile library's
// sources.  Sections and records are held in file order; lookups walk them
// from the back, so the later of two equal names is found first.
#pragma once

#include <cstdio>
#include <memory>
#include <string>
#include <vector>

namespace vlr::profile {

struct ProfileEntry {
  std::string key;
  std::string value;
};

struct ProfileSection {
  // False while a '[' has been read but no ']': such a section is never
  // matched and never written.
  bool named = false;
  std::string name;
  std::vector<std::unique_ptr<ProfileEntry>> records;
};

struct ProfileCacheEntry {
  std::string file;
  std::vector<std::unique_ptr<ProfileSection>> sections;
  // The file was larger than kProfileMaxFileSize: it has no sections, takes
  // no values and is never written.
  bool refused = false;
};

// Parses the parameter-file text of `stream` into `entry` (appending).
// False, with the parse left incomplete, when the stream holds more than
// `maxBytes` bytes.
bool ParseProfile(std::FILE* stream, ProfileCacheEntry& entry, long long maxBytes);

// Prints the allocation-failure message and ends the process with status 1.
[[noreturn]] void ProfileOutOfMemory(bool growing);

}  // namespace vlr::profile
