// GDAL's spatial references as the geocoder uses them: a reference system
// from an EPSG code with longitude (or easting) first, and transformations
// between a map and geographic WGS 84.
#pragma once

#include <memory>
#include <string>

class OGRSpatialReference;
class OGRCoordinateTransformation;

namespace geocode_detail {

struct SrsDeleter {
  void operator()(OGRSpatialReference* s) const;
};
struct TransformDeleter {
  void operator()(OGRCoordinateTransformation* t) const;
};
using SrsPtr = std::unique_ptr<OGRSpatialReference, SrsDeleter>;
using TransformPtr = std::unique_ptr<OGRCoordinateTransformation, TransformDeleter>;

// The reference system of an EPSG code, or null (with the reason in
// *message) when the code names none that a map can use.
SrsPtr SrsFromEpsg(int epsg, std::string* message);

// Map <-> WGS 84 longitude and latitude (degrees).  One object per thread.
class MapTransform {
 public:
  // False (with *message) when GDAL cannot transform between the two.
  bool open(int epsg, std::string* message);
  bool toLonLat(double x, double y, double* lon, double* lat) const;
  bool fromLonLat(double lon, double lat, double* x, double* y) const;
  bool geographic() const { return geographic_; }
  std::string wkt() const;

 private:
  SrsPtr map_, wgs84_;
  TransformPtr toGeo_, fromGeo_;
  bool geographic_ = false;
};

}  // namespace geocode_detail
