// Map options that cannot make a map are refused with a reason, and the
// UTM zone of a point is the one whose 6-degree band holds it.
#include <gtest/gtest.h>

#include <cmath>
#include <string>

#include "geocode/map_grid.h"
#include "runtime/ckerr.h"

namespace {

struct ZoneCase {
  double lat, lon;
  int epsg;
};

TEST(UtmZone, BandOfTheLongitudeAndHemisphereOfTheLatitude) {
  const ZoneCase cases[] = {
      {45.0, 5.999, 32631},   {45.0, 6.001, 32632},    {-33.9, 18.4, 32734},
      {0.0, 0.0, 32631},      {-0.001, -0.001, 32730}, {77.6, 179.99, 32660},
      {77.6, -179.99, 32601}, {10.0, 180.0, 32601},    {-45.1, 127.6, 32752},
  };
  for (const ZoneCase& c : cases) EXPECT_EQ(UtmEpsg(c.lat, c.lon), c.epsg) << c.lat << " " << c.lon;
}

struct OptionCase {
  int epsg;
  double spacing, height, groundStep;
  const char* reason;  // null: accepted
};

TEST(GeocodeOptions, RefusedWithAReason) {
  init_report(0, "ASAR FOCUSSING", 1);
  const OptionCase cases[] = {
      {0, 0.0, 0.0, 75.0, nullptr},
      {4326, 0.001, 0.0, 75.0, nullptr},
      {3857, 100.0, 250.0, 75.0, nullptr},
      {99999, 0.0, 0.0, 75.0, "99999"},  // no such code
      {9001, 0.0, 0.0, 75.0, "9001"},    // a unit, not a reference system
      {4978, 0.0, 0.0, 75.0, "4978"},    // geocentric
      {-5, 0.0, 0.0, 75.0, "-5"},
      {0, -75.0, 0.0, 75.0, "spacing"},
      {0, NAN, 0.0, 75.0, "spacing"},
      {0, 0.0, 0.0, 0.0, "spacing"},  // no spacing and no default
      {0, 0.0, NAN, 75.0, "height"},
  };
  for (const OptionCase& c : cases) {
    GeocodeOptions o;
    o.epsg = c.epsg;
    o.spacing = c.spacing;
    o.height = c.height;
    std::string message;
    const int code = CheckGeocodeOptions(o, c.groundStep, &message);
    if (c.reason == nullptr) {
      EXPECT_EQ(code, 0) << c.epsg << ": " << message;
    } else {
      EXPECT_NE(code, 0) << c.epsg;
      EXPECT_NE(message.find(c.reason), std::string::npos) << message;
    }
  }
}

}  // namespace
