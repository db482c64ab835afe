// Entry point: selects the tool by its command word, runs it and ends the
// process with its code; a command line for people ("import_wss import
// ...") is run through the same tools.
#include "cli/command_line.h"
#include "drivers/drivers.h"
#include "entry/entry.h"

int main(int argc, char** argv) {
  // Before anything opens a file: see ReopenStandardDescriptors.
  vlr::ReopenStandardDescriptors();
  const vlr::EntryDrivers drivers{fvlr_main_multilook_wss, fvlr_main_import_esa};
  if (vlr::cli::IsCommandLine(argc, argv)) return vlr::cli::RunCommandLine(argc, argv, drivers);
  return vlr::RunEntry(argc, argv, drivers);
}
