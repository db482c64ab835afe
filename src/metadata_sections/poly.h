// A two-dimensional SAR polynomial in range time and azimuth time, valid
// around a reference point (one data set of a polynomial family).
//
// With r = rt - trg0_s and a = az - taz0_s:
//   value = c0 + c1 r + c2 a + c3 r a + c4 r^2 + c5 r^3 + c6 r^4
//
// Stored as the block "PolySAR/<name>" of channel 1 of the XML auxiliary
// document, fields "pol" (7 values), "trg0_s" and "taz0_s".
#pragma once

#include "metadata_framework/general_sar_base.h"

class poly : public GeneralSAR_Base {
 public:
  static constexpr int kCoefficients = 7;

  poly();

  // Value at range time rt and azimuth time az (seconds).  Returns 0.
  virtual int EvaluatePoly(double rt, double az, double* out) const;
  // Value of the coefficients c0..c6 at the offsets r and a from the
  // reference point.
  static double Value(const double* coef, double r, double a);

  // Copies the coefficients and reference times into `other`.  Returns 0.
  int clone(poly* other) const;

  // The block "PolySAR/<name>" of channel 1 in a document that the caller
  // has loaded, so that the many data sets of one file are read or written
  // without parsing the file again for each.  Read: true when every field
  // was found.  Write: replaces the block (not saved); 0, or 1 when a field
  // cannot be stored.
  bool readFromDocument(tessalxml& doc, const char* name);
  int writeToDocument(tessalxml& doc, const char* name);

  double pol[kCoefficients] = {};
  double trg0_s = 0.0;  // reference range time, s
  double taz0_s = 0.0;  // reference azimuth time, sec85

 protected:
  // Keys of one data set in the older parameter-file form.
  struct LegacyKeys {
    const char* coefficients;
    const char* azimuthTime;
    const char* rangeTime;
  };

  void refreshParameters() override;

  // The block "PolySAR/<name>" of channel 1 of `file`.  Write: 0 or the
  // writer's code; read: true when every field was found.
  int writeBlock(const char* file, const char* name);
  bool readBlock(const char* file, const char* name);

  // The block, or else (unless `keys` is null) the parameter-file section
  // `name` with the given keys; keys that are missing leave their values as
  // they are.  0, or 10 when neither the block nor any of the keys exists.
  int readBlockOrLegacy(const char* file, const char* name, const LegacyKeys* keys);
};
