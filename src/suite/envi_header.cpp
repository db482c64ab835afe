// The ENVI header written beside a suite product, so that viewers can
// display the raster, and the GDAL virtual raster written instead beside a
// product whose lines carry a prefix or suffix.  An ENVI header knows only
// one offset before the first line: over such a product it would make every
// reader that opens the raster by its own name show a wrong image, so the
// product gets none and is read through its virtual raster.
#include "suite/envi_header.h"

#include <strings.h>
#include <unistd.h>

#include <cmath>
#include <cstdio>
#include <cstring>
#include <string>
#include <vector>

#include "runtime/environment.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/process_log.h"
#include "runtime/raise.h"
#include "runtime/run_outputs.h"
#include "suite/cell_types.h"
#include "suite/description_header.h"
#include "suite/description_io.h"
#include "suite/number_text.h"
#include "suite/raster_file.h"

namespace {

constexpr const char* kModule = "vlr_envi_util";
constexpr const char* kKeywordSection = "ENVI_HeaderDescriptionType";
constexpr const char* kSoftwareLine = "   File generated with Veloran 4.2.000 }\n";
constexpr const char* kNoTimesDescription = "ENVI\ndescription = {\n   File Imported into ENVI.}\n";
constexpr double kPi = 3.14159265358979323846;
// Largest header offset, line prefix or suffix taken as a byte count.
constexpr double kMaxOffset = 9.0e15;

// Ellipsoid semi-axes (metres) of the datums written in "projection info".
constexpr double kWgs84A = 6378137.0;
constexpr double kWgs84B = 6356752.314245;
constexpr double kInternational1924A = 6378388.0;
constexpr double kInternational1924B = 6356911.946127946;

// ENVI projection type codes.
constexpr int kEnviTransverseMercator = 3;
constexpr int kEnviLambertConic = 4;
constexpr int kEnviStereographic = 7;
constexpr int kEnviAlbers = 9;
constexpr int kEnviGnomonic = 13;
constexpr int kEnviMiller = 18;
constexpr int kEnviMercator = 20;
constexpr int kEnviPolarStereographic = 31;

std::string number(double value) {
  return NVLR_UTILITY_DoubleText(value);
}

// A header field, or null when it is absent or unset.
const CDescriptionField* setField(CDescriptionHeader& header, const char* path) {
  const CDescriptionField* field = findField(header, path);
  return field != nullptr && field->isSet() ? field : nullptr;
}

bool textOf(const CDescriptionField* field, int index, std::string& value) {
  if (field == nullptr || index >= field->columns() || !field->isSetAt(0, index)) return false;
  if (field->type() == CVLR_FieldType::String) {
    value = field->getStringAt(0, index);
  } else if (field->type() == CVLR_FieldType::Integer) {
    value = std::to_string(field->getIntegerAt(0, index));
  } else if (field->type() == CVLR_FieldType::Double) {
    value = number(field->getDoubleAt(0, index));
  } else {
    return false;
  }
  return true;
}

bool numberOf(const CDescriptionField* field, int index, double& value) {
  if (field == nullptr || index >= field->columns() || !field->isSetAt(0, index)) return false;
  switch (field->type()) {
    case CVLR_FieldType::Integer:
      value = field->getIntegerAt(0, index);
      return true;
    case CVLR_FieldType::Double:
      value = field->getDoubleAt(0, index);
      return true;
    case CVLR_FieldType::String:
      return NVLR_UTILITY_ParseDouble(field->getStringAt(0, index), value);
    default:
      return false;
  }
}

bool text(CDescriptionHeader& header, const char* path, std::string& value) {
  return textOf(setField(header, path), 0, value);
}

bool numberAt(CDescriptionHeader& header, const char* path, double& value) {
  return numberOf(setField(header, path), 0, value);
}

double numberOr(CDescriptionHeader& header, const char* path, double fallback) {
  double value = fallback;
  return numberAt(header, path, value) ? value : fallback;
}

// A whole number of the header within [minimum, maximum]; false otherwise.
bool wholeNumber(CDescriptionHeader& header, const char* path, double minimum, double maximum,
                 long long& value) {
  double v = 0.0;
  if (!numberAt(header, path, v) || !(v >= minimum && v <= maximum) || v != std::floor(v)) {
    return false;
  }
  value = static_cast<long long>(v);
  return true;
}

// The value of a (key, value) row of "RasterInfo.OtherInfo".
bool otherInfo(CDescriptionHeader& header, const char* key, std::string& value) {
  const CDescriptionField* info = setField(header, "RasterInfo.OtherInfo");
  if (info == nullptr || info->type() != CVLR_FieldType::String || info->columns() < 2) {
    return false;
  }
  for (int row = 0; row < info->rows(); ++row) {
    if (info->isSetAt(row, 0) && info->getStringAt(row, 0) == key) {
      value = info->getStringAt(row, 1);
      return true;
    }
  }
  return false;
}

// The ENVI keywords and value tables of the installation.
class EnviKeywords {
 public:
  explicit EnviKeywords(CDescriptionSection* section) : mSection(section) {}

  std::string word(const char* name) const {
    std::string value;
    return textOf(mSection->findField(name), 0, value) ? value : std::string();
  }
  // Element index of a table field; empty when the table has no such element.
  std::string tableValue(const char* name, int index) const {
    std::string value;
    return index >= 0 && textOf(mSection->findField(name), index, value) ? value : std::string();
  }

 private:
  CDescriptionSection* mSection;
};

void appendLine(std::string& text, const std::string& keyword, const std::string& value) {
  if (keyword.empty() || value.empty()) return;
  text += keyword + " = " + value + "\n";
}

// "description = {...}": the acquisition times found in "RasterInfo.OtherInfo".
// The first line takes "ACQUISITION TIME", or "NEW_ACQUISITION TIME" when
// only that one is there; the label written is the key found.
std::string descriptionText(CDescriptionHeader& header) {
  const char* const kTimeKeys[][2] = {{"ACQUISITION TIME", "NEW_ACQUISITION TIME"},
                                      {"MASTER ACQUISITION TIME", nullptr},
                                      {"SLAVE ACQUISITION TIME", nullptr}};
  std::string times;
  for (const auto& keys : kTimeKeys) {
    for (const char* key : keys) {
      std::string value;
      if (key != nullptr && otherInfo(header, key, value)) {
        times += std::string("   ") + key + " = " + value + "\n";
        break;
      }
    }
  }
  if (times.empty()) return kNoTimesDescription;
  return "ENVI\ndescription = {\n" + times + kSoftwareLine;
}

struct Grid {
  double easting = 0.0;
  double northing = 0.0;
  double spacingEast = 0.0;
  double spacingNorth = 0.0;

  std::string numbers() const {
    return number(easting) + ", " + number(northing) + ", " + number(spacingEast) + ", " +
           number(spacingNorth);
  }
};

bool geocodedGrid(CDescriptionHeader& header, Grid& grid) {
  std::string geocoded;
  if (!text(header, "RasterInfo.GeocodedImage", geocoded) ||
      strcasecmp(geocoded.c_str(), "OK") != 0) {
    return false;
  }
  return numberAt(header, "RegistrationCoordinates.LonEasting", grid.easting) &&
         numberAt(header, "RegistrationCoordinates.LatNorthing", grid.northing) &&
         numberAt(header, "RegistrationCoordinates.PixelSpacingLonEast", grid.spacingEast) &&
         numberAt(header, "RegistrationCoordinates.PixelSpacingLatNorth", grid.spacingNorth);
}

// "projection info" of a projected state.  Parameters after the ENVI type
// code, all from "CartographicSystem" (an unset value counts as 0, an unset
// scale factor as 1, an unset sphere radius as the semi-major axis):
//   Lambert conic (4), Albers (9):  a, b, lat0, lon0, x0, y0, sp1, sp2
//   transverse family (3), stereographic (7):  a, b, lat0, lon0, x0, y0, k0
//   Mercator (20):  a, b, latitude of true scale, lon0, x0, y0
//   polar stereographic (31):  a, b, latitude of true scale (the central
//     latitude when unset, else +-90 by hemisphere), lon0, x0, y0
//   gnomonic (13):  R, lat0, lon0, x0, y0;   Miller (18):  R, lon0, x0, y0
// followed by the datum, the projection name and the units.  "LAMBERT2008"
// has its origin latitude fixed at 50.797815 and "LAMBERT72" at 90.000.
std::string projectionInfo(CDescriptionHeader& header, const std::string& projection,
                           const std::string& name, const std::string& datum, bool north) {
  const bool bd72 = projection == "LAMBERT72";
  const double a = bd72 ? kInternational1924A : kWgs84A;
  const double b = bd72 ? kInternational1924B : kWgs84B;
  const std::string lat0 = number(numberOr(header, "CartographicSystem.CentralOfProjLatitude", 0));
  const std::string lon0 = number(numberOr(header, "CartographicSystem.CentralOfProjLongitude", 0));
  const std::string falseEN =
      number(numberOr(header, "CartographicSystem.ProjectionDatumFalseEasting", 0)) + ", " +
      number(numberOr(header, "CartographicSystem.ProjectionDatumFalseNorthing", 0));
  const std::string scale = number(numberOr(header, "CartographicSystem.ScaleFactor", 1));
  const std::string parallels =
      number(numberOr(header, "CartographicSystem.StandardParallel1", 0)) + ", " +
      number(numberOr(header, "CartographicSystem.StandardParallel2", 0));
  const std::string axes = number(a) + ", " + number(b);
  const std::string radius = number(numberOr(header, "CartographicSystem.SphereRadius", a));

  int code = kEnviTransverseMercator;
  std::string parameters;
  if (projection.rfind("LAMBERT", 0) == 0) {
    code = kEnviLambertConic;
    const std::string origin = projection == "LAMBERT2008" ? "50.797815" : bd72 ? "90.000" : lat0;
    parameters = axes + ", " + origin + ", " + lon0 + ", " + falseEN + ", " + parallels;
  } else if (projection == "ALBERS") {
    code = kEnviAlbers;
    parameters = axes + ", " + lat0 + ", " + lon0 + ", " + falseEN + ", " + parallels;
  } else if (projection == "GNOMONIC") {
    code = kEnviGnomonic;
    parameters = radius + ", " + lat0 + ", " + lon0 + ", " + falseEN;
  } else if (projection == "MILLER") {
    code = kEnviMiller;
    parameters = radius + ", " + lon0 + ", " + falseEN;
  } else if (projection == "MERCATOR") {
    code = kEnviMercator;
    const std::string trueScale =
        number(numberOr(header, "CartographicSystem.LatitudeOfTrueScale", 0));
    parameters = axes + ", " + trueScale + ", " + lon0 + ", " + falseEN;
  } else if (projection == "POLAR_STEREOGRAPHIC") {
    code = kEnviPolarStereographic;
    const double pole =
        numberOr(header, "CartographicSystem.CentralOfProjLatitude", north ? 90.0 : -90.0);
    const std::string trueScale =
        number(numberOr(header, "CartographicSystem.LatitudeOfTrueScale", pole));
    parameters = axes + ", " + trueScale + ", " + lon0 + ", " + falseEN;
  } else if (projection.find("STEREOGRAPHIC") != std::string::npos) {
    code = kEnviStereographic;
    parameters = axes + ", " + lat0 + ", " + lon0 + ", " + falseEN + ", " + scale;
  } else {
    parameters = axes + ", " + lat0 + ", " + lon0 + ", " + falseEN + ", " + scale;
  }
  return "projection info = {" + std::to_string(code) + ", " + parameters + ", " + datum + ", " +
         name + ", units=Meters}\n";
}

// "map info", "projection info", "pixel size" and the upper-left keywords of
// a geocoded product.
std::string geocodedText(CDescriptionHeader& header, const EnviKeywords& keys, const Grid& grid,
                         const std::string& state) {
  std::string hemisphere;
  const bool north =
      !text(header, "CartographicSystem.Hemisphere", hemisphere) || hemisphere == "NORTH";
  std::string units = "Meters";
  std::string out;
  if (state == "GEO-GLOBAL") {
    units = "Degrees";
    out =
        "map info = {Geographic Lat/Lon, 1, 1, " + grid.numbers() + ", WGS-84, \n units=Degrees}\n";
  } else if (state == "UTM-GLOBAL") {
    std::string zone;
    text(header, "CartographicSystem.Zone", zone);
    out = "map info = {UTM, 1, 1, " + grid.numbers() + ",\n " + zone +
          (north ? ", North" : ", South") + ", WGS-84, units=Meters }\n";
  } else {
    std::string projection;
    text(header, "CartographicSystem.Projection", projection);
    const std::string datum = projection == "LAMBERT72" ? "BD72" : "WGS-84";
    if (projection.empty() || projection == "NONE") {
      units = "Degrees";
      out = "map info = {Geographic Lat/Lon, 1.0, 1.0, " + grid.numbers() + ", " + datum +
            ", units=Degrees }\n";
    } else {
      const std::string name = projection != "POLAR_STEREOGRAPHIC" ? projection
                               : north                             ? "Polar Stereographic North"
                                                                   : "Polar Stereographic South";
      out = "map info = {" + name + ", 1.0, 1.0, " + grid.numbers() + ", " + datum +
            ", units=Meters }\n";
      out += projectionInfo(header, projection, name, datum, north);
    }
  }
  out += "pixel size = {" + number(grid.spacingEast) + ", " + number(grid.spacingNorth) +
         ", units=" + units + "}\n";
  appendLine(out, keys.word("ULXMAP_NAME"), number(grid.easting));
  appendLine(out, keys.word("ULYMAP_NAME"), number(grid.northing));
  return out;
}

// The pixel size of a slant-range image on the ground: the range spacing
// divided by the sine of the incidence angle, the azimuth spacing as it is.
// An image resampled to ground range ("GROUND_RANGE") already has ground
// spacings.  Nothing when a value is missing or the angle is not in (0, 90]
// degrees.
std::string slantRangePixelSize(CDescriptionHeader& header) {
  std::string geometry;
  double range = 0.0, azimuth = 0.0, incidence = 0.0;
  if (!text(header, "InitialGeometry.Projection", geometry) ||
      (geometry != "SLANT_RANGE" && geometry != "GROUND_RANGE") ||
      !numberAt(header, "Processing.PixelSpacingRg", range) ||
      !numberAt(header, "Processing.PixelSpacingAz", azimuth)) {
    return std::string();
  }
  if (geometry == "GROUND_RANGE")
    return "pixel size = {" + number(range) + ", " + number(azimuth) + ", units=Meters}\n";
  if (!numberAt(header, "ChannelInfo.IncidenceAngle", incidence)) return std::string();
  if (!(incidence > 0.0 && incidence <= 90.0)) {
    NVLR_UTILITY_TracePrint("ENVI header: incidence angle %s out of range, no pixel size\n",
                            number(incidence).c_str());
    return std::string();
  }
  const double groundRange = range / std::sin(incidence * kPi / 180.0);
  return "pixel size = {" + number(groundRange) + ", " + number(azimuth) + ", units=Meters}\n";
}

bool isPhase(const std::string& units) {
  return units == "PHASE" || units == "UNWRAPPED PHASE" || units == "INTERFEROGRAMME" ||
         units == "SYNTHETIC INTERFEROGRAMME" || units == "FLATTENED INTERFEROGRAMME";
}

// "classes", "class lookup" and "class names" of a classification product.
// Class 0 is "No classified"; the names of "RasterInfo.ClassificationName"
// follow (its first name is not repeated when it is already that one), and
// class i takes element i of the three colour tables (0 when missing).
std::string classificationText(CDescriptionHeader& header) {
  static const char* const kUnclassified = "No classified";
  std::vector<std::string> names{kUnclassified};
  const CDescriptionField* given = setField(header, "RasterInfo.ClassificationName");
  for (int i = 0; given != nullptr && i < given->columns(); ++i) {
    std::string name;
    textOf(given, i, name);
    if (i == 0 && name == kUnclassified) continue;
    names.push_back(name);
  }
  const CDescriptionField* tables[3] = {setField(header, "RasterInfo.TiffLUTRed"),
                                        setField(header, "RasterInfo.TiffLUTGreen"),
                                        setField(header, "RasterInfo.TiffLUTBlue")};
  std::string lookup, classNames;
  for (size_t i = 0; i < names.size(); ++i) {
    for (const CDescriptionField* table : tables) {
      double value = 0.0;
      if (!numberOf(table, static_cast<int>(i), value)) value = 0.0;
      lookup += (lookup.empty() ? "" : ", ") + number(value);
    }
    classNames += (i == 0 ? "" : ", ") + names[i];
  }
  return "classes = " + std::to_string(names.size()) + "\nclass lookup = {" + lookup +
         "}\nclass names = {" + classNames + "}\n";
}

// The raster layout of the product header, as far as it is usable.
struct Layout {
  long long lines = 0;
  long long pixels = 0;
  long long headerOffset = 0;
  long long prefix = 0;
  long long suffix = 0;
  int cellType = -1;
  bool mostSignificantFirst = false;
  bool complete = false;
};

Layout rasterLayout(CDescriptionHeader& header) {
  Layout layout;
  std::string cellType, order;
  if (text(header, "RasterInfo.CellType", cellType)) {
    layout.cellType = NVLR_UTILITY_CellTypeCode(cellType.c_str());
  }
  layout.mostSignificantFirst = text(header, "RasterInfo.BytesOrder", order) && order == "MSBF";
  layout.complete =
      wholeNumber(header, "RasterInfo.NrOfLinesPerImage", 1, CVLR_RF_MAX_DIMENSION, layout.lines) &&
      wholeNumber(header, "RasterInfo.NrOfPixelsPerLine", 1, CVLR_RF_MAX_DIMENSION,
                  layout.pixels) &&
      wholeNumber(header, "RasterInfo.HeaderOffset", 0, kMaxOffset, layout.headerOffset) &&
      wholeNumber(header, "RasterInfo.RowPrefix", 0, kMaxOffset, layout.prefix) &&
      wholeNumber(header, "RasterInfo.RowSuffix", 0, kMaxOffset, layout.suffix);
  return layout;
}

// The GDAL data type of a cell type; null where GDAL has none (packed bits,
// complex bytes, complex unsigned shorts).  Signed bytes are "Byte" with the
// SIGNEDBYTE pixel type, which every GDAL version reads.
const char* gdalDataType(int cellType) {
  switch (cellType) {
    case CVLR_BYTE:
    case CVLR_UNSIGNED_BYTE:
      return "Byte";
    case CVLR_SHORT:
      return "Int16";
    case CVLR_UNSIGNED_SHORT:
      return "UInt16";
    case CVLR_SHORT_COMPLEX:
      return "CInt16";
    case CVLR_FLOAT:
      return "Float32";
    case CVLR_FLOAT_COMPLEX:
      return "CFloat32";
    case CVLR_DOUBLE:
      return "Float64";
    case CVLR_DOUBLE_COMPLEX:
      return "CFloat64";
    case CVLR_UNSIGNED_INT:
      return "UInt32";
    case CVLR_INT:
      return "Int32";
    default:
      return nullptr;
  }
}

std::string xmlEscaped(const std::string& text) {
  std::string out;
  for (char c : text) {
    const char* entity = vlr_header_io::XmlEntity(c);
    out += entity != nullptr ? std::string(entity) : std::string(1, c);
  }
  return out;
}

// A raw GDAL raster over the product: the pixels of line r start at
// HeaderOffset + RowPrefix + r x record length.
std::string vrtText(CDescriptionHeader& header, const Layout& layout, const char* dataType,
                    const std::string& productFile) {
  int valuesPerPixel = 1;
  const int bytesPerPixel = NVLR_UTILITY_CellTypeSize(layout.cellType, &valuesPerPixel);
  const long long record = layout.pixels * bytesPerPixel + layout.prefix + layout.suffix;
  std::string out = "<VRTDataset rasterXSize=\"" + std::to_string(layout.pixels) +
                    "\" rasterYSize=\"" + std::to_string(layout.lines) + "\">\n";
  out += std::string("  <VRTRasterBand dataType=\"") + dataType +
         "\" band=\"1\" subClass=\"VRTRawRasterBand\">\n";
  double nullValue = 0.0;
  if (!NVLR_UTILITY_IsComplexCellType(layout.cellType) &&
      numberAt(header, "RasterInfo.NullCellValue", nullValue)) {
    out += "    <NoDataValue>" + number(nullValue) + "</NoDataValue>\n";
  }
  if (layout.cellType == CVLR_BYTE) {
    out +=
        "    <Metadata domain=\"IMAGE_STRUCTURE\">\n"
        "      <MDI key=\"PIXELTYPE\">SIGNEDBYTE</MDI>\n    </Metadata>\n";
  }
  out +=
      "    <SourceFilename relativeToVRT=\"1\">" + xmlEscaped(productFile) + "</SourceFilename>\n";
  out += "    <ImageOffset>" + std::to_string(layout.headerOffset + layout.prefix) +
         "</ImageOffset>\n";
  out += "    <PixelOffset>" + std::to_string(bytesPerPixel) + "</PixelOffset>\n";
  out += "    <LineOffset>" + std::to_string(record) + "</LineOffset>\n";
  out += std::string("    <ByteOrder>") + (layout.mostSignificantFirst ? "MSB" : "LSB") +
         "</ByteOrder>\n";
  out += "  </VRTRasterBand>\n</VRTDataset>\n";
  return out;
}

// Writes the file through a temporary beside it, so that a reader never sees
// a half-written header; 261124 with the name when that fails.
void writeWhole(const std::string& path, const std::string& content) {
  const std::string temporary = path + ".tmp" + std::to_string(getpid());
  FILE* file = std::fopen(temporary.c_str(), "wb");
  bool written =
      file != nullptr && std::fwrite(content.data(), 1, content.size(), file) == content.size();
  if (file != nullptr) written = std::fclose(file) == 0 && written;
  written = written && std::rename(temporary.c_str(), path.c_str()) == 0;
  if (!written) {
    std::remove(temporary.c_str());
    NVLR_UTILITY_TracePrint("Error: cannot write the file %s\n", path.c_str());
    NVLR_UTILITY_RaiseError(vlr::kCodeFileWrite, kModule, __LINE__, path.c_str());
  }
  VlrRunOutputBegun(path.c_str());
}

// A virtual raster left from an earlier layout of the product would show it
// wrongly.
void removeStaleVrt(const std::string& path) {
  if (NVLR_UTILITY_FileExists(path.c_str()) && std::remove(path.c_str()) != 0) {
    NVLR_UTILITY_TracePrint("Warning: cannot remove the old virtual raster %s\n", path.c_str());
  }
}

// Likewise an ENVI header of an earlier layout.  Only a file that is an ENVI
// header goes: another header under that name (the processing libraries'
// one) is left alone.
void removeStaleEnviHeader(const std::string& path) {
  FILE* file = std::fopen(path.c_str(), "rb");
  if (file == nullptr) return;
  char start[5] = {};
  const bool envi = std::fread(start, 1, sizeof start, file) == sizeof start &&
                    std::memcmp(start, "ENVI\n", sizeof start) == 0;
  std::fclose(file);
  if (envi && std::remove(path.c_str()) != 0) {
    NVLR_UTILITY_TracePrint("Warning: cannot remove the old ENVI header %s\n", path.c_str());
  }
}

// Whether each line of the raster is its pixels alone, so that the lines
// follow one another from the header offset on, the one layout an ENVI
// header can state.  A prefix or suffix that is not a usable byte count
// counts as one.
bool plainLines(CDescriptionHeader& header) {
  long long prefix = -1, suffix = 0;
  if (!wholeNumber(header, "RasterInfo.RowPrefix", 0, kMaxOffset, prefix)) return false;
  if (setField(header, "RasterInfo.RowSuffix") != nullptr &&
      !wholeNumber(header, "RasterInfo.RowSuffix", 0, kMaxOffset, suffix)) {
    return false;
  }
  return prefix == 0 && suffix == 0;
}

void writeVrt(CDescriptionHeader& header, const std::string& product) {
  const std::string path = product + ".vrt";
  const Layout layout = rasterLayout(header);
  if (layout.prefix == 0 && layout.suffix == 0) {
    removeStaleVrt(path);
    return;
  }
  const char* dataType = gdalDataType(layout.cellType);
  if (dataType == nullptr || !layout.complete) {
    NVLR_UTILITY_TracePrint("No GDAL virtual raster for %s: cell type %s or layout not usable\n",
                            product.c_str(), NVLR_UTILITY_CellTypeName(layout.cellType));
    removeStaleVrt(path);
    return;
  }
  writeWhole(path, vrtText(header, layout, dataType, NVLR_UTILITY_BaseName(product)));
}

std::string enviText(CDescriptionHeader& header, const EnviKeywords& keys) {
  const Layout layout = rasterLayout(header);
  std::string units, value;
  text(header, "RasterInfo.DataUnits", units);
  const bool classification = units == "CLASSIFICATION";

  std::string out = descriptionText(header);
  appendLine(out, keys.word("NCOLS_NAME"),
             text(header, "RasterInfo.NrOfPixelsPerLine", value) ? value : "0");
  appendLine(out, keys.word("NROWS_NAME"),
             text(header, "RasterInfo.NrOfLinesPerImage", value) ? value : "0");
  long long bands = 1;
  if (!wholeNumber(header, "RasterInfo.NrOfChannels", 1, 1e9, bands)) bands = 1;
  appendLine(out, keys.word("NBANDS_NAME"), std::to_string(bands));
  appendLine(out, keys.word("HEADERBYTES_NAME"),
             text(header, "RasterInfo.HeaderOffset", value) ? value : "0");
  appendLine(out, keys.word("FILE_TYPE_NAME"),
             classification ? "ENVI Classification" : "ENVI Standard");
  const std::string dataType = keys.tableValue("DATATYPE_VALS", layout.cellType);
  if (dataType.empty() || dataType == "-1") {
    NVLR_UTILITY_TracePrint("ENVI header: no ENVI data type for cell type %s\n",
                            NVLR_UTILITY_CellTypeName(layout.cellType));
  } else {
    appendLine(out, keys.word("DATATYPE_NAME"), dataType);
  }
  appendLine(out, keys.word("SENSOR_TYPE"), "Unknown");
  appendLine(out, keys.word("LAYOUT_NAME"), keys.tableValue("LAYOUT_VALS", 0));
  appendLine(out, keys.word("BYTEORDER_NAME"),
             keys.tableValue("BYTEORDER_VALS", layout.mostSignificantFirst ? 1 : 0));

  Grid grid;
  std::string state;
  if (geocodedGrid(header, grid) && text(header, "CartographicSystem.State", state)) {
    out += geocodedText(header, keys, grid, state);
  } else {
    out += slantRangePixelSize(header);
  }
  double nullValue = 0.0;
  if (numberAt(header, "RasterInfo.NullCellValue", nullValue)) {
    out += "Data Ignore Value = " + number(nullValue) + "\n";
  }
  if (NVLR_UTILITY_IsComplexCellType(layout.cellType)) {
    out += isPhase(units) ? "complex function = Phase\n" : "complex function = Magnitude\n";
  }
  if (classification) out += classificationText(header);
  return out;
}

void noEnviHeader(const std::string& name) {
  NVLR_UTILITY_TracePrint(" writeRasterHeaderEnvi NO CREATE ENVI .hdr for : %s\n", name.c_str());
}

}  // namespace

void NVLR_UTILITY_WriteEnviHeader(CDescriptionHeader& header, const char* headerName) {
  const std::string name = headerName ? headerName : "";
  std::string product = name;
  NVLR_UTILITY_RemoveSuffix(product, "_hdr");
  NVLR_UTILITY_RemoveSuffix(product, ".sml");
  if (product.empty() || NVLR_UTILITY_EndsWith(product.c_str(), ".tif")) {
    noEnviHeader(name);
    return;
  }
  if (setField(header, "RasterInfo.RowPrefix") == nullptr) {
    NVLR_UTILITY_TracePrint("NOT FOUND : %s\n", "RowPrefix");
    noEnviHeader(name);
    return;
  }
  if (!plainLines(header)) {
    NVLR_UTILITY_TracePrint("No ENVI header for %s: its lines carry a prefix or suffix\n",
                            product.c_str());
    removeStaleEnviHeader(product + ".hdr");
    writeVrt(header, product);
    return;
  }
  const std::string keywordFile = NVLR_UTILITY_EnvValue("VELORAN_CEOS_DES_FILES_DIR") +
                                  "ENVI_descriptions_" + "default" + ".des";
  if (!NVLR_UTILITY_IsRegularFile(keywordFile.c_str())) {
    NVLR_UTILITY_TracePrint("SEC_FILE_NOT_FOUND : %s\n", keywordFile.c_str());
    noEnviHeader(name);
    return;
  }
  CDescriptionHeader keywordHeader;
  CDescriptionSection* keywords = keywordHeader.addSectionFromKeyFile(kKeywordSection);
  readTextHeaderFile(keywordHeader, keywordFile.c_str());
  writeWhole(product + ".hdr", enviText(header, EnviKeywords(keywords)));
  writeVrt(header, product);
}
