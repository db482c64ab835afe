#include "entry/command.h"

#include <cstring>

namespace vlr {

namespace {

struct CommandWord {
  const char* word;
  Tool tool;
};

// Compared in this order, case-sensitively, as a prefix of the command.
constexpr CommandWord kWords[] = {
    {"main_multilook_WSS#", Tool::Multilook},
    {"main_import_ESA#", Tool::Import},
};

constexpr const char* kMarker = "###Veloran###";

}  // namespace

Tool SelectCommand(const char* command, const char** argumentText) {
  if (command == nullptr) return Tool::Unknown;
  for (const CommandWord& w : kWords) {
    const size_t n = std::strlen(w.word);
    if (std::strncmp(command, w.word, n) == 0) {
      if (argumentText) *argumentText = command + n;
      return w.tool;
    }
  }
  return Tool::Unknown;
}

void CutAtMarker(char* command) {
  if (char* m = std::strstr(command, kMarker)) *m = '\0';
}

}  // namespace vlr
