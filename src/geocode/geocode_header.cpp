// Suite header of a geocoded image.
#include "geocode/geocode_header.h"

#include <cerrno>
#include <string>

#include "runtime/call_scope.h"
#include "runtime/file_utility.h"
#include "suite/cell_types.h"
#include "suite/description_field.h"
#include "suite/description_header.h"
#include "suite/map_utility.h"

namespace {

void SetText(CDescriptionHeader& header, const char* path, const std::string& value) {
  if (CDescriptionField* f = findField(header, path)) setString(f, value);
}
void SetNumber(CDescriptionHeader& header, const char* path, double value) {
  if (CDescriptionField* f = findField(header, path)) setDouble(f, value);
}
void SetCount(CDescriptionHeader& header, const char* path, int value) {
  if (CDescriptionField* f = findField(header, path)) setInteger(f, value);
}

}  // namespace

void WriteGeocodedHeader(const char* image, const MapGrid& map, const char* target) {
  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  // Without the multilook's header the map fields stand alone.
  readHeader(header, image);
  SetCount(header, "RasterInfo.NrOfLinesPerImage", map.height);
  SetCount(header, "RasterInfo.NrOfPixelsPerLine", map.width);
  SetText(header, "RasterInfo.CellType", NVLR_UTILITY_CellTypeName(CVLR_FLOAT));
  SetNumber(header, "RasterInfo.NullCellValue", kGeocodeNoData);
  SetText(header, "RasterInfo.GeocodedImage", "OK");
  for (const char* path :
       {"RasterInfo.RowPrefix", "RasterInfo.RowSuffix", "RasterInfo.HeaderOffset"}) {
    CDescriptionField* f = findField(header, path);
    if (f != nullptr && f->type() == CVLR_FieldType::Integer) setInteger(f, 0);
  }
  const bool utm =
      (map.epsg > 32600 && map.epsg <= 32660) || (map.epsg > 32700 && map.epsg <= 32760);
  if (utm) {
    SetText(header, "CartographicSystem.State", CVLR_STATE_UTM_GLOBAL);
    SetText(header, "CartographicSystem.Hemisphere", map.epsg < 32700 ? "NORTH" : "SOUTH");
    SetText(header, "CartographicSystem.Projection", "UTM");
    SetText(header, "CartographicSystem.Zone", std::to_string(map.epsg % 100));
    // The transverse Mercator of the zone.
    SetNumber(header, "CartographicSystem.ProjectionDatumFalseEasting", 500000.0);
    SetNumber(header, "CartographicSystem.ProjectionDatumFalseNorthing",
              map.epsg < 32700 ? 0.0 : 10000000.0);
    SetNumber(header, "CartographicSystem.CentralOfProjLongitude", -183.0 + 6.0 * (map.epsg % 100));
    SetNumber(header, "CartographicSystem.CentralOfProjLatitude", 0.0);
    SetNumber(header, "CartographicSystem.ScaleFactor", 0.9996);
  } else if (map.epsg == 4326) {
    SetText(header, "CartographicSystem.State", CVLR_STATE_GEO_GLOBAL);
    SetText(header, "CartographicSystem.Hemisphere", map.originY > 0.0 ? "NORTH" : "SOUTH");
    SetText(header, "CartographicSystem.Projection", "NONE");
    SetText(header, "CartographicSystem.Zone", "0");
  } else {
    // Outside the suite's own states: the EPSG code names the reference.
    SetText(header, "CartographicSystem.State", "EPSG:" + std::to_string(map.epsg));
    SetText(header, "CartographicSystem.Projection", "NONE");
  }
  if (utm || map.epsg == 4326) {
    SetText(header, "CartographicSystem.Ellipsoid", "WGS84");
    SetText(header, "CartographicSystem.DatumShift", "NONE");
  }
  SetNumber(header, "CartographicSystem.ReferenceHeight", map.groundHeight);
  SetNumber(header, "RegistrationCoordinates.LatNorthing", map.originY);
  SetNumber(header, "RegistrationCoordinates.LonEasting", map.originX);
  SetNumber(header, "RegistrationCoordinates.PixelSpacingLatNorth", map.spacing);
  SetNumber(header, "RegistrationCoordinates.PixelSpacingLonEast", map.spacing);
  writeHeader(header, (std::string(target) + "_hdr").c_str());
}

int GeocodeMultilook(const char* image, const MlookRadarGrid& grid, const GeneralSAROrbit& orbit,
                     const GeocodeOptions& options, double groundStep, const char* target,
                     std::string* message, MapGrid* mapOut, GeocodeFigures* figures) {
  VLR_SCOPE("GeocodeMultilook", "geocode");
  MapGrid map;
  VLR_CALL(ChooseMapGrid(grid, orbit, options, groundStep, &map, message));
  VLR_CALL(GeocodeImage(image, grid, orbit, map, target, message, figures));
  WriteGeocodedHeader(image, map, target);
  if (mapOut != nullptr) *mapOut = map;
  errno = 0;
  return 0;
}
