// The metadata section "StateVectorData": the satellite's orbit as n state
// vectors (Earth-fixed positions in m and velocities in m/s) equally spaced
// in time from t0, and one polynomial per component through all of them.
#pragma once

#include "metadata/general_sar_base.h"
#include "runtime/call_scope.h"

struct gr_pt_record;

// Largest number of vectors a header may declare.
constexpr int kMaxStateVectors = 100000;

class SAROrbitStateVectors_Obj : public GeneralSAR_Base {
 public:
  SAROrbitStateVectors_Obj();
  ~SAROrbitStateVectors_Obj() override;
  // The buffers are owned: copy with clone().
  SAROrbitStateVectors_Obj(const SAROrbitStateVectors_Obj&) = delete;
  SAROrbitStateVectors_Obj& operator=(const SAROrbitStateVectors_Obj&) = delete;

  // Releases the buffers, stores the grid and allocates n vectors (values
  // undefined until a reader fills them).  0, 1 for a negative or too large
  // n, 7 when the allocation fails.
  int SVCreate(double t0, double dt, int n);
  // Releases the buffers.  Returns 0.
  int SVDestroy();

  // Allocates 3 n positions and velocities and the six coefficient sets for
  // the current n and registers the fields.  0, 1 (n invalid), 7.
  int createBuffers() override;
  int destroyBuffers() override;

  // Fits the polynomial of degree n-1 through all vectors, per component,
  // with time counted from t0.  0 or the fit's code (1 without vectors).
  int SVPolyCompute();
  // Position and velocity at sec85 time t from the polynomials.  0, or 1
  // when the polynomials have not been computed.
  int SVGetPos(double t, double out[3]);
  int SVGetVel(double t, double out[3]);

  // Latitude and longitude, or incidence and look angle (degrees), of the
  // zero-Doppler ground point at azimuth time t and two-way range delay tau
  // for the wavelength lambda, from the first five vectors.  0; -1 when t
  // lies outside [t0 - dt/2, t0 + 4.5 dt]; 1 with fewer than five vectors;
  // the ground-point solution's code when it fails.
  int SVGetLatLon(double t, double tau, double lambda, double* lat, double* lon);
  int SVGetAngles(double t, double tau, double lambda, double* incidence, double* look);

  // The section in channel 1 of the XML auxiliary file.  Read falls back on
  // the parameter-file keys "TimeFirst", "TimeDelta", "nStateVectors",
  // "pos" and "vel" of section "StateVectorData": 4 when one of them is
  // missing or short, 1 for an invalid count, 7.  Write: 0 or the writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;

  // Copies grid, vectors and look sign into dst and fits dst's polynomials;
  // nothing when this holds no vectors.  0 or the first failing code.
  int clone(SAROrbitStateVectors_Obj* dst) const;

  double* positions() { return positions_.data(); }
  const double* positions() const { return positions_.data(); }
  double* velocities() { return velocities_.data(); }
  const double* velocities() const { return velocities_.data(); }
  double t0() const { return t0_; }
  double dt() const { return dt_; }
  int n() const { return n_; }
  int lookSign() const { return lookSign_; }
  // +1 or -1: the side of the radar beam (any other value counts as +1).
  void setLookSign(int sign) { lookSign_ = sign < 0 ? -1 : 1; }
  bool isFitted() const { return fitted_; }

 protected:
  void refreshParameters() override;

 private:
  // Fills `record` for the first five vectors and solves it.
  int groundPoint(double t, double tau, double lambda, gr_pt_record* record);

  vlr::CkBuffer<double> positions_;
  vlr::CkBuffer<double> velocities_;
  // x, y, z position and vx, vy, vz velocity polynomials, n coefficients
  // each in descending order.
  vlr::CkBuffer<double> polys_[6];
  double t0_ = -999.0;
  double dt_ = -999.0;
  int n_ = -999;
  int lookSign_ = 1;
  bool fitted_ = false;
};
