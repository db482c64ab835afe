// Export of a suite raster product as an 8-bit GeoTIFF image.
//
// The export writes three files beside the image name T (the output name,
// ".tif" appended when it lacks it): the image T, its suite header T_hdr
// (stored as T.sml, "RasterInfo.CellType" "UNSIGNED_BYTE") and, for a
// geocoded "GEO-GLOBAL" product, the KML overlay (T without ".tif", then
// ".kml").
//
// Grey levels.  Byte 0 marks null pixels (the product's "NullCellValue", or
// a value that is not finite) and 1 to 255 the data:
//
//   byte = 1 + floor(254 * clamp((w - TiffMinValue) * TiffScale, 0, 1) + 0.5)
//   w    = sign(v) * |v| ^ TiffExponent
//
// where v is the pixel value (the squared magnitude for complex cells) and
// TiffScale = 1 / (TiffMaxValue - TiffMinValue).  TiffExponent is 0.5 for
// power data (data units "POWER" and complex cells), so that the picture is
// linear in amplitude, and 1 for anything else.  TiffMinValue and
// TiffMaxValue are the values of w shown as black (byte 1) and white
// (byte 255).  They come from a regular subsample of at most about 1,000,000
// valid pixels (every k-th pixel of every k-th line; all valid pixels, up to
// that number, when none lies on that grid):
//   - white is the (100 - s) percentile of w, s the saturation: the
//     percentage of the brightest pixels allowed to saturate;
//   - black is 0, or the s percentile when that is negative (signed data
//     such as heights or decibels);
//   - the p percentile of n sorted values is the value at index
//     floor(p / 100 * (n - 1));
//   - when white does not lie above black, the largest and then the
//     smallest value of the sample take their place; when every sampled
//     value is the same (a constant image), that value maps to byte 128.
// A product without any valid pixel raises 130560 ("Error: 0 non null points
// in the input file : " and its name).
#pragma once

#include <vector>

#include "suite/read_write_map_info.h"

// The saturation used when the caller gives none: a value that is not a
// number in (0, CVLR_TIFF_MAX_SATURATION], such as 0, stands for this.
constexpr double CVLR_TIFF_DEFAULT_SATURATION = 2.0;
constexpr double CVLR_TIFF_MAX_SATURATION = 50.0;

// Exports productName (a suite raster with its header) as described above.
// The GeoTIFF keys follow the product's map reference, which is checked
// against the installation's map list first; ground control points, when
// given, locate an image that is not geocoded.  The run is given up with
// 326400 when the host withdraws it.
void NVLR_UTILITY_RasterToGeoTiff(const char* productName, const char* outputName,
                                  double saturation,
                                  const std::vector<CVlrGroundControlPoint>& gcps = {});
