// Report levels, call-graph tracking and the checked-allocation table.
#include "runtime/ckerr.h"

#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/progress.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kCheckerrModule = "checkerr_kestova";
constexpr const char* kDebugIoModule = "debugIO_kestova";
constexpr size_t kAlign = 16;

struct LevelInfo {
  const char* name;
  bool trace;
  bool log;
  int exitCode;
};

struct CkerrState {
  int reportLevel = 0;
  int reportCount = 0;
  int tracking = 0;
  int depth = 0;
  uint16_t coordinates[kCkerrMaxDepth] = {};
  char names[kCkerrMaxDepth][kCkerrNameLen] = {};
  // Kept dense: entries 0..size()-1 are live.  The table grows past its
  // nominal capacity instead of dropping entries.
  std::vector<CkerrEntry> table;
  int lastPercent = -1;
  int waitbarNesting = 0;
};

CkerrState& state() {
  static CkerrState s;
  return s;
}

LevelInfo levelInfo(int level) {
  switch (level) {
    case 0:
      return {"ERROR", true, true, 0};
    case 1:
      return {"WARNING", true, false, 0};
    case 2:
      return {"CHECKPOINT", true, false, 0};
    case 3:
      return {"ERROR_CALL_TREE", false, false, 0};
    case 4:
      return {"CORRECT_FUNCTION_CALL", false, false, 0};
    case 5:
      return {"CORRECT_SYSTEM_CALL", false, false, 0};
    case 6:
      return {"MESSAGE", true, false, 0};
    case 7:
      return {"XCA DOES NOT EXIST", true, true, 1305601};
    case 8:
      return {"XCH DOES NOT EXIST", true, true, 1305604};
    case 9:
      return {"DORVOR DOES NOT EXIST", true, true, 1305602};
    case 10:
      return {"INS DOES NOT EXIST", true, true, 1305603};
    case 11:
      return {"DEM DOES NOT COVER WHOLE IMAGE", true, true, 1370882};
    case 12:
      return {"DEM DOES NOT EXIST", true, true, 1370883};
    case 13:
      return {"IMAGE DOES NOT EXIST", true, true, 1305605};
    case 19:
      return {"BURST SYNC ERROR", true, true, 1370881};
    case 20:
      return {"OVERLAP ERROR", true, true, 1370884};
    case 21:
      return {"FILE I/O ERROR", true, true, 1305606};
    default:
      return {"", false, false, 0};
  }
}

void copyName(char* dst, const char* src) {
  if (src == nullptr) src = "";
  std::snprintf(dst, kCkerrNameLen, "%s", src);
}

// The handed-out address is the first 16-byte boundary strictly above the
// start of the underlying block; the word below it holds that start.
void* alignedBlock(void* raw) {
  if (raw == nullptr) return nullptr;
  uintptr_t start = reinterpret_cast<uintptr_t>(raw);
  uintptr_t user = (start + kAlign) & ~static_cast<uintptr_t>(kAlign - 1);
  reinterpret_cast<void**>(user)[-1] = raw;
  return reinterpret_cast<void*>(user);
}

void releaseBlock(void* address) {
  if (address != nullptr) std::free(static_cast<void**>(address)[-1]);
}

void record(void* address) {
  CkerrState& s = state();
  if (!s.tracking) return;
  CkerrEntry e{};
  e.address = address;
  e.depth = s.depth;
  std::memcpy(e.coordinates, s.coordinates, sizeof(e.coordinates));
  copyName(e.owner, s.names[s.depth]);
  s.table.push_back(e);
}

void interrupted() {
  NVLR_UTILITY_TracePrint("\n EXECUTION INTERRUPTED BY OPERATOR\n");
  NVLR_UTILITY_RaiseError(vlr::kCodeBatchWithdrawn, kDebugIoModule, __LINE__, nullptr);
}

}  // namespace

int ckerr_last_code = 0;

const char* are_level_name(int level) {
  return levelInfo(level).name;
}
int are_level_exit_code(int level) {
  return levelInfo(level).exitCode;
}

int init_report(int /*mode*/, const char* /*title*/, int level) {
  CkerrState& s = state();
  if (s.reportLevel >= 1 && s.reportLevel <= 3) return 0;
  if (!s.tracking) return 0;
  if (level >= 1 && level <= 3) {
    s.reportLevel = level;
    s.reportCount = 0;
  } else {
    s.reportLevel = 0;
  }
  return 0;
}

int set_flg_report(int level) {
  return state().reportLevel = level;
}
int ckflg_report() {
  return state().reportLevel;
}
int ckcnt_report() {
  return state().reportCount;
}
int exit_report() {
  return 0;
}

int are_add_report(const char* message, int level, int line, const char* function,
                   const char* file) {
  CkerrState& s = state();
  char record[2048];
  int len = std::snprintf(record, sizeof record, "%s - line : %d - function : %s - file : %s",
                          message ? message : "", line, function ? function : "", file ? file : "");
  if (s.reportLevel < 1 || s.reportLevel > 3) return len;
  const LevelInfo info = levelInfo(level);
  if (info.trace) {
    NVLR_UTILITY_TracePrint("Tessal %s: %s\n", info.name, record);
    NVLR_UTILITY_FlushTrace();
  }
  if (level == 0 || info.exitCode != 0) {
    NVLR_UTILITY_LogPrint("PROCESSING ERROR: %s - Tessal\n", record);
    NVLR_UTILITY_FlushTrace();
  }
  if (info.exitCode != 0) {
    NVLR_UTILITY_RaiseError(info.exitCode, kCheckerrModule, __LINE__, message);
  }
  NVLR_UTILITY_FlushTrace();
  s.reportCount++;
  return len;
}

void are_check(int error_number, int line, const char* function, const char* file) {
  if (error_number != 0)
    are_add_report(std::strerror(error_number), ARE_ERROR, line, function, file);
}

int init_ckerr_locking() {
  CkerrState& s = state();
  if (s.tracking) return 0;
  s.tracking = 1;
  std::memset(s.coordinates, 0, sizeof s.coordinates);
  s.table.clear();
  s.table.reserve(kCkerrTableCapacity);
  s.depth = 0;
  s.reportLevel = 0;
  copyName(s.names[0], "main()");
  return 0;
}

int set_ckerr_fun(const char* name) {
  CkerrState& s = state();
  if (!s.tracking) return 1;
  // Calls deeper than the coordinate vector share its last slot.
  int d = s.depth + 1;
  if (d >= kCkerrMaxDepth) d = kCkerrMaxDepth - 1;
  s.coordinates[d]++;
  s.depth = d;
  copyName(s.names[d], name);
  return 1;
}

void deccurdep() {
  CkerrState& s = state();
  if (s.depth > 0) s.depth--;
}

int ckflg_ckerr() {
  return state().tracking;
}
int ckerr_depth() {
  return state().depth;
}
const uint16_t* ckerr_coordinates() {
  return state().coordinates;
}
int ckerr_count() {
  return static_cast<int>(state().table.size());
}
const CkerrEntry* ckerr_entry(int index) {
  CkerrState& s = state();
  if (index < 0 || index >= static_cast<int>(s.table.size())) return nullptr;
  return &s.table[index];
}

int exit_ckerr() {
  CkerrState& s = state();
  if (!s.tracking) return 0;
  if (!s.table.empty()) {
    std::fprintf(stderr, "\nPotential memory leaks detected!\n");
    std::fprintf(stderr, "\n%d buffers left to be de-allocated.!\n",
                 static_cast<int>(s.table.size()));
    std::fprintf(stderr, "--------------------------------\n");
    std::fprintf(stderr, "ML call graph coordinates: \n");
    for (const CkerrEntry& e : s.table) {
      std::fprintf(stderr, "%s : ", e.owner);
      for (int d = 0; d <= e.depth; ++d) std::fprintf(stderr, "%d\t", e.coordinates[d]);
      std::fprintf(stderr, "\n");
    }
    std::fflush(stderr);
  }
  std::memset(s.coordinates, 0, sizeof s.coordinates);
  s.table.clear();
  s.tracking = 0;
  s.depth = 0;
  NVLR_UTILITY_EndProcess(0, 1, 1);
  return 0;
}

void* malloc_ckerr(size_t size) {
  void* user = nullptr;
  if (size <= SIZE_MAX - kAlign) user = alignedBlock(std::malloc(size + kAlign));
  record(user);
  return user;
}

void* calloc_ckerr(size_t count, size_t size) {
  void* user = nullptr;
  if (size == 0 || count <= (SIZE_MAX - kAlign) / size) {
    const size_t bytes = count * size;
    user = alignedBlock(std::calloc(1, bytes + kAlign));
  }
  record(user);
  return user;
}

void free_ckerr(void* address) {
  CkerrState& s = state();
  if (!s.tracking) {
    releaseBlock(address);
    return;
  }
  for (size_t i = 0; i < s.table.size(); ++i) {
    if (s.table[i].address != address) continue;
    releaseBlock(address);
    s.table[i] = s.table.back();
    s.table.pop_back();
    return;
  }
}

void freeall_ckerr() {
  CkerrState& s = state();
  if (!s.tracking) return;
  for (;;) {
    const CkerrEntry* match = nullptr;
    for (const CkerrEntry& e : s.table) {
      bool same = true;
      for (int d = s.depth; d >= 0 && same; --d) same = e.coordinates[d] == s.coordinates[d];
      if (same) {
        match = &e;
        break;
      }
    }
    if (match == nullptr) return;
    free_ckerr(match->address);
  }
}

void** matalloc_ckerr(int rows, size_t rowSize) {
  const size_t n = rows < 1 ? 0 : static_cast<size_t>(rows);
  if (n > SIZE_MAX / sizeof(void*)) return nullptr;
  void** m = static_cast<void**>(malloc_ckerr(n * sizeof(void*)));
  if (m == nullptr) return nullptr;
  for (size_t i = 0; i < n; ++i) {
    m[i] = calloc_ckerr(1, rowSize);
    if (m[i] == nullptr) return nullptr;
  }
  return m;
}

void matfree_ckerr(void** matrix, int rows) {
  if (matrix == nullptr) return;
  for (int i = 0; i < rows; ++i) free_ckerr(matrix[i]);
  free_ckerr(matrix);
}

int waitbar_open(const char* title) {
  CkerrState& s = state();
  NVLR_UTILITY_SetProcessLabel(title);
  if (s.lastPercent != 0) {
    if (getAndSetPerc(s.lastPercent, 0, title) != 1) interrupted();
    s.lastPercent = 0;
  }
  s.waitbarNesting++;
  errno = 0;
  return 0;
}

int waitbar_update(int /*handle*/, float percent) {
  CkerrState& s = state();
  // NaN and negative values show 0 (the host takes negative percents for
  // status codes); the range check also keeps the conversion defined.
  if (!(percent >= 0.0f)) percent = 0.0f;
  if (percent > 100.0f) percent = 100.0f;
  const int p = static_cast<int>(percent);
  if (p != s.lastPercent) {
    if (getAndSetPerc(s.lastPercent, p, nullptr) != 1) interrupted();
    s.lastPercent = p;
  }
  errno = 0;
  return 0;
}

int waitbar_close(int /*handle*/) {
  CkerrState& s = state();
  if (s.waitbarNesting > 0) s.waitbarNesting--;
  return 0;
}

int write_debug(const char* path, const void* buffer, int type, int countA, int countB) {
  static const int kSizes[] = {4, 8, 8, 16, 2};
  FILE* f = std::fopen(path, "wb");
  if (f == nullptr) return 0;
  const int32_t head[3] = {type, countA, countB};
  std::fwrite(head, sizeof(int32_t), 3, f);
  if (type >= 0 && type <= 4 && countA > 0 && countB > 0 && buffer != nullptr) {
    std::fwrite(buffer, static_cast<size_t>(kSizes[type]), static_cast<size_t>(countA) * countB, f);
  }
  std::fclose(f);
  return 0;
}
