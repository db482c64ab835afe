// The 8-bit GeoTIFF export: grey levels of known images checked against the
// documented mapping computed here and the bytes GDAL reads from the TIFF,
// null pixels, constant and empty images, the process-log record and the
// exported header, the host's withdrawal, and ground control points as GDAL
// lists them.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <limits>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/raise.h"
#include "suite/description_header.h"
#include "suite/raster_to_geotiff.h"
#include "suite_fixture.h"

namespace {

using vlr_test::Exists;
using vlr_test::RaisedCode;
using vlr_test::ReadFile;
using vlr_test::RunProgram;
using vlr_test::WriteFile;

const double kNaN = std::numeric_limits<double>::quiet_NaN();

// The documented grey level of display value w for black `low` and white
// `high`.
unsigned char grey(double w, double low, double high) {
  const double t = std::fmin(1.0, std::fmax(0.0, (w - low) / (high - low)));
  return static_cast<unsigned char>(1 + std::floor(254.0 * t + 0.5));
}

std::string floats(const std::vector<double>& values) {
  std::string bytes;
  for (double v : values) {
    const float f = static_cast<float>(v);
    bytes.append(reinterpret_cast<const char*>(&f), sizeof f);
  }
  return bytes;
}

struct Raster {
  int lines, pixels;
  const char* cellType;
  const char* units;        // null: unset
  double nullValue = kNaN;  // NaN: "NullCellValue" unset
};

class GeoTiffTest : public vlr_test::SuiteTest {
 protected:
  void SetUp() override {
    SuiteTest::SetUp();
    inst_.hostFiles();
  }

  std::string product(const std::string& name, const Raster& r, const std::string& bytes) {
    CDescriptionHeader h(std::vector<std::string>{"RasterInfo"});
    setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), r.lines);
    setInteger(getField(h, "RasterInfo.NrOfPixelsPerLine"), r.pixels);
    setString(getField(h, "RasterInfo.CellType"), r.cellType);
    for (const char* zero : {"HeaderOffset", "RowPrefix", "RowSuffix"}) {
      setInteger(getField(h, zero), 0);
    }
    if (r.units) setString(getField(h, "RasterInfo.DataUnits"), r.units);
    if (!std::isnan(r.nullValue)) setDouble(getField(h, "RasterInfo.NullCellValue"), r.nullValue);
    writeHeader(h, work(name + "_hdr").c_str());
    WriteFile(work(name), bytes);
    return work(name);
  }

  static vlr_test::RunResult run(const std::vector<std::string>& argv) {
    const vlr_test::RunResult r = RunProgram(argv, {}, true);
    EXPECT_EQ(r.status, 0) << argv[0] << "\n" << r.err;
    return r;
  }

  // The image bytes as GDAL reads them from the TIFF.
  std::string gdalBytes(const std::string& tiff) {
    run({"/usr/bin/gdal_translate", "-q", "-of", "ENVI", tiff, work("read.raw")});
    return ReadFile(work("read.raw"));
  }
};

TEST_F(GeoTiffTest, ARampMapsAsDocumentedAndIsRecorded) {
  // Values 1..400 with one null pixel at the end of each line, marked by
  // "NullCellValue" or by a NaN.  Saturation 10 %: white is the sorted
  // value at floor(0.9 * 399) = 359, that is 360; black is 0.
  const Raster r = {4, 101, "FLOAT", "AMPLITUDE", -1.0};
  std::vector<double> values;
  std::string want;
  for (int line = 0; line < 4; ++line) {
    for (int p = 0; p < 100; ++p) {
      values.push_back(line * 100 + p + 1);
      want += static_cast<char>(grey(values.back(), 0.0, 360.0));
    }
    values.push_back(line % 2 ? kNaN : -1.0);
    want += '\0';
  }
  const std::string path = product("ramp", r, floats(values));
  NVLR_UTILITY_RasterToGeoTiff(path.c_str(), (path + ".tif").c_str(), 10.0);

  EXPECT_EQ(gdalBytes(path + ".tif"), want);
  const std::string info = run({"/usr/bin/gdalinfo", path + ".tif"}).out;
  EXPECT_NE(info.find("Type=Byte, ColorInterp=Gray"), std::string::npos) << info;
  EXPECT_NE(info.find("NoData Value=0"), std::string::npos) << info;

  const std::string record =
      "\nMAKE TIFF OF FILE [" + path + "]     TIFF  NAME  [" + path +
      ".tif]      Data Units : AMPLITUDE  ;  Data Type : FLOAT  ;  Number of Line : 4  ;  "
      "Number of Pixels : 101\t\tSTATISTICS   Scale : 0.002778  ;  Exponent : 1.000000  ;  "
      "Min : 1.000000  ;  Mean : 200.500000  ;  Max : 400.000000    ;   TIFF  Saturation : "
      "10.000000  ;  Scale : 0.002778  ;  Exponent    : 1.000000\n";
  EXPECT_NE(processLog().find(record), std::string::npos) << processLog();

  // The exported header, beside the TIFF and without an ENVI header.
  EXPECT_TRUE(Exists(path + ".tif.sml"));
  EXPECT_FALSE(Exists(path + ".tif.hdr"));
  EXPECT_FALSE(Exists(path + ".tif.tif"));
  CDescriptionHeader exported(std::vector<std::string>{"RasterInfo"});
  ASSERT_TRUE(readHeader(exported, (path + ".tif_hdr").c_str()));
  EXPECT_EQ(getString(getField(exported, "RasterInfo.CellType")), "UNSIGNED_BYTE");
  EXPECT_EQ(getDouble(getField(exported, "RasterInfo.TiffMinValue")), 0.0);
  EXPECT_DOUBLE_EQ(getDouble(getField(exported, "RasterInfo.TiffMaxValue")), 360.0);
  EXPECT_DOUBLE_EQ(getDouble(getField(exported, "RasterInfo.TiffScale")), 1.0 / 360.0);
  const CDescriptionField* other = getField(exported, "RasterInfo.OtherInfo");
  ASSERT_EQ(other->rows(), 2);  // "SOFTWARE", then the description
  EXPECT_EQ(getStringAt(other, 1, 1), "Image generated with : " + NVLR_UTILITY_Identification());
}

TEST_F(GeoTiffTest, PowerComplexAndSignedImages) {
  struct Case {
    const char* name;
    Raster raster;
    std::string bytes;
    double saturation;
    std::string want;
  };
  std::vector<Case> cases;

  // Power k^2 for k = 1..200 is shown as amplitude k.  Saturation 0 stands
  // for 2 %: white is the amplitude at floor(0.98 * 199) = 195, that is 196.
  Case power = {"power", {2, 100, "FLOAT", "POWER"}, "", 0.0, ""};
  std::vector<double> squares;
  for (int k = 1; k <= 200; ++k) {
    squares.push_back(double(k) * k);
    power.want += static_cast<char>(grey(k, 0.0, 196.0));
  }
  power.bytes = floats(squares);
  cases.push_back(power);

  // Complex cells: magnitudes 5, 10 and 15 around a null (0, 0) pixel; at
  // 50 % white is the middle magnitude, 10.
  cases.push_back(
      {"complex",
       {1, 4, "FLOAT_COMPLEX", "SLC"},
       floats({3, 4, 0, 0, 6, 8, 9, 12}),
       50.0,
       {static_cast<char>(grey(5, 0, 10)), '\0', static_cast<char>(255), static_cast<char>(255)}});

  // Signed values -100..99: black and white at the 5 % and 95 % values,
  // sorted index floor(0.05 * 199) = 9 and floor(0.95 * 199) = 189.
  Case dem = {"dem", {1, 200, "FLOAT", "DEM", -9999.0}, "", 5.0, ""};
  std::vector<double> heights;
  for (int v = -100; v < 100; ++v) {
    heights.push_back(v);
    dem.want += static_cast<char>(grey(v, -91.0, 89.0));
  }
  dem.bytes = floats(heights);
  cases.push_back(dem);

  // A constant image is mid grey; "SHORT" cells, no data units.
  cases.push_back({"constant",
                   {2, 3, "SHORT", nullptr, -1.0},
                   std::string("\x07\x00\x07\x00\xff\xff\x07\x00\x07\x00\x07\x00", 12),
                   2.0,
                   std::string("\x80\x80\x00\x80\x80\x80", 6)});

  for (const Case& c : cases) {
    SCOPED_TRACE(c.name);
    const std::string path = product(c.name, c.raster, c.bytes);
    NVLR_UTILITY_RasterToGeoTiff(path.c_str(), path.c_str(), c.saturation);
    EXPECT_EQ(gdalBytes(path + ".tif"), c.want);
  }
}

TEST_F(GeoTiffTest, EmptyAndSparseImagesAndAWithdrawnRun) {
  // Every pixel null: refused, nothing written.
  const std::string empty =
      product("empty", {2, 2, "FLOAT", "POWER"}, floats({0.0, 0.0, kNaN, 0.0}));
  try {
    NVLR_UTILITY_RasterToGeoTiff(empty.c_str(), nullptr, 2.0);
    ADD_FAILURE() << "an image without valid pixels was exported";
  } catch (const CErrorExceptionManager& e) {
    EXPECT_EQ(e.code(), 130560);
    EXPECT_EQ(e.extra(), "Error: 0 non null points in the input file : " + empty);
  }
  EXPECT_FALSE(Exists(empty + ".tif"));
  EXPECT_FALSE(Exists(empty + ".tif.part"));

  // A run the host has withdrawn stops.
  const std::string gone = product("gone", {2, 2, "FLOAT", nullptr}, floats({1, 2, 3, 4}));
  std::remove((inst_.workingFile() + "_batch_ok").c_str());
  EXPECT_EQ(RaisedCode([&] { NVLR_UTILITY_RasterToGeoTiff(gone.c_str(), nullptr, 2.0); }),
            vlr::kCodeBatchWithdrawn);
  EXPECT_FALSE(Exists(gone + ".tif"));
  inst_.hostFiles();

  // 1.5 million pixels are sampled every second line and pixel; the one
  // valid pixel lies on an odd line and must still be found.
  const int pixels = 500000;
  std::string bytes(static_cast<size_t>(3 * pixels), '\0');
  bytes[pixels + 333333] = 9;
  const std::string sparse = product("sparse", {3, pixels, "UNSIGNED_BYTE", nullptr}, bytes);
  NVLR_UTILITY_RasterToGeoTiff(sparse.c_str(), nullptr, 2.0);
  std::string want(bytes.size(), '\0');
  want[pixels + 333333] = static_cast<char>(128);
  EXPECT_EQ(gdalBytes(sparse + ".tif"), want);
}

TEST_F(GeoTiffTest, GroundControlPointsLocateAnImageThatIsNotGeocoded) {
  const Raster r = {20, 30, "FLOAT", "POWER"};
  const std::vector<double> ones(20 * 30, 1.0);
  const std::string path = product("gcp", r, floats(ones));
  const std::vector<CVlrGroundControlPoint> gcps = {{0, 0, 10.0, 50.0},
                                                    {29, 0, 11.0, 50.25},
                                                    {0, 19, 9.75, 49.0},
                                                    {29, 19, 10.75, 49.25},
                                                    {15, 10, 10.375, 49.625}};
  NVLR_UTILITY_RasterToGeoTiff(path.c_str(), nullptr, 2.0, gcps);
  const std::string info = run({"/usr/bin/gdalinfo", path + ".tif"}).out;
  EXPECT_NE(info.find("GCP Projection = \nGEOGCRS[\"WGS 84\""), std::string::npos) << info;
  EXPECT_NE(info.find("ID[\"EPSG\",4326]"), std::string::npos) << info;
  // Pixel centres lie half a pixel from the corner of the grid.
  for (const char* point :
       {"(0.5,0.5) -> (10,50,0)", "(29.5,0.5) -> (11,50.25,0)", "(0.5,19.5) -> (9.75,49,0)",
        "(29.5,19.5) -> (10.75,49.25,0)", "(15.5,10.5) -> (10.375,49.625,0)"}) {
    EXPECT_NE(info.find(point), std::string::npos) << point << "\n" << info;
  }
  // A point off the earth is refused.
  const std::vector<CVlrGroundControlPoint> bad = {{0, 0, 10.0, 95.0}};
  EXPECT_EQ(RaisedCode([&] { NVLR_UTILITY_RasterToGeoTiff(path.c_str(), nullptr, 2.0, bad); }),
            130560);
}

}  // namespace
