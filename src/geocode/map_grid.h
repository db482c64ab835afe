// The map grid of a geocoded image: its coordinate reference system (an EPSG
// code), the upper-left corner and the pixel spacing, and the size that just
// covers the image's footprint on the ellipsoid.
#pragma once

#include <string>

#include "multilook/mlook_radar_grid.h"

class GeneralSAROrbit;

// What the caller may choose of the map grid.
struct GeocodeOptions {
  // EPSG code of the map; 0: UTM on WGS 84 in the zone of the scene centre.
  int epsg = 0;
  // Pixel spacing in map units (metres, or degrees for a geographic map);
  // 0: the ground sampling step (converted to degrees of latitude for a
  // geographic map).
  double spacing = 0.0;
  // Height of the ground above the WGS 84 ellipsoid, m.
  double height = 0.0;
};

struct MapGrid {
  int epsg = 0;
  bool geographic = false;
  std::string wkt;       // the reference system as WKT
  double originX = 0.0;  // upper-left corner of the upper-left pixel
  double originY = 0.0;
  double spacing = 0.0;  // square pixels, map units
  int width = 0;
  int height = 0;
  double groundHeight = 0.0;  // m above the ellipsoid

  // Map coordinates of a pixel position (0.5, 0.5 is the centre of the first
  // pixel).
  double x(double column) const { return originX + column * spacing; }
  double y(double row) const { return originY - row * spacing; }
  // GDAL's affine geotransform of the grid.
  void geoTransform(double gt[6]) const;
};

// EPSG code of the UTM zone (WGS 84) that holds a point: 326zz in the north
// (latitude >= 0), 327zz in the south; zones are 6 degrees of longitude wide
// from 180 W.
int UtmEpsg(double latitudeDeg, double longitudeDeg);

// Checks the options: an EPSG code that names no projected or geographic
// reference system, a spacing or a ground sampling step that is not
// positive, or a height that is not finite is refused.  0, or 1 with the
// reason in *message (also reported).
int CheckGeocodeOptions(const GeocodeOptions& options, double groundStep, std::string* message);

// The map grid covering the image of `grid`, imaged from `orbit` (its
// footprint at the options' height, from points along the image's border).
// groundStep is the default spacing in metres.  0, or 1 with *message.
int ChooseMapGrid(const MlookRadarGrid& grid, const GeneralSAROrbit& orbit,
                  const GeocodeOptions& options, double groundStep, MapGrid* map,
                  std::string* message);
