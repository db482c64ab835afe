// Command-word selection.
#pragma once

namespace vlr {

enum class Tool { Unknown = -1, Multilook = 1, Import = 2 };

// Selects the tool by the command word at the head of command; for a known
// word, argumentText points behind its '#'.  The string is not modified.
Tool SelectCommand(const char* command, const char** argumentText);

// Cuts the command string at the first "###Veloran###".
void CutAtMarker(char* command);

}  // namespace vlr
