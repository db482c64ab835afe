#include "orbit/general_sar_orbit.h"

#include <cmath>
#include <cstring>
#include <limits>

#include "orbit/earth_constants.h"
#include "orbit/get_state_vectors_envi.h"
#include "orbit/orbit_fit.h"
#include "orbit/orbit_poly.h"
#include "orbit/state_vectors.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSARorbit";
constexpr int kChannel = 1;
constexpr const char* kSection = "StateVectorData";
// A window holds five vectors.
constexpr int kWindow = 5;
// Hysteresis of the window selection, in spacings from the window start.
constexpr double kKeepFrom = 0.6;
constexpr double kKeepTo = 3.4;

bool all_finite(const double* v, size_t count) {
  for (size_t i = 0; i < count; ++i)
    if (!std::isfinite(v[i])) return false;
  return true;
}

}  // namespace

GeneralSAROrbit::GeneralSAROrbit() : StateVectorStore(0.0, 0.0, 0) {}

GeneralSAROrbit::GeneralSAROrbit(double lambda) : StateVectorStore(0.0, 0.0, 0), lambda_(lambda) {}

GeneralSAROrbit::~GeneralSAROrbit() = default;

bool GeneralSAROrbit::isAscending() const {
  return !velocities_.empty() && n_ > 0 && velocities_[2] > 0.0;
}

int GeneralSAROrbit::SVCreate(double t0, double dt, int n) {
  VLR_SCOPE("GeneralSAROrbit::SVCreate", kModule);
  destroyBuffers();
  if (n < kWindow) VLR_FAIL("You must provide at least 5 state vectors!", vlr::kLibInconsistent);
  if (!std::isfinite(t0) || !(dt > 0.0) || !std::isfinite(dt))
    VLR_FAIL("Invalid state vector time or spacing", vlr::kLibInconsistent);
  t0_ = t0;
  n_ = n;
  dt_ = dt;
  VLR_CALL(createBuffers());
  return 0;
}

int GeneralSAROrbit::createBuffers() {
  VLR_SCOPE("GeneralSAROrbit::createBuffers", kModule);
  if (n_ == 0) return 0;
  destroyBuffers();
  if (n_ > 0 && n_ < kWindow)
    VLR_FAIL("You must provide at least 5 state vectors!", vlr::kLibInconsistent);
  VLR_CALL(checkCount("nSV_n", n_, kMaxStateVectors));
  windowCount_ = n_ - 4;
  if (!allocateVectors(windowPolys_, kAxes, kWindow * static_cast<size_t>(windowCount_)))
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  return 0;
}

int GeneralSAROrbit::destroyBuffers() {
  windowCount_ = 0;
  fitted_ = false;
  windowPositions_ = windowVelocities_ = nullptr;
  cx_ = cy_ = cz_ = nullptr;
  tw_ = 0.0;
  releaseVectors(windowPolys_, kAxes);
  return 0;
}

int GeneralSAROrbit::computeRotationMatrix(const double v[3], double R[9], double* speed) const {
  VLR_SCOPE("GeneralSAROrbit::computeRotationMatrix", kModule);
  const double h = std::sqrt(v[0] * v[0] + v[1] * v[1]);
  if (!all_finite(v, 3) || !(h > 0.0)) VLR_FAIL("Degenerate track direction", 1);
  // A track due north or south (vx = 0) takes the limit from vx > 0.
  const double s = v[0] < 0.0 ? -1.0 : 1.0;
  const double a = v[0] != 0.0 ? std::atan(-v[1] / v[0]) : (v[1] > 0.0 ? -kPi / 2 : kPi / 2);
  const double b = std::atan(-v[2] / (s * h));
  const double ca = std::cos(a), sa = std::sin(a), cb = std::cos(b), sb = std::sin(b);
  const double m[9] = {ca * cb, sa, sb * ca, -sa * cb, ca, -sa * sb, -sb, 0.0, cb};
  std::memcpy(R, m, sizeof m);
  *speed = s * std::sqrt(h * h + v[2] * v[2]);
  return 0;
}

int GeneralSAROrbit::computeApproximateSV() {
  VLR_SCOPE("GeneralSAROrbit::computeApproximateSV", kModule);
  fitted_ = false;
  cx_ = cy_ = cz_ = nullptr;
  windowPositions_ = windowVelocities_ = nullptr;
  tw_ = 0.0;
  if (positions_.empty() || n_ < kWindow || windowCount_ != n_ - 4)
    VLR_FAIL("You must provide at least 5 state vectors!", vlr::kLibInconsistent);
  if (!std::isfinite(t0_) || !(dt_ > 0.0) || !std::isfinite(dt_))
    VLR_FAIL("Invalid state vector time or spacing", vlr::kLibInconsistent);
  const size_t values = 3 * static_cast<size_t>(n_);
  if (!all_finite(positions_.data(), values) || !all_finite(velocities_.data(), values))
    VLR_FAIL("State vectors are not finite", vlr::kLibInconsistent);
  for (int k = 0; k < windowCount_; ++k)
    VLR_CALL(orb_interp(0.0, positions_.data() + 3 * k, dt_, windowPolys_[0].data() + kWindow * k,
                        windowPolys_[1].data() + kWindow * k, windowPolys_[2].data() + kWindow * k,
                        kWindow));
  fitted_ = true;
  // Five vectors over the whole orbit.
  dtA_ = (n_ - 1) * dt_ * 0.25;
  tA0_ = t0_;
  for (int i = 0; i < 5; ++i) {
    SVGetPos(tA0_ + i * dtA_, approxPositions_ + 3 * i);
    SVGetVel(tA0_ + i * dtA_, approxVelocities_ + 3 * i);
  }
  int rc =
      orb_interp(0.0, approxPositions_, dtA_, globalPolys_[0], globalPolys_[1], globalPolys_[2], 5);
  // Mean track from the first to the last vector.
  double v[3];
  const double* last = positions_.data() + 3 * (n_ - 1);
  for (int a = 0; a < 3; ++a) v[a] = (last[a] - positions_[a]) / ((n_ - 1) * dt_);
  if (rc == 0) rc = computeRotationMatrix(v, rotation_, &trackSpeed_);
  if (rc != 0) {
    fitted_ = false;
    cx_ = cy_ = cz_ = nullptr;
    VLR_CALL(rc);
  }
  return 0;
}

int GeneralSAROrbit::updatePolys(double t) {
  if (!fitted_) return 1;
  if (cx_ != nullptr && t >= tw_ + kKeepFrom * dt_ && t <= tw_ + kKeepTo * dt_) return 0;
  const double last = t0_ + (n_ - 1) * dt_;
  int k = 0;
  if (t >= t0_ && t <= last) {
    double kk;
    if (cx_ != nullptr && std::fabs(t - tw_) < kKeepFrom * dt_)
      kk = std::ceil((t - t0_ + kKeepFrom * dt_) / dt_) - 4.0;  // backwards
    else
      kk = std::floor((t - t0_ - kKeepFrom * dt_) / dt_);
    k = static_cast<int>(std::fmax(0.0, std::fmin(kk, n_ - 5.0)));
  } else if (t > last) {
    k = n_ - 5;
  }
  tw_ = t0_ + k * dt_;
  windowPositions_ = positions_.data() + 3 * k;
  windowVelocities_ = velocities_.data() + 3 * k;
  cx_ = windowPolys_[0].data() + kWindow * k;
  cy_ = windowPolys_[1].data() + kWindow * k;
  cz_ = windowPolys_[2].data() + kWindow * k;
  return 0;
}

int GeneralSAROrbit::checkSpan(double t) const {
  const double half = 0.5 * dt_;
  return t >= t0_ - half && t <= t0_ + (n_ - 1) * dt_ + half ? 0 : -1;
}

int GeneralSAROrbit::evaluate(double t, double (*macro)(double, const double*, int),
                              double out[3]) {
  if (updatePolys(t) != 0) return 1;
  const double u = t - tw_;
  out[0] = macro(u, cx_, kWindow);
  out[1] = macro(u, cy_, kWindow);
  out[2] = macro(u, cz_, kWindow);
  return checkSpan(t);
}

int GeneralSAROrbit::SVGetPos(double t, double out[3]) {
  return evaluate(t, POSMACRO, out);
}

int GeneralSAROrbit::SVGetVel(double t, double out[3]) {
  return evaluate(t, VELMACRO, out);
}

const double* GeneralSAROrbit::resultOrNaN(int code) {
  if (code != 0)
    for (double& r : result_) r = std::numeric_limits<double>::quiet_NaN();
  return result_;
}

const double* GeneralSAROrbit::SVGetPos(double t) {
  return resultOrNaN(SVGetPos(t, result_));
}

const double* GeneralSAROrbit::SVGetVel(double t) {
  return resultOrNaN(SVGetVel(t, result_));
}

int GeneralSAROrbit::GetStateVectorsENVI(const char* path, double tStart, double duration) {
  VLR_SCOPE("GeneralSAROrbit::GetStateVectorsENVI", kModule);
  double t0 = 0.0, dt = 0.0;
  int n = 0;
  VLR_CALL(StateVectorGridENVI(tStart, duration, &t0, &dt, &n));
  VLR_CALL(SVCreate(t0, dt, n));
  VLR_CALL(::GetStateVectorsENVI(path, t0, dt, n, positions_.data(), velocities_.data()));
  VLR_CALL(computeApproximateSV());
  return 0;
}

int GeneralSAROrbit::writehdr(const char* file) {
  VLR_SCOPE("GeneralSAROrbit::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int GeneralSAROrbit::readhdr(const char* file) {
  VLR_SCOPE("GeneralSAROrbit::readhdr", kModule);
  // Both forms of the section are those of the state vector section.
  SAROrbitStateVectors_Obj stored;
  const int rc = stored.readhdr(file);
  if (rc != 0) {
    destroyBuffers();
    VLR_CALL(rc);
  }
  VLR_CALL(SVCreate(stored.t0(), stored.dt(), stored.n()));
  copyVectorsFrom(stored);
  VLR_CALL(computeApproximateSV());
  return 0;
}

int GeneralSAROrbit::clone(GeneralSAROrbit* dst) const {
  VLR_SCOPE("GeneralSAROrbit::clone", kModule);
  if (dst == nullptr || dst == this) return 0;
  dst->SVDestroy();
  dst->lambda_ = lambda_;
  dst->lookSign_ = lookSign_;
  if (positions_.empty() || n_ < kWindow) return 0;
  VLR_CALL(dst->SVCreate(t0_, dt_, n_));
  dst->copyVectorsFrom(*this);
  VLR_CALL(dst->computeApproximateSV());
  return 0;
}
