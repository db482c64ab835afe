#include "entry/entry.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <string>
#include <vector>

#include "entry/command.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"

namespace vlr {

namespace {

constexpr const char* kModule = "main_import_ASAR";
constexpr int kStandardDescriptors = 3;

int run(std::vector<char>& command, const EntryDrivers& drivers) {
  NVLR_UTILITY_SetCommandString(command.data());
  NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
  CutAtMarker(command.data());
  NVLR_UTILITY_SetCommandString(command.data());
  errno = 0;
  init_ckerr_locking();
  init_report(0, "ASAR FOCUSSING", 1);
  VlrRunOutputsTrack();

  const char* argumentText = nullptr;
  int code = 0;
  switch (SelectCommand(command.data(), &argumentText)) {
    case Tool::Multilook:
      code = drivers.multilook(argumentText);
      break;
    case Tool::Import:
      code = drivers.import(argumentText);
      break;
    case Tool::Unknown:
      code = kCodeUnknownCommand;
      NVLR_UTILITY_TracePrint("[%s]\n", command.data());
      break;
  }
  NVLR_UTILITY_TracePrint("\n%s\n", "Closing trace");
  if (code == 0) {
    exit_report();
    exit_ckerr();
    VlrRunOutputsCommit();
    return 0;
  }
  NVLR_UTILITY_RaiseError(code, kModule, __LINE__, nullptr);
}

}  // namespace

void ReopenStandardDescriptors() {
  for (int fd = 0; fd < kStandardDescriptors; ++fd) {
    if (fcntl(fd, F_GETFD) != -1 || errno != EBADF) continue;
    // The lower descriptors are open by now, so this normally yields fd.
    const int opened = open("/dev/null", O_RDWR);
    if (opened < 0) continue;
    if (opened != fd) {
      dup2(opened, fd);
      close(opened);
    }
  }
}

int RunEntry(int argc, char** argv, const EntryDrivers& drivers) {
  std::string joined;
  for (int i = 1; i < argc; ++i) {
    if (i > 1) joined += ' ';
    joined += argv[i];
  }
  std::vector<char> command(joined.begin(), joined.end());
  command.push_back('\0');
  try {
    return run(command, drivers);
  } catch (...) {
    // Outside logging mode the raise throws its error record; the process
    // ends with the code all the same.
    try {
      NVLR_UTILITY_RaiseError(kCodeException, kModule, __LINE__, nullptr);
    } catch (...) {
    }
    VlrTerminate(kCodeException);
  }
}

}  // namespace vlr
