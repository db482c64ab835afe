// The polynomial families of an image: choice of the data set, interpolation
// in azimuth, stored forms and damaged headers.
#include <cmath>
#include <string>
#include <utility>

#include "metadata_fixture.h"
#include "metadata_sections/poly_sar.h"

namespace {

class PolySarTest : public MetadataTest {
 protected:
  // A header holding the "PolySAR" block with the given fields and blocks.
  std::string header(const std::string& body) {
    const std::string file = path("h" + std::to_string(++files_) + ".xml");
    spit(file,
         "<?xml version=\"1.0\"?>\n<TessalXmlDoc><NumberOfChannels>1</NumberOfChannels>"
         "<Description>d</Description><Channel Number=\"1\"><PolySAR>" +
             body + "</PolySAR></Channel></TessalXmlDoc>\n");
    return file;
  }
  static std::string dataSet(const std::string& name, const std::string& taz0) {
    std::string s = "<" + name + "><pol>";
    for (int k = 1; k <= 7; ++k) s += "<val N=\"" + std::to_string(k) + "\">1</val>";
    return s + "</pol><trg0_s>0</trg0_s><taz0_s>" + taz0 + "</taz0_s></" + name + ">";
  }
  static const char* sixCounts() {
    return "<nfr>0</nfr><nsl2gr>0</nsl2gr><ngr2sl>0</ngr2sl><nsl2theta>0</nsl2theta>"
           "<nsl2phi>0</nsl2phi>";
  }
  int files_ = 0;
};

TEST_F(PolySarTest, OneDataSetGivesTheSameValueEverywhere) {
  polySAR s;
  ASSERT_EQ(s.CreatePolys(1, 0), 0);
  s.dc[0].pol[0] = 7.0;
  s.dc[0].pol[1] = 2.0;  // per second of range
  s.dc[0].pol[2] = 0.5;  // per second of azimuth
  s.dc[0].trg0_s = 1.0;
  s.dc[0].taz0_s = 100.0;
  for (double az : {-1e9, 50.0, 100.0, 104.0, 1e9}) {
    const double expected = 7.0 + 2.0 * (3.0 - 1.0) + 0.5 * (az - 100.0);
    EXPECT_DOUBLE_EQ(s.EvaluateDC(3.0, az), expected) << az;
    EXPECT_DOUBLE_EQ(s.EvaluateDCinterp(3.0, az), expected) << az;
    int index = -1;
    EXPECT_EQ(s.getDCnum(az, &index), 0);
    EXPECT_EQ(index, 0);
  }
}

TEST_F(PolySarTest, TwoDataSetsInterpolateAndExtrapolate) {
  polySAR s;
  ASSERT_EQ(s.CreatePolys(2, 0), 0);
  s.dc[0].pol[0] = 100.0;
  s.dc[1].pol[0] = 200.0;
  s.dc[1].taz0_s = 10.0;
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 5.0), 150.0);
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 15.0), 250.0);
  EXPECT_EQ(s.EvaluateDCinterp(0.0, -5.0), 50.0);
  // The plain form takes the first data set not before az; the index the
  // one whose interval holds az.
  const double plain[][2] = {{-3, 100}, {0, 100}, {5, 200}, {10, 200}, {99, 200}};
  for (const auto& [az, value] : plain) EXPECT_EQ(s.EvaluateDC(0.0, az), value) << az;
  int index = -1;
  const std::pair<double, int> intervals[] = {{-5, 0}, {0, 0}, {5, 0}, {10, 1}, {15, 1}};
  for (const auto& [az, expected] : intervals) {
    EXPECT_EQ(s.getDCnum(az, &index), 0);
    EXPECT_EQ(index, expected) << az;
  }
  // The interpolated polynomial keeps the reference point of that data set:
  // with an azimuth slope of 1 the offset from it shows.
  s.dc[0].pol[2] = s.dc[1].pol[2] = 1.0;
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 5.0), 150.0 + 5.0);   // from set 0 at 0 s
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 15.0), 250.0 + 5.0);  // from set 1 at 10 s
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 10.0), 200.0);        // exactly at set 1
}

TEST_F(PolySarTest, ManyDataSetsAndCoincidentReferenceTimes) {
  polySAR s;
  ASSERT_EQ(s.CreatePolys(0, 3), 0);
  const double t[3] = {0.0, 10.0, 30.0};
  for (int i = 0; i < 3; ++i) {
    s.fr[i].taz0_s = t[i];
    for (int k = 0; k < 7; ++k) s.fr[i].pol[k] = (i + 1) * (k + 1) * (i == 2 ? 3.0 : 1.0);
  }
  double coef[7];
  ASSERT_EQ(s.getFRpoly(20.0, coef), 0);  // half way between sets 1 and 2
  for (int k = 0; k < 7; ++k) EXPECT_DOUBLE_EQ(coef[k], (2.0 * (k + 1) + 9.0 * (k + 1)) / 2) << k;
  ASSERT_EQ(s.getFRpoly(40.0, coef), 0);  // half a spacing after set 2
  for (int k = 0; k < 7; ++k) EXPECT_DOUBLE_EQ(coef[k], 9.0 * (k + 1) * 1.5 - 2.0 * (k + 1) * 0.5);
  int index = -1;
  s.getFRnum(20.0, &index);
  EXPECT_EQ(index, 1);
  s.getFRnum(30.0, &index);
  EXPECT_EQ(index, 2);

  // Two data sets at the same time give no slope: the nearer one is used.
  s.fr[1].taz0_s = 30.0;
  ASSERT_EQ(s.getFRpoly(50.0, coef), 0);
  EXPECT_EQ(coef[0], 9.0);
  s.fr[0].taz0_s = 30.0;
  s.fr[2].taz0_s = 30.0;
  ASSERT_EQ(s.getFRpoly(20.0, coef), 0);
  EXPECT_EQ(coef[0], 1.0);
  // An azimuth time that is not a number stays inside the family.
  EXPECT_TRUE(std::isnan(s.EvaluateFRinterp(0.0, NAN)));
  EXPECT_EQ(s.getFRnum(NAN, &index), 0);
  EXPECT_EQ(index, 0);
}

TEST_F(PolySarTest, EveryFamilyEvaluatesItsOwnDataSets) {
  polySAR s;
  double out = 0.0;
  EXPECT_EQ(s.EvaluateDC(0.0, 0.0, &out), 10);
  EXPECT_EQ(s.EvaluateSL2PHIinterp(0.0, 0.0, &out), 10);
  EXPECT_TRUE(std::isnan(s.EvaluateGR2SL(0.0, 0.0)));
  double coef[7] = {5, 5, 5, 5, 5, 5, 5};
  EXPECT_EQ(s.getSL2THETApoly(0.0, coef), 10);
  EXPECT_EQ(coef[0], 5.0);
  int index = 4;
  EXPECT_EQ(s.getSL2GRnum(0.0, &index), 10);

  ASSERT_EQ(s.CreatePolys(1, 1, 1, 1, 1, 1), 0);
  s.dc[0].pol[0] = 1, s.fr[0].pol[0] = 2, s.sl2gr[0].pol[0] = 3;
  s.gr2sl[0].pol[0] = 4, s.sl2theta[0].pol[0] = 5, s.sl2phi[0].pol[0] = 6;
  // Plain value, interpolated value and coefficient lookup of each family.
  struct Family {
    double (*plain)(polySAR&);
    double (*interp)(polySAR&);
    int (*coefs)(polySAR&, double*);
  };
  const Family families[] = {
      {[](polySAR& p) { return p.EvaluateDC(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateDCinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getDCpoly(0.0, c); }},
      {[](polySAR& p) { return p.EvaluateFR(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateFRinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getFRpoly(0.0, c); }},
      {[](polySAR& p) { return p.EvaluateSL2GR(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateSL2GRinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getSL2GRpoly(0.0, c); }},
      {[](polySAR& p) { return p.EvaluateGR2SL(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateGR2SLinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getGR2SLpoly(0.0, c); }},
      {[](polySAR& p) { return p.EvaluateSL2THETA(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateSL2THETAinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getSL2THETApoly(0.0, c); }},
      {[](polySAR& p) { return p.EvaluateSL2PHI(0.0, 0.0); },
       [](polySAR& p) { return p.EvaluateSL2PHIinterp(0.0, 0.0); },
       [](polySAR& p, double* c) { return p.getSL2PHIpoly(0.0, c); }},
  };
  double expected = 1.0;
  for (const Family& family : families) {
    EXPECT_EQ(family.plain(s), expected);
    EXPECT_EQ(family.interp(s), expected);
    EXPECT_EQ(family.coefs(s, coef), 0);
    EXPECT_EQ(coef[0], expected);
    expected += 1.0;
  }
}

// Rewritten with fewer data sets, a header keeps none of the old ones; a copy is independent of
// its source.
TEST_F(PolySarTest, RewritingLeavesNoStaleDataSetsAndCopiesAreIndependent) {
  const std::string file = path("h.xml");
  polySAR s;
  ASSERT_EQ(s.CreatePolys(3, 1, 1, 1, 1, 1, 2, 1), 0);
  s.dc[2].pol[0] = 5.0;
  s.dcExt[1].extPol[13] = 2.5;
  ASSERT_EQ(s.writehdr(file.c_str()), 0);
  EXPECT_EQ(s.writehdr(path("no/such/dir.xml").c_str()), 5);
  // A plain data set is too short for an extended one.
  EXPECT_EQ(extended_polyDC().readpar(file.c_str(), "DopplerCentroid-0"), 10);
  polySAR r;
  ASSERT_EQ(r.readhdr(file.c_str()), 0);
  EXPECT_EQ(r.dcExt[1].extPol[13], 2.5);
  polySAR c;
  ASSERT_EQ(r.clone(&c), 0);
  r.dc[2].pol[0] = -1.0;
  EXPECT_EQ(c.dc[2].pol[0], 5.0);
  EXPECT_EQ(c.nsl2phi, 1);

  s.CreatePolys(1, 0, 0, 0, 0, 1);
  s.sl2phi[0].pol[6] = 42.0;
  ASSERT_EQ(s.writehdr(file.c_str()), 0);
  EXPECT_EQ(occurrences(slurp(file), "<DopplerCentroid-"), 1);
  ASSERT_EQ(r.readhdr(file.c_str()), 0);
  EXPECT_EQ(r.dc.size(), 1u);
  EXPECT_EQ(r.dcExt.size(), 0u);
  EXPECT_EQ(r.sl2phi[0].pol[6], 42.0);
}

TEST_F(PolySarTest, ParameterFileForm) {
  const std::string file = path("legacy.hdr");
  spit(file,
       "[PolySAR]\nnDopCenDataSet = 2\nnFMRateDataSet = 1\nnSlant2Phi = 1\n"
       "[DopplerCentroid-0]\nDCpoly = {100 0 0 0 0 0 0}\nDCpoly_azt0 = 0\n"
       "[DopplerCentroid-1]\nDCpoly = {200 0 0 0 0 0 0}\nDCpoly_azt0 = 10\n"
       "[DopplerRate-0]\nFRpoly = {-2000 0 0 0 0 0 0}\n"
       "[SlantToPhi-0]\nSL2PHIpoly_rgt0 = 0.005\n");
  polySAR s;
  ASSERT_EQ(s.readhdr(file.c_str()), 0);
  EXPECT_EQ(s.ndc, 2);
  EXPECT_EQ(s.nsl2gr, 0);
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 2.5), 125.0);
  EXPECT_EQ(s.EvaluateFR(0.0, 0.0), -2000.0);
  EXPECT_EQ(s.sl2phi[0].trg0_s, 0.005);

  // All counts absent or zero: no polynomials in the file.
  const std::string none = path("none.hdr");
  spit(none, "[PolySAR]\nnDopCenDataSet = 0\n[Other]\nnFMRateDataSet = 4\n");
  EXPECT_EQ(s.readhdr(none.c_str()), 1);
  EXPECT_TRUE(s.dc.empty());
  EXPECT_EQ(s.ndc, 0);
}

// Damaged headers fail with 1 (counts) or 10 (missing data set) and leave the
// families empty and consistent with the counts; nothing is allocated for
// counts the file cannot back.
TEST_F(PolySarTest, DamagedHeaders) {
  const std::string six = sixCounts();
  const std::string dc0 = dataSet("DopplerCentroid-0", "5");
  struct Case {
    const char* what;
    std::string body;
    int code;
  };
  const Case cases[] = {
      {"1e9 data sets", "<ndc>1000000000</ndc>" + six + dc0, 1},
      {"count beyond int", "<ndc>99999999999999999999</ndc>" + six, 1},
      {"negative count", "<ndc>-2</ndc>" + six, 1},
      {"extended count over its limit", "<ndc>1</ndc>" + six + "<ndcExt>1001</ndcExt>" + dc0, 1},
      {"negative extended count", "<ndc>1</ndc>" + six + "<nfrExt>-1</nfrExt>" + dc0, 1},
      {"fewer blocks than announced", "<ndc>3</ndc>" + six + dc0, 10},
      {"extended block missing", "<ndc>1</ndc>" + six + "<nfrExt>1</nfrExt>" + dc0, 10},
      {"counts block incomplete", "<ndc>1</ndc><nfr>0</nfr>" + dc0, 1},
      {"reference time not a number", "<ndc>1</ndc>" + six + dataSet("DopplerCentroid-0", "nan"),
       1},
  };
  for (const Case& c : cases) {
    polySAR s;
    ASSERT_EQ(s.CreatePolys(2, 2), 0);
    EXPECT_EQ(s.readhdr(header(c.body).c_str()), c.code) << c.what;
    EXPECT_TRUE(s.dc.empty() && s.fr.empty() && s.dcExt.empty() && s.frExt.empty()) << c.what;
    EXPECT_EQ(s.ndc + s.nfr + s.ndcExt + s.nfrExt, 0) << c.what;
  }

  polySAR s;
  EXPECT_EQ(s.readhdr(path("absent.xml").c_str()), 1);
  const std::pair<const char*, int> legacy[] = {
      {"[PolySAR]\nnDopCenDataSet = 1000000000\n", 1},
      {"[PolySAR]\nnDopCenDataSet = many\nnFMRateDataSet = 1\n", 1},
      {"[PolySAR]\nnSlant2Theta = -1\nnFMRateDataSet = 1\n", 1},
      {"[PolySAR]\nnSlant2Ground = 2\n[SlantToGround-0]\nSL2GRpoly_azt0 = 1\n", 10},
  };
  int n = 0;
  for (const auto& [text, code] : legacy) {
    const std::string file = path("legacy" + std::to_string(++n) + ".hdr");
    spit(file, text);
    EXPECT_EQ(s.readhdr(file.c_str()), code) << text;
    EXPECT_TRUE(s.sl2gr.empty() && s.dc.empty()) << text;
  }

  // Invalid counts given by a caller change nothing.
  ASSERT_EQ(s.CreatePolys(1, 1), 0);
  EXPECT_EQ(s.CreatePolys(-1, 0), 1);
  EXPECT_EQ(s.CreatePolys(1, 1, 1, 1, 1, polySAR::kMaxDataSets + 1), 1);
  EXPECT_EQ(s.dc.size(), 1u);
  EXPECT_EQ(s.nfr, 1);
}

// Data sets stored out of azimuth order are put in order, so that the choice
// by azimuth time still finds the right one.
TEST_F(PolySarTest, OutOfOrderDataSetsAreSorted) {
  std::string body = "<ndc>3</ndc>" + std::string(sixCounts());
  const char* times[] = {"20", "0", "10"};
  for (int i = 0; i < 3; ++i) {
    std::string set = dataSet("DopplerCentroid-" + std::to_string(i), times[i]);
    set.replace(set.find(">1<"), 3, ">" + std::string(times[i]) + "<");  // c0 = its time
    body += set;
  }
  polySAR s;
  ASSERT_EQ(s.readhdr(header(body).c_str()), 0);
  EXPECT_EQ(s.dc[0].taz0_s, 0.0);
  EXPECT_EQ(s.dc[2].taz0_s, 20.0);
  EXPECT_EQ(s.EvaluateDC(0.0, 5.0), 10.0 + (5.0 - 10.0));  // c0 + c2 a, set at 10 s
  EXPECT_EQ(s.EvaluateDCinterp(0.0, 15.0), 15.0 + 1.0 * 5.0);
}

}  // namespace
