// Cell types and data units of suite rasters: names, codes and pixel sizes.
#include "suite/cell_types.h"

#include <cstring>

#include "runtime/process_log.h"

namespace {

struct CellTypeInfo {
  const char* name;
  int bytesPerPixel;
  int valuesPerPixel;
};

// Indexed by the cell-type code.  "BIT" packs 8 pixels in a byte; its size
// here is the byte that holds them.
constexpr CellTypeInfo kCellTypes[CVLR_NBR_CELL_TYPES] = {
    {"BYTE", 1, 1},
    {"BYTE_COMPLEX", 2, 2},
    {"UNSIGNED_BYTE", 1, 1},
    {"UBYTE_COMPLEX", 2, 2},
    {"SHORT", 2, 1},
    {"UNSIGNED_SHORT", 2, 1},
    {"SHORT_COMPLEX", 4, 2},
    {"FLOAT", 4, 1},
    {"FLOAT_COMPLEX", 8, 2},
    {"DOUBLE", 8, 1},
    {"DOUBLE_COMPLEX", 16, 2},
    {"UNSIGNED_INT", 4, 1},
    {"INT", 4, 1},
    {"BIT", 1, 1},
    {"UNSIGNED_SHORT_COMPLEX", 4, 2},
};

// Indexed by the data-units code; the spellings are those stored in headers.
constexpr const char* kDataUnits[CVLR_NBR_DATA_UNITS] = {
    "POWER",
    "AMPLITUDE",
    "SQUARE ROOT",
    "COHERENCE",
    "INTERFEROGRAMME",
    "SLC",
    "CLASSIFICATION",
    "RATIO",
    "NUMBER",
    "OPTICAL NUMBER",
    "ERS RAW",
    "UNWRAPPED PHASE",
    "DEM",
    "SLOPE",
    "SYNTHETIC INTERFEROGRAMME",
    "FLATTENED INTERFEROGRAMME",
    "RESOLUTION",
    "PTM RESOLUTION",
    "CALIBRATED",
    "JERS 1 RAW",
    "PHASE",
    "DR",
    "SIR-C RAW",
    "TRANSPLANTING",
    "BINARY_MASK",
    "VEGETATION_INDEX",
    "DMP",
    "PTM ACCURACY",
    "ALPHA",
    "ENTROPY",
    "ANISOTROPY",
    "EDGE MAP",
    "REGION MERGING MAP",
    "REGION MERGING MODULE",
    "LOGARITMIC",
    "LIA",
    "SRDISTANCE",
    "RADIANCE",
    "REFLETTANCE",
};

bool validCellType(int code) {
  return code >= 0 && code < CVLR_NBR_CELL_TYPES;
}

}  // namespace

int NVLR_UTILITY_CellTypeCode(const char* name) {
  if (name == nullptr) return -1;
  for (int code = 0; code < CVLR_NBR_CELL_TYPES; ++code) {
    if (std::strcmp(name, kCellTypes[code].name) == 0) return code;
  }
  return -1;
}

const char* NVLR_UTILITY_CellTypeName(int code) {
  return validCellType(code) ? kCellTypes[code].name : "WRONG CELL TYPE";
}

int NVLR_UTILITY_CellTypeSize(int code, int* valuesPerPixel) {
  if (!validCellType(code)) {
    NVLR_UTILITY_TracePrint("Error: unsupported raster file type %d\n", code);
    return -1;
  }
  if (valuesPerPixel != nullptr) *valuesPerPixel = kCellTypes[code].valuesPerPixel;
  return kCellTypes[code].bytesPerPixel;
}

bool NVLR_UTILITY_IsComplexCellType(int code) {
  return validCellType(code) && kCellTypes[code].valuesPerPixel == 2;
}

int NVLR_UTILITY_DataUnitsCode(const char* name) {
  if (name == nullptr) return -1;
  for (int code = 0; code < CVLR_NBR_DATA_UNITS; ++code) {
    if (std::strcmp(name, kDataUnits[code]) == 0) return code;
  }
  return -1;
}

const char* NVLR_UTILITY_DataUnitsName(int code) {
  return code >= 0 && code < CVLR_NBR_DATA_UNITS ? kDataUnits[code] : "WRONG UNITS";
}
