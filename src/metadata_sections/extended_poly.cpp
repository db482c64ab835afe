#include "metadata_sections/extended_poly.h"

#include <cfloat>

extended_poly::extended_poly() {
  createElementsVector(3);
}

void extended_poly::refreshParameters() {
  addElementDouble("pol", extPol, kExtendedCoefficients, -DBL_MAX, DBL_MAX, true);
  addElementDouble("trg0_s", &trg0_s, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("taz0_s", &taz0_s, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int extended_poly::EvaluatePoly(double rt, double az, double* out) const {
  const double r = rt - trg0_s;
  const double a = az - taz0_s;
  const double* c = extPol;
  const double r2 = r * r;
  const double a2 = a * a;
  *out = c[0] + c[1] * r + c[2] * a + c[3] * r * a + c[4] * a2 + c[5] * r2 + c[6] * r * a2 +
         c[7] * r2 * a + r2 * r * (c[8] + r * (c[9] + r * c[10])) +
         a2 * a * (c[11] + a * (c[12] + a * c[13]));
  return 0;
}

int extended_poly::clone(extended_poly* other) const {
  for (int i = 0; i < kExtendedCoefficients; ++i) other->extPol[i] = extPol[i];
  other->trg0_s = trg0_s;
  other->taz0_s = taz0_s;
  return 0;
}
