// The polynomial families of a SAR image, stored as the section "PolySAR".
//
// Each family is a vector of data sets in ascending order of their reference
// azimuth time.  The plain evaluation (EvaluateDC ...) uses one data set, the
// first whose reference time is not before the azimuth time (the last when
// there is none); the
// interpolating forms (EvaluateDCinterp ...) interpolate the coefficients
// linearly in azimuth between neighbouring data sets (see poly_selection.h).
//
// Stored form: the block "PolySAR" of channel 1 holds the eight counts, and
// every data set is the block "PolySAR/<family>-<index>" (index from 0), for
// example "PolySAR/DopplerCentroid-0".  Older header files hold the counts in
// the parameter-file section "PolySAR" ("nDopCenDataSet", "nFMRateDataSet",
// "nSlant2Ground", "nGround2Slant", "nSlant2Theta", "nSlant2Phi") and each
// data set in a parameter-file section of its own name.
#pragma once

#include <string>
#include <vector>

#include "metadata_framework/general_sar_base.h"
#include "metadata_sections/poly_families.h"

class polySAR : public GeneralSAR_Base {
 public:
  // Largest number of data sets of one family that a header may announce.
  static constexpr int kMaxDataSets = 10000;
  // Largest number of data sets of an extended family.
  static constexpr int kMaxExtendedDataSets = 1000;

  polySAR();

  // Store the counts (the shorter forms set the others to 0) and create that
  // many default data sets per family, replacing the previous ones.  0, 1
  // when a count is negative or above its limit (nothing changes), 7 when
  // memory runs out (the families are then empty).
  int CreatePolys(int ndc, int nfr);
  int CreatePolys(int ndc, int nfr, int nsl2gr, int ngr2sl, int nsl2theta, int nsl2phi);
  int CreatePolys(int ndc, int nfr, int nsl2gr, int ngr2sl, int nsl2theta, int nsl2phi, int ndcExt,
                  int nfrExt);
  // Frees every data set and sets the counts to 0.  Returns 0.
  int DestroyPolys();

  // Value of a family at range time rt and azimuth time az with the data set
  // selected for az.  0, or 10 when the family is empty ("NO DC poly
  // available" ...).  The double forms return the value, or NaN when the
  // family is empty.
  int EvaluateDC(double rt, double az, double* out);
  int EvaluateFR(double rt, double az, double* out);
  int EvaluateSL2GR(double rt, double az, double* out);
  int EvaluateGR2SL(double rt, double az, double* out);
  int EvaluateSL2THETA(double rt, double az, double* out);
  int EvaluateSL2PHI(double rt, double az, double* out);
  double EvaluateDC(double rt, double az);
  double EvaluateFR(double rt, double az);
  double EvaluateSL2GR(double rt, double az);
  double EvaluateGR2SL(double rt, double az);
  double EvaluateSL2THETA(double rt, double az);
  double EvaluateSL2PHI(double rt, double az);

  // The same with coefficients interpolated at az and the reference times of
  // the data set that get*num gives for az.
  int EvaluateDCinterp(double rt, double az, double* out);
  int EvaluateFRinterp(double rt, double az, double* out);
  int EvaluateSL2GRinterp(double rt, double az, double* out);
  int EvaluateGR2SLinterp(double rt, double az, double* out);
  int EvaluateSL2THETAinterp(double rt, double az, double* out);
  int EvaluateSL2PHIinterp(double rt, double az, double* out);
  double EvaluateDCinterp(double rt, double az);
  double EvaluateFRinterp(double rt, double az);
  double EvaluateSL2GRinterp(double rt, double az);
  double EvaluateGR2SLinterp(double rt, double az);
  double EvaluateSL2THETAinterp(double rt, double az);
  double EvaluateSL2PHIinterp(double rt, double az);

  // The 7 coefficients interpolated at az.  0, or 10 when the family is
  // empty (coef unchanged).
  int getDCpoly(double az, double* coef);
  int getFRpoly(double az, double* coef);
  int getSL2GRpoly(double az, double* coef);
  int getGR2SLpoly(double az, double* coef);
  int getSL2THETApoly(double az, double* coef);
  int getSL2PHIpoly(double az, double* coef);

  // The data set around az: 0 when az is not after the first reference time,
  // the last when az is not before the last one, else i with
  // t(i) < az <= t(i+1).  0, or 10 when the family is empty (index
  // unchanged).
  int getDCnum(double az, int* index);
  int getFRnum(double az, int* index);
  int getSL2GRnum(double az, int* index);
  int getGR2SLnum(double az, int* index);
  int getSL2THETAnum(double az, int* index);
  int getSL2PHInum(double az, int* index);

  // Reads the section from the header `file` (XML block, or else the older
  // parameter-file form).  0; 1 when the counts are missing, all zero in the
  // older form, out of range, or a reference time is not a number; the code
  // of the first data set that cannot be read (10 when it is missing).  On
  // failure the families are left empty.  Data sets stored out of azimuth
  // order are sorted (with a warning).
  int readhdr(const char* file) override;
  // Writes the counts and every data set into `file`.  0, or the code of the
  // first write that failed (the remaining data sets are still written).
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;

  // Copies the counts and every data set into `other`.  0, or the code of
  // CreatePolys.
  int clone(polySAR* other) const;

  // Name of data set `index` of a family: "<family>-<index>".
  static std::string DataSetName(const char* family, int index);

  int ndc = 0;
  int nfr = 0;
  int nsl2gr = 0;
  int ngr2sl = 0;
  int nsl2theta = 0;
  int nsl2phi = 0;
  int ndcExt = 0;
  int nfrExt = 0;

  std::vector<polyDC> dc;
  std::vector<polyFR> fr;
  std::vector<polySL2GR> sl2gr;
  std::vector<polyGR2SL> gr2sl;
  std::vector<polySL2THETA> sl2theta;
  std::vector<polySL2PHI> sl2phi;
  std::vector<extended_polyDC> dcExt;
  std::vector<extended_polyFR> frExt;

 protected:
  void refreshParameters() override;
};
