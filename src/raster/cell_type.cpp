#include "raster/cell_type.h"

#include <cstring>

namespace {

constexpr int kSizes[kCellTypeCount] = {8, 4, 16, 8, 8, 4, 4, 2, 2, 1};
constexpr const char* kTexts[kCellTypeCount] = {
    "FLOAT_COMPLEX", "FLOAT32",       "DOUBLE_COMPLEX", "FLOAT64",      "",
    "INT32",         "SHORT_COMPLEX", "INT16",          "INT8_COMPLEX", "INT8"};

}  // namespace

int cell_type_size(int code) {
  return cell_type_is_valid(code) ? kSizes[code] : 0;
}

const char* cell_type_text(int code) {
  return cell_type_is_valid(code) ? kTexts[code] : "";
}

int cell_type_from_text(const char* text) {
  if (text == nullptr || text[0] == '\0') return -1;
  for (int code = 0; code < kCellTypeCount; ++code) {
    if (std::strcmp(text, kTexts[code]) == 0) return code;
  }
  return -1;
}
