// The suite's cell types ("RasterInfo.CellType") and data units
// ("RasterInfo.DataUnits").  These are not the processing libraries' codes.
#pragma once

enum CVLR_CellType {
  CVLR_BYTE = 0,
  CVLR_BYTE_COMPLEX = 1,
  CVLR_UNSIGNED_BYTE = 2,
  CVLR_UBYTE_COMPLEX = 3,
  CVLR_SHORT = 4,
  CVLR_UNSIGNED_SHORT = 5,
  CVLR_SHORT_COMPLEX = 6,
  CVLR_FLOAT = 7,
  CVLR_FLOAT_COMPLEX = 8,
  CVLR_DOUBLE = 9,
  CVLR_DOUBLE_COMPLEX = 10,
  CVLR_UNSIGNED_INT = 11,
  CVLR_INT = 12,
  CVLR_BIT = 13,
  CVLR_UNSIGNED_SHORT_COMPLEX = 14,
};
constexpr int CVLR_NBR_CELL_TYPES = 15;

// Exact, case-sensitive name to code; -1 for anything else.
int NVLR_UTILITY_CellTypeCode(const char* name);
// "WRONG CELL TYPE" for an unknown code.
const char* NVLR_UTILITY_CellTypeName(int code);
// Bytes per pixel, with the values per pixel in valuesPerPixel; -1 (after
// "Error: unsupported raster file type " on the trace) for an unknown code.
int NVLR_UTILITY_CellTypeSize(int code, int* valuesPerPixel);
bool NVLR_UTILITY_IsComplexCellType(int code);

constexpr int CVLR_NBR_DATA_UNITS = 39;
// -1 for an unknown name.
int NVLR_UTILITY_DataUnitsCode(const char* name);
// "WRONG UNITS" for an unknown code.
const char* NVLR_UTILITY_DataUnitsName(int code);
