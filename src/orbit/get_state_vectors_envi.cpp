#include "orbit/get_state_vectors_envi.h"

#include <cmath>

#include "orbit/interp_orb_l.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSAR";
constexpr double kGridStep = 5.0;
constexpr double kShortScene = 15.0;

}  // namespace

int GetStateVectorsENVI(const char* path, double t0, double dt, int n, double* positions,
                        double* velocities) {
  VLR_SCOPE("GetStateVectorsENVI", kModule);
  int orbit = 0;
  // Neither the orbit number nor the ascending node time is kept, so the
  // node time is not asked for: its search can fail (no ascending crossing
  // between the file start and the scene) while the vectors are sound.
  double anx = 0.0;
  VLR_CALL(
      interp_orb_l(path, t0 + dt * (n - 1) * 0.5, n, dt, positions, velocities, &orbit, 0, &anx));
  return 0;
}

int GetStateVectorsENVI(const char* path, double t0, double dt, int n,
                        SAROrbitStateVectors_Obj* sv) {
  VLR_SCOPE("GetStateVectorsENVI", kModule);
  if (sv == nullptr) VLR_FAIL("Missing state vector object", vlr::kLibInconsistent);
  VLR_CALL(sv->SVCreate(t0, dt, n));
  VLR_CALL(GetStateVectorsENVI(path, t0, dt, n, sv->positions(), sv->velocities()));
  VLR_CALL(sv->SVPolyCompute());
  return 0;
}

int StateVectorGridENVI(double tStart, double duration, double* t0, double* dt, int* n) {
  VLR_SCOPE("StateVectorGridENVI", kModule);
  if (!std::isfinite(tStart) || !std::isfinite(duration))
    VLR_FAIL("Invalid scene time or duration", vlr::kLibInconsistent);
  *dt = kGridStep;
  if (duration < kShortScene) {
    *n = 5;
    *t0 = tStart + 0.5 * duration - 10.0;
    return 0;
  }
  // std::round rounds halves away from zero.
  const double half = std::round((1.4 * duration / kGridStep + 1.0) * 0.5);
  if (half > (kMaxStateVectors - 1) / 2) VLR_FAIL("Scene too long for the orbit grid", 1);
  *t0 = tStart - 0.2 * duration;
  *n = 2 * static_cast<int>(half) + 1;
  return 0;
}
