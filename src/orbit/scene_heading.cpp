#include "orbit/scene_heading.h"

#include <cmath>

#include "orbit/earth_constants.h"
#include "orbit/general_sar_orbit.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {
constexpr const char* kModule = "scene_heading";
constexpr double kFullCircle = 360.0;
}  // namespace

int scene_heading(GeneralSAROrbit& orbit, double t, double tau, double* heading) {
  VLR_SCOPE("scene_heading", kModule);
  double lat = 0.0, lon = 0.0, v[3] = {};
  VLR_CALL(orbit.SVGetLatLon(t, tau, &lat, &lon));
  VLR_CALL(orbit.SVGetVel(t, v));
  // East and north unit vectors of the local horizontal plane at the
  // geodetic latitude and longitude of the ground point.
  const double phi = lat / kRadToDeg, lambda = lon / kRadToDeg;
  const double east[3] = {-std::sin(lambda), std::cos(lambda), 0.0};
  const double north[3] = {-std::sin(phi) * std::cos(lambda), -std::sin(phi) * std::sin(lambda),
                           std::cos(phi)};
  const double ve = v[0] * east[0] + v[1] * east[1];
  const double vn = v[0] * north[0] + v[1] * north[1] + v[2] * north[2];
  if (!std::isfinite(ve) || !std::isfinite(vn) || (ve == 0.0 && vn == 0.0))
    VLR_FAIL("No horizontal velocity at the scene centre", vlr::kLibInconsistent);
  double h = std::atan2(ve, vn) * kRadToDeg;
  if (h < 0.0) h += kFullCircle;
  // -0.0 and values that round to 360 belong to north.
  if (!(h < kFullCircle)) h = 0.0;
  *heading = h;
  return 0;
}
