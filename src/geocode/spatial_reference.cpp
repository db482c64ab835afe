// Spatial references and transformations through GDAL.
#include "geocode/spatial_reference.h"

#include <cpl_error.h>
#include <ogr_spatialref.h>

#include <cerrno>

namespace geocode_detail {

void SrsDeleter::operator()(OGRSpatialReference* s) const {
  if (s != nullptr) s->Release();
}

void TransformDeleter::operator()(OGRCoordinateTransformation* t) const {
  OGRCoordinateTransformation::DestroyCT(t);
}

SrsPtr SrsFromEpsg(int epsg, std::string* message) {
  SrsPtr srs(new OGRSpatialReference());
  // GDAL would print its own complaint about an unknown code.
  CPLPushErrorHandler(CPLQuietErrorHandler);
  const OGRErr err = epsg > 0 ? srs->importFromEPSG(epsg) : OGRERR_UNSUPPORTED_SRS;
  CPLPopErrorHandler();
  // PROJ leaves its own error numbers in errno.
  errno = 0;
  if (err != OGRERR_NONE) {
    *message = "EPSG code " + std::to_string(epsg) + " is unknown";
    return nullptr;
  }
  if (!srs->IsProjected() && !srs->IsGeographic()) {
    *message = "EPSG code " + std::to_string(epsg) + " is not a map";
    return nullptr;
  }
  if (srs->IsGeographic() && srs->GetAxesCount() != 2) {
    *message = "EPSG code " + std::to_string(epsg) + " is not a 2D map";
    return nullptr;
  }
  srs->SetAxisMappingStrategy(OAMS_TRADITIONAL_GIS_ORDER);
  return srs;
}

bool MapTransform::open(int epsg, std::string* message) {
  map_ = SrsFromEpsg(epsg, message);
  wgs84_ = SrsFromEpsg(4326, message);
  if (!map_ || !wgs84_) return false;
  geographic_ = map_->IsGeographic();
  CPLPushErrorHandler(CPLQuietErrorHandler);
  toGeo_.reset(OGRCreateCoordinateTransformation(map_.get(), wgs84_.get()));
  fromGeo_.reset(OGRCreateCoordinateTransformation(wgs84_.get(), map_.get()));
  CPLPopErrorHandler();
  errno = 0;
  if (!toGeo_ || !fromGeo_) {
    *message = "No transformation between EPSG:" + std::to_string(epsg) + " and WGS 84";
    return false;
  }
  return true;
}

bool MapTransform::toLonLat(double x, double y, double* lon, double* lat) const {
  CPLPushErrorHandler(CPLQuietErrorHandler);
  const bool ok = toGeo_->Transform(1, &x, &y) != 0;
  CPLPopErrorHandler();
  *lon = x;
  *lat = y;
  return ok;
}

bool MapTransform::fromLonLat(double lon, double lat, double* x, double* y) const {
  CPLPushErrorHandler(CPLQuietErrorHandler);
  const bool ok = fromGeo_->Transform(1, &lon, &lat) != 0;
  CPLPopErrorHandler();
  *x = lon;
  *y = lat;
  return ok;
}

std::string MapTransform::wkt() const {
  char* text = nullptr;
  std::string out;
  if (map_->exportToWkt(&text) == OGRERR_NONE && text != nullptr) out = text;
  CPLFree(text);
  return out;
}

}  // namespace geocode_detail
