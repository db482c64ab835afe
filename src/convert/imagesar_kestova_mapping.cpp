// The fields of the suite header, written from the library header in the
// order the host's tools expect them.
#include <climits>
#include <cmath>
#include <cstring>
#include <string>
#include <utility>
#include <vector>

#include "convert/imagesar_kestova_internal.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "sar_container/general_sar.h"
#include "suite/description_header.h"

namespace {

using namespace kestova;

// Texts of the suite header.
constexpr const char* kSensorName = "ENVISAT-1";
constexpr const char* kSlantRangeGeometry = "SLANT_RANGE";
constexpr const char* kGroundRangeGeometry = "GROUND_RANGE";
constexpr const char* kIncreasingTime = "INCREASE TIME DIRECTION";
constexpr const char* kSoftware = "Zorvek v1.0";
constexpr const char* kSlantRangeProjection = "SLANT RANGE";
// Azimuth looks of every product.  The multilook keeps the line spacing of
// its input and averages no lines: each output line is the weighted sum of
// the bursts covering its time, which with the usual weights (W1 + W2 / 2 =
// 1/2) hand over from one burst to the next.  Its lines are single looks in
// azimuth, like those of a sub-swath.
constexpr int kAzimuthLooks = 1;
// Degrees of longitude per UTM zone and the last zone.
constexpr double kUtmZoneWidth = 6.0;
constexpr int kLastUtmZone = 60;

// Writes fields of one header by path.
class FieldWriter {
 public:
  explicit FieldWriter(CDescriptionHeader& header) : header_(header) {}

  void integer(const char* path, int value) { setInteger(getField(header_, path), value); }
  void real(const char* path, double value) { setDouble(getField(header_, path), value); }
  void text(const char* path, const std::string& value) {
    setString(getField(header_, path), value);
  }
  void reals(const char* path, const std::vector<double>& values) {
    CDescriptionField* f = getField(header_, path);
    setNumberOfElements(f, static_cast<int>(values.size()));
    for (size_t i = 0; i < values.size(); ++i) setDouble(f, static_cast<int>(i), values[i]);
  }
  void integers(const char* path, const std::vector<int>& values) {
    CDescriptionField* f = getField(header_, path);
    setNumberOfElements(f, static_cast<int>(values.size()));
    for (size_t i = 0; i < values.size(); ++i) setInteger(f, static_cast<int>(i), values[i]);
  }
  void texts(const char* path, const std::vector<std::string>& values) {
    CDescriptionField* f = getField(header_, path);
    setNumberOfElements(f, static_cast<int>(values.size()));
    for (size_t i = 0; i < values.size(); ++i) setString(f, static_cast<int>(i), values[i]);
  }
  // One row per entry of `rows`, `columns` values each; no rows is an empty
  // matrix without columns either.
  void matrix(const char* path, const std::vector<std::vector<double>>& rows, int columns) {
    CDescriptionField* f = getField(header_, path);
    resize(f, static_cast<int>(rows.size()), rows.empty() ? 0 : columns);
    for (size_t r = 0; r < rows.size(); ++r) {
      for (int c = 0; c < columns; ++c)
        setDoubleAt(f, static_cast<int>(r), c, rows[r][static_cast<size_t>(c)]);
    }
  }
  void stringMatrix(const char* path,
                    const std::vector<std::pair<std::string, std::string>>& rows) {
    CDescriptionField* f = getField(header_, path);
    resize(f, static_cast<int>(rows.size()), 2);
    for (size_t r = 0; r < rows.size(); ++r) {
      setStringAt(f, static_cast<int>(r), 0, rows[r].first);
      setStringAt(f, static_cast<int>(r), 1, rows[r].second);
    }
  }

 private:
  CDescriptionHeader& header_;
};

// One polynomial family in the suite's form: reference times as date texts,
// range reference times and the kept coefficients.
struct Family {
  std::vector<std::string> azimuthTimes;
  std::vector<double> rangeTimes;
  std::vector<std::vector<double>> coefficients;
};

// The coefficient indices kept per family: the range terms c0, c1, c4, c5, c6
// of a Doppler centroid, c0, c1, c4 of a Doppler rate, all seven otherwise.
constexpr int kDopplerCentroidTerms[kDopplerCentroidCoefficients] = {0, 1, 4, 5, 6};
constexpr int kDopplerRateTerms[kDopplerRateCoefficients] = {0, 1, 4};
constexpr int kGeometryTerms[kGeometryCoefficients] = {0, 1, 2, 3, 4, 5, 6};

template <class Poly>
int MakeFamily(const std::vector<Poly>& polys, const int* terms, int termCount, Family* out) {
  VLR_SCOPE("MakeFamily", kModule);
  for (const Poly& p : polys) {
    std::string when;
    if (!TimeText(p.taz0_s, &when)) {
      VLR_FAIL(
          NVLR_UTILITY_Format("Polynomial reference time %.6f is not a date", p.taz0_s).c_str(),
          vlr::kLibInconsistent);
    }
    out->azimuthTimes.push_back(when);
    out->rangeTimes.push_back(p.trg0_s);
    std::vector<double> row;
    for (int i = 0; i < termCount; ++i) row.push_back(p.pol[terms[i]]);
    out->coefficients.push_back(row);
  }
  return 0;
}

bool KnownPolarisation(const char* text) {
  for (const char* p : {"H/H", "V/V", "H/V", "V/H"}) {
    if (std::strcmp(text, p) == 0) return true;
  }
  return false;
}

// The scene centre and corners are usable only when the header holds them
// (they need an orbit) and the centre is a place on the Earth.
bool HasGeographicPoints(const GeneralSAR& gs) {
  const geopoint& c = gs.geoCoords.Center;
  return gs.GSexists(GeneralSAR::GS_GEOCOORDS) && std::isfinite(c.latitude) &&
         std::isfinite(c.longitude) && std::fabs(c.latitude) <= 90.0;
}

// UTM zone of a longitude: brought into -180..180 first; 180 itself belongs
// to the last zone.
int UtmZone(double longitude) {
  double lon = std::fmod(longitude, 360.0);
  if (lon > 180.0) lon -= 360.0;
  if (lon < -180.0) lon += 360.0;
  const int zone = 1 + static_cast<int>(std::trunc((lon + 180.0) / kUtmZoneWidth));
  return zone > kLastUtmZone ? kLastUtmZone : zone;
}

// The image geometry: a composed product resampled to ground range is not
// in slant range, its spacings are ground distances that viewers must not
// project again; everything else is in slant range.
const char* Geometry(const GeneralSAR& gs, const ImageTiming& timing) {
  const bool groundRange =
      timing.composed && std::strcmp(gs.dataSetInfo.Projection, kSlantRangeProjection) != 0;
  return groundRange ? kGroundRangeGeometry : kSlantRangeGeometry;
}

std::string Degrees(double value) {
  return NVLR_UTILITY_Format("%lf", value);
}

// Orbit: number, first time, spacing and the six component vectors.
int WriteStateVectors(const GeneralSAR& gs, FieldWriter& w) {
  VLR_SCOPE("WriteStateVectors", kModule);
  const bool orbit = gs.GSexists(GeneralSAR::GS_ORBIT);
  const StateVectorStore& sv = orbit ? static_cast<const StateVectorStore&>(gs.orbit)
                                     : static_cast<const StateVectorStore&>(gs.stateVectors);
  const bool present = (orbit || gs.GSexists(GeneralSAR::GS_STATEVECTORS)) && sv.n() > 0 &&
                       sv.positions() != nullptr && sv.velocities() != nullptr;
  const int n = present ? sv.n() : 0;
  w.integer("nStateVectors", n);
  if (n > 0) {
    std::string first;
    if (!TimeText(sv.t0(), &first))
      VLR_FAIL("Time of the first state vector is not a date", vlr::kLibInconsistent);
    w.text("TimeFirst", first);
    w.real("TimeDelta", sv.dt());
  }
  const char* names[] = {"pos_x", "pos_y", "pos_z", "vel_x", "vel_y", "vel_z"};
  for (int c = 0; c < 6; ++c) {
    const double* source = c < 3 ? sv.positions() : sv.velocities();
    std::vector<double> values(static_cast<size_t>(n));
    for (int i = 0; i < n; ++i) values[static_cast<size_t>(i)] = source[3 * i + c % 3];
    w.reals(names[c], values);
  }
  return 0;
}

int WriteDopplerCentroid(const GeneralSAR& gs, FieldWriter& w) {
  VLR_SCOPE("WriteDopplerCentroid", kModule);
  Family dc;
  VLR_CALL(MakeFamily(gs.polys.dc, kDopplerCentroidTerms, kDopplerCentroidCoefficients, &dc));
  const int n = static_cast<int>(dc.azimuthTimes.size());
  w.integer("nDopCenDataSet", n);
  w.texts("DopCenRefTime", dc.azimuthTimes);
  w.reals("DopCenRgRefTime", dc.rangeTimes);
  w.integers("DopCenPol_nCoeff",
             std::vector<int>(static_cast<size_t>(n), kDopplerCentroidCoefficients));
  w.matrix("DopCenRangeCoeff", dc.coefficients, kDopplerCentroidCoefficients);
  return 0;
}

// Doppler rate and the four geometric families, after their counts.
int WriteOrbitPolynomials(const GeneralSAR& gs, FieldWriter& w) {
  VLR_SCOPE("WriteOrbitPolynomials", kModule);
  const polySAR& p = gs.polys;
  w.integer("nDopRateDataSet", static_cast<int>(p.fr.size()));
  w.integer("nSl2GrDataSet", static_cast<int>(p.sl2gr.size()));
  w.integer("nGr2SlDataSet", static_cast<int>(p.gr2sl.size()));
  w.integer("nSl2ThetaDataSet", static_cast<int>(p.sl2theta.size()));
  w.integer("nSl2PhiDataSet", static_cast<int>(p.sl2phi.size()));

  Family fr;
  VLR_CALL(MakeFamily(p.fr, kDopplerRateTerms, kDopplerRateCoefficients, &fr));
  w.texts("DopRateRefTime", fr.azimuthTimes);
  w.reals("DopRateRgRefTime", fr.rangeTimes);
  w.integers("DopRatePol_nCoeff",
             std::vector<int>(fr.azimuthTimes.size(), kDopplerRateCoefficients));
  w.matrix("DopRateRangeCoeff", fr.coefficients, kDopplerRateCoefficients);

  Family families[4];
  VLR_CALL(MakeFamily(p.sl2gr, kGeometryTerms, kGeometryCoefficients, &families[0]));
  VLR_CALL(MakeFamily(p.gr2sl, kGeometryTerms, kGeometryCoefficients, &families[1]));
  VLR_CALL(MakeFamily(p.sl2theta, kGeometryTerms, kGeometryCoefficients, &families[2]));
  VLR_CALL(MakeFamily(p.sl2phi, kGeometryTerms, kGeometryCoefficients, &families[3]));
  const char* names[4] = {"SlantToGround", "GroundToSlant", "SlantToTheta", "SlantToPhi"};
  for (int f = 0; f < 4; ++f) {
    const std::string name = names[f];
    w.matrix(name.c_str(), families[f].coefficients, kGeometryCoefficients);
    w.texts((name + "-RefTime").c_str(), families[f].azimuthTimes);
    w.reals((name + "-RgRefTime").c_str(), families[f].rangeTimes);
  }
  return 0;
}

// The two-way elevation pattern, when the header holds one.
int WriteAntennaPattern(GeneralSAR& gs, FieldWriter& w) {
  VLR_SCOPE("WriteAntennaPattern", kModule);
  AntennaPattern_Obj& a = gs.antenna;
  if (!gs.GSexists(GeneralSAR::GS_ANTENNA) || a.PatternSamples <= 0) {
    w.integer("EnvisatTwoWayAntennaElevationPatternTableNbr", 0);
    return 0;
  }
  vlr::CkBuffer<float> gains;
  if (!gains.allocate(static_cast<size_t>(a.PatternSamples)))
    VLR_FAIL("Memory allocation failed", vlr::kLibAlloc);
  VLR_CALL(a.getPatternArray(gains.data()));
  w.integer("EnvisatTwoWayAntennaElevationPatternTableNbr", a.PatternSamples);
  // The pattern is centred on its reference angle.
  w.real("EnvisatReferenceElevationAngle",
         a.StartAngle + 0.5 * (a.PatternSamples - 1) * a.DeltaAngle);
  w.reals("EnvisatTwoWayAntennaElevationPatternTable",
          std::vector<double>(gains.begin(), gains.end()));
  return 0;
}

// Layout of the raster file.
int WriteRasterLayout(const GeneralSAR& gs, FieldWriter& w) {
  VLR_SCOPE("WriteRasterLayout", kModule);
  const DataFile& d = gs.datafile.data;
  const char* cellType = SuiteCellType(d.cell_type);
  if (cellType == nullptr) {
    VLR_FAIL(NVLR_UTILITY_Format("Cell type %d has no suite equivalent", d.cell_type).c_str(),
             vlr::kLibInconsistent);
  }
  if (d.header_offset < 0 || d.header_offset > INT_MAX) {
    VLR_FAIL(NVLR_UTILITY_Format("Header offset %lld does not fit the suite header",
                                 static_cast<long long>(d.header_offset))
                 .c_str(),
             vlr::kLibInconsistent);
  }
  const bool complex = cell_type_is_complex(d.cell_type);
  w.integer("HeaderOffset", static_cast<int>(d.header_offset));
  w.integer("RowPrefix", d.row_prefix);
  w.integer("RowSuffix", 0);
  w.text("CellType", cellType);
  w.text("DataUnits", complex ? "SLC" : "AMPLITUDE");
  w.real("NullCellValue", 0.0);
  w.integer("NrOfPixelsPerLine", d.pixels_per_line);
  w.integer("NrOfLinesPerImage", d.lines_per_image);
  w.text("BytesOrder", d.byte_order == 1 ? "MSBF" : "LSBF");
  return 0;
}

// The (key, value) rows of "RasterInfo.OtherInfo".
std::vector<std::pair<std::string, std::string>> OtherInfo(const GeneralSAR& gs,
                                                           const ImageTiming& timing) {
  const DataSetInfo_Obj& info = gs.dataSetInfo;
  std::vector<std::pair<std::string, std::string>> rows;
  std::string origin = "ENVISAT_WSM";
  if (timing.composed) {
    origin = std::strcmp(info.Projection, kSlantRangeProjection) == 0 ? "ENVISAT_WS_SR"
                                                                      : "ENVISAT_WS_GR";
  }
  rows.emplace_back("ORIGIN DATA", origin);
  rows.emplace_back("ACQUISITION TIME", info.SenseDate);
  const bool geographic = HasGeographicPoints(gs);
  const geoCoords_Obj& g = gs.geoCoords;
  if (geographic) {
    rows.emplace_back("UTM_HEMISPHERE", g.Center.latitude >= 0.0 ? "NORTH" : "SOUTH");
    rows.emplace_back("UTM_ZONE", NVLR_UTILITY_Format("%i", UtmZone(g.Center.longitude)));
  }
  rows.emplace_back(
      "SCENE DATA",
      NVLR_UTILITY_Format("%s|%s|%s|%s|%s|%s", kSensorName,
                          timing.composed ? "ENVISAT_WSM" : "ENVISAT_WSS", info.Swath,
                          info.Polarization, info.OrbitConfiguration, Geometry(gs, timing)));
  rows.emplace_back("SOFTWARE", kSoftware);
  if (geographic) {
    // Corners numbered clockwise around the footprint from the south-east;
    // X is the longitude, Y the latitude.
    const struct {
      const char* number;
      const geopoint& point;
    } corners[] = {{"3", g.NorthWest}, {"4", g.NorthEast}, {"2", g.SouthWest}, {"1", g.SouthEast}};
    for (const auto& c : corners) {
      rows.emplace_back(std::string("CORNER POINT ") + c.number + "  X",
                        Degrees(c.point.longitude));
      rows.emplace_back(std::string("CORNER POINT ") + c.number + "  Y", Degrees(c.point.latitude));
    }
    rows.emplace_back("CENTER SCENE POINT X", Degrees(g.Center.longitude));
    rows.emplace_back("CENTER SCENE POINT Y", Degrees(g.Center.latitude));
  }
  return rows;
}

}  // namespace

namespace kestova {

int WriteMappedFields(GeneralSAR& gs, const ImageTiming& timing, CDescriptionHeader& header) {
  VLR_SCOPE("WriteMappedFields", kModule);
  FieldWriter w(header);
  const DataSetInfo_Obj& info = gs.dataSetInfo;
  const ROI_Obj& roi = gs.roi.roi;
  const SamplingConstants_Obj& sc = gs.sampling;

  w.reals("AzimuthPixelShift", {0.0});
  w.text("StateVectorSource", "SLC_DATA_PRODUCT");
  w.text("StateVectorReference", "ECR");
  VLR_CALL(WriteStateVectors(gs, w));

  w.text("InitialGeometry.Projection", Geometry(gs, timing));
  w.real("InitialGeometry.SceneHeading", info.SceneHeading);
  w.text("InitialGeometry.TimeDirectionPixel", kIncreasingTime);
  w.text("InitialGeometry.TimeDirectionLines", kIncreasingTime);
  w.text("InitialGeometry.OrbitConfiguration", info.OrbitConfiguration);
  w.real("InitialGeometry.ReferenceHeight", 0.0);

  // A composed product states the range look count its multilook used.
  w.integer("NAzimuthLooks", kAzimuthLooks);
  w.integer("NRangeLooks", timing.composed ? info.RangeLooks : 1);
  const double nearTime = roi.FastStartTime;
  const double farTime = roi.FastStartTime + roi.FastTimeLength;
  std::vector<double> slantRange;
  for (int i = 0; i < 3; ++i)
    slantRange.push_back((nearTime + i * (farTime - nearTime) / 2.0) * kHalfSpeedOfLight);
  w.reals("SlantRange", slantRange);
  // The region's sample step; a region without one falls back on the
  // sampling constants.
  const double rangeStep = roi.FastTimeDelta > 0.0 ? roi.FastTimeDelta : sc.Trg_s;
  w.real("PixelSpacingRg", rangeStep * kHalfSpeedOfLight);
  if (timing.spacingKnown) w.real("PixelSpacingAz", roi.SlowTimeDelta * timing.velocity);
  w.reals("FastTime", {nearTime});
  std::string start, stop;
  if (!TimeText(timing.firstLine, &start) || !TimeText(timing.lastLine, &stop))
    VLR_FAIL("First or last line time is not a date", vlr::kLibInconsistent);
  w.text("AzimuthStartTime", start);
  w.text("AzimuthStopTime", stop);
  VLR_CALL(WriteDopplerCentroid(gs, w));
  w.reals("ProcessingVelocity", {timing.velocity});
  w.integer("FromInImageAzimuthLooks", 1);
  w.integer("FromInImageRangeLooks", 1);

  w.reals("CarrierFrequency", {sc.fc_hz});
  w.reals("SamplingRate", {sc.frg_hz});
  w.reals("PRF", {sc.prf_hz});
  w.reals("PRFExtracted", {sc.prf_hz});
  w.reals("PulseDuration", {gs.pulse.PulseLength});
  w.reals("BandWidth", {sc.Brg_hz});
  w.texts("Description", {info.Description});
  w.real("CalConstProc", info.ExternalCalibrationFactor);
  const bool geographic = HasGeographicPoints(gs);
  if (geographic) {
    w.real("RangeLookAngle", gs.geoCoords.Center.lookAngle);
    w.real("IncidenceAngle", gs.geoCoords.Center.incidence);
  }
  if (!KnownPolarisation(info.Polarization)) VLR_FAIL("Wrong Polarization Type", 1);

  VLR_CALL(WriteAntennaPattern(gs, w));
  w.reals("AzWinCoeff", {gs.spectralWindows.AzMatchedFilterCoef});
  VLR_CALL(WriteRasterLayout(gs, w));
  w.text("SensorName", kSensorName);
  if (geographic) {
    w.real("LatNorthing", gs.geoCoords.Center.latitude);
    w.real("LonEasting", gs.geoCoords.Center.longitude);
  }

  const SwathInfo& s = gs.swathInfo;
  w.real("Inter_Burst_Time", sc.bri_s);
  w.real("SWST_MAX", info.SWST_MAX);
  // The reference slant range of the range-spreading correction, so that the
  // multilook of converted sub-swaths uses the value of the library header.
  w.real("RO_REF", info.RO_REF);
  w.real("RgFilterCoeff", gs.spectralWindows.RgMatchedFilterCoef);
  w.integer("Rank", s.Rank);
  w.integer("Echoes_per_burst", s.Echoes_per_burst);
  w.integer("Lines_per_burst", s.Lines_per_burst);
  w.integer("Bursts", s.Bursts);
  w.integer("Order", s.Order);
  w.real("Acquisition_Start_Time", s.Acquisition_Start_Time);
  w.real("NoisePower", s.NoisePower);
  w.real("ChirpPower", s.ChirpPower);
  VLR_CALL(WriteOrbitPolynomials(gs, w));

  w.stringMatrix("RasterInfo.OtherInfo", OtherInfo(gs, timing));
  return 0;
}

}  // namespace kestova
