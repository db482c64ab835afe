// Map references of exported images: the check against the installation's
// map list and map files, each kind of reference as GDAL reads it from the
// GeoTIFF, and the KML overlay of geographic images.
#include <string>
#include <vector>

#include "runtime/error_codes.h"
#include "runtime/raise.h"
#include "suite/description_header.h"
#include "suite/raster_to_geotiff.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;
using vlr_test::ReadFile;
using vlr_test::RunProgram;
using vlr_test::WriteFile;

struct Reference {
  const char* geocoded;  // "RasterInfo.GeocodedImage"; null leaves it unset
  const char* state;
  const char* hemisphere;
  const char* zone;
};

class MapInfoTest : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    inst_.hostFiles();
  }

  std::string mapDir() const { return inst_.root() + "/maps/"; }

  // A 2-line, 3-pixel FLOAT product with the given map reference, corner
  // (7.25 E, 45.5 N) and spacing 0.5 east and 0.25 north.
  std::string product(const std::string& name, const Reference& r) {
    CDescriptionHeader h(
        std::vector<std::string>{"RasterInfo", "RegistrationCoordinates", "CartographicSystem"});
    setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), 2);
    setInteger(getField(h, "RasterInfo.NrOfPixelsPerLine"), 3);
    setString(getField(h, "RasterInfo.CellType"), "FLOAT");
    for (const char* zero :
         {"RasterInfo.HeaderOffset", "RasterInfo.RowPrefix", "RasterInfo.RowSuffix"})
      setInteger(getField(h, zero), 0);
    if (r.geocoded) setString(getField(h, "RasterInfo.GeocodedImage"), r.geocoded);
    setDouble(getField(h, "RegistrationCoordinates.LonEasting"), 7.25);
    setDouble(getField(h, "RegistrationCoordinates.LatNorthing"), 45.5);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLonEast"), 0.5);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLatNorth"), 0.25);
    setString(getField(h, "CartographicSystem.State"), r.state);
    setString(getField(h, "CartographicSystem.Hemisphere"), r.hemisphere);
    setString(getField(h, "CartographicSystem.Projection"), "NONE");
    setString(getField(h, "CartographicSystem.Zone"), r.zone);
    setString(getField(h, "CartographicSystem.Ellipsoid"), "WGS84");
    setString(getField(h, "CartographicSystem.DatumShift"), "NONE");
    writeHeader(h, work(name + "_hdr").c_str());
    const float values[6] = {1, 2, 3, 4, 5, 6};
    WriteFile(work(name), std::string(reinterpret_cast<const char*>(values), sizeof values));
    return work(name);
  }

  // Exports the product; returns the code raised, 0 when none.
  int exportCode(const std::string& name, const Reference& r) {
    const std::string path = product(name, r);
    return RaisedCode([&] { NVLR_UTILITY_RasterToGeoTiff(path.c_str(), nullptr, 0.0); });
  }

  static std::string gdalinfo(const std::string& path) {
    const vlr_test::RunResult r = RunProgram({"/usr/bin/gdalinfo", path}, {}, true);
    EXPECT_EQ(r.status, 0) << r.err;
    return r.out;
  }

  // Lets "UTM-GLOBAL" take zones 0 and 61 too, as a site may configure it.
  void allowExtraUtmZones() {
    writeKeyFile("zone", "[zone]\nzone_0 = S\nzone_32 = S\nzone_61 = S\n");
    std::string map = ReadFile(mapDir() + "UTM-GLOBAL_map.sml");
    const std::string zones = "   <zone>\n";
    map.insert(map.find(zones) + zones.size(),
               "      <zone_0>0</zone_0>\n      <zone_61>61</zone_61>\n");
    WriteFile(mapDir() + "UTM-GLOBAL_map.sml", map);
  }
};

TEST_F(MapInfoTest, GeographicProductGetsItsReferenceGridAndOverlay) {
  // "ok" in lower case counts as geocoded.
  ASSERT_EQ(exportCode("geo", {"ok", "GEO-GLOBAL", "NORTH", "0"}), 0);
  const std::string info = gdalinfo(work("geo.tif"));
  EXPECT_NE(info.find("ID[\"EPSG\",4326]"), std::string::npos) << info;
  EXPECT_NE(info.find("Origin = (7.250000000000000,45.500000000000000)"), std::string::npos)
      << info;
  EXPECT_NE(info.find("Pixel Size = (0.500000000000000,-0.250000000000000)"), std::string::npos)
      << info;

  // The overlay, read by an independent XML parser: box of 3 x 0.5 degrees
  // east and 2 x 0.25 north from the corner, centre in between.
  WriteFile(work("kml.py"), R"PY(
import sys, xml.etree.ElementTree as ET
ns = {'k': 'http://earth.google.com/kml/2.0'}
root = ET.parse(sys.argv[1]).getroot()
assert root.tag == '{http://earth.google.com/kml/2.0}kml', root.tag
o = root.find('k:GroundOverlay', ns)
for path in ['k:description', 'k:name', 'k:LookAt/k:range', 'k:LookAt/k:tilt',
             'k:LookAt/k:heading', 'k:visibility', 'k:LatLonBox/k:rotation']:
    assert o.find(path, ns) is not None, path
v = lambda p: o.find(p, ns).text
print(v('k:Icon/k:href'), v('k:color'), float(v('k:LatLonBox/k:north')),
      float(v('k:LatLonBox/k:south')), float(v('k:LatLonBox/k:east')),
      float(v('k:LatLonBox/k:west')), float(v('k:LookAt/k:longitude')),
      float(v('k:LookAt/k:latitude')))
)PY");
  const vlr_test::RunResult kml =
      RunProgram({"/usr/bin/python3", work("kml.py"), work("geo.kml")}, {}, true);
  EXPECT_EQ(kml.status, 0) << kml.err;
  EXPECT_EQ(kml.out, "geo.tif ffffffff 45.5 45.0 8.75 7.25 8.0 45.25\n");
  EXPECT_EQ(ReadFile(work("geo.kml")).find("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n"), 0u);
}

TEST_F(MapInfoTest, UtmZonesOtherStatesAndImagesNotGeocoded) {
  for (int north = 0; north < 2; ++north) {
    ASSERT_EQ(exportCode("utm", {"OK", "UTM-GLOBAL", north ? "NORTH" : "SOUTH", "32"}), 0);
    const std::string info = gdalinfo(work("utm.tif"));
    EXPECT_NE(info.find(north ? "ID[\"EPSG\",32632]" : "ID[\"EPSG\",32732]"), std::string::npos)
        << info;
    EXPECT_FALSE(vlr_test::Exists(work("utm.kml")));
  }

  // Zones outside 1..60, where a site's map file allows them, are described by their citation
  // like any other state, in metres.
  allowExtraUtmZones();
  for (const char* zone : {"0", "61"}) {
    ASSERT_EQ(exportCode("other", {"OK", "UTM-GLOBAL", "NORTH", zone}), 0);
    const std::string info = gdalinfo(work("other.tif"));
    EXPECT_NE(info.find(std::string("ENGCRS[\" | State = UTM-GLOBAL | Hemisphere = NORTH | "
                                    "Projection = NONE | Zone = ") +
                        zone + " | Ellipsoid = WGS84 | DatumShift = NONE\""),
              std::string::npos)
        << info;
    EXPECT_NE(info.find("LENGTHUNIT[\"metre\""), std::string::npos) << info;
  }

  // Not geocoded: only the citation, no grid, and the reference is not checked.
  for (const char* geocoded : {"NO", static_cast<const char*>(nullptr)}) {
    ASSERT_EQ(exportCode("plain", {geocoded, "NOWHERE", "EAST", "99"}), 0);
    const std::string info = gdalinfo(work("plain.tif"));
    EXPECT_NE(info.find("ENGCRS[\"No Geocoded Image\""), std::string::npos) << info;
    EXPECT_EQ(info.find("Origin ="), std::string::npos) << info;
  }
}

TEST_F(MapInfoTest, ReferencesTheInstallationDoesNotKnowAreRefused) {
  const Reference utm = {"OK", "UTM-GLOBAL", "NORTH", "32"};
  const std::string mars = product("x", {"OK", "MARS-GLOBAL", "NORTH", "32"});
  try {
    NVLR_UTILITY_RasterToGeoTiff(mars.c_str(), nullptr, 0.0);
    ADD_FAILURE() << "an unknown state was accepted";
  } catch (const CErrorExceptionManager& e) {
    EXPECT_EQ(e.code(), 456960);
    EXPECT_EQ(e.extra(), "State specified in the Image header or GCP File is invalid.");
  }
  EXPECT_EQ(exportCode("x", {"OK", "UTM-GLOBAL", "EAST", "32"}), 130560);
  EXPECT_EQ(exportCode("x", {"OK", "UTM-GLOBAL", "NORTH", "61"}), 130560);

  // A map file without any allowed ellipsoid cannot answer the lookup.
  std::string map = ReadFile(mapDir() + "UTM-GLOBAL_map.sml");
  const std::string withEllipsoid = map;
  map.erase(map.find("      <ellipsoid_WGS84>"),
            std::string("      <ellipsoid_WGS84>WGS84</ellipsoid_WGS84>\n").size());
  WriteFile(mapDir() + "UTM-GLOBAL_map.sml", map);
  EXPECT_EQ(exportCode("x", utm), 195840);
  WriteFile(mapDir() + "UTM-GLOBAL_map.sml", withEllipsoid);

  WriteFile(mapDir() + "map_list", "GEO-GLOBAL\nUTM-GLOBAL\nPOLAR\n");
  EXPECT_EQ(exportCode("x", {"OK", "POLAR", "NORTH", "0"}), 261122);

  // A list of blank lines names no state; "GEO-GLOBAL" needs none.
  WriteFile(mapDir() + "map_list", "\n  \n");
  EXPECT_EQ(exportCode("x", utm), 783360);
  EXPECT_EQ(exportCode("x", {"OK", "GEO-GLOBAL", "NORTH", "0"}), 0);
  // Nothing of a refused export is left behind.
  WriteFile(mapDir() + "map_list", "");
  ASSERT_EQ(exportCode("refused", utm), 783360);
  EXPECT_FALSE(vlr_test::Exists(work("refused.tif")));
  EXPECT_FALSE(vlr_test::Exists(work("refused.tif.part")));
}

}  // namespace
