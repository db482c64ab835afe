#include "orbit/orbit_poly.h"

// Horner's scheme from the highest power down; c[m-1-k] multiplies t^k.

double POSMACRO(double t, const double* c, int m) {
  double r = 0.0;
  for (int j = 0; j < m; ++j) r = r * t + c[j];
  return r;
}

double VELMACRO(double t, const double* c, int m) {
  double r = 0.0;
  for (int k = m - 1; k >= 1; --k) r = r * t + k * c[m - 1 - k];
  return r;
}

double ACCMACRO(double t, const double* c, int m) {
  double r = 0.0;
  for (int k = m - 1; k >= 2; --k) r = r * t + static_cast<double>(k) * (k - 1) * c[m - 1 - k];
  return r;
}

void POSVELACC_5(double t, const double* cx, const double* cy, const double* cz, double pos[3],
                 double vel[3], double acc[3]) {
  const double* c[3] = {cx, cy, cz};
  for (int a = 0; a < 3; ++a) {
    pos[a] = POSMACRO(t, c[a], 5);
    vel[a] = VELMACRO(t, c[a], 5);
    acc[a] = ACCMACRO(t, c[a], 5);
  }
}
