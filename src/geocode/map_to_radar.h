// The exact inverse geometry of one map position: map coordinates to
// longitude and latitude, to the Earth-fixed point at the grid's height, to
// its zero-Doppler time and two-way range time through the orbit, and to a
// line and column of the radar image.  It owns its copy of the orbit and its
// transformation.  The orbit reports through the process-wide call tree:
// use it on one thread at a time.
#pragma once

#include <string>

#include "geocode/map_grid.h"
#include "geocode/spatial_reference.h"
#include "multilook/mlook_radar_grid.h"
#include "orbit/general_sar_orbit.h"

class MapToRadar {
 public:
  MapToRadar(const MlookRadarGrid& grid, const MapGrid& map) : grid_(grid), map_(map) {}
  MapToRadar(const MapToRadar&) = delete;
  MapToRadar& operator=(const MapToRadar&) = delete;

  // 0, or 1 with *message when the orbit or the map cannot be used.
  int open(const GeneralSAROrbit& orbit, std::string* message);
  // Image line and column of the map pixel position (row, column; 0.5, 0.5
  // is the centre of the first pixel).  False where the point is not seen
  // from the orbit.
  bool solve(double row, double column, double* line, double* imageColumn);

 private:
  const MlookRadarGrid& grid_;
  const MapGrid& map_;
  GeneralSAROrbit orbit_;
  geocode_detail::MapTransform transform_;
};
