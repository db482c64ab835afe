// A suite header read back into the library's sections: the inverse of the
// mapping that writehdr_kestova writes.
#include <cerrno>
#include <cmath>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "convert/imagesar_kestova.h"
#include "convert/imagesar_kestova_internal.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "sar_container/general_sar.h"
#include "suite/description_header.h"
#include "time/date_text.h"

namespace {

using namespace kestova;

// Pieces of "SCENE DATA": sensor, product kind, swath, polarisation, orbit
// configuration, geometry.
constexpr size_t kSceneDataPieces = 6;
constexpr const char* kSensorName = "ENVISAT-1";

// Reads fields of one header by path, checking that vectors and matrices
// hold the elements a count asks for.  The first problem is kept for the
// report; reads after it give zeros.
class FieldReader {
 public:
  explicit FieldReader(CDescriptionHeader& header) : header_(header) {}

  int integer(const char* path) { return getInteger(getField(header_, path)); }
  double real(const char* path) { return getDouble(getField(header_, path)); }
  std::string text(const char* path) { return getString(getField(header_, path)); }
  bool isSet(const char* path) { return ::isSet(getField(header_, path)); }

  // Element `column` of row `row` of a field that must hold at least
  // rows x columns elements.
  double realAt(const char* path, int row, int column) {
    const CDescriptionField* f = sized(path, row + 1, column + 1);
    return f != nullptr ? getDoubleAt(f, row, column) : 0.0;
  }
  int integerAt(const char* path, int column) {
    const CDescriptionField* f = sized(path, 1, column + 1);
    return f != nullptr ? getIntegerAt(f, 0, column) : 0;
  }
  std::string textAt(const char* path, int column) {
    const CDescriptionField* f = sized(path, 1, column + 1);
    return f != nullptr ? getStringAt(f, 0, column) : std::string();
  }
  // A date text element as sec85.
  double timeAt(const char* path, int column) {
    const std::string t = textAt(path, column);
    double value = 0.0;
    if (ok() && !parse_sec85(t.c_str(), &value))
      fail(NVLR_UTILITY_Format("%s [%d] is not a date: \"%s\"", path, column, t.c_str()));
    return value;
  }
  double time(const char* path) { return timeAt(path, 0); }

  bool ok() const { return problem_.empty(); }
  const std::string& problem() const { return problem_; }
  void fail(const std::string& what) {
    if (ok()) problem_ = what;
  }

 private:
  const CDescriptionField* sized(const char* path, int rows, int columns) {
    const CDescriptionField* f = getField(header_, path);
    if (!ok()) return nullptr;
    if (f->rows() < rows || f->columns() < columns) {
      fail(NVLR_UTILITY_Format("%s holds %d x %d values, %d x %d needed", path, f->rows(),
                               f->columns(), rows, columns));
      return nullptr;
    }
    return f;
  }

  CDescriptionHeader& header_;
  std::string problem_;
};

void CopyText(char* field, const std::string& text) {
  std::snprintf(field, kParStringSize, "%s", text.c_str());
}

// 1. State vectors, into both orbit sections.
int ReadStateVectors(FieldReader& r, GeneralSAR* gs) {
  VLR_SCOPE("ReadStateVectors", kModule);
  const int n = r.integer("nStateVectors");
  if (n <= 0) return 0;
  const double t0 = r.time("TimeFirst");
  const double dt = r.real("TimeDelta");
  const char* names[] = {"pos_x", "pos_y", "pos_z", "vel_x", "vel_y", "vel_z"};
  // Every vector must hold n values before anything is allocated for them.
  for (const char* name : names) r.realAt(name, 0, n - 1);
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  VLR_CALL(gs->orbit.SVCreate(t0, dt, n));
  VLR_CALL(gs->stateVectors.SVCreate(t0, dt, n));
  for (int c = 0; c < 6; ++c) {
    double* orbit = c < 3 ? gs->orbit.positions() : gs->orbit.velocities();
    double* vectors = c < 3 ? gs->stateVectors.positions() : gs->stateVectors.velocities();
    for (int i = 0; i < n; ++i) {
      const double v = r.realAt(names[c], 0, i);
      orbit[3 * i + c % 3] = v;
      vectors[3 * i + c % 3] = v;
    }
  }
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  VLR_CALL(gs->orbit.computeApproximateSV());
  gs->GSenable(GeneralSAR::GS_ORBIT);
  gs->GSenable(GeneralSAR::GS_STATEVECTORS);
  return 0;
}

// 2. Geometry and timing: the region, the heading and the speed.
int ReadGeometry(FieldReader& r, GeneralSAR* gs) {
  VLR_SCOPE("ReadGeometry", kModule);
  const double velocity = r.realAt("ProcessingVelocity", 0, 0);
  gs->attitude.Eq_speed = velocity;
  gs->dataSetInfo.SceneHeading = r.real("SceneHeading");
  ROI_Obj& roi = gs->roi.roi;
  const double nearRange = r.realAt("SlantRange", 0, 0);
  const double farRange = r.realAt("SlantRange", 0, 2);
  roi.FastStartTime = nearRange / kHalfSpeedOfLight;
  roi.FastTimeLength = (farRange - nearRange) / kHalfSpeedOfLight;
  roi.FastTimeDelta = r.real("PixelSpacingRg") / kHalfSpeedOfLight;
  // The line interval comes back through the speed it was multiplied with.
  const double spacingAz = r.real("PixelSpacingAz");
  roi.SlowTimeDelta = velocity > 0.0 ? spacingAz / velocity : 0.0;
  roi.SlowStartTime = r.time("AzimuthStartTime");
  roi.SlowTimeLength = r.time("AzimuthStopTime") - roi.SlowStartTime;
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  gs->GSenable(GeneralSAR::GS_ROI);
  gs->GSenable(GeneralSAR::GS_ATTITUDE);
  return 0;
}

// Names of the three fields that hold a family.
struct FamilyFields {
  const char* coefficients;
  const char* azimuthTimes;
  const char* rangeTimes;
};

// Data set `row` of a family: its reference times and the coefficients at
// the indices `terms`.
void ReadDataSet(FieldReader& r, const FamilyFields& f, int row, const int* terms, int termCount,
                 poly* p) {
  p->taz0_s = r.timeAt(f.azimuthTimes, row);
  p->trg0_s = r.realAt(f.rangeTimes, 0, row);
  for (int c = 0; c < termCount && r.ok(); ++c) p->pol[terms[c]] = r.realAt(f.coefficients, row, c);
}

template <class Poly>
void ReadFamily(FieldReader& r, const FamilyFields& f, const int* terms, int termCount,
                std::vector<Poly>* family) {
  for (size_t i = 0; i < family->size() && r.ok(); ++i)
    ReadDataSet(r, f, static_cast<int>(i), terms, termCount, &(*family)[i]);
}

// 3. The six polynomial families.
int ReadPolynomials(FieldReader& r, GeneralSAR* gs) {
  VLR_SCOPE("ReadPolynomials", kModule);
  polySAR& p = gs->polys;
  VLR_CALL(p.CreatePolys(r.integer("nDopCenDataSet"), r.integer("nDopRateDataSet"),
                         r.integer("nSl2GrDataSet"), r.integer("nGr2SlDataSet"),
                         r.integer("nSl2ThetaDataSet"), r.integer("nSl2PhiDataSet")));
  // Doppler centroid: the range coefficients c0 c1 c4 c5 c6, or all seven.
  static constexpr int kFive[] = {0, 1, 4, 5, 6};
  static constexpr int kSeven[] = {0, 1, 2, 3, 4, 5, 6};
  static constexpr int kRate[] = {0, 1, 4};
  const FamilyFields dcFields = {"DopCenRangeCoeff", "DopCenRefTime", "DopCenRgRefTime"};
  for (size_t i = 0; i < p.dc.size() && r.ok(); ++i) {
    const int count = r.integerAt("DopCenPol_nCoeff", static_cast<int>(i));
    if (count != kDopplerCentroidCoefficients && count != kGeometryCoefficients) {
      r.fail(NVLR_UTILITY_Format("DopCenPol_nCoeff [%zu] is %d: 5 or 7 expected", i, count));
      break;
    }
    ReadDataSet(r, dcFields, static_cast<int>(i), count == kGeometryCoefficients ? kSeven : kFive,
                count, &p.dc[i]);
  }
  ReadFamily(r, {"DopRateRangeCoeff", "DopRateRefTime", "DopRateRgRefTime"}, kRate,
             kDopplerRateCoefficients, &p.fr);
  ReadFamily(r, {"SlantToGround", "SlantToGround-RefTime", "SlantToGround-RgRefTime"}, kSeven,
             kGeometryCoefficients, &p.sl2gr);
  ReadFamily(r, {"GroundToSlant", "GroundToSlant-RefTime", "GroundToSlant-RgRefTime"}, kSeven,
             kGeometryCoefficients, &p.gr2sl);
  ReadFamily(r, {"SlantToTheta", "SlantToTheta-RefTime", "SlantToTheta-RgRefTime"}, kSeven,
             kGeometryCoefficients, &p.sl2theta);
  ReadFamily(r, {"SlantToPhi", "SlantToPhi-RefTime", "SlantToPhi-RgRefTime"}, kSeven,
             kGeometryCoefficients, &p.sl2phi);
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  gs->GSenable(GeneralSAR::GS_POLYSAR);
  return 0;
}

// 4. Bursts and acquisition; 5. sampling, pulse, calibration and angles.
int ReadAcquisition(FieldReader& r, GeneralSAR* gs) {
  VLR_SCOPE("ReadAcquisition", kModule);
  SwathInfo& s = gs->swathInfo;
  s.Rank = r.integer("Rank");
  s.Echoes_per_burst = r.integer("Echoes_per_burst");
  s.Lines_per_burst = r.integer("Lines_per_burst");
  s.Bursts = r.integer("Bursts");
  s.Order = r.integer("Order");
  s.Acquisition_Start_Time = r.real("Acquisition_Start_Time");
  s.NoisePower = r.real("NoisePower");
  s.ChirpPower = r.real("ChirpPower");

  SamplingConstants_Obj& sc = gs->sampling;
  DataSetInfo_Obj& info = gs->dataSetInfo;
  SpectralWindows_Obj& windows = gs->spectralWindows;
  sc.bri_s = r.real("Inter_Burst_Time");
  sc.brf_hz = sc.bri_s > 0.0 ? 1.0 / sc.bri_s : 0.0;
  info.SWST_MAX = r.real("SWST_MAX");
  // Headers written before the reference slant range was carried keep the
  // section's default.
  if (r.isSet("RO_REF")) info.RO_REF = r.real("RO_REF");
  windows.RgMatchedFilterCoef = r.real("RgFilterCoeff");
  windows.AzMatchedFilterCoef = r.realAt("AzWinCoeff", 0, 0);

  sc.fc_hz = r.realAt("CarrierFrequency", 0, 0);
  sc.lambda_m = kSpeedOfLight / sc.fc_hz;
  sc.Brg_hz = r.realAt("BandWidth", 0, 0);
  sc.prf_hz = r.realAt("PRFExtracted", 0, 0);
  sc.pri_s = 1.0 / sc.prf_hz;
  sc.Baz_hz = sc.prf_hz;
  sc.frg_hz = r.realAt("SamplingRate", 0, 0);
  sc.Trg_s = 1.0 / sc.frg_hz;
  gs->pulse.PulseLength = r.realAt("PulseDuration", 0, 0);
  gs->pulse.Bandwidth = sc.Brg_hz;
  gs->pulse.PulseSamplingRate = sc.frg_hz;
  info.ExternalCalibrationFactor = r.real("CalConstProc");
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  if (!(sc.fc_hz > 0.0) || !(sc.frg_hz > 0.0) || !(sc.prf_hz > 0.0))
    VLR_FAIL("Carrier frequency, sampling rate or PRF not positive", vlr::kLibInconsistent);
  if (gs->GSexists(GeneralSAR::GS_ORBIT)) gs->orbit.setLambda(sc.lambda_m);
  for (const GeneralSAR::GSObject o : {GeneralSAR::GS_SWATHINFO, GeneralSAR::GS_SAMPLING,
                                       GeneralSAR::GS_SPECTRALWINDOWS, GeneralSAR::GS_PULSE}) {
    gs->GSenable(o);
  }
  return 0;
}

// 6. Raster layout of the raster the header describes.
int ReadRasterLayout(FieldReader& r, const char* rasterName, GeneralSAR* gs) {
  VLR_SCOPE("ReadRasterLayout", kModule);
  DataFile& d = gs->datafile.data;
  d.set_name(rasterName);
  d.header_offset = r.integer("HeaderOffset");
  d.row_prefix = r.integer("RowPrefix");
  const std::string cellType = r.text("CellType");
  d.cell_type = LibraryCellType(cellType);
  d.pixels_per_line = r.integer("NrOfPixelsPerLine");
  d.lines_per_image = r.integer("NrOfLinesPerImage");
  d.byte_order = r.text("BytesOrder") == "LSBF" ? 0 : 1;
  if (d.cell_type < 0) {
    VLR_FAIL(
        NVLR_UTILITY_Format("Cell type \"%s\" has no library equivalent", cellType.c_str()).c_str(),
        vlr::kLibInconsistent);
  }
  if (d.check_description() != 0) VLR_FAIL("Impossible raster description", vlr::kLibInconsistent);
  ROI_Obj& roi = gs->roi.roi;
  roi.Samples = d.pixels_per_line;
  roi.Lines = roi.SlowTimeDelta > 0.0
                  ? static_cast<int>(std::lround(roi.SlowTimeLength / roi.SlowTimeDelta)) + 1
                  : d.lines_per_image;
  gs->GSenable(GeneralSAR::GS_DATAFILE);
  return 0;
}

// The value of a "RasterInfo.OtherInfo" row; false when no row has the key.
bool OtherInfoValue(CDescriptionHeader& header, const char* key, std::string* value) {
  const CDescriptionField* f = getField(header, "RasterInfo.OtherInfo");
  if (f->columns() < 2) return false;
  for (int row = 0; row < f->rows(); ++row) {
    if (f->isSetAt(row, 0) && getStringAt(f, row, 0) == key) {
      *value = getStringAt(f, row, 1);
      return true;
    }
  }
  return false;
}

// A whole text as a number.
bool Number(const std::string& text, double* value) {
  const char* begin = text.c_str();
  char* end = nullptr;
  *value = std::strtod(begin, &end);
  while (end != nullptr && (*end == ' ' || *end == '\t')) ++end;
  return end != begin && end != nullptr && *end == '\0' && std::isfinite(*value);
}

// The longitude (X) and latitude (Y) rows of a point.
int ReadPoint(CDescriptionHeader& header, const std::string& name, double incidence, double look,
              geopoint* point, bool* found) {
  VLR_SCOPE("ReadPoint", kModule);
  std::string x, y;
  *found = OtherInfoValue(header, (name + " X").c_str(), &x) &&
           OtherInfoValue(header, (name + " Y").c_str(), &y);
  if (!*found) return 0;
  double lon = 0.0, lat = 0.0;
  if (!Number(x, &lon) || !Number(y, &lat)) {
    VLR_FAIL(
        NVLR_UTILITY_Format("%s is not a point: \"%s\", \"%s\"", name.c_str(), x.c_str(), y.c_str())
            .c_str(),
        vlr::kLibInconsistent);
  }
  point->set(lat, lon, 0.0, incidence, look);
  return 0;
}

// 7. Corners and centre, and the data-set texts of "SCENE DATA".
int ReadScene(FieldReader& r, CDescriptionHeader& header, GeneralSAR* gs) {
  VLR_SCOPE("ReadScene", kModule);
  DataSetInfo_Obj& info = gs->dataSetInfo;
  std::string scene;
  if (OtherInfoValue(header, "SCENE DATA", &scene)) {
    std::vector<std::string> pieces;
    size_t from = 0;
    for (size_t bar = scene.find('|'); bar != std::string::npos; bar = scene.find('|', from)) {
      pieces.push_back(scene.substr(from, bar - from));
      from = bar + 1;
    }
    pieces.push_back(scene.substr(from));
    if (pieces.size() != kSceneDataPieces)
      VLR_FAIL(("SCENE DATA is not six texts: " + scene).c_str(), vlr::kLibInconsistent);
    if (pieces[0] == kSensorName) info.SetSensorType(DS_SENSOR_ASAR);
    CopyText(info.Swath, pieces[2]);
    CopyText(info.Polarization, pieces[3]);
  }
  CopyText(info.OrbitConfiguration, r.text("InitialGeometry.OrbitConfiguration"));
  CopyText(info.Description, r.textAt("Description", 0));
  std::string acquisition;
  if (OtherInfoValue(header, "ACQUISITION TIME", &acquisition))
    CopyText(info.SenseDate, acquisition);
  if (!r.ok()) VLR_FAIL(r.problem().c_str(), vlr::kLibInconsistent);
  gs->GSenable(GeneralSAR::GS_DATASETINFO);

  geoCoords_Obj& g = gs->geoCoords;
  const struct {
    const char* name;
    geopoint* point;
  } corners[] = {{"CORNER POINT 3 ", &g.NorthWest},
                 {"CORNER POINT 4 ", &g.NorthEast},
                 {"CORNER POINT 2 ", &g.SouthWest},
                 {"CORNER POINT 1 ", &g.SouthEast}};
  bool all = true, found = false;
  for (const auto& c : corners) {
    VLR_CALL(ReadPoint(header, c.name, -999.0, -999.0, c.point, &found));
    all = all && found;
  }
  const double incidence = r.isSet("IncidenceAngle") ? r.real("IncidenceAngle") : -999.0;
  const double look = r.isSet("RangeLookAngle") ? r.real("RangeLookAngle") : -999.0;
  VLR_CALL(ReadPoint(header, "CENTER SCENE POINT", incidence, look, &g.Center, &found));
  if (all && found) gs->GSenable(GeneralSAR::GS_GEOCOORDS);
  return 0;
}

}  // namespace

int readpar_kestova(CDescriptionHeader& header, const char* rasterName, GeneralSAR* gs) {
  VLR_SCOPE("readpar_kestova", kModule);
  if (gs == nullptr || rasterName == nullptr) VLR_FAIL("No container", vlr::kLibInconsistent);
  gs->GSdestroy();
  for (int i = 0; i < GeneralSAR::kObjects; ++i)
    gs->GSdisable(static_cast<GeneralSAR::GSObject>(i));
  FieldReader r(header);
  VLR_CALL(ReadStateVectors(r, gs));
  VLR_CALL(ReadGeometry(r, gs));
  VLR_CALL(ReadPolynomials(r, gs));
  VLR_CALL(ReadAcquisition(r, gs));
  VLR_CALL(ReadRasterLayout(r, rasterName, gs));
  VLR_CALL(ReadScene(r, header, gs));
  return 0;
}

int readhdr_kestova(const char* suiteHeader, GeneralSAR* gs) {
  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  VLR_SCOPE("readhdr_kestova", kModule);
  if (suiteHeader == nullptr || suiteHeader[0] == '\0' ||
      std::strlen(suiteHeader) > kKestovaMaxName) {
    VLR_FAIL("Missing or too long header name", vlr::kLibInconsistent);
  }
  const bool read = readHeader(header, suiteHeader);
  errno = 0;
  if (!read) VLR_FAIL("File not opened!", vlr::kLibOpen);
  std::string raster = suiteHeader;
  NVLR_UTILITY_RemoveSuffix(raster, "_hdr");
  NVLR_UTILITY_RemoveSuffix(raster, ".sml");
  VLR_CALL(readpar_kestova(header, raster.c_str(), gs));
  return 0;
}
