// Entry point: selects the tool by its command word, runs it and ends the
// process with its code.
#include <cerrno>
#include <string>
#include <vector>

#include "drivers/drivers.h"
#include "entry/command.h"
#include "runtime/ckerr.h"
#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"

namespace {

constexpr const char* kModule = "main_import_ASAR";

int run(std::vector<char>& command) {
  NVLR_UTILITY_SetCommandString(command.data());
  NVLR_UTILITY_InitEnvironment(1, kVeloranIdentification, 1);
  vlr::CutAtMarker(command.data());
  NVLR_UTILITY_SetCommandString(command.data());
  errno = 0;
  init_ckerr_locking();
  init_report(0, "ASAR FOCUSSING", 1);

  const char* argumentText = nullptr;
  int code = 0;
  switch (vlr::SelectCommand(command.data(), &argumentText)) {
    case vlr::Tool::Multilook:
      code = fvlr_main_multilook_wss(argumentText);
      break;
    case vlr::Tool::Import:
      code = fvlr_main_import_esa(argumentText);
      break;
    case vlr::Tool::Unknown:
      code = vlr::kCodeUnknownCommand;
      NVLR_UTILITY_TracePrint("[%s]\n", command.data());
      break;
  }
  NVLR_UTILITY_TracePrint("\n%s\n", "Closing trace");
  if (code == 0) {
    exit_report();
    exit_ckerr();
    return 0;
  }
  NVLR_UTILITY_RaiseError(code, kModule, __LINE__, nullptr);
}

}  // namespace

int main(int argc, char** argv) {
  std::string joined;
  for (int i = 1; i < argc; ++i) {
    if (i > 1) joined += ' ';
    joined += argv[i];
  }
  std::vector<char> command(joined.begin(), joined.end());
  command.push_back('\0');
  try {
    return run(command);
  } catch (...) {
    // Outside logging mode the raise throws its error record; the process
    // ends with the code all the same.
    try {
      NVLR_UTILITY_RaiseError(vlr::kCodeException, kModule, __LINE__, nullptr);
    } catch (...) {
    }
    VlrTerminate(vlr::kCodeException);
  }
}
