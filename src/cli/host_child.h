// Runs one host command in a child process of this executable, inside a
// private run folder, and follows it: progress events come back through a
// pipe, Ctrl-C withdraws the run through the host's "_batch_ok" file.
#pragma once

#include <string>

#include "cli/progress_display.h"
#include "cli/run_folder.h"
#include "entry/entry.h"

namespace vlr::cli {

struct ChildResult {
  int exitStatus = -1;       // the child's exit status; -1 when a signal ended it
  int signal = 0;            // the signal that ended it
  bool interrupted = false;  // Ctrl-C (or SIGTERM) reached the command line
  int code = 0;              // the full error code from the error file, else 0
  std::string message;       // the error file's title, text and extra lines
};

// Runs "commandWord + argumentFile" as the host would, with the run folder as
// the installation the child initialises from.  Blocks until the child ends.
ChildResult RunHostCommand(const std::string& command, const RunFolder& folder,
                           const EntryDrivers& drivers, ProgressDisplay& progress);

// Reads the error file the host protocol leaves after a failure: the code of
// its "[EC : N]" line (0 when there is none) and its text lines joined.
int ReadErrorFile(const std::string& path, std::string& message);

}  // namespace vlr::cli
