#include "metadata_sections/poly.h"

#include <cfloat>
#include <cstdio>
#include <string>

#include "profile/profile_par.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "polySAR";
constexpr int kChannel = 1;
constexpr const char* kPolyBlock = "PolySAR";

std::string blockPath(const char* name) {
  return std::string(kPolyBlock) + "/" + (name != nullptr ? name : "");
}

}  // namespace

poly::poly() {
  createElementsVector(3);
}

void poly::refreshParameters() {
  addElementDouble("pol", pol, kCoefficients, -DBL_MAX, DBL_MAX, true);
  addElementDouble("trg0_s", &trg0_s, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("taz0_s", &taz0_s, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

double poly::Value(const double* c, double r, double a) {
  return c[0] + c[1] * r + c[2] * a + c[3] * r * a + r * r * (c[4] + r * (c[5] + r * c[6]));
}

int poly::EvaluatePoly(double rt, double az, double* out) const {
  *out = Value(pol, rt - trg0_s, az - taz0_s);
  return 0;
}

int poly::clone(poly* other) const {
  for (int i = 0; i < kCoefficients; ++i) other->pol[i] = pol[i];
  other->trg0_s = trg0_s;
  other->taz0_s = taz0_s;
  return 0;
}

// Every field of a polynomial is a double array (count 1 for the times).
bool poly::readFromDocument(tessalxml& doc, const char* name) {
  const std::string block = blockPath(name);
  for (int i = 0; i < elementCount(); ++i) {
    const parElement& e = element(i);
    const std::string field = block + "/" + e.name;
    if (e.type != parElement::PT_DOUBLE ||
        doc.readDouble(kChannel, field.c_str(), static_cast<double*>(e.value), e.count) != 0)
      return false;
  }
  return true;
}

int poly::writeToDocument(tessalxml& doc, const char* name) {
  const std::string block = blockPath(name);
  doc.removeElements(kChannel, block.c_str());
  for (int i = 0; i < elementCount(); ++i) {
    const parElement& e = element(i);
    const std::string field = block + "/" + e.name;
    if (e.type != parElement::PT_DOUBLE ||
        doc.writeDouble(kChannel, field.c_str(), static_cast<const double*>(e.value), e.count) != 0)
      return 1;
  }
  return 0;
}

int poly::writeBlock(const char* file, const char* name) {
  VLR_SCOPE("writepar", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, blockPath(name).c_str()));
  return 0;
}

bool poly::readBlock(const char* file, const char* name) {
  return readAuxiliaryFile(file, kChannel, blockPath(name).c_str());
}

int poly::readBlockOrLegacy(const char* file, const char* name, const LegacyKeys* keys) {
  VLR_SCOPE("readpar", kModule);
  if (readBlock(file, name)) return 0;
  // Older parameter-file form.  A key that is missing leaves its value; a
  // data set of which nothing at all is stored is missing.
  bool found = false;
  if (keys != nullptr) {
    const int coefficients = GetParDouble(file, keys->coefficients, kCoefficients, pol, 1, name);
    const int azimuth = GetParDouble(file, keys->azimuthTime, 1, &taz0_s, 1, name);
    const int range = GetParDouble(file, keys->rangeTime, 1, &trg0_s, 1, name);
    found = coefficients == 0 || azimuth == 0 || range == 0;
  }
  if (!found) {
    char text[200];
    std::snprintf(text, sizeof text, "Polynomial data set '%.64s' not found",
                  name != nullptr ? name : "");
    VLR_FAIL(text, 10);
  }
  return 0;
}
