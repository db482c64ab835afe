// Direct geometry of the orbit: from (azimuth time, range delay, Doppler) to
// the ground point and what is seen there.
#include <cmath>
#include <limits>

#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/gr_pt.h"
#include "orbit/gr_pt_lat_lon.h"
#include "orbit/orbit_poly.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSARorbit";
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

}  // namespace

int GeneralSAROrbit::groundPoint(double t, double tau, double fdc, gr_pt_record* record) {
  VLR_SCOPE("GeneralSAROrbit::groundPoint", kModule);
  if (updatePolys(t) != 0) VLR_FAIL("You must provide at least 5 state vectors!", 1);
  VLR_CALL(solveGroundPoint(windowPositions_, tw_, t, tau, fdc, lambda_, record));
  return 0;
}

int GeneralSAROrbit::SVGetLatLon(double t, double tau, double fdc, double* lat, double* lon) {
  VLR_SCOPE("GeneralSAROrbit::SVGetLatLon", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, fdc, &r));
  *lat = r.lat;
  *lon = r.lon;
  return 0;
}

int GeneralSAROrbit::SVGetLatLon(double t, double tau, double* lat, double* lon) {
  return SVGetLatLon(t, tau, 0.0, lat, lon);
}

int GeneralSAROrbit::SVGetAngles(double t, double tau, double fdc, double* incidence,
                                 double* look) {
  VLR_SCOPE("GeneralSAROrbit::SVGetAngles", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, fdc, &r));
  *incidence = r.incidence;
  *look = r.look;
  return 0;
}

int GeneralSAROrbit::SVGetAngles(double t, double tau, double* incidence, double* look) {
  return SVGetAngles(t, tau, 0.0, incidence, look);
}

int GeneralSAROrbit::SVGetFR(double t, double tau, double fdc, double* fr) {
  VLR_SCOPE("GeneralSAROrbit::SVGetFR", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, fdc, &r));
  *fr = r.dopplerRate;
  return 0;
}

int GeneralSAROrbit::SVGetFR(double t, double tau, double* fr) {
  return SVGetFR(t, tau, 0.0, fr);
}

int GeneralSAROrbit::SVGetSatSpeed(double t, double tau, double fdc, double* v) {
  VLR_SCOPE("GeneralSAROrbit::SVGetSatSpeed", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, fdc, &r));
  *v = r.groundSpeed;
  return 0;
}

int GeneralSAROrbit::SVGetSatSpeed(double t, double tau, double* v) {
  return SVGetSatSpeed(t, tau, 0.0, v);
}

double GeneralSAROrbit::SVGetLat(double t, double tau, double fdc) {
  double lat = kNaN, lon = kNaN;
  return SVGetLatLon(t, tau, fdc, &lat, &lon) == 0 ? lat : kNaN;
}

double GeneralSAROrbit::SVGetLon(double t, double tau, double fdc) {
  double lat = kNaN, lon = kNaN;
  return SVGetLatLon(t, tau, fdc, &lat, &lon) == 0 ? lon : kNaN;
}

double GeneralSAROrbit::SVGetAnglesIncidence(double t, double tau, double fdc) {
  double incidence = kNaN, look = kNaN;
  return SVGetAngles(t, tau, fdc, &incidence, &look) == 0 ? incidence : kNaN;
}

double GeneralSAROrbit::SVGetAnglesLook(double t, double tau, double fdc) {
  double incidence = kNaN, look = kNaN;
  return SVGetAngles(t, tau, fdc, &incidence, &look) == 0 ? look : kNaN;
}

double GeneralSAROrbit::SVGetFR(double t, double tau, double fdc) {
  double fr = kNaN;
  return SVGetFR(t, tau, fdc, &fr) == 0 ? fr : kNaN;
}

double GeneralSAROrbit::SVGetSatSpeed(double t, double tau, double fdc) {
  double v = -1.0;
  return SVGetSatSpeed(t, tau, fdc, &v) == 0 ? v : -1.0;
}

int GeneralSAROrbit::sat2earth(double t, double tau, double fdc, double out[3]) {
  VLR_SCOPE("GeneralSAROrbit::sat2earth", kModule);
  double P[3], V[3];
  const int rc = SVGetPos(t, P);
  if (rc == 1) VLR_FAIL("You must provide at least 5 state vectors!", 1);
  // The same reach as the ground point of gr_pt_lat_lon: half a spacing.
  if (rc != 0) VLR_FAIL("Azimuth time outside the state vectors", -1);
  SVGetVel(t, V);
  VLR_CALL(gr_pt(P, V, tau, fdc, lambda_, 0.0, lookSign_, kWgs84A, kWgs84B, out));
  return 0;
}

int GeneralSAROrbit::sat2earth(double t, double tau, double out[3]) {
  return sat2earth(t, tau, 0.0, out);
}

int GeneralSAROrbit::sat2earth(const double P[3], const double V[3], double tau, double out[3]) {
  VLR_SCOPE("GeneralSAROrbit::sat2earth", kModule);
  VLR_CALL(gr_pt(P, V, tau, 0.0, lambda_, 0.0, lookSign_, kWgs84A, kWgs84B, out));
  return 0;
}

const double* GeneralSAROrbit::sat2earth(double t, double tau) {
  return resultOrNaN(sat2earth(t, tau, 0.0, result_));
}

double GeneralSAROrbit::sat2earthX(double t, double tau) {
  return sat2earth(t, tau)[0];
}

double GeneralSAROrbit::sat2earthY(double t, double tau) {
  return sat2earth(t, tau)[1];
}

double GeneralSAROrbit::sat2earthZ(double t, double tau) {
  return sat2earth(t, tau)[2];
}

int GeneralSAROrbit::SVGetGeoCoords(geoCoords_Obj* gc, GSRoi_Obj* region) {
  VLR_SCOPE("GeneralSAROrbit::SVGetGeoCoords", kModule);
  if (gc == nullptr || region == nullptr) VLR_FAIL("Missing corner or region section", 1);
  const ROI_Obj& roi = region->roi;
  const double r0 = roi.FastStartTime, lr = roi.FastTimeLength;
  const double a0 = roi.SlowStartTime, la = roi.SlowTimeLength;
  if (!std::isfinite(r0) || !std::isfinite(a0) || !(lr >= 0.0) || !(la >= 0.0) ||
      !std::isfinite(lr) || !std::isfinite(la))
    VLR_FAIL("Invalid region", vlr::kLibInconsistent);
  // Early near, early far, late near, late far, centre.
  const double at[5][2] = {
      {a0, r0}, {a0, r0 + lr}, {a0 + la, r0}, {a0 + la, r0 + lr}, {a0 + 0.5 * la, r0 + 0.5 * lr}};
  gr_pt_record point[5];
  for (int i = 0; i < 5; ++i) VLR_CALL(groundPoint(at[i][0], at[i][1], 0.0, &point[i]));
  // Right-looking: an ascending track sees the west at near range and the
  // north late; a descending one the reverse.
  const bool ascending = isAscending();
  geopoint* corner[5] = {ascending ? &gc->SouthWest : &gc->NorthEast,
                         ascending ? &gc->SouthEast : &gc->NorthWest,
                         ascending ? &gc->NorthWest : &gc->SouthEast,
                         ascending ? &gc->NorthEast : &gc->SouthWest, &gc->Center};
  for (int i = 0; i < 5; ++i)
    corner[i]->set(point[i].lat, point[i].lon, 0.0, point[i].incidence, point[i].look);
  return 0;
}
