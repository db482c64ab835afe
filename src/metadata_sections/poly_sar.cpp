#include "metadata_sections/poly_sar.h"

#include <algorithm>
#include <cmath>
#include <cstdio>
#include <limits>
#include <new>
#include <type_traits>

#include "metadata_sections/poly_selection.h"
#include "profile/profile_cache.h"
#include "profile/profile_par.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "polySAR";
constexpr int kChannel = 1;
constexpr const char* kBlock = "PolySAR";
constexpr int kEmptyFamily = 10;
constexpr double kNoValue = std::numeric_limits<double>::quiet_NaN();

constexpr const char* kDopplerCentroid = "DopplerCentroid";
constexpr const char* kDopplerRate = "DopplerRate";
constexpr const char* kSlantToGround = "SlantToGround";
constexpr const char* kGroundToSlant = "GroundToSlant";
constexpr const char* kSlantToTheta = "SlantToTheta";
constexpr const char* kSlantToPhi = "SlantToPhi";
constexpr const char* kExtendedDopplerCentroid = "ExtendedDopplerCentroid";
constexpr const char* kExtendedDopplerRate = "ExtendedDopplerRate";

// Calls f(family, name) for every family, in the stored order.
template <class S, class F>
void forEachFamily(S& s, F f) {
  f(s.dc, kDopplerCentroid);
  f(s.fr, kDopplerRate);
  f(s.sl2gr, kSlantToGround);
  f(s.gr2sl, kGroundToSlant);
  f(s.sl2theta, kSlantToTheta);
  f(s.sl2phi, kSlantToPhi);
  f(s.dcExt, kExtendedDopplerCentroid);
  f(s.frExt, kExtendedDopplerRate);
}

// The operations on one family.  `function` is the public name that reports
// show, `family` the short name in "NO <family> poly available".
int emptyFamily(vlr::CallScope& scope, const char* family) {
  char text[64];
  std::snprintf(text, sizeof text, "NO %s poly available", family);
  return scope.fail(text, kEmptyFamily, __LINE__);
}

template <class P>
int evaluateFamily(const char* function, const char* family, const std::vector<P>& sets,
                   bool interpolate, double rt, double az, double* out) {
  VLR_SCOPE(function, kModule);
  if (sets.empty()) return emptyFamily(vlr_scope_, family);
  if (!interpolate)
    return sets[static_cast<size_t>(poly_select_set(sets, az))].EvaluatePoly(rt, az, out);
  double coef[poly::kCoefficients];
  poly_interp_coefficients(sets, az, coef);
  const P& reference = sets[static_cast<size_t>(poly_bracket_set(sets, az))];
  *out = poly::Value(coef, rt - reference.trg0_s, az - reference.taz0_s);
  return 0;
}

template <class P>
int familyCoefficients(const char* function, const char* family, const std::vector<P>& sets,
                       double az, double* coef) {
  VLR_SCOPE(function, kModule);
  if (sets.empty()) return emptyFamily(vlr_scope_, family);
  poly_interp_coefficients(sets, az, coef);
  return 0;
}

template <class P>
int familyIndex(const char* function, const char* family, const std::vector<P>& sets, double az,
                int* index) {
  VLR_SCOPE(function, kModule);
  if (sets.empty()) return emptyFamily(vlr_scope_, family);
  *index = poly_bracket_set(sets, az);
  return 0;
}

// The value of a coded evaluation, NaN when it failed.
template <class F>
double valueOf(F evaluate) {
  double value = kNoValue;
  return evaluate(&value) == 0 ? value : kNoValue;
}

// A count of the older form: 0 when the key is absent (n = 0) or read, 1
// when it is present but not a number.
int legacyCount(const char* file, const char* key, int* n) {
  *n = 0;
  if (GetSetProfileChar(kProfileGet, kBlock, key, nullptr, file) == nullptr) return 0;
  return GetParInt(file, key, 1, n, 1, kBlock) == 0 ? 0 : 1;
}

template <class P>
bool finiteReferenceTimes(const std::vector<P>& sets) {
  for (const P& p : sets)
    if (!std::isfinite(p.taz0_s) || !std::isfinite(p.trg0_s)) return false;
  return true;
}

template <class P>
bool azimuthOrdered(const std::vector<P>& sets) {
  for (size_t i = 1; i < sets.size(); ++i)
    if (sets[i].taz0_s < sets[i - 1].taz0_s) return false;
  return true;
}

}  // namespace

polySAR::polySAR() {
  createElementsVector(8);
}

void polySAR::refreshParameters() {
  addElementInt("ndc", &ndc, 1, 0, kMaxDataSets, true);
  addElementInt("nfr", &nfr, 1, 0, kMaxDataSets, true);
  addElementInt("nsl2gr", &nsl2gr, 1, 0, kMaxDataSets, true);
  addElementInt("ngr2sl", &ngr2sl, 1, 0, kMaxDataSets, true);
  addElementInt("nsl2theta", &nsl2theta, 1, 0, kMaxDataSets, true);
  addElementInt("nsl2phi", &nsl2phi, 1, 0, kMaxDataSets, true);
  addElementInt("ndcExt", &ndcExt, 1, 0, kMaxExtendedDataSets, false);
  addElementInt("nfrExt", &nfrExt, 1, 0, kMaxExtendedDataSets, false);
  setAllocationFlag(true);
}

std::string polySAR::DataSetName(const char* family, int index) {
  char name[96];
  std::snprintf(name, sizeof name, "%.64s-%d", family != nullptr ? family : "", index);
  return name;
}

int polySAR::CreatePolys(int ndc_, int nfr_) {
  return CreatePolys(ndc_, nfr_, 0, 0, 0, 0, 0, 0);
}

int polySAR::CreatePolys(int ndc_, int nfr_, int nsl2gr_, int ngr2sl_, int nsl2theta_,
                         int nsl2phi_) {
  return CreatePolys(ndc_, nfr_, nsl2gr_, ngr2sl_, nsl2theta_, nsl2phi_, 0, 0);
}

int polySAR::CreatePolys(int ndc_, int nfr_, int nsl2gr_, int ngr2sl_, int nsl2theta_, int nsl2phi_,
                         int ndcExt_, int nfrExt_) {
  VLR_SCOPE("CreatePolys", kModule);
  VLR_CALL(checkCount("ndc", ndc_, kMaxDataSets));
  VLR_CALL(checkCount("nfr", nfr_, kMaxDataSets));
  VLR_CALL(checkCount("nsl2gr", nsl2gr_, kMaxDataSets));
  VLR_CALL(checkCount("ngr2sl", ngr2sl_, kMaxDataSets));
  VLR_CALL(checkCount("nsl2theta", nsl2theta_, kMaxDataSets));
  VLR_CALL(checkCount("nsl2phi", nsl2phi_, kMaxDataSets));
  VLR_CALL(checkCount("ndcExt", ndcExt_, kMaxExtendedDataSets));
  VLR_CALL(checkCount("nfrExt", nfrExt_, kMaxExtendedDataSets));
  DestroyPolys();
  try {
    dc.resize(static_cast<size_t>(ndc_));
    fr.resize(static_cast<size_t>(nfr_));
    sl2gr.resize(static_cast<size_t>(nsl2gr_));
    gr2sl.resize(static_cast<size_t>(ngr2sl_));
    sl2theta.resize(static_cast<size_t>(nsl2theta_));
    sl2phi.resize(static_cast<size_t>(nsl2phi_));
    dcExt.resize(static_cast<size_t>(ndcExt_));
    frExt.resize(static_cast<size_t>(nfrExt_));
  } catch (const std::bad_alloc&) {
    DestroyPolys();
    VLR_FAIL("Memory allocation failure", 7);
  }
  ndc = ndc_;
  nfr = nfr_;
  nsl2gr = nsl2gr_;
  ngr2sl = ngr2sl_;
  nsl2theta = nsl2theta_;
  nsl2phi = nsl2phi_;
  ndcExt = ndcExt_;
  nfrExt = nfrExt_;
  return 0;
}

int polySAR::DestroyPolys() {
  forEachFamily(*this, [](auto& family, const char*) {
    family.clear();
    family.shrink_to_fit();
  });
  ndc = nfr = nsl2gr = ngr2sl = nsl2theta = nsl2phi = ndcExt = nfrExt = 0;
  return 0;
}

int polySAR::readhdr(const char* file) {
  VLR_SCOPE("polySAR::readhdr", kModule);
  // The counts go to a separate object first, so that a damaged header does
  // not leave counts here that the families do not match.
  polySAR header;
  header.ndcExt = ndcExt;
  header.nfrExt = nfrExt;
  DestroyPolys();  // a read that fails leaves no families
  if (!header.readAuxiliaryFile(file, kChannel, kBlock)) {
    // Older parameter-file form; a missing count is 0.
    const int bad = legacyCount(file, "nDopCenDataSet", &header.ndc) |
                    legacyCount(file, "nFMRateDataSet", &header.nfr) |
                    legacyCount(file, "nSlant2Ground", &header.nsl2gr) |
                    legacyCount(file, "nGround2Slant", &header.ngr2sl) |
                    legacyCount(file, "nSlant2Theta", &header.nsl2theta) |
                    legacyCount(file, "nSlant2Phi", &header.nsl2phi);
    if (bad != 0) VLR_FAIL("Invalid number of polynomials", 1);
    if (header.ndc == 0 && header.nfr == 0 && header.nsl2gr == 0 && header.ngr2sl == 0 &&
        header.nsl2theta == 0 && header.nsl2phi == 0)
      return 1;
  }
  VLR_CALL(CreatePolys(header.ndc, header.nfr, header.nsl2gr, header.ngr2sl, header.nsl2theta,
                       header.nsl2phi, header.ndcExt, header.nfrExt));
  // The data sets come from the document loaded once; a data set that it
  // does not hold is read on its own (older parameter-file form).
  tessalxml doc(file);
  int rc = 0;
  forEachFamily(*this, [&](auto& family, const char* name) {
    for (size_t i = 0; rc == 0 && i < family.size(); ++i) {
      const std::string set = DataSetName(name, static_cast<int>(i));
      if (!family[i].readFromDocument(doc, set.c_str()))
        rc = vlr_scope_.callee(family[i].readpar(file, set.c_str()), __LINE__);
    }
  });
  if (rc != 0) {
    DestroyPolys();
    return rc;
  }
  bool finite = true;
  forEachFamily(
      *this, [&](auto& family, const char*) { finite = finite && finiteReferenceTimes(family); });
  if (!finite) {
    DestroyPolys();
    VLR_FAIL("Polynomial reference time is not a number", 1);
  }
  // The selection relies on ascending reference times.
  forEachFamily(*this, [&](auto& family, const char* name) {
    if (azimuthOrdered(family)) return;
    using P = typename std::decay_t<decltype(family)>::value_type;
    std::stable_sort(family.begin(), family.end(),
                     [](const P& a, const P& b) { return a.taz0_s < b.taz0_s; });
    char text[160];
    std::snprintf(text, sizeof text, "Data sets of %s not in azimuth order: sorted", name);
    VLR_REPORT(text, 1);
  });
  return 0;
}

int polySAR::writehdr(const char* file) {
  VLR_SCOPE("polySAR::writehdr", kModule);
  // The counts follow the families.
  ndc = static_cast<int>(dc.size());
  nfr = static_cast<int>(fr.size());
  nsl2gr = static_cast<int>(sl2gr.size());
  ngr2sl = static_cast<int>(gr2sl.size());
  nsl2theta = static_cast<int>(sl2theta.size());
  nsl2phi = static_cast<int>(sl2phi.size());
  ndcExt = static_cast<int>(dcExt.size());
  nfrExt = static_cast<int>(frExt.size());
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kBlock));
  // The data sets go into the document loaded once and saved once.
  tessalxml doc(file);
  int first = 0;
  forEachFamily(*this, [&](auto& family, const char* name) {
    for (size_t i = 0; i < family.size(); ++i) {
      const std::string set = DataSetName(name, static_cast<int>(i));
      const int rc = vlr_scope_.callee(family[i].writeToDocument(doc, set.c_str()), __LINE__);
      if (first == 0) first = rc;
    }
  });
  const int saved = vlr_scope_.callee(doc.write(), __LINE__);
  return first != 0 ? first : saved;
}

int polySAR::clone(polySAR* other) const {
  VLR_SCOPE("polySAR::clone", kModule);
  if (other == this) return 0;
  VLR_CALL(other->CreatePolys(static_cast<int>(dc.size()), static_cast<int>(fr.size()),
                              static_cast<int>(sl2gr.size()), static_cast<int>(gr2sl.size()),
                              static_cast<int>(sl2theta.size()), static_cast<int>(sl2phi.size()),
                              static_cast<int>(dcExt.size()), static_cast<int>(frExt.size())));
  for (size_t i = 0; i < dc.size(); ++i) dc[i].clone(&other->dc[i]);
  for (size_t i = 0; i < fr.size(); ++i) fr[i].clone(&other->fr[i]);
  for (size_t i = 0; i < sl2gr.size(); ++i) sl2gr[i].clone(&other->sl2gr[i]);
  for (size_t i = 0; i < gr2sl.size(); ++i) gr2sl[i].clone(&other->gr2sl[i]);
  for (size_t i = 0; i < sl2theta.size(); ++i) sl2theta[i].clone(&other->sl2theta[i]);
  for (size_t i = 0; i < sl2phi.size(); ++i) sl2phi[i].clone(&other->sl2phi[i]);
  for (size_t i = 0; i < dcExt.size(); ++i) dcExt[i].clone(&other->dcExt[i]);
  for (size_t i = 0; i < frExt.size(); ++i) frExt[i].clone(&other->frExt[i]);
  return 0;
}

int polySAR::EvaluateDC(double rt, double az, double* out) {
  return evaluateFamily("EvaluateDC", "DC", dc, false, rt, az, out);
}
double polySAR::EvaluateDC(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateDC(rt, az, v); });
}
int polySAR::EvaluateDCinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateDCinterp", "DC", dc, true, rt, az, out);
}
double polySAR::EvaluateDCinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateDCinterp(rt, az, v); });
}
int polySAR::getDCpoly(double az, double* coef) {
  return familyCoefficients("getDCpoly", "DC", dc, az, coef);
}
int polySAR::getDCnum(double az, int* index) {
  return familyIndex("getDCnum", "DC", dc, az, index);
}

int polySAR::EvaluateFR(double rt, double az, double* out) {
  return evaluateFamily("EvaluateFR", "FR", fr, false, rt, az, out);
}
double polySAR::EvaluateFR(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateFR(rt, az, v); });
}
int polySAR::EvaluateFRinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateFRinterp", "FR", fr, true, rt, az, out);
}
double polySAR::EvaluateFRinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateFRinterp(rt, az, v); });
}
int polySAR::getFRpoly(double az, double* coef) {
  return familyCoefficients("getFRpoly", "FR", fr, az, coef);
}
int polySAR::getFRnum(double az, int* index) {
  return familyIndex("getFRnum", "FR", fr, az, index);
}

int polySAR::EvaluateSL2GR(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2GR", "SL2GR", sl2gr, false, rt, az, out);
}
double polySAR::EvaluateSL2GR(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2GR(rt, az, v); });
}
int polySAR::EvaluateSL2GRinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2GRinterp", "SL2GR", sl2gr, true, rt, az, out);
}
double polySAR::EvaluateSL2GRinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2GRinterp(rt, az, v); });
}
int polySAR::getSL2GRpoly(double az, double* coef) {
  return familyCoefficients("getSL2GRpoly", "SL2GR", sl2gr, az, coef);
}
int polySAR::getSL2GRnum(double az, int* index) {
  return familyIndex("getSL2GRnum", "SL2GR", sl2gr, az, index);
}

int polySAR::EvaluateGR2SL(double rt, double az, double* out) {
  return evaluateFamily("EvaluateGR2SL", "GR2SL", gr2sl, false, rt, az, out);
}
double polySAR::EvaluateGR2SL(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateGR2SL(rt, az, v); });
}
int polySAR::EvaluateGR2SLinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateGR2SLinterp", "GR2SL", gr2sl, true, rt, az, out);
}
double polySAR::EvaluateGR2SLinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateGR2SLinterp(rt, az, v); });
}
int polySAR::getGR2SLpoly(double az, double* coef) {
  return familyCoefficients("getGR2SLpoly", "GR2SL", gr2sl, az, coef);
}
int polySAR::getGR2SLnum(double az, int* index) {
  return familyIndex("getGR2SLnum", "GR2SL", gr2sl, az, index);
}

int polySAR::EvaluateSL2THETA(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2THETA", "SL2THETA", sl2theta, false, rt, az, out);
}
double polySAR::EvaluateSL2THETA(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2THETA(rt, az, v); });
}
int polySAR::EvaluateSL2THETAinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2THETAinterp", "SL2THETA", sl2theta, true, rt, az, out);
}
double polySAR::EvaluateSL2THETAinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2THETAinterp(rt, az, v); });
}
int polySAR::getSL2THETApoly(double az, double* coef) {
  return familyCoefficients("getSL2THETApoly", "SL2THETA", sl2theta, az, coef);
}
int polySAR::getSL2THETAnum(double az, int* index) {
  return familyIndex("getSL2THETAnum", "SL2THETA", sl2theta, az, index);
}

int polySAR::EvaluateSL2PHI(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2PHI", "SL2PHI", sl2phi, false, rt, az, out);
}
double polySAR::EvaluateSL2PHI(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2PHI(rt, az, v); });
}
int polySAR::EvaluateSL2PHIinterp(double rt, double az, double* out) {
  return evaluateFamily("EvaluateSL2PHIinterp", "SL2PHI", sl2phi, true, rt, az, out);
}
double polySAR::EvaluateSL2PHIinterp(double rt, double az) {
  return valueOf([&](double* v) { return EvaluateSL2PHIinterp(rt, az, v); });
}
int polySAR::getSL2PHIpoly(double az, double* coef) {
  return familyCoefficients("getSL2PHIpoly", "SL2PHI", sl2phi, az, coef);
}
int polySAR::getSL2PHInum(double az, int* index) {
  return familyIndex("getSL2PHInum", "SL2PHI", sl2phi, az, index);
}
