#include "metadata_sections/geo_point.h"

#include <cfloat>

#include "profile/profile_values.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "geopoint";
constexpr int kChannel = 1;
constexpr const char* kLegacySection = "Coordinates";

}  // namespace

geopoint::geopoint() {
  createElementsVector(1);
}

void geopoint::refreshParameters() {
  addElementDouble("Point", Point, kValues, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

void geopoint::toPoint() {
  Point[0] = latitude;
  Point[1] = longitude;
  Point[2] = height;
  Point[3] = incidence;
  Point[4] = lookAngle;
}

void geopoint::fromPoint() {
  latitude = Point[0];
  longitude = Point[1];
  height = Point[2];
  incidence = Point[3];
  lookAngle = Point[4];
}

int geopoint::set(double lat, double lon, double h, double incidenceAngle, double lookAngleValue) {
  latitude = lat;
  longitude = lon;
  height = h;
  incidence = incidenceAngle;
  lookAngle = lookAngleValue;
  toPoint();
  return 0;
}

int geopoint::readhdr(const char* file, const char* name) {
  VLR_SCOPE("geopoint::readhdr", kModule);
  if (name == nullptr || name[0] == '\0') VLR_FAIL("Missing point name!", 1);
  double values[kValues];
  for (int i = 0; i < kValues; ++i) values[i] = Point[i];
  if (!readAuxiliaryFile(file, kChannel, name)) {
    // Values of an incomplete block are not kept.
    for (int i = 0; i < kValues; ++i) Point[i] = values[i];
    if (GetProfileDoubleArray(kLegacySection, name, values, kValues, file) != 0) return 1;
    for (int i = 0; i < kValues; ++i) Point[i] = values[i];
  }
  fromPoint();
  return 0;
}

int geopoint::writehdr(const char* file, const char* name) {
  VLR_SCOPE("geopoint::writehdr", kModule);
  if (name == nullptr || name[0] == '\0') VLR_FAIL("Missing point name!", 1);
  toPoint();
  VLR_CALL(writeAuxiliaryFile(file, kChannel, name));
  return 0;
}

int geopoint::clone(geopoint* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}
