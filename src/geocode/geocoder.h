// Geocoding of a multilook image onto a map grid.
//
// For every map pixel the point on the ellipsoid (at the grid's height) is
// taken back to the line and column of the image where it was seen, and the
// image's amplitude is interpolated there (bilinear); pixels that fall
// outside the image get the no-data value.  The exact inverse geometry is
// solved on a coarse lattice of map pixels only, kLookupStep pixels apart,
// and the line and column are interpolated bilinearly between its nodes:
// the mapping is smooth enough that this stays within a few thousandths of
// an image pixel of the exact solution.
//
// The work goes by bands of map rows, their tiles on two threads; the
// calling thread solves the next band's lattice nodes before it joins in.
// Each tile reads only the window of image lines and columns it needs, so
// memory does not grow with the length of the product.
#pragma once

#include <string>

#include "geocode/map_grid.h"
#include "multilook/mlook_radar_grid.h"

class GeneralSAROrbit;

// Map pixels between the nodes of the exact inverse solutions.
constexpr int kLookupStep = 16;
// The value of map pixels without data.
constexpr float kGeocodeNoData = 0.0f;

struct GeocodeFigures {
  int exactSolutions = 0;   // inverse solutions computed
  int validPixels = 0;      // map pixels that got a value
  double cogSeconds = 0.0;  // time taken by the final Cloud Optimized GeoTIFF copy
};

// Geocodes the float32 raster `image` (the multilook output, described by
// `grid`) onto `map` and writes the Cloud Optimized GeoTIFF `output`.  0, or
// a library code with *message: 1 inconsistent input, 4 read failure, 5
// write failure, 7 memory.
int GeocodeImage(const char* image, const MlookRadarGrid& grid, const GeneralSAROrbit& orbit,
                 const MapGrid& map, const char* output, std::string* message,
                 GeocodeFigures* figures = nullptr);
