#include "orbit/rtbis.h"

#include <cmath>

#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "matrixlib";
constexpr int kMaxHalvings = 200;

}  // namespace

int rtbis(double (*func)(double), double x1, double x2, double xacc, double* root) {
  VLR_SCOPE("rtbis", kModule);
  const double f = func(x1);
  double fmid = func(x2);
  // A NaN fails the bracket test too.
  if (!(f * fmid < 0.0)) VLR_FAIL("Root must be bracketed for bisection in rtbis", 1);
  // Bisect from the end where the function is negative.
  double dx;
  double rtb;
  if (f < 0.0) {
    dx = x2 - x1;
    rtb = x1;
  } else {
    dx = x1 - x2;
    rtb = x2;
  }
  for (int j = 0; j < kMaxHalvings; ++j) {
    dx *= 0.5;
    const double xmid = rtb + dx;
    fmid = func(xmid);
    if (fmid <= 0.0) rtb = xmid;
    if (std::fabs(dx) < xacc || fmid == 0.0) {
      *root = rtb;
      return 0;
    }
  }
  VLR_FAIL("Too many bisections in rtbis", 1);
}
