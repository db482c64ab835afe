// Range polynomials of a region computed from the orbit geometry: Doppler
// rate, slant to ground range and back, incidence and look angle.
#include <cmath>
#include <vector>

#include "metadata_sections/poly_families.h"
#include "metadata_sections/roi.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/gr_pt_lat_lon.h"
#include "orbit/poly_fit.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSARorbit";
constexpr int kPoints = 10;
constexpr int kPointsV2 = 50;

// Least-squares polynomial of degree `degree` through (x, y), computed on
// x / max|x| for a well-conditioned normal matrix and scaled back; stored in
// the range terms of a SAR polynomial (c0, c1, c4, c5, c6) with the given
// reference times.  0 or the fit's code.
int fit_range_poly(const std::vector<double>& x, const std::vector<double>& y, int degree,
                   double trg0, double taz0, poly* out) {
  VLR_SCOPE("fit_range_poly", kModule);
  double scale = 0.0;
  for (double v : x) scale = std::fmax(scale, std::fabs(v));
  if (!(scale > 0.0) || !std::isfinite(scale)) VLR_FAIL("Degenerate region", 1);
  std::vector<double> xs(x.size());
  for (size_t i = 0; i < x.size(); ++i) xs[i] = x[i] / scale;
  double c[5] = {0.0, 0.0, 0.0, 0.0, 0.0};
  VLR_CALL(polfit(xs.data(), y.data(), static_cast<int>(x.size()), c, degree));
  double f = 1.0;
  for (int k = 0; k <= degree; ++k, f *= scale) c[k] /= f;
  // Range terms of the SAR polynomial: c0, c1 r, c4 r^2, c5 r^3, c6 r^4.
  static const int kSlot[5] = {0, 1, 4, 5, 6};
  for (double& p : out->pol) p = 0.0;
  for (int k = 0; k <= degree; ++k) out->pol[kSlot[k]] = c[k];
  out->trg0_s = trg0;
  out->taz0_s = taz0;
  return 0;
}

}  // namespace

struct GeneralSAROrbit::RegionSamples {
  std::vector<double> offset;  // range time - r0 (s)
  std::vector<gr_pt_record> point;
  double r0 = 0.0;
  double az = 0.0;
  // One output of every point, in range order.
  std::vector<double> values(double gr_pt_record::*field) const {
    std::vector<double> v(point.size());
    for (size_t i = 0; i < point.size(); ++i) v[i] = point[i].*field;
    return v;
  }
};

int GeneralSAROrbit::sampleRegion(const ROI_Obj* roi, const polyDC* dc, int m, RegionSamples* out) {
  VLR_SCOPE("GeneralSAROrbit::sampleRegion", kModule);
  if (roi == nullptr) VLR_FAIL("Missing region", 1);
  const double r0 = roi->FastStartTime, lr = roi->FastTimeLength;
  if (!std::isfinite(r0) || !(lr > 0.0) || !std::isfinite(lr) ||
      !std::isfinite(roi->SlowStartTime) || !std::isfinite(roi->SlowTimeLength))
    VLR_FAIL("Degenerate region", vlr::kLibInconsistent);
  out->r0 = r0;
  out->az = roi->SlowStartTime + 0.5 * roi->SlowTimeLength;
  out->offset.resize(m);
  out->point.resize(m);
  for (int i = 0; i < m; ++i) {
    out->offset[i] = i * lr / (m - 1);
    const double rt = r0 + out->offset[i];
    double fdc = 0.0;
    if (dc != nullptr) dc->EvaluatePoly(rt, out->az, &fdc);
    VLR_CALL(groundPoint(out->az, rt, fdc, &out->point[i]));
  }
  return 0;
}

int GeneralSAROrbit::dopplerRatePoly(ROI_Obj* roi, polyDC* dc, int m, polyFR* fr) {
  VLR_SCOPE("GeneralSAROrbit::dopplerRatePoly", kModule);
  if (fr == nullptr) VLR_FAIL("Missing polynomial", 1);
  RegionSamples s;
  VLR_CALL(sampleRegion(roi, dc, m, &s));
  VLR_CALL(fit_range_poly(s.offset, s.values(&gr_pt_record::dopplerRate), 2, s.r0, s.az, fr));
  return 0;
}

int GeneralSAROrbit::SVGetFRpoly(ROI_Obj* roi, polyDC* dc, polyFR* fr) {
  VLR_SCOPE("GeneralSAROrbit::SVGetFRpoly", kModule);
  VLR_CALL(dopplerRatePoly(roi, dc, kPoints, fr));
  return 0;
}

int GeneralSAROrbit::SVGetFRpoly_v2(ROI_Obj* roi, polyDC* dc, polyFR* fr) {
  VLR_SCOPE("GeneralSAROrbit::SVGetFRpoly_v2", kModule);
  VLR_CALL(dopplerRatePoly(roi, dc, kPointsV2, fr));
  return 0;
}

int GeneralSAROrbit::SVGetGroundToSlantPolys(ROI_Obj* roi, polyDC* dc, polySL2GR* sl2gr,
                                             polyGR2SL* gr2sl) {
  VLR_SCOPE("GeneralSAROrbit::SVGetGroundToSlantPolys", kModule);
  if (sl2gr == nullptr || gr2sl == nullptr) VLR_FAIL("Missing polynomial", 1);
  RegionSamples s;
  VLR_CALL(sampleRegion(roi, dc, kPoints, &s));
  // Ground range: distance accumulated point to point from the near range.
  std::vector<double> ground(kPoints, 0.0), rt(kPoints);
  rt[0] = s.r0;
  for (int i = 1; i < kPoints; ++i) {
    const double* a = s.point[i - 1].ground;
    const double* b = s.point[i].ground;
    const double d[3] = {b[0] - a[0], b[1] - a[1], b[2] - a[2]};
    ground[i] = ground[i - 1] + std::sqrt(d[0] * d[0] + d[1] * d[1] + d[2] * d[2]);
    rt[i] = s.r0 + s.offset[i];
  }
  VLR_CALL(fit_range_poly(s.offset, ground, 2, s.r0, s.az, sl2gr));
  VLR_CALL(fit_range_poly(ground, rt, 2, 0.0, s.az, gr2sl));
  return 0;
}

int GeneralSAROrbit::SVGetSlantToAnglesPolys(ROI_Obj* roi, polyDC* dc, polySL2THETA* theta,
                                             polySL2PHI* phi) {
  VLR_SCOPE("GeneralSAROrbit::SVGetSlantToAnglesPolys", kModule);
  if (theta == nullptr || phi == nullptr) VLR_FAIL("Missing polynomial", 1);
  RegionSamples s;
  VLR_CALL(sampleRegion(roi, dc, kPoints, &s));
  VLR_CALL(fit_range_poly(s.offset, s.values(&gr_pt_record::incidence), 4, s.r0, s.az, theta));
  VLR_CALL(fit_range_poly(s.offset, s.values(&gr_pt_record::look), 4, s.r0, s.az, phi));
  return 0;
}
