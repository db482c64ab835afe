#include "orbit/gauss_jordan.h"

#include <cmath>
#include <new>
#include <stdexcept>
#include <utility>
#include <vector>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "matrixlib";

}  // namespace

int ldgaussj(double* a, int n, double* b) {
  VLR_SCOPE("ldgaussj", kModule);
  if (n < 1) VLR_FAIL("Singular matrix in ldgaussj", 1);
  const size_t un = static_cast<size_t>(n);
  std::vector<int> indxc, indxr, ipiv;
  try {
    indxc.resize(un);
    indxr.resize(un);
    ipiv.assign(un, 0);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  } catch (const std::length_error&) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  auto at = [a, un](int r, int c) -> double& { return a[static_cast<size_t>(r) * un + c]; };
  for (int i = 0; i < n; ++i) {
    // Full pivoting: the largest element among the rows and columns not yet used.
    double big = 0.0;
    int irow = -1, icol = -1;
    for (int j = 0; j < n; ++j) {
      if (ipiv[j] != 0) continue;
      for (int k = 0; k < n; ++k) {
        if (ipiv[k] == 0 && std::fabs(at(j, k)) >= big) {
          big = std::fabs(at(j, k));
          irow = j;
          icol = k;
        }
      }
    }
    if (irow < 0 || big == 0.0 || !std::isfinite(big)) VLR_FAIL("Singular matrix in ldgaussj", 1);
    ++ipiv[icol];
    if (irow != icol) {
      for (int l = 0; l < n; ++l) std::swap(at(irow, l), at(icol, l));
      std::swap(b[irow], b[icol]);
    }
    indxr[i] = irow;
    indxc[i] = icol;
    const double pivinv = 1.0 / at(icol, icol);
    at(icol, icol) = 1.0;
    for (int l = 0; l < n; ++l) at(icol, l) *= pivinv;
    b[icol] *= pivinv;
    for (int ll = 0; ll < n; ++ll) {
      if (ll == icol) continue;
      const double dum = at(ll, icol);
      at(ll, icol) = 0.0;
      for (int l = 0; l < n; ++l) at(ll, l) -= at(icol, l) * dum;
      b[ll] -= b[icol] * dum;
    }
  }
  // Undo the column interchanges of the inverse.
  for (int l = n - 1; l >= 0; --l) {
    if (indxr[l] != indxc[l])
      for (int k = 0; k < n; ++k) std::swap(at(k, indxr[l]), at(k, indxc[l]));
  }
  return 0;
}
