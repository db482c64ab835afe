// The run's output files in a fixed table that a signal handler can walk.
#include "runtime/run_outputs.h"

#include <unistd.h>

#include <atomic>
#include <csignal>
#include <cstdlib>
#include <cstring>

namespace {

// A run writes a few dozen files; the drivers limit names to 511 characters
// and the outputs add short suffixes.
constexpr int kSlots = 128;
constexpr size_t kPathSize = 1024;

// An entry is live while its first byte is not zero.  Writers store the
// first byte last, so a reader that interrupts them sees either nothing or
// the whole name.
char gPaths[kSlots][kPathSize];
// Entries at or beyond this index have never been used.
volatile std::sig_atomic_t gUsed = 0;
volatile std::sig_atomic_t gTracking = 0;
bool gExitHandler = false;

void removeAtExit() {
  // A normal end of a successful run has committed; anything left belongs
  // to a run that ended through exit() on a failure.
  VlrRunOutputsDiscard();
}

int find(const char* path) {
  for (int i = 0; i < gUsed; ++i)
    if (gPaths[i][0] != '\0' && std::strcmp(gPaths[i], path) == 0) return i;
  return -1;
}

void clear(int slot) {
  gPaths[slot][0] = '\0';
  std::atomic_signal_fence(std::memory_order_seq_cst);
}

}  // namespace

void VlrRunOutputsTrack() {
  gTracking = 1;
  if (!gExitHandler) gExitHandler = std::atexit(removeAtExit) == 0;
}

bool VlrRunOutputBegun(const char* path) {
  if (gTracking == 0 || path == nullptr || path[0] == '\0') return false;
  const size_t length = std::strlen(path);
  if (length >= kPathSize) return false;
  if (find(path) >= 0) return true;
  int slot = 0;
  while (slot < gUsed && gPaths[slot][0] != '\0') ++slot;
  if (slot == kSlots) return false;
  char* entry = gPaths[slot];
  std::memcpy(entry + 1, path + 1, length);
  std::atomic_signal_fence(std::memory_order_seq_cst);
  entry[0] = path[0];
  std::atomic_signal_fence(std::memory_order_seq_cst);
  if (slot == gUsed) gUsed = slot + 1;
  return true;
}

void VlrRunOutputMoved(const char* from, const char* to) {
  if (gTracking == 0 || from == nullptr) return;
  // The new name is recorded before the old one goes, so that the file is
  // always known under one of them.
  VlrRunOutputBegun(to);
  const int slot = find(from);
  if (slot >= 0 && (to == nullptr || std::strcmp(from, to) != 0)) clear(slot);
}

void VlrRunOutputRemoved(const char* path) {
  if (gTracking == 0 || path == nullptr) return;
  const int slot = find(path);
  if (slot >= 0) clear(slot);
}

void VlrRunOutputsCommit() {
  gTracking = 0;
  for (int i = 0; i < gUsed; ++i) clear(i);
  gUsed = 0;
}

void VlrRunOutputsDiscard() {
  gTracking = 0;
  for (int i = 0; i < gUsed; ++i) {
    if (gPaths[i][0] == '\0') continue;
    unlink(gPaths[i]);
    clear(i);
  }
  gUsed = 0;
}

int VlrRunOutputsCount() {
  int n = 0;
  for (int i = 0; i < gUsed; ++i)
    if (gPaths[i][0] != '\0') ++n;
  return n;
}
