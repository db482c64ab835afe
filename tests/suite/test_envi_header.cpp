// The ENVI header and the GDAL virtual raster beside a product, checked by
// reading the product with GDAL and comparing every sample with the values
// the test wrote, and by GDAL's reading of the map information.
#include <cmath>
#include <cstdint>
#include <cstring>
#include <string>
#include <vector>

#include "runtime/error_codes.h"
#include "suite/description_header.h"
#include "suite/envi_header.h"
#include "suite_fixture.h"

namespace {

using vlr_test::RaisedCode;
using vlr_test::ReadFile;

const std::vector<std::string> kSections = {"RasterInfo",         "InitialGeometry",
                                            "Processing",         "ChannelInfo",
                                            "CartographicSystem", "RegistrationCoordinates"};

// The four bytes of a float in the given order.
std::string floatBytes(float value, bool mostSignificantFirst) {
  uint32_t bits;
  std::memcpy(&bits, &value, 4);
  std::string out;
  for (int k = 0; k < 4; ++k) {
    const int shift = mostSignificantFirst ? 24 - 8 * k : 8 * k;
    out += static_cast<char>((bits >> shift) & 0xFF);
  }
  return out;
}

class EnviHeaderTest : public vlr_test::SuiteTest {
 protected:
  CDescriptionHeader raster(int lines, int pixels, const char* cellType, int prefix,
                            int headerOffset, const char* order) {
    CDescriptionHeader h(kSections);
    setInteger(getField(h, "RasterInfo.NrOfLinesPerImage"), lines);
    setInteger(getField(h, "RasterInfo.NrOfPixelsPerLine"), pixels);
    setString(getField(h, "RasterInfo.CellType"), cellType);
    setInteger(getField(h, "RasterInfo.HeaderOffset"), headerOffset);
    setInteger(getField(h, "RasterInfo.RowPrefix"), prefix);
    setInteger(getField(h, "RasterInfo.RowSuffix"), 0);
    setString(getField(h, "RasterInfo.BytesOrder"), order);
    return h;
  }

  void geocode(CDescriptionHeader& h, const char* state, double e, double n, double s) {
    setString(getField(h, "RasterInfo.GeocodedImage"), "OK");
    setString(getField(h, "CartographicSystem.State"), state);
    setDouble(getField(h, "RegistrationCoordinates.LonEasting"), e);
    setDouble(getField(h, "RegistrationCoordinates.LatNorthing"), n);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLonEast"), s);
    setDouble(getField(h, "RegistrationCoordinates.PixelSpacingLatNorth"), s);
  }

  static std::string gdal(const std::vector<std::string>& argv) {
    const vlr_test::RunResult r = vlr_test::RunProgram(argv, {}, true);
    EXPECT_EQ(r.status, 0) << argv[0] << " " << argv[1] << "\n" << r.err;
    return r.out;
  }

  // The samples GDAL reads from source, in host order.
  std::string gdalSamples(const std::string& source) {
    gdal({"/usr/bin/gdal_translate", "-q", "-of", "ENVI", source, work("copy")});
    return ReadFile(work("copy"));
  }
};

TEST_F(EnviHeaderTest, ExactTextOfASlantRangeProduct) {
  CDescriptionHeader h = raster(4, 3, "FLOAT_COMPLEX", 0, 0, "MSBF");
  CDescriptionField* info = getField(h, "RasterInfo.OtherInfo");
  resize(info, 1, 2);
  setStringAt(info, 0, 0, "ACQUISITION TIME");
  setStringAt(info, 0, 1, "01-MAR-2008 21:55:27.000000");
  setDouble(getField(h, "RasterInfo.NullCellValue"), 0.0);
  setString(getField(h, "RasterInfo.DataUnits"), "SLC");
  setString(getField(h, "InitialGeometry.Projection"), "SLANT_RANGE");
  setDouble(getField(h, "Processing.PixelSpacingRg"), 7.8);
  setDouble(getField(h, "Processing.PixelSpacingAz"), 4.0);
  setDouble(getField(h, "ChannelInfo.IncidenceAngle"), 30.0);
  NVLR_UTILITY_WriteEnviHeader(h, work("slc_hdr").c_str());
  // 7.8 / sin(30 degrees) in doubles is 15.600000000000001.
  EXPECT_EQ(ReadFile(work("slc.hdr")),
            "ENVI\ndescription = {\n"
            "   ACQUISITION TIME = 01-MAR-2008 21:55:27.000000\n"
            "   File generated with Veloran 4.2.000 }\n"
            "samples = 3\nlines = 4\nbands = 1\nheader offset = 0\nfile type = ENVI Standard\n"
            "data type = 6\nsensor type = Unknown\ninterleave = bsq\nbyte order = 1\n"
            "pixel size = {15.600000000000001, 4, units=Meters}\n"
            "Data Ignore Value = 0\ncomplex function = Magnitude\n");
}

TEST_F(EnviHeaderTest, GdalReadsEveryProductRightOrNotAtAll) {
  // Complex floats, most significant byte first, 17 bytes of prefix per line:
  // the virtual raster reads them; the product opened by its own name finds
  // no ENVI header (one of an earlier run is removed) and is refused, not
  // shown shifted by the prefixes.
  std::string bytes, want;
  for (int line = 0; line < 4; ++line) {
    bytes.append(17, '\xEE');
    for (int pixel = 0; pixel < 3; ++pixel)
      for (float v : {line * 10 + pixel + 0.25f, -(line * 100.0f + pixel) - 0.5f}) {
        bytes += floatBytes(v, true);
        want += floatBytes(v, false);
      }
  }
  vlr_test::WriteFile(work("slc"), bytes);
  vlr_test::WriteFile(work("slc.hdr"),
                      "ENVI\nsamples = 3\nlines = 4\nbands = 1\n"
                      "header offset = 0\ndata type = 6\nbyte order = 1\n");
  CDescriptionHeader slc = raster(4, 3, "FLOAT_COMPLEX", 17, 0, "MSBF");
  NVLR_UTILITY_WriteEnviHeader(slc, work("slc_hdr").c_str());
  const std::string info = gdal({"/usr/bin/gdalinfo", work("slc.vrt")});
  EXPECT_NE(info.find("Size is 3, 4"), std::string::npos) << info;
  EXPECT_NE(info.find("Type=CFloat32"), std::string::npos) << info;
  EXPECT_EQ(gdalSamples(work("slc.vrt")), want);
  EXPECT_FALSE(vlr_test::Exists(work("slc.hdr")));
  EXPECT_NE(vlr_test::RunProgram({"/usr/bin/gdalinfo", work("slc")}, {}, true).status, 0);
  // A header of that name that is not an ENVI header is another program's.
  vlr_test::WriteFile(work("slc.hdr"), "<?xml version=\"1.0\"?>\n");
  NVLR_UTILITY_WriteEnviHeader(slc, work("slc.sml").c_str());
  EXPECT_EQ(ReadFile(work("slc.hdr")), "<?xml version=\"1.0\"?>\n");

  // Floats behind an 8-byte header, no prefix: the ENVI header alone is right,
  // and a virtual raster of an earlier layout goes.
  bytes = std::string(8, '\x55');
  want.clear();
  for (int i = 0; i < 12; ++i) {
    const float v = i == 5 ? -9999.0f : i * 1.5f - 4.0f;
    bytes += floatBytes(v, false);
    want += floatBytes(v, false);
  }
  vlr_test::WriteFile(work("pwr"), bytes);
  vlr_test::WriteFile(work("pwr.vrt"), "stale");
  CDescriptionHeader pwr = raster(4, 3, "FLOAT", 0, 8, "LSBF");
  setDouble(getField(pwr, "RasterInfo.NullCellValue"), -9999.0);
  NVLR_UTILITY_WriteEnviHeader(pwr, work("pwr.sml").c_str());
  EXPECT_FALSE(vlr_test::Exists(work("pwr.vrt")));
  const std::string pwrInfo = gdal({"/usr/bin/gdalinfo", work("pwr")});
  EXPECT_NE(pwrInfo.find("Type=Float32"), std::string::npos) << pwrInfo;
  EXPECT_NE(pwrInfo.find("NoData Value=-9999"), std::string::npos) << pwrInfo;
  EXPECT_EQ(gdalSamples(work("pwr")), want);
}

TEST_F(EnviHeaderTest, GdalReadsTheMapInformation) {
  struct Case {
    const char* state;
    double easting, northing, spacing;
    const char* expectedCrs;
  };
  const Case cases[] = {{"GEO-GLOBAL", 7.25, 45.5, 0.001, "WGS 84"},
                        {"UTM-GLOBAL", 500000, 4500000, 12.5, "UTM zone 32N"}};
  for (const Case& c : cases) {
    SCOPED_TRACE(c.state);
    vlr_test::WriteFile(work("map"), std::string(2 * 2 * 4, '\0'));
    CDescriptionHeader h = raster(2, 2, "FLOAT", 0, 0, "LSBF");
    geocode(h, c.state, c.easting, c.northing, c.spacing);
    setString(getField(h, "CartographicSystem.Zone"), "32");
    setString(getField(h, "CartographicSystem.Hemisphere"), "NORTH");
    NVLR_UTILITY_WriteEnviHeader(h, work("map_hdr").c_str());
    const std::string info = gdal({"/usr/bin/gdalinfo", work("map")});
    char origin[128], size[128];
    std::snprintf(origin, sizeof origin, "Origin = (%.15f,%.15f)", c.easting, c.northing);
    std::snprintf(size, sizeof size, "Pixel Size = (%.15f,%.15f)", c.spacing, -c.spacing);
    EXPECT_NE(info.find(origin), std::string::npos) << info;
    EXPECT_NE(info.find(size), std::string::npos) << info;
    EXPECT_NE(info.find(c.expectedCrs), std::string::npos) << info;
  }

  // Belgian Lambert 1972: GDAL's reading of the parameters shows their order.
  CDescriptionHeader h = raster(2, 2, "FLOAT", 0, 0, "LSBF");
  geocode(h, "BELGIUM", 150000, 170000, 10);
  setString(getField(h, "CartographicSystem.Projection"), "LAMBERT72");
  setDouble(getField(h, "CartographicSystem.CentralOfProjLongitude"), 4.367486666666666);
  setDouble(getField(h, "CartographicSystem.StandardParallel1"), 51.16666723333333);
  setDouble(getField(h, "CartographicSystem.StandardParallel2"), 49.8333339);
  setDouble(getField(h, "CartographicSystem.ProjectionDatumFalseEasting"), 150000.013);
  setDouble(getField(h, "CartographicSystem.ProjectionDatumFalseNorthing"), 5400088.438);
  NVLR_UTILITY_WriteEnviHeader(h, work("map_hdr").c_str());
  const std::string info = gdal({"/usr/bin/gdalinfo", work("map")});
  for (const char* parameter :
       {"\"Latitude of false origin\",90,", "\"Longitude of false origin\",4.36748666666667,",
        "\"Latitude of 1st standard parallel\",51.1666672333333,",
        "\"Latitude of 2nd standard parallel\",49.8333339,",
        "\"Easting at false origin\",150000.013,", "\"Northing at false origin\",5400088.438,"}) {
    EXPECT_NE(info.find(parameter), std::string::npos) << parameter << "\n" << info;
  }
}

TEST_F(EnviHeaderTest, WhenNothingIsWrittenAndWhenWritingFails) {
  CDescriptionHeader h = raster(2, 2, "FLOAT", 0, 0, "LSBF");
  NVLR_UTILITY_WriteEnviHeader(h, work("export.tif_hdr").c_str());
  EXPECT_FALSE(vlr_test::Exists(work("export.tif.hdr")));
  EXPECT_FALSE(vlr_test::Exists(work("export.hdr")));

  CDescriptionHeader noPrefix = raster(2, 2, "FLOAT", 0, 0, "LSBF");
  getField(noPrefix, "RasterInfo.RowPrefix")->clear();
  NVLR_UTILITY_WriteEnviHeader(noPrefix, work("plain_hdr").c_str());
  EXPECT_FALSE(vlr_test::Exists(work("plain.hdr")));

  // Packed bits have no GDAL type: with a prefix neither header describes
  // them.
  CDescriptionHeader bits = raster(2, 9, "BIT", 4, 0, "LSBF");
  vlr_test::WriteFile(work("bits.vrt"), "stale");
  NVLR_UTILITY_WriteEnviHeader(bits, work("bits_hdr").c_str());
  EXPECT_FALSE(vlr_test::Exists(work("bits.hdr")));
  EXPECT_FALSE(vlr_test::Exists(work("bits.vrt")));

  EXPECT_EQ(RaisedCode([&] { NVLR_UTILITY_WriteEnviHeader(h, work("no/such_hdr").c_str()); }),
            vlr::kCodeFileWrite);

  std::remove((inst_.root() + "/des/ENVI_descriptions_default.des").c_str());
  NVLR_UTILITY_WriteEnviHeader(h, work("nodes_hdr").c_str());
  EXPECT_FALSE(vlr_test::Exists(work("nodes.hdr")));
}

}  // namespace
