// Exact inverse geometry of map positions.
#include "geocode/map_to_radar.h"

#include <cmath>

#include "orbit/geodetic.h"

int MapToRadar::open(const GeneralSAROrbit& orbit, std::string* message) {
  if (orbit.clone(&orbit_) != 0) {
    *message = "The orbit cannot be copied";
    return 1;
  }
  if (!transform_.open(map_.epsg, message)) return 1;
  return 0;
}

bool MapToRadar::solve(double row, double column, double* line, double* imageColumn) {
  double lon = 0.0, lat = 0.0;
  if (!transform_.toLonLat(map_.x(column), map_.y(row), &lon, &lat)) return false;
  const double llh[3] = {lat * M_PI / 180.0, lon * M_PI / 180.0, map_.groundHeight};
  double G[3];
  geo2cart(G, llh);
  double t = 0.0, tau = 0.0;
  if (orbit_.earth2sat(G, &t, &tau) != 0) return false;
  *line = grid_.line(t);
  *imageColumn = grid_.column(tau, t);
  return std::isfinite(*line) && std::isfinite(*imageColumn);
}
