// Progress protocol: the working file holds the percent and a message.
#include "runtime/progress.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/working_file.h"

namespace {

constexpr const char* kModule = "vlr_generic_utility";
constexpr int kMaxPercent = 99;

// Not part of the suite state: it outlives the environment's
// initialisation, which resets that state.
VlrProgressObserver gObserver = nullptr;

void traceStreamState(FILE* f, int attempt) {
  if (!NVLR_UTILITY_IsTraceOn()) return;
  std::string words = " File ";
  if (f != nullptr && std::feof(f)) words += "End of file reached ";
  if (f != nullptr && std::ferror(f))
    words += "| A possibly recoverable formatting or conversion error ";
  if (f == nullptr) words += "| A severe I/O error or unknown state";
  NVLR_UTILITY_TracePrint("%s attempt open : %d\n", words.c_str(), attempt);
}

// Withdrawal at a chosen point, for tests of what a withdrawn run leaves:
// with VELORAN_TEST_WITHDRAW_AT set to "<phase>@<percent>", the run does what
// the host does when the working file shows that phase (its message line, or
// the process label) at that percent or beyond: it deletes "_batch_ok", and
// the next progress update ends the run as withdrawn.
void withdrawWhenAsked(const std::string& working, int percent, const std::string& message) {
  const char* request = std::getenv("VELORAN_TEST_WITHDRAW_AT");
  const char* at = request != nullptr ? std::strrchr(request, '@') : nullptr;
  if (at == nullptr) return;
  const std::string phase(request, at);
  if (percent < std::atoi(at + 1)) return;
  if (phase != message && " " + phase != NVLR_UTILITY_ProcessLabel()) return;
  std::remove((working + "_batch_ok").c_str());
}

FILE* openWorkingFile(const std::string& path) {
  const int fd = ::open(path.c_str(), O_RDWR | O_CREAT, 0666);
  if (fd < 0) return nullptr;
  FILE* f = fdopen(fd, "r+");
  if (f == nullptr) ::close(fd);
  return f;
}

}  // namespace

int getAndSetPerc(int previous, int current, const char* message) {
  if (current == previous) return 1;
  // The host reads -1 and -2 on line 1 as the error and warning status.
  if (current < 0) current = 0;
  if (current > kMaxPercent) current = kMaxPercent;
  const std::string& working = NVLR_UTILITY_WorkingFile();
  if (!NVLR_UTILITY_FileExists((working + "_batch_ok").c_str())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBatchWithdrawn, kModule, __LINE__, working.c_str());
  }
  FILE* f = nullptr;
  if (!NVLR_UTILITY_FileExists(working.c_str())) {
    NVLR_UTILITY_TracePrint("getAndSetPerc - Not found the file : %s\n", working.c_str());
    NVLR_UTILITY_TracePrint(" attempt create : %d\n", 1);
  }
  // Opened for reading and writing, created when missing and never
  // truncated: a run sharing the working file may delete it at its end
  // between any check here and the opening, and that must not end this run.
  for (int attempt = 1; attempt <= kWorkingOpenAttempts; ++attempt) {
    f = openWorkingFile(working);
    if (f != nullptr) break;
    traceStreamState(f, attempt);
    const int error = errno;
    if (!VlrTransientOpenError(error)) break;
    sleep(static_cast<unsigned>(attempt - 1));
  }
  if (f == nullptr) {
    NVLR_UTILITY_RaiseError(vlr::kCodeBatchWithdrawn, kModule, __LINE__, working.c_str());
  }
  const std::string first = VlrReadWorkingLine(f);
  const std::string second = VlrReadWorkingLine(f);
  if (std::atoi(first.c_str()) > 100) {
    std::fclose(f);
    NVLR_UTILITY_RaiseError(vlr::kCodeBatchWithdrawn, kModule, __LINE__, working.c_str());
  }
  std::rewind(f);
  const std::string shown = message ? message : second;
  std::fprintf(f, "%i\n%s\n", current, shown.c_str());
  std::fflush(f);
  if (ftruncate(fileno(f), std::ftell(f)) != 0) {
  }
  std::fclose(f);
  withdrawWhenAsked(working, current, shown);
  VlrNotifyProgressObserver(current, message);
  return 1;
}

void VlrSetProgressObserver(VlrProgressObserver observer) {
  gObserver = observer;
}

void VlrNotifyProgressObserver(int percent, const char* title) {
  if (gObserver != nullptr) gObserver(percent, title);
}
