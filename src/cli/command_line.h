// The command line for people and scripts: "import_wss import ..." and
// "import_wss multilook ...", run through the host protocol in a private
// folder, with progress on standard error and errors in words.
#pragma once

#include "entry/entry.h"

namespace vlr::cli {

// True when the program arguments are a command line of this kind rather
// than a host command string: the first argument is one of its words, or no
// host could have started the program (no initialisation folder in the
// environment) and the first argument is no host command word.
bool IsCommandLine(int argc, char** argv);

// Runs the command line; returns the process exit status.
int RunCommandLine(int argc, char** argv, const EntryDrivers& drivers);

}  // namespace vlr::cli
