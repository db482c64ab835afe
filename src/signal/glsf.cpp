#include "signal/glsf.h"

#include <cmath>
#include <cstddef>
#include <utility>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "glsf";
constexpr int kMaxKernelLength = 1024;
constexpr double kPi = 3.14159265358979323846;
// Weight of the guard band in the right-hand side.
constexpr double kGuardWeight = 1e-5;

double sinc(double u) {
  if (u == 0.0) return 1.0;
  const double x = kPi * u;
  return std::sin(x) / x;
}

double alternating(int k) {
  return (k % 2 == 0) ? 1.0 : -1.0;
}

// Solves a x = b (a n x n, row-major) by LU decomposition with partial
// pivoting; a is overwritten by its factors and b by x.  false when a pivot
// is zero or not finite.
bool solveLu(double* a, double* b, int n) {
  const size_t un = static_cast<size_t>(n);
  auto at = [a, un](int r, int c) -> double& { return a[static_cast<size_t>(r) * un + c]; };
  for (int col = 0; col < n; ++col) {
    int pivot = col;
    for (int r = col + 1; r < n; ++r)
      if (std::fabs(at(r, col)) > std::fabs(at(pivot, col))) pivot = r;
    const double p = at(pivot, col);
    if (p == 0.0 || !std::isfinite(p)) return false;
    if (pivot != col) {
      for (int c = 0; c < n; ++c) std::swap(at(pivot, c), at(col, c));
      std::swap(b[pivot], b[col]);
    }
    for (int r = col + 1; r < n; ++r) {
      const double f = at(r, col) / p;
      if (f == 0.0) continue;
      for (int c = col + 1; c < n; ++c) at(r, c) -= f * at(col, c);
      b[r] -= f * b[col];
    }
  }
  for (int r = n - 1; r >= 0; --r) {
    double v = b[r];
    for (int c = r + 1; c < n; ++c) v -= at(r, c) * b[c];
    b[r] = v / at(r, r);
  }
  return true;
}

}  // namespace

int glsF(float* kernel, int L, double s, double B, double eps) {
  VLR_SCOPE("glsF", kModule);
  if (kernel == nullptr || L < 1 || L > kMaxKernelLength)
    VLR_FAIL("Kernel length out of range", vlr::kLibInconsistent);
  if (!std::isfinite(s) || !std::isfinite(B) || !std::isfinite(eps))
    VLR_FAIL("Kernel parameters not finite", vlr::kLibInconsistent);
  const size_t n = static_cast<size_t>(L);
  vlr::CkBuffer<double> corr, h;
  if (!corr.allocate(n * n) || !h.allocate(n))
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);

  const double guard = 1.0 - eps - B;
  const int c = (L - 1) / 2;
  for (int k = 0; k < L; ++k) {
    const double x = k - s - c;
    h[k] = B * sinc(B * x) + kGuardWeight * B * alternating(k) * sinc(guard * x);
  }
  // Correlation of the signal model: the band plus the guard term.
  for (int j = 0; j < L; ++j) {
    for (int k = 0; k < L; ++k) {
      const int m = j > k ? j - k : k - j;
      corr[static_cast<size_t>(j) * n + k] = B * sinc(B * m) + B * alternating(m) * sinc(guard * m);
    }
  }
  if (!solveLu(corr.data(), h.data(), L))
    VLR_FAIL("Singular matrix in glsF", vlr::kLibInconsistent);
  double sum = 0.0;
  for (int k = 0; k < L; ++k) sum += h[k];
  if (sum == 0.0 || !std::isfinite(sum)) VLR_FAIL("Kernel taps sum to zero", vlr::kLibInconsistent);
  for (int k = 0; k < L; ++k) kernel[k] = static_cast<float>(h[k] / sum);
  return 0;
}
