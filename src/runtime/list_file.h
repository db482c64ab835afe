// Text list files and the driver argument list.
#pragma once

#include <string>
#include <vector>

// Longest line the list-file reader accepts, in characters.
constexpr int kListFileMaxLine = 10000;

std::vector<std::string> NVLR_UTILITY_ReadListFile(const char* path);
std::vector<std::string> NVLR_UTILITY_SplitCommand(const char* text);
