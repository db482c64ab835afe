#include "orbit/state_vector_store.h"

#include <cfloat>
#include <climits>
#include <cstring>

#include "orbit/earth_constants.h"
#include "orbit/gr_pt_lat_lon.h"

namespace {

constexpr int kFields = 5;

}  // namespace

StateVectorStore::StateVectorStore(double t0, double dt, int n) : t0_(t0), dt_(dt), n_(n) {
  createElementsVector(kFields);
}

StateVectorStore::~StateVectorStore() = default;

void StateVectorStore::refreshParameters() {
  const int values = positions_.empty() ? 0 : 3 * n_;
  addElementDouble("pSV_m", positions_.data(), values, -DBL_MAX, DBL_MAX, true);
  addElementDouble("vSV_mOs", velocities_.data(), values, -DBL_MAX, DBL_MAX, true);
  addElementDouble("t0SV_s", &t0_, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("dtSV_s", &dt_, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("nSV_n", &n_, 1, INT_MIN, INT_MAX, true);
}

int StateVectorStore::SVDestroy() {
  if (!positions_.empty()) destroyBuffers();
  return 0;
}

bool StateVectorStore::allocateVectors(vlr::CkBuffer<double>* extra, int count, size_t size) {
  const size_t values = 3 * static_cast<size_t>(n_);
  bool ok = positions_.allocate(values) && velocities_.allocate(values);
  for (int i = 0; i < count; ++i) ok = ok && extra[i].allocate(size);
  if (!ok) {
    destroyBuffers();
    return false;
  }
  refreshParameters();
  setAllocationFlag(true);
  return true;
}

void StateVectorStore::releaseVectors(vlr::CkBuffer<double>* extra, int count) {
  positions_.reset();
  velocities_.reset();
  for (int i = 0; i < count; ++i) extra[i].reset();
  refreshParameters();
  setAllocationFlag(false);
}

void StateVectorStore::copyVectorsFrom(const StateVectorStore& src) {
  const size_t bytes = 3 * static_cast<size_t>(n_) * sizeof(double);
  std::memcpy(positions_.data(), src.positions_.data(), bytes);
  std::memcpy(velocities_.data(), src.velocities_.data(), bytes);
}

int StateVectorStore::solveGroundPoint(const double* window, double tw, double t, double tau,
                                       double fdc, double lambda, gr_pt_record* record) const {
  gr_pt_record& r = *record;
  std::memcpy(r.positions, window, sizeof r.positions);
  r.tw = tw;
  r.dt = dt_;
  r.t = t;
  r.tau = tau;
  r.fdc = fdc;
  r.lambda = lambda;
  r.lookSign = lookSign_;
  r.height = 0.0;
  return gr_pt_lat_lon(record, kWgs84A, kWgs84B);
}
