// Generated products multilooked and geocoded: checkerboard edges and point
// targets where the generator's geometry puts them on the map (through GDAL),
// a Cloud Optimized GeoTIFF that GDAL places, a UTM zone that fits the scene.
#include <cpl_conv.h>
#include <gdal_priv.h>
#include <ogr_spatialref.h>

#include <algorithm>
#include <array>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>
#include <vector>

#include "geocode/geocode_header.h"
#include "geocode/map_to_radar.h"
#include "mlook_fixture.h"

namespace mlook_test {
namespace {

// Descending pass over the default real orbit; ascending over a circular
// model orbit; descending above 77 N across the antimeridian.
constexpr const char* kDescending = "--size small --pattern checkerboard --band-limit --seed 11";
constexpr const char* kAscending =
    "--size small --pattern checkerboard --band-limit --seed 12 --orbit kepler --pass ascending";
constexpr const char* kArctic =
    "--size small --pattern checkerboard --band-limit --seed 13 --start \"02-MAR-2008 00:11:00\"";
constexpr const char* kPoints = "--size small --pattern points --band-limit --seed 14";
// Descending in the southern hemisphere; across the border of UTM zones 55
// and 56 (150 E), its centre just west of it.
constexpr const char* kSouth = "--size tiny --seed 15 --start \"02-MAR-2008 00:46:02\"";
constexpr const char* kZoneBorder = "--size tiny --seed 16 --start \"02-MAR-2008 00:21:13\"";

// A geocoded image as GDAL reads it.
struct MapImage : Image {
  double gt[6] = {};
  int epsg = 0;
};

MapImage ReadMap(const std::string& path) {
  GDALAllRegister();
  MapImage m;
  std::unique_ptr<GDALDataset> ds(static_cast<GDALDataset*>(GDALOpen(path.c_str(), GA_ReadOnly)));
  if (!ds) {
    ADD_FAILURE() << "GDAL cannot open " << path;
    return m;
  }
  m.samples = ds->GetRasterXSize();
  m.lines = ds->GetRasterYSize();
  ds->GetGeoTransform(m.gt);
  const OGRSpatialReference* srs = ds->GetSpatialRef();
  if (srs != nullptr && srs->GetAuthorityCode(nullptr) != nullptr)
    m.epsg = std::atoi(srs->GetAuthorityCode(nullptr));
  int has = 0;
  m.noData = ds->GetRasterBand(1)->GetNoDataValue(&has);
  if (!has) m.noData = NAN;
  m.v.resize(static_cast<size_t>(m.samples) * m.lines);
  EXPECT_EQ(ds->GetRasterBand(1)->RasterIO(GF_Read, 0, 0, m.samples, m.lines, m.v.data(), m.samples,
                                           m.lines, GDT_Float32, 0, 0, nullptr),
            CE_None);
  return m;
}

// WGS 84 longitude and latitude into pixel positions of the map image
// (pixel centres at whole numbers), through the reference system GDAL reads
// from the file.
class ToPixel {
 public:
  explicit ToPixel(const MapImage& m) : m_(m) {
    OGRSpatialReference geo, map;
    geo.importFromEPSG(4326);
    geo.SetAxisMappingStrategy(OAMS_TRADITIONAL_GIS_ORDER);
    map.importFromEPSG(m.epsg);
    map.SetAxisMappingStrategy(OAMS_TRADITIONAL_GIS_ORDER);
    ct_.reset(OGRCreateCoordinateTransformation(&geo, &map));
  }
  std::array<double, 2> operator()(double lon, double lat) const {
    double x = lon, y = lat;
    EXPECT_TRUE(ct_ && ct_->Transform(1, &x, &y));
    return {(x - m_.gt[0]) / m_.gt[1] - 0.5, (y - m_.gt[3]) / m_.gt[5] - 0.5};
  }

 private:
  const MapImage& m_;
  std::unique_ptr<OGRCoordinateTransformation> ct_;
};

struct Geocoded {
  int code = -1;
  std::string path, message;
  MapGrid map;
  MlookRadarGrid grid;
  std::unique_ptr<GeneralSAROrbit> orbit;
  MapImage image;
};

class GeocodeProducts : public MultilookTest {
 protected:
  // Multilooks the product as the driver does and geocodes the output.
  Geocoded geocode(const Imported& p, const std::string& name, bool ground,
                   GeocodeOptions options = {}) {
    Geocoded g;
    g.orbit = std::make_unique<GeneralSAROrbit>();
    const Output o = multilook(p, name, ground, nullptr, [&](mlook& ml) {
      ASSERT_EQ(ml.radarGrid(&g.grid), 0);
      ASSERT_EQ(ml.orbit()->clone(g.orbit.get()), 0);
    });
    g.code = o.code;
    if (g.code != 0) return g;
    g.path = work(name + "_geo.tif");
    g.code = GeocodeMultilook(o.name.c_str(), g.grid, *g.orbit, options, kGroundStep,
                              g.path.c_str(), &g.message, &g.map);
    if (g.code == 0) g.image = ReadMap(g.path);
    return g;
  }

  // Every cell edge of the checkerboard that lies within the image, away
  // from its first and last lines, is within one map pixel of the truth;
  // range edges are found in every sub-swath.
  void CheckCheckerboard(const char* args, bool ground) {
    const Imported& p = product(args);
    const Geocoded g = geocode(p, ground ? "C_gr" : "C_pwr", ground);
    ASSERT_EQ(g.code, 0) << g.message;
    const MapImage& m = g.image;
    const auto traj = trajectory(p);
    const ToPixel toPixel(m);
    const double t0 = p.number("Scene", "SensingStart");
    const double near = p.swath(0, "NearRangeTime");
    ExpectCheckerboardEdges(p, m, [&](double daz, double drg) {
      synth::GroundPoint gp;
      EXPECT_TRUE(synth::zero_doppler_point(traj->at(t0 + daz), near + drg, &gp));
      return toPixel(gp.geo.lon_deg, gp.geo.lat_deg);
    });

    // The lattice: line and column interpolated between exact solutions
    // kLookupStep pixels apart stay within 0.05 image pixel of the exact
    // solution, at the middle of lattice cells (where the error is largest).
    MapToRadar exact(g.grid, g.map);
    std::string message;
    ASSERT_EQ(exact.open(*g.orbit, &message), 0) << message;
    double worst = 0.0;
    for (int i = 0; i + kLookupStep < g.map.height; i += 5 * kLookupStep)
      for (int j = 0; j + kLookupStep < g.map.width; j += 3 * kLookupStep) {
        double l[4], c[4], line = 0, column = 0;
        bool ok = exact.solve(i + 0.5 + kLookupStep / 2, j + 0.5 + kLookupStep / 2, &line, &column);
        for (int n = 0; n < 4; ++n)
          ok = ok && exact.solve(i + 0.5 + (n / 2) * kLookupStep, j + 0.5 + (n % 2) * kLookupStep,
                                 &l[n], &c[n]);
        if (!ok || line < 0 || line > g.grid.lines() - 1 || column < 0 ||
            column > g.grid.samples() - 1)
          continue;
        worst = std::max(worst, std::fabs((l[0] + l[1] + l[2] + l[3]) / 4 - line));
        worst = std::max(worst, std::fabs((c[0] + c[1] + c[2] + c[3]) / 4 - column));
      }
    EXPECT_LT(worst, 0.05);
  }
};

TEST_F(GeocodeProducts, CheckerboardDescendingRealOrbitGroundRange) {
  CheckCheckerboard(kDescending, true);
}

TEST_F(GeocodeProducts, CheckerboardAscendingModelOrbitSlantRange) {
  CheckCheckerboard(kAscending, false);
}

TEST_F(GeocodeProducts, CheckerboardAbove77NorthAcrossTheAntimeridian) {
  CheckCheckerboard(kArctic, true);
}

// The bright points away from the image border have their centres of power
// where the truth puts them: within one map pixel on average, and none
// further than the multilook itself may displace a point (one of its lines,
// 79 m here, on top of the map's own half pixel).
TEST_F(GeocodeProducts, PointTargetsWhereTheTruthPutsThem) {
  const Imported& p = product(kPoints);
  const Geocoded g = geocode(p, "P_gr", true);
  ASSERT_EQ(g.code, 0) << g.message;
  const MapImage& m = g.image;
  const ToPixel toPixel(m);
  std::vector<double> all;
  for (float v : m.v)
    if (v != m.noData) all.push_back(double{v} * v);
  std::nth_element(all.begin(), all.begin() + all.size() / 2, all.end());
  const double background = all[all.size() / 2];
  const int targets = static_cast<int>(p.number("Pattern", "Targets"));
  int checked = 0;
  double squares = 0.0;
  for (int i = 0; i < targets; ++i) {
    double daz = 0, drg = 0, lat = 0, lon = 0;
    ASSERT_EQ(std::sscanf(text(p.run, "Pattern", "Target" + std::to_string(i)).c_str(),
                          "%lf %lf %lf %lf", &daz, &drg, &lat, &lon),
              4);
    const auto e = toPixel(lon, lat);
    const int x0 = static_cast<int>(std::lround(e[0])), y0 = static_cast<int>(std::lround(e[1]));
    double sum = 0, sx = 0, sy = 0, peak = 0;
    bool whole = true;
    for (int y = y0 - 3; y <= y0 + 3; ++y)
      for (int x = x0 - 3; x <= x0 + 3; ++x) {
        if (x < 0 || y < 0 || x >= m.samples || y >= m.lines || m.at(y, x) == m.noData) {
          whole = false;
          continue;
        }
        const double pw = m.power(y, x);
        const double w = std::max(0.0, pw - 2.0 * background);
        peak = std::max(peak, pw);
        sum += w;
        sx += w * x;
        sy += w * y;
      }
    // Targets on a sub-swath seam or at the image border may be dim.
    if (!whole || peak < 4.0 * background) continue;
    const double offset = std::hypot(sx / sum - e[0], sy / sum - e[1]);
    EXPECT_LE(offset, 1.5) << "target " << i;
    squares += offset * offset;
    ++checked;
  }
  EXPECT_GE(checked, targets / 2);
  EXPECT_LE(std::sqrt(squares / checked), 0.75);
}

// What gdalinfo reports of the file, and its placement by GDAL alone: the
// scene centre of the truth has data, the map corners outside the swath
// have none, and nothing is NaN.
TEST_F(GeocodeProducts, CloudOptimizedGeoTiffThatGdalPlaces) {
  const Imported& p = product(kDescending);
  const Geocoded g = geocode(p, "G_gr", true);
  ASSERT_EQ(g.code, 0) << g.message;
  const std::string info = work("gdalinfo.txt");
  ASSERT_EQ(synth_test::shell("gdalinfo '" + g.path + "' > '" + info + "'"), 0);
  const std::string text = synth_test::read_text(info);
  const double centreLon = p.swath(2, "CentreLon"), centreLat = p.swath(2, "CentreLat");
  const int zone = UtmEpsg(centreLat, centreLon);
  for (const std::string& expected :
       {std::string("ID[\"EPSG\",") + std::to_string(zone) + "]]", std::string("LAYOUT=COG"),
        std::string("COMPRESSION=DEFLATE"), std::string("Block=512x512 Type=Float32"),
        std::string("NoData Value=0"), std::string("Overviews: "),
        std::string("Pixel Size = (75.000000000000000,-75.000000000000000)")})
    EXPECT_NE(text.find(expected), std::string::npos) << expected << "\n" << text;

  const MapImage& m = g.image;
  auto valueAt = [&](double lon, double lat) {
    const std::string out = work("location.txt");
    char cmd[512];
    std::snprintf(cmd, sizeof cmd, "gdallocationinfo -valonly -wgs84 '%s' %.7f %.7f > '%s'",
                  g.path.c_str(), lon, lat, out.c_str());
    EXPECT_EQ(synth_test::shell(cmd), 0);
    return std::atof(synth_test::read_text(out).c_str());
  };
  EXPECT_GT(valueAt(centreLon, centreLat), 0.0);
  for (int k = 0; k < kMlookSwaths; ++k)
    EXPECT_GT(valueAt(p.swath(k, "CentreLon"), p.swath(k, "CentreLat")), 0.0) << k + 1;
  size_t nan = 0, data = 0;
  for (float v : m.v) {
    nan += std::isnan(v) ? 1 : 0;
    data += v != m.noData ? 1 : 0;
  }
  EXPECT_EQ(nan, 0u);
  EXPECT_GT(data, m.v.size() / 2);
  for (int y : {0, m.lines - 1})
    for (int x : {0, m.samples - 1}) EXPECT_EQ(m.at(y, x), m.noData) << x << " " << y;

  // The first overview, as GDAL reads it: each pixel the mean of the valid
  // pixels of its 2 x 2 block, NoData where there are none.
  const std::string overview = work("overview.bin");
  ASSERT_EQ(
      synth_test::shell("gdal_translate -q -of ENVI -ovr 0 '" + g.path + "' '" + overview + "'"),
      0);
  const std::vector<uint8_t> bytes = synth_test::read_file(overview);
  const int ow = (m.samples + 1) / 2, oh = (m.lines + 1) / 2;
  ASSERT_EQ(bytes.size(), sizeof(float) * ow * oh);
  size_t wrong = 0;
  for (int j = 0; j < oh; ++j)
    for (int i = 0; i < ow; ++i) {
      double sum = 0.0;
      int count = 0;
      for (int y = 2 * j; y < std::min(m.lines, 2 * j + 2); ++y)
        for (int x = 2 * i; x < std::min(m.samples, 2 * i + 2); ++x)
          if (m.at(y, x) != m.noData) sum += m.at(y, x), ++count;
      float got;
      std::memcpy(&got, bytes.data() + sizeof(float) * (static_cast<size_t>(j) * ow + i),
                  sizeof got);
      const double want = count > 0 ? sum / count : m.noData;
      if (std::fabs(got - want) > 1e-4 * std::max(1.0, std::fabs(want))) ++wrong;
    }
  EXPECT_EQ(wrong, 0u) << "overview pixels that are not the mean of their block";

  // The suite header holds the map grid.
  const std::string sml = synth_test::read_text(g.path + ".sml");
  EXPECT_NE(sml.find("UTM-GLOBAL"), std::string::npos);
  EXPECT_NE(sml.find("<Zone>" + std::to_string(zone % 100) + "</Zone>"), std::string::npos);
  char meridian[96];
  std::snprintf(meridian, sizeof meridian, "<CentralOfProjLongitude>%d</CentralOfProjLongitude>",
                -183 + 6 * (zone % 100));
  EXPECT_NE(sml.find(meridian), std::string::npos) << sml;
}

// A scene across the border of UTM zones 55 and 56 (150 E) is mapped in
// the zone of its centre, just west of the border.
TEST_F(GeocodeProducts, UtmZoneOfTheSceneCentre) {
  const Imported& p = product(kZoneBorder);
  ASSERT_LT(p.swath(4, "LastFarLon"), 150.0);
  ASSERT_GT(p.swath(0, "FirstNearLon"), 150.0);
  const Geocoded g = geocode(p, "Z_gr", true);
  ASSERT_EQ(g.code, 0) << g.message;
  EXPECT_EQ(g.image.epsg, 32655);
}

// A geographic map at a given spacing in degrees.
TEST_F(GeocodeProducts, GeographicMap) {
  const Imported& p = product(kSouth);
  GeocodeOptions o;
  o.epsg = 4326;
  o.spacing = 0.001;
  const Geocoded g = geocode(p, "W_gr", true, o);
  ASSERT_EQ(g.code, 0) << g.message;
  EXPECT_EQ(g.image.epsg, 4326);
  EXPECT_DOUBLE_EQ(g.image.gt[1], 0.001);
  const ToPixel toPixel(g.image);
  const auto c = toPixel(p.swath(2, "CentreLon"), p.swath(2, "CentreLat"));
  EXPECT_GT(g.image.at(static_cast<int>(std::lround(c[1])), static_cast<int>(std::lround(c[0]))),
            0.0f);
}

}  // namespace
}  // namespace mlook_test
