#include "orbit/state_vectors.h"

#include <cerrno>
#include <cstdio>

#include "orbit/gr_pt_lat_lon.h"
#include "orbit/orbit_fit.h"
#include "orbit/orbit_poly.h"
#include "profile/profile_par.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSAR";
constexpr int kChannel = 1;
constexpr const char* kSection = "StateVectorData";
// Grid values before any read.
constexpr double kUnset = -999.0;

}  // namespace

SAROrbitStateVectors_Obj::SAROrbitStateVectors_Obj()
    : StateVectorStore(kUnset, kUnset, static_cast<int>(kUnset)) {}

SAROrbitStateVectors_Obj::~SAROrbitStateVectors_Obj() = default;

int SAROrbitStateVectors_Obj::SVCreate(double t0, double dt, int n) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::SVCreate", kModule);
  destroyBuffers();
  t0_ = t0;
  n_ = n;
  dt_ = dt;
  VLR_CALL(createBuffers());
  return 0;
}

int SAROrbitStateVectors_Obj::createBuffers() {
  VLR_SCOPE("SAROrbitStateVectors_Obj::createBuffers", kModule);
  destroyBuffers();
  VLR_CALL(checkCount("nSV_n", n_, kMaxStateVectors));
  if (!allocateVectors(polys_, kPolys, static_cast<size_t>(n_)))
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  return 0;
}

int SAROrbitStateVectors_Obj::destroyBuffers() {
  fitted_ = false;
  releaseVectors(polys_, kPolys);
  return 0;
}

int SAROrbitStateVectors_Obj::SVPolyCompute() {
  VLR_SCOPE("SAROrbitStateVectors_Obj::SVPolyCompute", kModule);
  fitted_ = false;
  if (positions_.empty() || n_ < 1) VLR_FAIL("No state vectors", vlr::kLibInconsistent);
  if (n_ > kMaxFitStateVectors) {
    char text[160];
    std::snprintf(text, sizeof text,
                  "%d state vectors are too many for one orbit polynomial (at most %d)", n_,
                  kMaxFitStateVectors);
    VLR_FAIL(text, vlr::kLibInconsistent);
  }
  VLR_CALL(orb_interp(0.0, positions_.data(), dt_, polys_[0].data(), polys_[1].data(),
                      polys_[2].data(), n_));
  VLR_CALL(orb_interp(0.0, velocities_.data(), dt_, polys_[3].data(), polys_[4].data(),
                      polys_[5].data(), n_));
  fitted_ = true;
  return 0;
}

int SAROrbitStateVectors_Obj::SVGetPos(double t, double out[3]) {
  if (!fitted_) return 1;
  for (int a = 0; a < 3; ++a) out[a] = POSMACRO(t - t0_, polys_[a].data(), n_);
  return 0;
}

int SAROrbitStateVectors_Obj::SVGetVel(double t, double out[3]) {
  if (!fitted_) return 1;
  for (int a = 0; a < 3; ++a) out[a] = POSMACRO(t - t0_, polys_[3 + a].data(), n_);
  return 0;
}

int SAROrbitStateVectors_Obj::groundPoint(double t, double tau, double lambda,
                                          gr_pt_record* record) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::groundPoint", kModule);
  if (positions_.empty() || n_ < 5) VLR_FAIL("You must provide at least 5 state vectors!", 1);
  VLR_CALL(solveGroundPoint(positions_.data(), t0_, t, tau, 0.0, lambda, record));
  return 0;
}

int SAROrbitStateVectors_Obj::SVGetLatLon(double t, double tau, double lambda, double* lat,
                                          double* lon) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::SVGetLatLon", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, lambda, &r));
  *lat = r.lat;
  *lon = r.lon;
  return 0;
}

int SAROrbitStateVectors_Obj::SVGetAngles(double t, double tau, double lambda, double* incidence,
                                          double* look) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::SVGetAngles", kModule);
  gr_pt_record r;
  VLR_CALL(groundPoint(t, tau, lambda, &r));
  *incidence = r.incidence;
  *look = r.look;
  return 0;
}

int SAROrbitStateVectors_Obj::writehdr(const char* file) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SAROrbitStateVectors_Obj::readhdr(const char* file) {
  VLR_SCOPE("SAROrbitStateVectors_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  // Older parameter-file form.
  double t0 = 0.0, dt = 0.0;
  int n = 0;
  // A header without state vectors (an image extracted without orbit) is
  // not an error of the header: the caller learns it from the code alone.
  if (GetParDouble(file, "TimeFirst", 1, &t0, 1, kSection) != 0 ||
      GetParDouble(file, "TimeDelta", 1, &dt, 1, kSection) != 0 ||
      GetParInt(file, "nStateVectors", 1, &n, 1, kSection) != 0) {
    destroyBuffers();
    errno = 0;
    return vlr::kLibRead;
  }
  VLR_CALL(SVCreate(t0, dt, n));
  if (n > 0 && (GetParDouble(file, "pos", 3 * n, positions_.data(), 1, kSection) != 0 ||
                GetParDouble(file, "vel", 3 * n, velocities_.data(), 1, kSection) != 0)) {
    destroyBuffers();
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  refreshParameters();
  setAllocationFlag(true);
  return 0;
}

int SAROrbitStateVectors_Obj::clone(SAROrbitStateVectors_Obj* dst) const {
  VLR_SCOPE("SAROrbitStateVectors_Obj::clone", kModule);
  if (dst == nullptr || dst == this || n_ <= 0 || positions_.empty()) return 0;
  VLR_CALL(dst->SVCreate(t0_, dt_, n_));
  dst->copyVectorsFrom(*this);
  dst->lookSign_ = lookSign_;
  if (n_ > kMaxFitStateVectors) {
    char text[160];
    std::snprintf(text, sizeof text,
                  "%d state vectors copied without their orbit polynomial (at most %d are fitted)",
                  n_, kMaxFitStateVectors);
    VLR_REPORT(text, ARE_WARNING);
    return 0;
  }
  VLR_CALL(dst->SVPolyCompute());
  return 0;
}
