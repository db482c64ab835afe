// Single polynomials: evaluation term by term, and the parameter-file forms
// of every family (the stored blocks are covered with the family set).
#include <cmath>
#include <vector>

#include "metadata_fixture.h"
#include "metadata_sections/poly_families.h"

namespace {

class PolyTest : public MetadataTest {};

// With r = 2 and a = 3, each coefficient alone must give its own monomial.
TEST_F(PolyTest, EachCoefficientWeighsItsOwnTerm) {
  // 1, r, a, r a, r^2, r^3, r^4
  const double monomials[7] = {1, 2, 3, 6, 4, 8, 16};
  poly p;
  p.trg0_s = 1.0;
  p.taz0_s = 10.0;
  for (int k = 0; k < 7; ++k) {
    for (double& c : p.pol) c = 0.0;
    p.pol[k] = 1.0;
    double v = -1.0;
    EXPECT_EQ(p.EvaluatePoly(3.0, 13.0, &v), 0);
    EXPECT_EQ(v, monomials[k]) << "c" << k;
  }
  // 1, r, a, r a, a^2, r^2, r a^2, r^2 a, r^3, r^4, r^5, a^3, a^4, a^5
  const double extended[14] = {1, 2, 3, 6, 9, 4, 18, 12, 8, 16, 32, 27, 81, 243};
  extended_poly e;
  e.trg0_s = -1.0;
  e.taz0_s = 0.5;
  for (int k = 0; k < 14; ++k) {
    for (double& c : e.extPol) c = 0.0;
    e.extPol[k] = 1.0;
    double v = -1.0;
    const poly& base = e;  // evaluated through the base class as well
    EXPECT_EQ(base.EvaluatePoly(1.0, 3.5, &v), 0);
    EXPECT_EQ(v, extended[k]) << "c" << k;
  }
}

TEST_F(PolyTest, ParameterFileForms) {
  const std::string file = path("legacy.hdr");
  spit(file,
       "[DopplerCentroid-0]\nDCpoly = {1 2 3 4 5 6 7}\nDCpoly_azt0 = 1\nDCpoly_rgt0 = 0.5\n"
       "[DopplerRate-0]\nFRpoly = {2 2 3 4 5 6 7}\nFRpoly_azt0 = 2\nFRPoly_rgt0 = 1.5\n"
       "[SlantToGround-0]\nSL2GRpoly = {3 2 3 4 5 6 7}\nSL2GRpoly_azt0 = 3\n"
       "[GroundToSlant-0]\nGR2SLpoly = {4 2 3 4 5 6 7}\nGR2SLpoly_rgt0 = 3.5\n"
       "[SlantToTheta-0]\nSL2THETApoly = {5 2 3 4 5 6 7}\nSL2THETApoly_azt0 = 5\n"
       "SL2THETApoly_rgt0 = 4.5\n"
       "[SlantToPhi-0]\nSL2PHIpoly_rgt0 = 5.5\n"
       "[Old]\nDopCenPol_nCoeff = 5\nDopCenRangeCoeffs = {10 11 12 13 14}\n"
       "DopCenRgRefTimes = 0.0051\nDopCenAzRefSec85Times = 6.5e8\n"
       "AzimuthCoeff = {20 21 22 23 24}\nDopRatRangeCoeff = {30 31 32 33 34 35 36}\n"
       "[Old7]\nDopCenPol_nCoeff = 7\nDopCenRangeCoeffs = {40 41 42 43 44 45 46}\n"
       "[Old6]\nDopCenPol_nCoeff = 6\nDopCenRangeCoeffs = {50 51 52 53 54 55}\n");
  // Family f (from 1) stores c0 = f, "..._azt0" = f and "..._rgt0" = f - 0.5;
  // keys that are missing keep their defaults (0).
  polyDC dc;
  polyFR fr;
  polySL2GR sl2gr;
  polyGR2SL gr2sl;
  polySL2THETA theta;
  polySL2PHI phi;
  ASSERT_EQ(dc.readpar(file.c_str(), "DopplerCentroid-0"), 0);
  ASSERT_EQ(fr.readpar(file.c_str(), "DopplerRate-0"), 0);
  ASSERT_EQ(sl2gr.readpar(file.c_str(), "SlantToGround-0"), 0);
  ASSERT_EQ(gr2sl.readpar(file.c_str(), "GroundToSlant-0"), 0);
  ASSERT_EQ(theta.readpar(file.c_str(), "SlantToTheta-0"), 0);
  ASSERT_EQ(phi.readpar(file.c_str(), "SlantToPhi-0"), 0);
  const poly* read[] = {&dc, &fr, &sl2gr, &gr2sl, &theta, &phi};
  const double c0[] = {1, 2, 3, 4, 5, 0}, az[] = {1, 2, 3, 0, 5, 0},
               rg[] = {.5, 1.5, 0, 3.5, 4.5, 5.5};
  for (int f = 0; f < 6; ++f) {
    EXPECT_EQ(read[f]->pol[0], c0[f]) << f;
    EXPECT_EQ(read[f]->pol[6], f == 5 ? 0.0 : 7.0) << f;
    EXPECT_EQ(read[f]->taz0_s, az[f]) << f;
    EXPECT_EQ(read[f]->trg0_s, rg[f]) << f;
  }
  // A section that holds none of the family's keys is a missing data set.
  EXPECT_EQ(polySL2PHI().readpar(file.c_str(), "SlantToTheta-0"), 10);
  EXPECT_EQ(extended_polyDC().readpar(file.c_str(), "DopplerCentroid-0"), 10);

  // Oldest forms: five range coefficients are c0 c1 c4 c5 c6, three of the
  // rate c0 c1 c3; other counts are unsupported and leave the data set as it
  // was.
  auto expectPol = [](const poly& p, std::vector<double> c, const char* what) {
    for (int k = 0; k < 7; ++k) EXPECT_EQ(p.pol[k], c[k]) << what << " c" << k;
  };
  polyDC old;
  ASSERT_EQ(old.readparold(file.c_str(), "Old"), 0);
  expectPol(old, {10, 11, 0, 0, 12, 13, 14}, "dc5");
  EXPECT_EQ(old.trg0_s, 0.0051);
  EXPECT_EQ(old.taz0_s, 6.5e8);
  ASSERT_EQ(old.readparold(file.c_str(), "Old7"), 0);
  ASSERT_EQ(old.readparold(file.c_str(), "Old6"), 0);
  expectPol(old, {40, 41, 42, 43, 44, 45, 46}, "dc7");
  EXPECT_EQ(old.readparold(file.c_str(), "DopplerCentroid-0"), 10);

  polyFR ofr;
  ASSERT_EQ(ofr.readparold(file.c_str(), "Old", 5), 0);
  expectPol(ofr, {20, 21, 0, 0, 22, 23, 24}, "fr5");
  polyFR ofr3;
  ASSERT_EQ(ofr3.readparold(file.c_str(), "Old", 3), 0);
  expectPol(ofr3, {20, 21, 0, 22, 0, 0, 0}, "fr3");
  ASSERT_EQ(ofr3.readparold(file.c_str(), "Old", 7), 0);
  ASSERT_EQ(ofr3.readparold(file.c_str(), "Old", 4), 0);
  expectPol(ofr3, {30, 31, 32, 33, 34, 35, 36}, "fr7");
  EXPECT_EQ(ofr3.readparold(file.c_str(), "Old7", 5), 10);
}

}  // namespace
