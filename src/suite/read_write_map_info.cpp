// GeoTIFF keys and georeferencing tags of an exported image, and the KML
// overlay of a geographic image.
#include "suite/read_write_map_info.h"

#include <geokeys.h>
#include <geotiff.h>
#include <geovalues.h>
#include <xtiffio.h>

#include <cmath>
#include <cstdio>
#include <memory>
#include <string>
#include <vector>

#include "runtime/error_codes.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"
#include "suite/number_text.h"

namespace {

constexpr const char* kModule = "vlr_read_write_map_info";
constexpr const char* kUnknownData = " UNKNOW Data";
constexpr int kPixelIsArea = 1;
constexpr int kEpsgWgs84 = 4326;
constexpr int kEpsgWgs84Datum = 6326;
constexpr int kEpsgWgs84Ellipsoid = 7030;
constexpr int kEpsgGreenwich = 8901;
constexpr int kEpsgDegree = 9102;
constexpr int kEpsgMetre = 9001;
constexpr int kUtmNorthBase = 32600;
constexpr int kUtmSouthBase = 32700;
// Far more than any caller locates an image with; a larger list is refused
// rather than written as a tag most readers reject.
constexpr size_t kMaxGcps = 10000;
constexpr double kMetresPerDegree = 111320.0;
constexpr double kKmlViewMargin = 1.5;
constexpr double kKmlMinimumRange = 1000.0;
constexpr const char* kKmlNamespace = "http://earth.google.com/kml/2.0";
// Raster space of a pixel-is-area image: pixel centres lie half a pixel from
// the corner of the grid.
constexpr double kPixelCentre = 0.5;

struct GtifCloser {
  void operator()(GTIF* gtif) const { GTIFFree(gtif); }
};
using GtifPtr = std::unique_ptr<GTIF, GtifCloser>;

void shortKey(GTIF* gtif, geokey_t key, int value) {
  GTIFKeySet(gtif, key, TYPE_SHORT, 1, value);
}
void asciiKey(GTIF* gtif, geokey_t key, const std::string& value) {
  GTIFKeySet(gtif, key, TYPE_ASCII, 0, value.c_str());
}

std::string orUnknown(const std::string& value) {
  return value.empty() ? kUnknownData : value;
}

void geographicKeys(GTIF* gtif) {
  shortKey(gtif, GTModelTypeGeoKey, ModelTypeGeographic);
  asciiKey(gtif, GTCitationGeoKey, "Geographic Model WGS 84");
  shortKey(gtif, GeogAngularUnitsGeoKey, kEpsgDegree);
  // The size keys of the units (2055 here, 3077 below) carry the unit's name.
  asciiKey(gtif, GeogAngularUnitSizeGeoKey, "Degree");
  shortKey(gtif, GTRasterTypeGeoKey, kPixelIsArea);
  shortKey(gtif, GeographicTypeGeoKey, kEpsgWgs84);
  shortKey(gtif, GeogGeodeticDatumGeoKey, kEpsgWgs84Datum);
  shortKey(gtif, GeogEllipsoidGeoKey, kEpsgWgs84Ellipsoid);
  shortKey(gtif, GeogPrimeMeridianGeoKey, kEpsgGreenwich);
  asciiKey(gtif, GeogCitationGeoKey, "WGS 84 Ellipsoid Used");
}

void utmKeys(GTIF* gtif, int zone, bool north) {
  const char* letter = north ? "N" : "S";
  char citation[64];
  std::snprintf(citation, sizeof citation, "UTM Zone %d%s WGS84", zone, letter);
  char pcsCitation[64];
  std::snprintf(pcsCitation, sizeof pcsCitation, "UTM Zone %d%s  with WGS84", zone, letter);
  shortKey(gtif, GTModelTypeGeoKey, ModelTypeProjected);
  asciiKey(gtif, GTCitationGeoKey, citation);
  shortKey(gtif, GTRasterTypeGeoKey, kPixelIsArea);
  shortKey(gtif, ProjectedCSTypeGeoKey, (north ? kUtmNorthBase : kUtmSouthBase) + zone);
  asciiKey(gtif, PCSCitationGeoKey, pcsCitation);
  shortKey(gtif, ProjLinearUnitsGeoKey, kEpsgMetre);
  asciiKey(gtif, ProjLinearUnitSizeGeoKey, "Meters");
}

void otherStateKeys(GTIF* gtif, const CVlrMapReference& r) {
  shortKey(gtif, GTModelTypeGeoKey, ModelTypeProjected);
  shortKey(gtif, ProjLinearUnitsGeoKey, kEpsgMetre);
  asciiKey(gtif, ProjLinearUnitSizeGeoKey, "Meters");
  const std::string citation =
      " | State = " + orUnknown(r.state) + " | Hemisphere = " + orUnknown(r.hemisphere) +
      " | Projection = " + orUnknown(r.projection) + " | Zone = " + orUnknown(r.zone) +
      " | Ellipsoid = " + orUnknown(r.ellipsoid) + " | DatumShift = " + orUnknown(r.datumShift);
  asciiKey(gtif, GTCitationGeoKey, citation);
}

// The corner of the grid and the pixel size.  Spacings are taken as sizes:
// lines run from north to south and pixels from west to east.
void gridTags(TIFF* tif, const CVlrMapReference& r) {
  double scale[3] = {std::fabs(r.spacingEast), std::fabs(r.spacingNorth), 0.0};
  double tiePoint[6] = {0.0, 0.0, 0.0, r.lonEasting, r.latNorthing, 0.0};
  TIFFSetField(tif, TIFFTAG_GEOPIXELSCALE, 3, scale);
  TIFFSetField(tif, TIFFTAG_GEOTIEPOINTS, 6, tiePoint);
}

void checkGcps(const std::vector<CVlrGroundControlPoint>& gcps) {
  if (gcps.size() > kMaxGcps) {
    NVLR_UTILITY_TracePrint("Too many ground control points : %zu\n", gcps.size());
    NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__,
                            "ground control points");
  }
  for (size_t i = 0; i < gcps.size(); ++i) {
    const CVlrGroundControlPoint& p = gcps[i];
    const bool ok = std::isfinite(p.column) && std::isfinite(p.row) &&
                    std::fabs(p.latitude) <= 90.0 && std::fabs(p.longitude) <= 360.0;
    if (!ok) {
      NVLR_UTILITY_TracePrint("Wrong ground control point %zu : %g %g %g %g\n", i, p.column, p.row,
                              p.longitude, p.latitude);
      NVLR_UTILITY_RaiseError(vlr::kCodeProcessingStepFailed, kModule, __LINE__,
                              "ground control points");
    }
  }
}

// An image that is not geocoded keeps its citation; with control points it
// also states WGS 84 geographic coordinates so that readers take the tie
// points as control points in that reference.
void gcpTags(TIFF* tif, GTIF* gtif, const std::vector<CVlrGroundControlPoint>& gcps) {
  std::vector<double> tiePoints;
  tiePoints.reserve(gcps.size() * 6);
  for (const CVlrGroundControlPoint& p : gcps) {
    const double point[6] = {
        p.column + kPixelCentre, p.row + kPixelCentre, 0.0, p.longitude, p.latitude, 0.0};
    tiePoints.insert(tiePoints.end(), point, point + 6);
  }
  TIFFSetField(tif, TIFFTAG_GEOTIEPOINTS, static_cast<int>(tiePoints.size()), tiePoints.data());
  shortKey(gtif, GTModelTypeGeoKey, ModelTypeGeographic);
  shortKey(gtif, GTRasterTypeGeoKey, kPixelIsArea);
  shortKey(gtif, GeographicTypeGeoKey, kEpsgWgs84);
}

std::string escaped(const std::string& text) {
  std::string out;
  for (char c : text) {
    switch (c) {
      case '&':
        out += "&amp;";
        break;
      case '<':
        out += "&lt;";
        break;
      case '>':
        out += "&gt;";
        break;
      case '"':
        out += "&quot;";
        break;
      case '\'':
        out += "&apos;";
        break;
      default:
        out += c;
    }
  }
  return out;
}

// One element "<name>value</name>" at the given nesting level.
std::string element(int level, const char* name, const std::string& value) {
  return std::string(static_cast<size_t>(3 * level), ' ') + "<" + name + ">" + value + "</" + name +
         ">\n";
}
std::string open(int level, const char* name) {
  return std::string(static_cast<size_t>(3 * level), ' ') + "<" + name + ">\n";
}
std::string close(int level, const char* name) {
  return std::string(static_cast<size_t>(3 * level), ' ') + "</" + name + ">\n";
}

}  // namespace

void NVLR_UTILITY_SetUpGeoKeys(TIFF* tif, const CVlrMapReference& reference,
                               const std::vector<CVlrGroundControlPoint>& gcps,
                               const char* fileName) {
  const char* name = fileName ? fileName : "";
  GtifPtr gtif(GTIFNew(tif));
  if (!gtif) NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, name);
  if (!reference.geocoded) {
    NVLR_UTILITY_TracePrint("\nSetUpGeoKeys No State Spec ");
    asciiKey(gtif.get(), GTCitationGeoKey, "No Geocoded Image");
    if (!gcps.empty()) {
      checkGcps(gcps);
      gcpTags(tif, gtif.get(), gcps);
    }
  } else {
    if (!gcps.empty()) {
      NVLR_UTILITY_TracePrint("Geocoded image: its grid is written, not the control points\n");
    }
    const int zone = NVLR_UTILITY_UtmZone(reference);
    if (reference.state == CVLR_STATE_GEO_GLOBAL) {
      geographicKeys(gtif.get());
    } else if (zone != 0) {
      utmKeys(gtif.get(), zone, reference.north());
    } else {
      otherStateKeys(gtif.get(), reference);
    }
    if (reference.hasGrid) {
      gridTags(tif, reference);
    } else {
      NVLR_UTILITY_TracePrint("Geocoded image without its grid : %s\n", name);
    }
  }
  if (!GTIFWriteKeys(gtif.get())) {
    NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, name);
  }
}

void NVLR_UTILITY_WriteKmlOverlay(const CVlrMapReference& r, const std::string& kmlPath,
                                  const std::string& tiffName, const std::string& description) {
  const double west = r.lonEasting;
  const double east = r.lonEasting + r.pixels * std::fabs(r.spacingEast);
  const double north = r.latNorthing;
  const double south = r.latNorthing - r.lines * std::fabs(r.spacingNorth);
  const double centreLon = (west + east) / 2.0;
  const double centreLat = (north + south) / 2.0;
  // Far enough to show the whole image.
  const double extent =
      std::fmax(north - south, (east - west) * std::cos(centreLat * M_PI / 180.0));
  const double range = std::fmax(kKmlMinimumRange, extent * kMetresPerDegree * kKmlViewMargin);
  auto num = [](double v) { return NVLR_UTILITY_DoubleText(v); };

  std::string kml = "<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n";
  kml += std::string("<kml xmlns=\"") + kKmlNamespace + "\">\n";
  kml += open(1, "GroundOverlay");
  kml += element(2, "description", escaped(description));
  kml += element(2, "name", escaped(tiffName));
  kml += open(2, "LookAt");
  kml += element(3, "longitude", num(centreLon));
  kml += element(3, "latitude", num(centreLat));
  kml += element(3, "range", num(range));
  kml += element(3, "tilt", "0");
  kml += element(3, "heading", "0");
  kml += close(2, "LookAt");
  kml += element(2, "visibility", "1");
  kml += element(2, "color", "ffffffff");
  kml += open(2, "Icon");
  kml += element(3, "href", escaped(tiffName));
  kml += close(2, "Icon");
  kml += open(2, "LatLonBox");
  kml += element(3, "north", num(north));
  kml += element(3, "south", num(south));
  kml += element(3, "east", num(east));
  kml += element(3, "west", num(west));
  kml += element(3, "rotation", "0");
  kml += close(2, "LatLonBox");
  kml += close(1, "GroundOverlay");
  kml += "</kml>\n";

  FILE* f = std::fopen(kmlPath.c_str(), "wb");
  if (f != nullptr) VlrRunOutputBegun(kmlPath.c_str());
  bool ok = f != nullptr && std::fwrite(kml.data(), 1, kml.size(), f) == kml.size();
  if (f != nullptr) ok = std::fclose(f) == 0 && ok;
  if (!ok) NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, kmlPath.c_str());
}
