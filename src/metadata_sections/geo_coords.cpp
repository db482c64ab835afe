#include "metadata_sections/geo_coords.h"

#include <cfloat>

#include "metadata_sections/legacy_fields.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "geo_coords";
constexpr int kChannel = 1;
constexpr const char* kSection = "GroundCornersPoints";
constexpr const char* kLegacySection = "GeoGridSize";
constexpr int kFields = 2;

// The points in the order they are read and written, with their block names.
struct Corner {
  geopoint geoCoords_Obj::*point;
  const char* name;
};
constexpr Corner kCorners[] = {{&geoCoords_Obj::NorthWest, "NorthWest"},
                               {&geoCoords_Obj::NorthEast, "NorthEast"},
                               {&geoCoords_Obj::SouthWest, "SouthWest"},
                               {&geoCoords_Obj::SouthEast, "SouthEast"},
                               {&geoCoords_Obj::Center, "Center"}};

}  // namespace

geoCoords_Obj::geoCoords_Obj() {
  createElementsVector(kFields);
}

void geoCoords_Obj::refreshParameters() {
  addElementDouble("EastingGridSize", &EastingGridSize, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("NorthingGridSize", &NorthingGridSize, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int geoCoords_Obj::readhdr(const char* file) {
  VLR_SCOPE("geoCoords_Obj::readhdr", kModule);
  if (!readAuxiliaryFile(file, kChannel, kSection) &&
      readLegacyFields(*this, file, kLegacySection) != 0) {
    return 1;
  }
  for (const Corner& c : kCorners) VLR_CALL((this->*c.point).readhdr(file, c.name));
  return 0;
}

int geoCoords_Obj::writehdr(const char* file) {
  VLR_SCOPE("geoCoords_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  for (const Corner& c : kCorners) VLR_CALL((this->*c.point).writehdr(file, c.name));
  return 0;
}

int geoCoords_Obj::clone(geoCoords_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}
