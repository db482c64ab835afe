// The process-wide parameter-file cache and its access primitive.
#include "profile/profile_cache.h"

#include <sys/stat.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <new>
#include <string>

#include "profile/profile_store.h"
#include "runtime/ckerr.h"
#include "runtime/file_utility.h"

namespace vlr::profile {

[[noreturn]] void ProfileOutOfMemory(bool growing) {
  std::fputs(growing ? "Memory re-allocation failure\n" : "Memory allocation failure\n", stderr);
  std::exit(1);
}

namespace {

constexpr const char* kModule = "profilelib";

// Cache entries in order of creation (oldest first).  The current entry is
// the one found or created by the latest lookup.
std::vector<std::unique_ptr<ProfileCacheEntry>>& Cache() {
  static std::vector<std::unique_ptr<ProfileCacheEntry>> cache;
  return cache;
}
ProfileCacheEntry* g_current = nullptr;

ProfileCacheEntry* FindCached(const char* file) {
  if (g_current != nullptr && g_current->file == file) return g_current;
  auto& cache = Cache();
  for (auto it = cache.rbegin(); it != cache.rend(); ++it) {
    if ((*it)->file == file) return it->get();
  }
  return nullptr;
}

void ReportRefused(const char* file) {
  const std::string message = NVLR_UTILITY_Format(
      "Parameter file %s is larger than %lld bytes: not read", file, kProfileMaxFileSize);
  are_add_report(message.c_str(), ARE_ERROR, __LINE__, "GetSetProfileChar", kModule);
}

// Finds the entry of `file`, parsing the file into a new entry on its first
// access.  A file that cannot be opened gives an entry without sections.
ProfileCacheEntry* FindOrLoad(const char* file) {
  ProfileCacheEntry* entry = FindCached(file);
  if (entry == nullptr) {
    auto created = std::make_unique<ProfileCacheEntry>();
    created->file = file;
    std::FILE* stream = std::fopen(file, "rb");
    if (stream != nullptr) {
      // The size is checked before anything is read; the parser stops at
      // the limit as well, for files whose size is not known beforehand.
      struct stat st;
      const bool tooLarge = ::fstat(fileno(stream), &st) == 0 && S_ISREG(st.st_mode) &&
                            static_cast<long long>(st.st_size) > kProfileMaxFileSize;
      if (tooLarge || !ParseProfile(stream, *created, kProfileMaxFileSize)) {
        created->sections.clear();
        created->refused = true;
      }
      std::fclose(stream);
    }
    errno = 0;
    if (created->refused) ReportRefused(file);
    entry = created.get();
    Cache().push_back(std::move(created));
  }
  g_current = entry;
  return entry;
}

// The first named section of that name in lookup order (later ones first).
std::vector<std::unique_ptr<ProfileSection>>::iterator FindSection(ProfileCacheEntry& entry,
                                                                   const char* section) {
  auto& sections = entry.sections;
  for (auto it = sections.end(); it != sections.begin();) {
    --it;
    if ((*it)->named && (*it)->name == section) return it;
  }
  return sections.end();
}

ProfileEntry* FindRecord(ProfileSection& section, const char* key) {
  auto& records = section.records;
  for (auto it = records.rbegin(); it != records.rend(); ++it) {
    if ((*it)->key == key) return it->get();
  }
  return nullptr;
}

const char* Access(int mode, const char* section, const char* key, const char* value,
                   const char* file) {
  ProfileCacheEntry* entry = FindOrLoad(file);
  if (entry->refused) return nullptr;
  const bool set = mode == kProfileSet;
  ProfileSection* firstMatch = nullptr;
  auto& sections = entry->sections;
  for (auto it = sections.rbegin(); it != sections.rend(); ++it) {
    ProfileSection& candidate = **it;
    if (!candidate.named || candidate.name != section) continue;
    if (ProfileEntry* record = FindRecord(candidate, key)) {
      if (set) record->value = value;
      return record->value.c_str();
    }
    if (set) {
      firstMatch = &candidate;
      break;
    }
  }
  if (!set) return nullptr;
  auto record = std::make_unique<ProfileEntry>();
  record->key = key;
  record->value = value;
  const char* stored = record->value.c_str();
  if (firstMatch == nullptr) {
    auto created = std::make_unique<ProfileSection>();
    created->named = true;
    created->name = section;
    firstMatch = created.get();
    sections.push_back(std::move(created));
  }
  firstMatch->records.push_back(std::move(record));
  return stored;
}

bool WriteEntry(std::FILE* stream, const ProfileCacheEntry& entry) {
  for (const auto& section : entry.sections) {
    if (!section->named) continue;
    std::fprintf(stream, "\n[%s]\n", section->name.c_str());
    for (const auto& record : section->records) {
      std::fprintf(stream, "%s = %s\n", record->key.c_str(), record->value.c_str());
    }
  }
  return std::ferror(stream) == 0;
}

// 0 written, 1 not opened, -1 write or close failed.  A refused file is
// left as it is.
int WriteFile(const ProfileCacheEntry& entry) {
  if (entry.refused) return 0;
  std::FILE* stream = std::fopen(entry.file.c_str(), "wb");
  if (stream == nullptr) return 1;
  const bool written = WriteEntry(stream, entry);
  const bool closed = std::fclose(stream) == 0;
  return written && closed ? 0 : -1;
}

}  // namespace
}  // namespace vlr::profile

using namespace vlr::profile;

const char* GetSetProfileChar(int mode, const char* section, const char* key, const char* value,
                              const char* file) {
  if (section == nullptr || key == nullptr || file == nullptr) return nullptr;
  if (mode == kProfileSet && value == nullptr) return nullptr;
  try {
    return Access(mode, section, key, value, file);
  } catch (const std::bad_alloc&) {
    ProfileOutOfMemory(false);
  }
}

bool ProfileFileRefused(const char* file) {
  if (file == nullptr) return false;
  const ProfileCacheEntry* entry = FindCached(file);
  return entry != nullptr && entry->refused;
}

int SyncProfile(const char* file) {
  if (file != nullptr) {
    const ProfileCacheEntry* entry = FindCached(file);
    return entry == nullptr ? 0 : WriteFile(*entry);
  }
  int result = 0;
  for (const auto& entry : Cache()) {
    if (WriteFile(*entry) != 0) result = -1;
  }
  return result;
}

void FreeProfile(const char* file) {
  auto& cache = Cache();
  if (file == nullptr) {
    cache.clear();
    g_current = nullptr;
    return;
  }
  for (auto it = cache.begin(); it != cache.end(); ++it) {
    if ((*it)->file == file) {
      if (g_current == it->get()) g_current = nullptr;
      cache.erase(it);
      return;
    }
  }
}

int DelProfileKey(const char* section, const char* key, const char* file) {
  ProfileCacheEntry* entry = file != nullptr ? FindCached(file) : nullptr;
  if (entry == nullptr) {
    std::fputs("Warning: DelProfileKey called before init\n", stderr);
    return 10;
  }
  if (section == nullptr || key == nullptr) return 10;
  auto found = FindSection(*entry, section);
  if (found == entry->sections.end()) return 10;
  auto& records = (*found)->records;
  for (auto it = records.end(); it != records.begin();) {
    --it;
    if ((*it)->key == key) {
      records.erase(it);
      return 0;
    }
  }
  return 10;
}

int DelProfileSection(const char* section, const char* file) {
  ProfileCacheEntry* entry = file != nullptr ? FindCached(file) : nullptr;
  if (entry == nullptr) {
    std::fputs("Warning: DelProfileSection called before init\n", stderr);
    return 10;
  }
  if (section == nullptr) return 10;
  auto found = FindSection(*entry, section);
  if (found == entry->sections.end()) return 10;
  entry->sections.erase(found);
  return 0;
}

int mystrcasecmp(const char* a, const char* b) {
  if (a == b) return 0;
  if (a == nullptr) return -1;
  if (b == nullptr) return 1;
  auto fold = [](unsigned char c) { return c >= 'A' && c <= 'Z' ? c - 'A' + 'a' : int{c}; };
  for (;; ++a, ++b) {
    const int ca = fold(static_cast<unsigned char>(*a));
    const int cb = fold(static_cast<unsigned char>(*b));
    if (ca != cb || ca == 0) return ca - cb;
  }
}
