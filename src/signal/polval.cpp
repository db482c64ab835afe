#include "signal/polval.h"

double polval(const double* c, int d, double x) {
  if (c == nullptr || d < 0) return 0.0;
  double v = c[d];
  for (int k = d - 1; k >= 0; --k) v = v * x + c[k];
  return v;
}
