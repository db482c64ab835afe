// The GeoTIFF map information of an exported image: the key directory for
// each kind of map reference, the georeferencing tags of a geocoded image,
// the tie points of an image located by ground control points, and the KML
// overlay of a geographic image.
#pragma once

#include <string>
#include <vector>

#include "suite/map_utility.h"

typedef struct tiff TIFF;

// A ground control point of an image that is not geocoded.  column and row
// are image coordinates whose whole values are pixel centres (0, 0 is the
// centre of the first pixel of the first line); longitude and latitude are
// WGS 84 degrees.
struct CVlrGroundControlPoint {
  double column = 0.0;
  double row = 0.0;
  double longitude = 0.0;
  double latitude = 0.0;
};

// Writes the GeoTIFF keys of the reference into tif, which must have been
// opened with XTIFFOpen and have no image data written yet.  A geocoded image
// with a grid also gets ModelPixelScaleTag and one ModelTiepointTag for its
// upper-left corner; an image that is not geocoded gets one tie point per
// ground control point.  Invalid control points raise 130560, a failed key
// write 261124 with fileName.
void NVLR_UTILITY_SetUpGeoKeys(TIFF* tif, const CVlrMapReference& reference,
                               const std::vector<CVlrGroundControlPoint>& gcps,
                               const char* fileName);

// Writes the KML ground overlay of a geographic, geocoded image with a grid
// to kmlPath; the overlay's icon is tiffName (a name relative to the KML
// file).  261124 when the file cannot be written.
void NVLR_UTILITY_WriteKmlOverlay(const CVlrMapReference& reference, const std::string& kmlPath,
                                  const std::string& tiffName, const std::string& description);
