#include "orbit/lagrange9.h"

namespace {

constexpr int kNodes = 9;

}  // namespace

void lagrange9(const double values[9][3], const double times[9], double t, double out[3]) {
  const double step = times[1] - times[0];
  const double u = (t - times[0]) / step;
  double x[kNodes];
  double l = 1.0;
  for (int j = 0; j < kNodes; ++j) {
    x[j] = (times[j] - times[0]) / step;
    l *= u - x[j];
  }
  if (l == 0.0) {
    for (int j = 0; j < kNodes; ++j) {
      if (u - x[j] == 0.0) {
        for (int a = 0; a < 3; ++a) out[a] = values[j][a];
        return;
      }
    }
  }
  double sum[3] = {0.0, 0.0, 0.0};
  for (int j = 0; j < kNodes; ++j) {
    // prod over k != j of (x_j - x_k): with nodes at 0 .. 8 exactly these
    // are the integers 40320, -5040, 1440, -720, 576, ..., so equally spaced
    // records give the same result as fixed weights, while a record that is
    // early or late is weighted for where it really lies.
    double weight = 1.0;
    for (int k = 0; k < kNodes; ++k)
      if (k != j) weight *= x[j] - x[k];
    const double w = l / ((u - x[j]) * weight);
    for (int a = 0; a < 3; ++a) sum[a] += w * values[j][a];
  }
  for (int a = 0; a < 3; ++a) out[a] = sum[a];
}

void interp_orb_Lagrange(const double samples[9][3], const double times[9], double out[][3],
                         const double* t, int k) {
  for (int i = 0; i < k; ++i) lagrange9(samples, times, t[i], out[i]);
}
