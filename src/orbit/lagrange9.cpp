#include "orbit/lagrange9.h"

namespace {

// prod over k != j of (j - k) for the nodes 0 .. 8.
constexpr double kWeights[9] = {40320.0, -5040.0, 1440.0,  -720.0, 576.0,
                                -720.0,  1440.0,  -5040.0, 40320.0};

}  // namespace

void lagrange9(const double values[9][3], const double times[9], double t, double out[3]) {
  const double step = times[1] - times[0];
  const double u = (t - times[0]) / step;
  double x[9];
  double l = 1.0;
  for (int j = 0; j < 9; ++j) {
    x[j] = (times[j] - times[0]) / step;
    l *= u - x[j];
  }
  if (l == 0.0) {
    for (int j = 0; j < 9; ++j) {
      if (u - x[j] == 0.0) {
        for (int a = 0; a < 3; ++a) out[a] = values[j][a];
        return;
      }
    }
  }
  double sum[3] = {0.0, 0.0, 0.0};
  for (int j = 0; j < 9; ++j) {
    const double w = l / ((u - x[j]) * kWeights[j]);
    for (int a = 0; a < 3; ++a) sum[a] += w * values[j][a];
  }
  for (int a = 0; a < 3; ++a) out[a] = sum[a];
}

void interp_orb_Lagrange(const double samples[9][3], const double times[9], double out[][3],
                         const double* t, int k) {
  for (int i = 0; i < k; ++i) lagrange9(samples, times, t[i], out[i]);
}
