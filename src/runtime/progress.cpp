// Progress protocol: the working file holds the percent and a message.
#include "runtime/progress.h"

#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstdlib>
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
    f = std::fopen(working.c_str(), "w+");
  } else {
    for (int attempt = 1; attempt <= kWorkingOpenAttempts; ++attempt) {
      f = std::fopen(working.c_str(), "r+");
      if (f != nullptr) break;
      traceStreamState(f, attempt);
      const int error = errno;
      if (!VlrTransientOpenError(error)) break;
      sleep(static_cast<unsigned>(attempt - 1));
    }
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
  std::fprintf(f, "%i\n%s\n", current, message ? message : second.c_str());
  std::fflush(f);
  if (ftruncate(fileno(f), std::ftell(f)) != 0) {
  }
  std::fclose(f);
  VlrNotifyProgressObserver(current, message);
  return 1;
}

void VlrSetProgressObserver(VlrProgressObserver observer) {
  gObserver = observer;
}

void VlrNotifyProgressObserver(int percent, const char* title) {
  if (gObserver != nullptr) gObserver(percent, title);
}
