#include "orbit/poly_fit.h"

#include <cmath>
#include <new>
#include <stdexcept>
#include <vector>

#include "orbit/gauss_jordan.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "interp_orb";

}  // namespace

int dpolfit(const double* x, const double* y, int m, double* coef, int d) {
  VLR_SCOPE("dpolfit", kModule);
  if (d < 0 || m < d + 1) VLR_FAIL("Too few points for the polynomial degree", 1);
  const int nc = d + 1;
  const size_t unc = static_cast<size_t>(nc);
  // Orbit samples are large numbers (millions of metres) that change little
  // over the fit; solved as they are, the normal equations lose millimetres
  // to rounding.  The line through the first and the last point is taken
  // out before the fit and added back to the coefficients (any polynomial of
  // degree 1 or more can hold it, so the fitted polynomial is the same), and
  // the equations are solved in x / scale with scale the largest |x|.
  double a0 = 0.0, a1 = 0.0;
  if (d >= 1 && x[m - 1] != x[0]) {
    a1 = (y[m - 1] - y[0]) / (x[m - 1] - x[0]);
    a0 = y[0] - a1 * x[0];
    if (!std::isfinite(a0) || !std::isfinite(a1)) a0 = a1 = 0.0;
  }
  double scale = 0.0;
  for (int i = 0; i < m; ++i) scale = std::fmax(scale, std::fabs(x[i]));
  if (!(scale > 0.0) || !std::isfinite(scale)) scale = 1.0;
  // Power sums: sums[p] = sum of u^p for p = 0 .. 2d; rhs[j] = sum of u^j y.
  // The sizes follow the degree, which may come from a file's count.
  std::vector<double> sums, rhs, normal;
  try {
    sums.assign(2 * unc - 1, 0.0);
    rhs.assign(unc, 0.0);
    normal.resize(unc * unc);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  } catch (const std::length_error&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  for (int i = 0; i < m; ++i) {
    const double u = x[i] / scale;
    const double r = y[i] - (a0 + a1 * x[i]);
    double p = 1.0;
    for (int k = 0; k < 2 * nc - 1; ++k) {
      sums[k] += p;
      if (k < nc) rhs[k] += p * r;
      p *= u;
    }
  }
  for (int j = 0; j < nc; ++j)
    for (int k = 0; k < nc; ++k) normal[j * unc + k] = sums[j + k];
  VLR_CALL(ldgaussj(normal.data(), nc, rhs.data()));
  double power = 1.0;
  for (int k = 0; k < nc; ++k) {
    coef[k] = rhs[k] / power;
    power *= scale;
  }
  if (d >= 1) {
    coef[0] += a0;
    coef[1] += a1;
  }
  return 0;
}

int polfit(const double* x, const double* y, int m, double* coef, int d) {
  VLR_SCOPE("polfit", kModule);
  if (m < 1) VLR_FAIL("Too few points for the polynomial degree", 1);
  std::vector<double> xs, ys;
  try {
    xs.assign(x, x + m);
    ys.assign(y, y + m);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  } catch (const std::length_error&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  VLR_CALL(dpolfit(xs.data(), ys.data(), m, coef, d));
  return 0;
}

int gen_polfit(int ncoef, const double* x, const double* y, int m, double* coef, double* sse) {
  VLR_SCOPE("gen_polfit", kModule);
  VLR_CALL(dpolfit(x, y, m, coef, ncoef - 1));
  if (sse != nullptr) {
    double sum = 0.0;
    for (int i = 0; i < m; ++i) {
      double value = 0.0, p = 1.0;
      for (int k = 0; k < ncoef; ++k) {
        value += coef[k] * p;
        p *= x[i];
      }
      const double r = y[i] - value;
      sum += r * r;
    }
    *sse = sum;
  }
  return 0;
}
