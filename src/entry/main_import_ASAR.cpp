// Entry point: selects the tool by its command word, runs it and ends the
// process with its code.
#include "drivers/drivers.h"
#include "entry/entry.h"

int main(int argc, char** argv) {
  // Before anything opens a file: see ReopenStandardDescriptors.
  vlr::ReopenStandardDescriptors();
  return vlr::RunEntry(argc, argv, {fvlr_main_multilook_wss, fvlr_main_import_esa});
}
