#include "orbit/orbit_fit.h"

#include <new>
#include <stdexcept>
#include <vector>

#include "orbit/poly_fit.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "interp_orb";

// Fits the three axes of `samples` and stores the coefficients interleaved;
// y (m values) and c (ncoef values) are scratch.
int fit_axes(const double* samples, const std::vector<double>& t, int m, double* coef, int ncoef,
             double* sse, std::vector<double>& y, std::vector<double>& c) {
  for (int a = 0; a < 3; ++a) {
    for (int i = 0; i < m; ++i) y[i] = samples[3 * i + a];
    double residual = 0.0;
    const int rc = gen_polfit(ncoef, t.data(), y.data(), m, c.data(), &residual);
    if (rc != 0) return rc;
    for (int k = 0; k < ncoef; ++k) coef[3 * k + a] = c[k];
    if (sse != nullptr) sse[a] = residual;
  }
  return 0;
}

}  // namespace

int orbffit(const double* pos, const double* vel, double t0, double dt, int m, double* cpos,
            double* cvel, int ncoef, double* ssePos, double* sseVel) {
  VLR_SCOPE("orbffit", kModule);
  if (m < 1 || ncoef < 1 || ncoef > m) VLR_FAIL("Too few points for the polynomial degree", 1);
  // The sizes come from the callers' counts, which may come from a file.
  std::vector<double> t, y, c;
  try {
    t.resize(static_cast<size_t>(m));
    y.resize(static_cast<size_t>(m));
    c.resize(static_cast<size_t>(ncoef));
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  } catch (const std::length_error&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  for (int i = 0; i < m; ++i) t[i] = t0 + i * dt;
  VLR_CALL(fit_axes(pos, t, m, cpos, ncoef, ssePos, y, c));
  if (vel != nullptr && cvel != nullptr) VLR_CALL(fit_axes(vel, t, m, cvel, ncoef, sseVel, y, c));
  return 0;
}

int orb_interp(double t0, const double* samples, double dt, double* cx, double* cy, double* cz,
               int m) {
  VLR_SCOPE("orb_interp", kModule);
  if (m < 1) VLR_FAIL("Too few points for the polynomial degree", 1);
  std::vector<double> coef;
  try {
    coef.resize(3 * static_cast<size_t>(m));
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  } catch (const std::length_error&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  VLR_CALL(orbffit(samples, nullptr, t0, dt, m, coef.data(), nullptr, m, nullptr, nullptr));
  for (int k = 0; k < m; ++k) {
    cx[m - 1 - k] = coef[3 * k];
    cy[m - 1 - k] = coef[3 * k + 1];
    cz[m - 1 - k] = coef[3 * k + 2];
  }
  return 0;
}
