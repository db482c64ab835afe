#include "extraction/geolocation_polys.h"

#include <cmath>
#include <new>

#include "orbit/geodetic.h"
#include "orbit/poly_fit.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"

namespace {

constexpr const char* kModule = "images_v2";
constexpr double kDegToRad = 3.141592653589793 / 180.0;
constexpr int kDegree = 4;
constexpr int kTies = asar::geo::kTiePoints;

// Least-squares polynomial of degree 4 through (x, y), stored in the range
// terms of a SAR polynomial (c0, c1, c4, c5, c6).  The abscissae are scaled
// to about unit size before the fit: range times of a few hundred
// microseconds would otherwise make the normal equations singular.
bool FitRangePoly(const double* x, const double* y, int n, double* pol) {
  double scale = 0.0;
  for (int i = 0; i < n; ++i) scale = std::fmax(scale, std::fabs(x[i]));
  if (!(scale > 0.0) || !std::isfinite(scale)) return false;
  double xs[kTies];
  for (int i = 0; i < n; ++i) xs[i] = x[i] / scale;
  double a[kDegree + 1] = {};
  if (dpolfit(xs, y, n, a, kDegree) != 0) return false;
  for (int j = 0; j <= kDegree; ++j) {
    a[j] /= std::pow(scale, j);
    if (!std::isfinite(a[j])) return false;
  }
  pol[0] = a[0];
  pol[1] = a[1];
  pol[2] = 0.0;
  pol[3] = 0.0;
  pol[4] = a[2];
  pol[5] = a[3];
  pol[6] = a[4];
  return true;
}

}  // namespace

int SelectGeolocationRows(const asar::AnnotationTable& grid, int subSwath, GeolocationRows* rows) {
  VLR_SCOPE("SelectGeolocationRows", kModule);
  try {
    rows->clear();
    for (int i = 0; i < grid.count(); ++i) {
      if (subSwath == 0 || grid.record(i).ch(asar::geo::kSwathDigit) == '0' + subSwath) {
        rows->push_back(i);
      }
    }
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the geolocation rows", vlr::kLibAlloc);
  }
  return 0;
}

int MakeImagePolynomials(const asar::AnnotationTable& doppler, const asar::AnnotationTable& grid,
                         const GeolocationRows& rows, int subSwathIndex, const asar::Record& mpp,
                         polySAR* polys) {
  VLR_SCOPE("MakeImagePolynomials", kModule);
  const int nrows = static_cast<int>(rows.size());
  VLR_CALL(polys->CreatePolys(doppler.count(), 1, nrows, nrows, nrows, 0));

  for (int i = 0; i < doppler.count(); ++i) {
    const asar::Record d = doppler.record(i);
    polyDC& p = polys->dc[i];
    p.taz0_s = d.time(asar::dop::kZeroDopplerTime);
    p.trg0_s = d.f32(asar::dop::kSlantRangeTime) * 1e-9;
    // The five range coefficients are the terms r^0, r^1, r^2, r^3, r^4.
    const int slot[asar::dop::kCoefficientCount] = {0, 1, 4, 5, 6};
    for (size_t c = 0; c < asar::dop::kCoefficientCount; ++c) {
      p.pol[slot[c]] = d.f32(asar::dop::kCoefficients + 4 * c);
    }
    if (subSwathIndex >= 0) p.pol[0] += d.i16(asar::dop::kSubSwathDelta + 2 * subSwathIndex);
  }

  polyFR& fr = polys->fr[0];
  fr.pol[0] = mpp.f32(asar::mpp::kFmRateCoefficients);
  fr.pol[1] = mpp.f32(asar::mpp::kFmRateCoefficients + 4);
  fr.pol[4] = mpp.f32(asar::mpp::kFmRateCoefficients + 8);
  fr.trg0_s = mpp.f32(asar::mpp::kFmRateOrigin) * 1e-9;
  fr.taz0_s = 0.0;

  for (int j = 0; j < nrows; ++j) {
    const asar::Record g = grid.record(rows[j]);
    const double azimuth = g.time(asar::geo::kZeroDopplerTime);
    double rangeTime[kTies], offset[kTies], ground[kTies], incidence[kTies];
    double previous[3] = {};
    for (int i = 0; i < kTies; ++i) {
      rangeTime[i] = g.f32(asar::geo::kSlantRangeTimes + 4 * i) * 1e-9;
      incidence[i] = g.f32(asar::geo::kIncidenceAngles + 4 * i);
      const double llh[3] = {g.i32(asar::geo::kLatitudes + 4 * i) * 1e-6 * kDegToRad,
                             g.i32(asar::geo::kLongitudes + 4 * i) * 1e-6 * kDegToRad, 0.0};
      double xyz[3];
      geo2cart(xyz, llh);
      ground[i] = i == 0
                      ? 0.0
                      : ground[i - 1] + std::sqrt((xyz[0] - previous[0]) * (xyz[0] - previous[0]) +
                                                  (xyz[1] - previous[1]) * (xyz[1] - previous[1]) +
                                                  (xyz[2] - previous[2]) * (xyz[2] - previous[2]));
      for (int a = 0; a < 3; ++a) previous[a] = xyz[a];
    }
    for (int i = 0; i < kTies; ++i) offset[i] = rangeTime[i] - rangeTime[0];
    polySL2GR& s2g = polys->sl2gr[j];
    polyGR2SL& g2s = polys->gr2sl[j];
    polySL2THETA& theta = polys->sl2theta[j];
    if (!FitRangePoly(offset, ground, kTies, s2g.pol) ||
        !FitRangePoly(ground, rangeTime, kTies, g2s.pol) ||
        !FitRangePoly(offset, incidence, kTies, theta.pol)) {
      VLR_FAIL(
          NVLR_UTILITY_Format("Geolocation row %d: tie points give no range fit", rows[j]).c_str(),
          vlr::kLibInconsistent);
    }
    s2g.trg0_s = theta.trg0_s = rangeTime[0];
    g2s.trg0_s = 0.0;
    s2g.taz0_s = g2s.taz0_s = theta.taz0_s = azimuth;
  }
  return 0;
}
