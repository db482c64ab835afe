#include "runtime/working_file.h"

#include <cerrno>

std::string VlrReadWorkingLine(FILE* f) {
  char buffer[kWorkingLineMax + 2];
  if (std::fgets(buffer, sizeof buffer, f) == nullptr) return "";
  std::string line = buffer;
  if (!line.empty() && line.back() == '\n') {
    line.pop_back();
  } else {
    int c;
    while ((c = std::fgetc(f)) != EOF && c != '\n') {
    }
  }
  if (!line.empty() && line.back() == '\r') line.pop_back();
  return line;
}

bool VlrTransientOpenError(int error) {
  return error == EINTR || error == EAGAIN || error == EBUSY || error == ETXTBSY;
}
