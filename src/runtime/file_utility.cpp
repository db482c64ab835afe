// File and string utilities.
#include "runtime/file_utility.h"

#include <spawn.h>
#include <strings.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <sys/types.h>
#include <unistd.h>

#include <cerrno>
#include <cstdarg>
#include <cstdio>
#include <cstring>
#include <ctime>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

extern char** environ;

namespace {

constexpr const char* kModule = "vlr_generic_utility";
constexpr size_t kFormatBuffer = 25000;
constexpr const char* kDeleteProgram = "main_delete_file";

// Header suffixes, in the order in which they are tried.
const char* const kHeaderSuffixes[] = {"_hdr", ".sml", "_par", "_map", ".orb", "_orb_hdr"};

bool endsWithExact(const std::string& s, const std::string& suffix) {
  return s.size() > suffix.size() &&
         s.compare(s.size() - suffix.size(), suffix.size(), suffix) == 0;
}

struct LocalNow {
  std::tm tm;
  long micro;
};

LocalNow localNow() {
  timeval tv{};
  gettimeofday(&tv, nullptr);
  LocalNow n{};
  const time_t t = tv.tv_sec;
  localtime_r(&t, &n.tm);
  n.micro = tv.tv_usec;
  return n;
}

}  // namespace

bool NVLR_UTILITY_FileExists(const char* path) {
  struct stat st;
  return path != nullptr && stat(path, &st) == 0;
}

bool NVLR_UTILITY_IsRegularFile(const char* path) {
  struct stat st;
  return path != nullptr && stat(path, &st) == 0 && S_ISREG(st.st_mode);
}

int64_t NVLR_UTILITY_FileSize(const char* path) {
  struct stat st;
  if (path == nullptr || stat(path, &st) != 0) return -1;
  return static_cast<int64_t>(st.st_size);
}

bool NVLR_UTILITY_CopyFile(const char* source, const char* destination) {
  FILE* in = std::fopen(source, "rb");
  FILE* out = in ? std::fopen(destination, "wb") : nullptr;
  bool ok = in != nullptr && out != nullptr;
  if (ok) {
    char buffer[1 << 16];
    size_t n;
    while ((n = std::fread(buffer, 1, sizeof buffer, in)) > 0) {
      if (std::fwrite(buffer, 1, n, out) != n) {
        ok = false;
        break;
      }
    }
    if (std::ferror(in)) ok = false;
  }
  const int error = errno;
  if (in) std::fclose(in);
  if (out && std::fclose(out) != 0) ok = false;
  if (!ok) {
    NVLR_UTILITY_TracePrint("Source file name : %s\n", source);
    NVLR_UTILITY_TracePrint("Dest file name : %s\n", destination);
    NVLR_UTILITY_TracePrint("ERROR CODE %d [%s];    %s\n", error, std::strerror(error), source);
    const std::string extra = NVLR_UTILITY_Format("%s -> %s", source, destination);
    NVLR_UTILITY_RaiseError(vlr::kCodeFileCopy, kModule, __LINE__, extra.c_str());
  }
  return ok;
}

bool NVLR_UTILITY_CreateDir(const char* path) {
  const std::string p = path ? path : "";
  size_t pos = 0;
  while (pos <= p.size()) {
    size_t next = p.find('/', pos);
    if (next == std::string::npos) next = p.size();
    const std::string part = p.substr(0, next);
    if (!part.empty() && !NVLR_UTILITY_FileExists(part.c_str())) {
      if (mkdir(part.c_str(), 0777) != 0 && errno != EEXIST) {
        NVLR_UTILITY_TracePrint("Cannot create the dir = %s\n", p.c_str());
        NVLR_UTILITY_TracePrint("Cannot create the part = %s\n", part.c_str());
        NVLR_UTILITY_TracePrint("Error Code = %d\n", errno);
        return false;
      }
    }
    pos = next + 1;
  }
  return true;
}

bool NVLR_UTILITY_EndsWith(const char* name, const char* suffix) {
  if (name == nullptr || suffix == nullptr) return false;
  const size_t n = std::strlen(name), m = std::strlen(suffix);
  if (n <= m) return false;
  return std::strcmp(name + n - m, suffix) == 0 || strcasecmp(name + n - m, suffix) == 0;
}

void NVLR_UTILITY_RemoveSuffix(std::string& name, const char* suffix) {
  if (NVLR_UTILITY_EndsWith(name.c_str(), suffix)) name.resize(name.size() - std::strlen(suffix));
}

std::string NVLR_UTILITY_Concat(const char* a, const char* b) {
  return std::string(a ? a : "") + (b ? b : "");
}

std::string NVLR_UTILITY_Format(const char* format, ...) {
  char buffer[kFormatBuffer];
  va_list args;
  va_start(args, format);
  const int n = std::vsnprintf(buffer, sizeof buffer, format, args);
  va_end(args);
  return n < 0 ? std::string() : std::string(buffer);
}

int NVLR_UTILITY_SpawnDeleteFile(const char* file) {
  const std::string program = NVLR_UTILITY_EnvValue("VELORAN_EXE_DIR") + kDeleteProgram;
  NVLR_UTILITY_TracePrint("NVLR_UTILITY_SpawnDeleteFile(%s, %s)\n", program.c_str(), file);
  std::string arg = file ? file : "";
  char* argv[] = {const_cast<char*>(program.c_str()), arg.data(), nullptr};
  pid_t pid;
  const int rc = posix_spawn(&pid, program.c_str(), nullptr, nullptr, argv, environ);
  return rc;
}

uint64_t NVLR_UTILITY_MemoryStatus() {
  unsigned long long total = 0, avail = 0, swapTotal = 0, swapFree = 0, commitLimit = 0,
                     committed = 0;
  if (FILE* f = std::fopen("/proc/meminfo", "r")) {
    char line[256];
    while (std::fgets(line, sizeof line, f)) {
      unsigned long long v = 0;
      if (std::sscanf(line, "MemTotal: %llu", &v) == 1)
        total = v * 1024;
      else if (std::sscanf(line, "MemAvailable: %llu", &v) == 1)
        avail = v * 1024;
      else if (std::sscanf(line, "SwapTotal: %llu", &v) == 1)
        swapTotal = v * 1024;
      else if (std::sscanf(line, "SwapFree: %llu", &v) == 1)
        swapFree = v * 1024;
      else if (std::sscanf(line, "CommitLimit: %llu", &v) == 1)
        commitLimit = v * 1024;
      else if (std::sscanf(line, "Committed_AS: %llu", &v) == 1)
        committed = v * 1024;
    }
    std::fclose(f);
  }
  if (NVLR_UTILITY_IsTraceOn()) {
    const unsigned long long load = total ? 100 - (100 * avail) / total : 0;
    NVLR_UTILITY_TracePrint("\n Memory Status :\n");
    NVLR_UTILITY_TracePrint(" Memory Load     = %llu\n", load);
    NVLR_UTILITY_TracePrint(" Total Phys      = %llu\n", total);
    NVLR_UTILITY_TracePrint(" Avail Phys      = %llu\n", avail);
    NVLR_UTILITY_TracePrint(" Total Page File = %llu\n", swapTotal);
    NVLR_UTILITY_TracePrint(" Avail Page File = %llu\n", swapFree);
    NVLR_UTILITY_TracePrint(" Total Virtual   = %llu\n", commitLimit);
    NVLR_UTILITY_TracePrint(" Avail Virtual   = %llu\n",
                            commitLimit > committed ? commitLimit - committed : 0);
  }
  return total;
}

std::string NVLR_UTILITY_Timestamp() {
  const LocalNow n = localNow();
  return NVLR_UTILITY_Format("%04d%02d%02d%02d%02d%02d.%06d", n.tm.tm_year + 1900, n.tm.tm_mon + 1,
                             n.tm.tm_mday, n.tm.tm_hour, n.tm.tm_min, n.tm.tm_sec,
                             static_cast<int>(n.micro));
}

std::string NVLR_UTILITY_TimestampText() {
  static const char* const kMonths[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                        "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
  const LocalNow n = localNow();
  return NVLR_UTILITY_Format("%02d-%3.3s-%04d %02d:%02d:%02d.%06d", n.tm.tm_mday,
                             kMonths[n.tm.tm_mon], n.tm.tm_year + 1900, n.tm.tm_hour, n.tm.tm_min,
                             n.tm.tm_sec, static_cast<int>(n.micro));
}

std::string NVLR_UTILITY_ResolveHeaderName(const char* name) {
  std::string n = name ? name : "";
  const char* found = nullptr;
  // The longest matching suffix wins, so "_orb_hdr" is not taken for "_hdr".
  for (const char* s : kHeaderSuffixes) {
    if (endsWithExact(n, s) && (found == nullptr || std::strlen(s) > std::strlen(found))) found = s;
  }
  if (found == nullptr) {
    n += "_hdr";
    found = "_hdr";
  }
  if (NVLR_UTILITY_FileExists(n.c_str())) return n;
  const std::string stem = n.substr(0, n.size() - std::strlen(found));
  for (const char* s : kHeaderSuffixes) {
    const std::string candidate = stem + s;
    if (NVLR_UTILITY_FileExists(candidate.c_str())) return candidate;
  }
  return n;
}

std::string NVLR_UTILITY_BaseName(const std::string& path) {
  const size_t slash = path.find_last_of('/');
  return slash == std::string::npos ? path : path.substr(slash + 1);
}
