// The metadata section "StateVectorData": the satellite's orbit as n state
// vectors (Earth-fixed positions in m and velocities in m/s) equally spaced
// in time from t0, and one polynomial per component through all of them.
#pragma once

#include "orbit/state_vector_store.h"

// Most vectors one polynomial is fitted through.  The polynomial of degree
// n-1 is solved from its normal equations, whose rounding grows with the
// degree.  Measured on a circular orbit and on the vectors of a real
// precise orbit file, 5 s apart: within 1 mm up to 11 vectors, 3 mm at 13,
// about 0.15 m at 31 (the grid of a 100 s scene); beyond that the error no
// longer follows the count (a few mm to 0.5 m up to about 110 vectors) and
// from about 120 vectors on the fit is hundreds of kilometres off.  The
// solution also costs n^3 (a second at 500 vectors, minutes at 1500).
// Longer orbits are kept and copied as vectors, but not fitted.
constexpr int kMaxFitStateVectors = 31;

class SAROrbitStateVectors_Obj : public StateVectorStore {
 public:
  SAROrbitStateVectors_Obj();
  ~SAROrbitStateVectors_Obj() override;

  // Releases the buffers, stores the grid and allocates n vectors (values
  // undefined until a reader fills them).  0, 1 for a negative or too large
  // n, 7 when the allocation fails.
  int SVCreate(double t0, double dt, int n);
  // Allocates 3 n positions and velocities and the six coefficient sets for
  // the current n and registers the fields.  0, 1 (n invalid), 7.
  int createBuffers() override;
  int destroyBuffers() override;

  // Fits the polynomial of degree n-1 through all vectors, per component,
  // with time counted from t0.  0 or the fit's code; 1 without vectors or
  // with more than kMaxFitStateVectors of them.
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

  // Copies grid, vectors and look sign into dst and fits dst's polynomials
  // (not with more than kMaxFitStateVectors vectors: dst then holds them
  // unfitted, as readhdr leaves them, and a warning is reported); nothing
  // when this holds no vectors.  0 or the first failing code.
  int clone(SAROrbitStateVectors_Obj* dst) const;

  bool isFitted() const { return fitted_; }

 private:
  // Fills `record` for the first five vectors and solves it.
  int groundPoint(double t, double tau, double lambda, gr_pt_record* record);

  // x, y, z position and vx, vy, vz velocity polynomials, n coefficients
  // each in descending order.
  static constexpr int kPolys = 6;
  vlr::CkBuffer<double> polys_[kPolys];
  bool fitted_ = false;
};
