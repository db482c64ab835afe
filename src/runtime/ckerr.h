// Report, call graph and checked allocation of the processing libraries.
#pragma once

#include <cstddef>
#include <cstdint>

// Report levels.
enum AreLevel {
  ARE_ERROR = 0,
  ARE_WARNING = 1,
  ARE_CHECKPOINT = 2,
  ARE_ERROR_CALL_TREE = 3,
  ARE_CORRECT_FUNCTION_CALL = 4,
  ARE_CORRECT_SYSTEM_CALL = 5,
  ARE_MESSAGE = 6,
  ARE_XCA_NOT_EXIST = 7,
  ARE_XCH_NOT_EXIST = 8,
  ARE_DORVOR_NOT_EXIST = 9,
  ARE_INS_NOT_EXIST = 10,
  ARE_DEM_NOT_COVER = 11,
  ARE_DEM_NOT_EXIST = 12,
  ARE_IMAGE_NOT_EXIST = 13,
  ARE_BURST_SYNC = 19,
  ARE_OVERLAP = 20,
  ARE_FILE_IO = 21,
};

constexpr int kCkerrMaxDepth = 64;
constexpr int kCkerrNameLen = 128;
constexpr int kCkerrTableCapacity = 1024;

// Report.
int init_report(int mode, const char* title, int level);
int set_flg_report(int level);
int ckflg_report();
int ckcnt_report();
int are_add_report(const char* message, int level, int line, const char* function,
                   const char* file);
void are_check(int error_number, int line, const char* function, const char* file);
int exit_report();
// Name of a report level ("" for levels without one) and its exit code (0 when
// the level is not fatal).
const char* are_level_name(int level);
int are_level_exit_code(int level);

// Call graph.
int init_ckerr_locking();
int set_ckerr_fun(const char* name);
void deccurdep();
int ckflg_ckerr();
int ckerr_depth();
const uint16_t* ckerr_coordinates();
int exit_ckerr();

// Last code returned by a called library function.
extern int ckerr_last_code;

// Checked allocation.
void* malloc_ckerr(size_t size);
void* calloc_ckerr(size_t count, size_t size);
void free_ckerr(void* address);
void freeall_ckerr();
void** matalloc_ckerr(int rows, size_t rowSize);
void matfree_ckerr(void** matrix, int rows);

// Inspection of the allocation table.
struct CkerrEntry {
  void* address;
  int depth;
  uint16_t coordinates[kCkerrMaxDepth];
  char owner[kCkerrNameLen];
};
int ckerr_count();
const CkerrEntry* ckerr_entry(int index);

// Progress bar forwarded to the host.
int waitbar_open(const char* title);
int waitbar_update(int handle, float percent);
int waitbar_close(int handle);

// Debug dump: type, count_a, count_b as 32-bit words, then the elements.
int write_debug(const char* path, const void* buffer, int type, int countA, int countB);
