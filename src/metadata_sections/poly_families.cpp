#include "metadata_sections/poly_families.h"

#include <cstdio>

#include "profile/profile_par.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "polySAR";

// Five range coefficients of the older forms are c0, c1 and the three
// highest powers of range; the azimuth terms are zero.
void mapFiveCoefficients(const double* v, double* pol) {
  pol[0] = v[0];
  pol[1] = v[1];
  pol[2] = 0.0;
  pol[3] = 0.0;
  pol[4] = v[2];
  pol[5] = v[3];
  pol[6] = v[4];
}

}  // namespace

int polyDC::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polyDC::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"DCpoly", "DCpoly_azt0", "DCpoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int polyDC::readparold(const char* file, const char* section) {
  VLR_SCOPE("polyDC::readparold", kModule);
  int n = 0;
  GetParDouble(file, "DopCenRgRefTimes", 1, &trg0_s, 1, section);
  GetParDouble(file, "DopCenAzRefSec85Times", 1, &taz0_s, 1, section);
  if (GetParInt(file, "DopCenPol_nCoeff", 1, &n, 1, section) != 0)
    VLR_FAIL("Number of Doppler centroid coefficients not found", 10);
  if (n != 5 && n != kCoefficients) {
    char text[120];
    std::snprintf(text, sizeof text, "Unsupported number of Doppler centroid coefficients %d", n);
    VLR_REPORT(text, 1);
    return 0;
  }
  double v[kCoefficients] = {};
  if (GetParDouble(file, "DopCenRangeCoeffs", n, v, 1, section) != 0)
    VLR_FAIL("Doppler centroid coefficients not found", 10);
  if (n == 5) {
    mapFiveCoefficients(v, pol);
  } else {
    for (int i = 0; i < kCoefficients; ++i) pol[i] = v[i];
  }
  return 0;
}

int polyFR::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polyFR::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"FRpoly", "FRpoly_azt0", "FRPoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int polyFR::readparold(const char* file, const char* section, int n) {
  VLR_SCOPE("polyFR::readparold", kModule);
  if (n != 3 && n != 5 && n != kCoefficients) {
    char text[120];
    std::snprintf(text, sizeof text, "Unsupported number of Doppler rate coefficients %d", n);
    VLR_REPORT(text, 1);
    return 0;
  }
  const char* key = n == kCoefficients ? "DopRatRangeCoeff" : "AzimuthCoeff";
  double v[kCoefficients] = {};
  if (GetParDouble(file, key, n, v, 1, section) != 0)
    VLR_FAIL("Doppler rate coefficients not found", 10);
  if (n == 5) {
    mapFiveCoefficients(v, pol);
  } else if (n == 3) {
    pol[0] = v[0];
    pol[1] = v[1];
    pol[3] = v[2];
  } else {
    for (int i = 0; i < kCoefficients; ++i) pol[i] = v[i];
  }
  return 0;
}

int polySL2GR::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polySL2GR::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"SL2GRpoly", "SL2GRpoly_azt0", "SL2GRpoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int polyGR2SL::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polyGR2SL::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"GR2SLpoly", "GR2SLpoly_azt0", "GR2SLpoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int polySL2THETA::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polySL2THETA::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"SL2THETApoly", "SL2THETApoly_azt0", "SL2THETApoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int polySL2PHI::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int polySL2PHI::readpar(const char* file, const char* name) {
  static const LegacyKeys keys{"SL2PHIpoly", "SL2PHIpoly_azt0", "SL2PHIpoly_rgt0"};
  return readBlockOrLegacy(file, name, &keys);
}

int extended_polyDC::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int extended_polyDC::readpar(const char* file, const char* name) {
  return readBlockOrLegacy(file, name, nullptr);
}

int extended_polyFR::writepar(const char* file, const char* name) {
  return writeBlock(file, name);
}
int extended_polyFR::readpar(const char* file, const char* name) {
  return readBlockOrLegacy(file, name, nullptr);
}
