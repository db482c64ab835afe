// Shared pieces of the host's working-file protocol.
#pragma once

#include <cstdio>
#include <string>

// Longest working-file line that is kept, in characters.
constexpr size_t kWorkingLineMax = 1025;
// Attempts to open the working file while the host holds it.
constexpr int kWorkingOpenAttempts = 10;

// Reads one line of the working file without its end (the rest of a longer
// line is skipped); "" at end of file.
std::string VlrReadWorkingLine(FILE* f);

// Opening fails on Linux for lasting reasons (missing file, permissions);
// only transient failures are worth the host's retry schedule.
bool VlrTransientOpenError(int error);
