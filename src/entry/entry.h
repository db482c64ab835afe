// Start-up, dispatch and shut-down of the tool.
#pragma once

namespace vlr {

// The drivers the command words select.  Each takes the argument text behind
// its word and returns 0 or an error code.
struct EntryDrivers {
  int (*multilook)(const char* argumentText);
  int (*import)(const char* argumentText);
};

// Opens /dev/null on each of the standard descriptors 0, 1 and 2 that is
// closed.  Files opened later (the process log, the trace) would otherwise
// take those numbers, and whatever is written to the standard streams would
// land inside them.
void ReopenStandardDescriptors();

// Runs the command given by the program arguments (joined by blanks): sets up
// the suite environment, the report and checked-allocation tracking, runs
// the selected driver and closes the run.  Returns 0 after a successful run;
// any failure, and any exception escaping start-up or the driver, ends the
// process with its code.
int RunEntry(int argc, char** argv, const EntryDrivers& drivers);

}  // namespace vlr
