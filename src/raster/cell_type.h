// Cell types of the raster data files: codes, element sizes, legacy texts.
#pragma once

#include <cstdint>

enum RasterCellType : int32_t {
  CT_FLOAT_COMPLEX = 0,   // two 32-bit floats
  CT_FLOAT32 = 1,         //
  CT_DOUBLE_COMPLEX = 2,  // two 64-bit floats
  CT_FLOAT64 = 3,         //
  CT_INT32_COMPLEX = 4,   // two 32-bit integers (no legacy text)
  CT_INT32 = 5,           //
  CT_SHORT_COMPLEX = 6,   // two 16-bit integers
  CT_INT16 = 7,           //
  CT_INT8_COMPLEX = 8,    // two 8-bit integers
  CT_INT8 = 9,            //
};

constexpr int kCellTypeCount = 10;

// Element size in bytes of a cell type; 0 for codes outside 0..9.
int cell_type_size(int code);
// Even codes are complex.
inline bool cell_type_is_complex(int code) {
  return code >= 0 && code < kCellTypeCount && code % 2 == 0;
}
inline bool cell_type_is_valid(int code) {
  return code >= 0 && code < kCellTypeCount;
}

// Legacy text of a code ("" for code 4 and for invalid codes).
const char* cell_type_text(int code);
// Code of a legacy text, matched exactly (case-sensitive); -1 when unknown.
int cell_type_from_text(const char* text);
