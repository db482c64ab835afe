// Choice of the map grid: reference system, spacing and extent.
#include "geocode/map_grid.h"

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <limits>

#include "geocode/spatial_reference.h"
#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/geodetic.h"
#include "orbit/gr_pt.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "geocode_map";
// Metres of one degree of latitude (mean), for a geographic default spacing.
constexpr double kMetresPerDegree = 111320.0;
// Points along each side of the image border for its footprint.
constexpr int kBorderPoints = 64;
// The largest map the geocoder writes, pixels.
constexpr double kMaxPixels = 4.0e9;
constexpr double kMaxSide = 1.0e6;

int Refuse(const std::string& text, std::string* message) {
  VLR_SCOPE("CheckGeocodeOptions", kModule);
  *message = text;
  VLR_FAIL(text.c_str(), vlr::kLibInconsistent);
}

// The ground point of (t, tau) on the ellipsoid raised by `height`.
bool GroundPoint(GeneralSAROrbit& orbit, int lookSign, double t, double tau, double height,
                 double* lon, double* lat) {
  double P[3], V[3], G[3];
  if (orbit.SVGetPos(t, P) > 0 || orbit.SVGetVel(t, V) > 0) return false;
  if (gr_pt(P, V, tau, 0.0, orbit.lambda(), 0.0, lookSign, kWgs84A + height, kWgs84B + height, G) !=
      0)
    return false;
  double geo[2];
  xyz2geo(G, geo, kWgs84A + height, kWgs84B + height);
  *lat = geo[0] * 180.0 / M_PI;
  *lon = geo[1] * 180.0 / M_PI;
  return std::isfinite(*lat) && std::isfinite(*lon);
}

}  // namespace

void MapGrid::geoTransform(double gt[6]) const {
  gt[0] = originX;
  gt[1] = spacing;
  gt[2] = 0.0;
  gt[3] = originY;
  gt[4] = 0.0;
  gt[5] = -spacing;
}

int UtmEpsg(double latitudeDeg, double longitudeDeg) {
  double lon = std::fmod(longitudeDeg + 180.0, 360.0);
  if (lon < 0.0) lon += 360.0;
  const int zone = std::min(60, static_cast<int>(lon / 6.0) + 1);
  return (latitudeDeg >= 0.0 ? 32600 : 32700) + zone;
}

int CheckGeocodeOptions(const GeocodeOptions& options, double groundStep, std::string* message) {
  if (options.epsg != 0) {
    if (!geocode_detail::SrsFromEpsg(options.epsg, message)) return Refuse(*message, message);
  }
  if (!(options.spacing >= 0.0) || !std::isfinite(options.spacing) ||
      (options.spacing == 0.0 && !(groundStep > 0.0)))
    return Refuse("Map pixel spacing not positive", message);
  if (!std::isfinite(options.height) || std::fabs(options.height) > 10000.0)
    return Refuse("Ground height beyond 10 km", message);
  return 0;
}

int ChooseMapGrid(const MlookRadarGrid& grid, const GeneralSAROrbit& orbitIn,
                  const GeocodeOptions& options, double groundStep, MapGrid* map,
                  std::string* message) {
  VLR_SCOPE("ChooseMapGrid", kModule);
  VLR_CALL(CheckGeocodeOptions(options, groundStep, message));
  if (!grid.valid()) {
    *message = "The image has no radar geometry";
    VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  }
  GeneralSAROrbit orbit;
  VLR_CALL(orbitIn.clone(&orbit));
  // The footprint: points along the four sides of the image.
  std::vector<double> lons, lats;
  const double lastLine = grid.lines() - 1.0, lastColumn = grid.samples() - 1.0;
  for (int side = 0; side < 4; ++side) {
    for (int i = 0; i <= kBorderPoints; ++i) {
      const double f = static_cast<double>(i) / kBorderPoints;
      const double line = side == 0 ? 0.0 : side == 1 ? lastLine : f * lastLine;
      const double column = side == 2 ? 0.0 : side == 3 ? lastColumn : f * lastColumn;
      const double t = grid.time(line);
      const double tau = grid.rangeTime(column, t);
      double lon = 0.0, lat = 0.0;
      if (!std::isfinite(tau) ||
          !GroundPoint(orbit, grid.lookSign(), t, tau, options.height, &lon, &lat)) {
        *message = "The image border cannot be located on the ellipsoid";
        VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
      }
      lons.push_back(lon);
      lats.push_back(lat);
    }
  }
  // The centre decides the UTM zone.
  double centreLon = 0.0, centreLat = 0.0;
  if (!GroundPoint(orbit, grid.lookSign(), grid.time(0.5 * lastLine),
                   grid.rangeTime(0.5 * lastColumn, grid.time(0.5 * lastLine)), options.height,
                   &centreLon, &centreLat)) {
    *message = "The image centre cannot be located on the ellipsoid";
    VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  }
  const int epsg = options.epsg != 0 ? options.epsg : UtmEpsg(centreLat, centreLon);
  geocode_detail::MapTransform transform;
  if (!transform.open(epsg, message)) VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  double spacing = options.spacing;
  if (spacing == 0.0) spacing = transform.geographic() ? groundStep / kMetresPerDegree : groundStep;

  double minX = std::numeric_limits<double>::infinity(), maxX = -minX, minY = minX, maxY = -minX;
  for (size_t i = 0; i < lons.size(); ++i) {
    double x = 0.0, y = 0.0;
    if (!transform.fromLonLat(lons[i], lats[i], &x, &y) || !std::isfinite(x) || !std::isfinite(y)) {
      *message = "The image does not lie within the map's reference system";
      VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
    }
    minX = std::min(minX, x);
    maxX = std::max(maxX, x);
    minY = std::min(minY, y);
    maxY = std::max(maxY, y);
  }
  // Whole pixels on the spacing's own lattice, one pixel of margin.
  const double x0 = (std::floor(minX / spacing) - 1.0) * spacing;
  const double y0 = (std::ceil(maxY / spacing) + 1.0) * spacing;
  const double width = std::ceil((maxX - x0) / spacing) + 1.0;
  const double height = std::ceil((y0 - minY) / spacing) + 1.0;
  if (!(width <= kMaxSide && height <= kMaxSide && width * height <= kMaxPixels)) {
    *message = "The map grid would be too large for this pixel spacing";
    VLR_FAIL(message->c_str(), vlr::kLibInconsistent);
  }
  map->epsg = epsg;
  map->geographic = transform.geographic();
  map->wkt = transform.wkt();
  map->originX = x0;
  map->originY = y0;
  map->spacing = spacing;
  map->width = static_cast<int>(width);
  map->height = static_cast<int>(height);
  map->groundHeight = options.height;
  // PROJ leaves errno set by the files it probed.
  errno = 0;
  return 0;
}
