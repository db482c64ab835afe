// The orbit section of the SAR metadata ("StateVectorData"): n state vectors
// equally spaced in time, modelled piecewise by degree-4 polynomials through
// five consecutive vectors (window k covers vectors k .. k+4), and the
// range-Doppler geometry between image coordinates (azimuth time t in sec85,
// two-way range delay tau in s, optional Doppler centroid fdc in Hz) and
// Earth-fixed points on the WGS84 ellipsoid.  Angles are degrees.
//
// Queries select the window first: the current one is kept while
// tw + 0.6 dt <= t <= tw + 3.4 dt, so sequential queries in either direction
// move to another window rarely.  Before the first or after the last vector
// the end windows answer up to half a spacing beyond their vectors; further
// out a query fails with -1.
#pragma once

#include "orbit/state_vector_store.h"

class geoCoords_Obj;
class GSRoi_Obj;
class ROI_Obj;
class polyDC;
class polyFR;
class polySL2GR;
class polyGR2SL;
class polySL2THETA;
class polySL2PHI;

class GeneralSAROrbit : public StateVectorStore {
 public:
  // Wavelength of the ASAR carrier (c / 5.331004416 GHz), m.
  static constexpr double kDefaultLambda = 0.05623564240544047;

  GeneralSAROrbit();
  explicit GeneralSAROrbit(double lambda);
  ~GeneralSAROrbit() override;

  void setLambda(double lambda) { lambda_ = lambda; }
  double lambda() const { return lambda_; }
  // True when the z velocity of vector 0 is positive.
  bool isAscending() const;

  // ---- State vectors -------------------------------------------------------
  // Releases the buffers, stores the grid and allocates n vectors (values
  // undefined until filled; then computeApproximateSV).  0; 1 "You must
  // provide at least 5 state vectors!" for n < 5, 1 for more than
  // kMaxStateVectors vectors or a spacing that is not positive; 7.
  int SVCreate(double t0, double dt, int n);
  // Allocates positions, velocities and the window polynomials for the
  // current n (nothing with n = 0).  0, 1 (n invalid), 7.
  int createBuffers() override;
  int destroyBuffers() override;
  // Fits the window polynomials, the five approximate vectors over the whole
  // orbit with their global polynomials, and the mean track.  Must run after
  // the vectors are filled.  0; 1 with fewer than five vectors, a spacing
  // that is not positive or vectors that are not finite; the fit's code.
  int computeApproximateSV();

  // The vectors covering a scene of `duration` s from the sec85 time tStart,
  // 5 s apart, from the DORIS orbit file `path`, then computeApproximateSV.
  // 0 or the first failing code (the orbit reader's 4, 9, 12, 13 ...).
  int GetStateVectorsENVI(const char* path, double tStart, double duration);

  // Block "StateVectorData" of channel 1, or else the parameter-file keys
  // "TimeFirst", "TimeDelta", "nStateVectors", "pos", "vel" of that section
  // (read as the state vector section does: 4 when one is missing, 1 for an
  // invalid count); then SVCreate (1 with fewer than five vectors) and
  // computeApproximateSV.  Write: 0 or the writer's code.
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Grid, wavelength, look sign and vectors into dst, then its fit.  0 (also
  // when this holds no vectors: dst is then emptied) or the first code.
  int clone(GeneralSAROrbit* dst) const;

  // Time of the first vector of the current window (0 before any query).
  double windowStart() const { return tw_; }

  // ---- Orbit evaluation ----------------------------------------------------
  // Position and velocity at t from the window polynomials.  0; 1 without
  // fitted vectors; -1 (out still filled, by extrapolation) when t lies more
  // than half a spacing outside the vectors.  The pointer forms return the
  // result buffer, filled with NaN on failure.
  int SVGetPos(double t, double out[3]);
  int SVGetVel(double t, double out[3]);
  const double* SVGetPos(double t);
  const double* SVGetVel(double t);

  // ---- Direct geometry -----------------------------------------------------
  // The ground point at (t, tau) seen with Doppler fdc (0 in the forms
  // without it), solved on the WGS84 ellipsoid from the current window
  // (gr_pt_lat_lon).  0; 1 without vectors; -1 when t lies more than half a
  // spacing outside the vectors; the ground-point solution's 1 or 2.
  int SVGetLatLon(double t, double tau, double* lat, double* lon);
  int SVGetLatLon(double t, double tau, double fdc, double* lat, double* lon);
  int SVGetAngles(double t, double tau, double* incidence, double* look);
  int SVGetAngles(double t, double tau, double fdc, double* incidence, double* look);
  // Doppler rate (Hz/s) and ground speed of the beam (m/s).
  int SVGetFR(double t, double tau, double* fr);
  int SVGetFR(double t, double tau, double fdc, double* fr);
  int SVGetSatSpeed(double t, double tau, double* v);
  int SVGetSatSpeed(double t, double tau, double fdc, double* v);
  // Value forms: NaN on failure, except SVGetSatSpeed: -1.0.
  double SVGetLat(double t, double tau, double fdc = 0.0);
  double SVGetLon(double t, double tau, double fdc = 0.0);
  double SVGetAnglesIncidence(double t, double tau, double fdc = 0.0);
  double SVGetAnglesLook(double t, double tau, double fdc = 0.0);
  double SVGetFR(double t, double tau, double fdc = 0.0);
  double SVGetSatSpeed(double t, double tau, double fdc = 0.0);

  // Earth-fixed ground point (m) of (t, tau, fdc) from the window's position
  // and velocity.  Codes as SVGetLatLon.
  int sat2earth(double t, double tau, double out[3]);
  int sat2earth(double t, double tau, double fdc, double out[3]);
  // From a given position and velocity, zero Doppler.  0 or gr_pt's code.
  int sat2earth(const double P[3], const double V[3], double tau, double out[3]);
  // The result buffer (NaN on failure) or one coordinate (NaN on failure).
  const double* sat2earth(double t, double tau);
  double sat2earthX(double t, double tau);
  double sat2earthY(double t, double tau);
  double sat2earthZ(double t, double tau);

  // Corners and centre of the region (range start r0 and length Lr, azimuth
  // start a0 and length La) with latitude, longitude, height 0, incidence
  // and look angle.  Ascending: "SouthWest" (a0, r0), "SouthEast" (a0, r0 +
  // Lr), "NorthWest" (a0 + La, r0), "NorthEast" (a0 + La, r0 + Lr);
  // descending: "NorthEast" (a0, r0), "NorthWest" (a0, r0 + Lr), "SouthEast"
  // (a0 + La, r0), "SouthWest" (a0 + La, r0 + Lr).  0; 1 for a region with
  // negative or non-finite extent; the direct geometry's code.
  int SVGetGeoCoords(geoCoords_Obj* gc, GSRoi_Obj* roi);

  // ---- Inverse geometry ----------------------------------------------------
  // Azimuth time and two-way delay at which the Earth-fixed point G is seen
  // with Doppler fdc (0 when omitted): the straight-line estimate, then a
  // Newton search on the window there (inv_grpt_opt).  0; 1 without vectors;
  // 12 when the search fails (the point is not seen within the orbit).  On
  // failure both results are -1.0.
  int earth2sat(const double G[3], double* t, double* tau, double fdc = 0.0);
  // The same with a first search on the global polynomials of the whole
  // orbit instead of the straight-line estimate.  That search may step
  // beyond the orbit and fail with 12 for points seen within about a second
  // of the first or last vector.
  int earth2satPrecise(const double G[3], double* t, double* tau, double fdc = 0.0);
  // The straight-line estimate only (mean track, then the chord of the
  // window there).  0; 1 without vectors.
  int earth2satLinear(const double G[3], double* t, double* tau, double fdc = 0.0);
  // tau or t of earth2sat (zero Doppler); -1.0 on failure.
  double earth2satRange(const double G[3]);
  double earth2satAzimuth(const double G[3]);
  double earth2satRange(double x, double y, double z);
  double earth2satAzimuth(double x, double y, double z);

  // Rotation of the track direction v: with s the sign of vx, a =
  // atan(-vy/vx), b = atan(-vz/(s sqrt(vx^2+vy^2))), R (row-major) = (cos a
  // cos b, sin a, sin b cos a; -sin a cos b, cos a, -sin a sin b; -sin b, 0,
  // cos b).  The along-track coordinate of a vector d is sum_i R[3i] d_i;
  // speed = s |v|.  0; 1 when vx is 0 or v is not finite.
  int computeRotationMatrix(const double v[3], double R[9], double* speed) const;

  // ---- Polynomials over a region -------------------------------------------
  // Sampled at the region's mid azimuth time, on range times r0 + i Lr/(m-1),
  // with the Doppler of polyDC there (zero Doppler when polyDC is null); the
  // fits use the range offset r - r0 and are stored with trg0_s = r0 and
  // taz0_s = the mid azimuth time, degree-2 terms in c0, c1, c4, degree-4
  // terms in c0, c1, c4, c5, c6.  0; 1 for a region without positive finite
  // range length or for a failing fit; the direct geometry's code.
  //
  // Doppler rate (Hz/s), degree 2: 10 points (SVGetFRpoly), 50 points
  // (SVGetFRpoly_v2).
  int SVGetFRpoly(ROI_Obj* roi, polyDC* dc, polyFR* fr);
  int SVGetFRpoly_v2(ROI_Obj* roi, polyDC* dc, polyFR* fr);
  // Ground range (m, accumulated point-to-point distance from the near-range
  // ground point) from range time, degree 2, 10 points; and back: the
  // two-way range time (s) from the ground range (trg0_s = 0), degree 2.
  int SVGetGroundToSlantPolys(ROI_Obj* roi, polyDC* dc, polySL2GR* sl2gr, polyGR2SL* gr2sl);
  // Incidence and look angle (degrees) from range time, degree 4, 10 points.
  int SVGetSlantToAnglesPolys(ROI_Obj* roi, polyDC* dc, polySL2THETA* theta, polySL2PHI* phi);

 private:
  // Selects the window for t (see the file comment).  0, or 1 without
  // fitted vectors.
  int updatePolys(double t);
  // 0 when t lies within half a spacing of the vectors, else -1.
  int checkSpan(double t) const;
  // Fills `record` with the window of t and solves it.
  int groundPoint(double t, double tau, double fdc, gr_pt_record* record);
  // The straight-line estimate of earth2satLinear, relative to vector k on
  // the track v with its rotation R and signed speed: time after vector k
  // and the delay.
  int linearEstimate(const double G[3], int k, const double v[3], const double R[9], double speed,
                     double fdc, double* t, double* tau) const;
  // The result buffer, filled with NaN when `code` is not 0.
  const double* resultOrNaN(int code);
  // m ground points of a region for the polynomial products: range offsets
  // from r0, at the mid azimuth time az.
  struct RegionSamples;
  int sampleRegion(const ROI_Obj* roi, const polyDC* dc, int m, RegionSamples* out);
  // Position or velocity at t with the window polynomials' value or slope.
  int evaluate(double t, double (*macro)(double, const double*, int), double out[3]);
  // The Doppler rate polynomial from m samples.
  int dopplerRatePoly(ROI_Obj* roi, polyDC* dc, int m, polyFR* fr);

  double lambda_ = kDefaultLambda;
  // Current window: its first vector, time and coefficient sets.
  const double* windowPositions_ = nullptr;
  const double* windowVelocities_ = nullptr;
  double tw_ = 0.0;
  const double* cx_ = nullptr;
  const double* cy_ = nullptr;
  const double* cz_ = nullptr;
  // Five vectors spanning the whole orbit and their polynomials (time from
  // tA0, descending order).
  double approxPositions_[15] = {};
  double approxVelocities_[15] = {};
  double tA0_ = 0.0;
  double dtA_ = 0.0;
  double globalPolys_[3][5] = {};
  // Mean track.
  double rotation_[9] = {};
  double trackSpeed_ = 0.0;
  // x, y, z coefficient sets of every window (5 each, descending order).
  static constexpr int kAxes = 3;
  vlr::CkBuffer<double> windowPolys_[kAxes];
  int windowCount_ = 0;
  bool fitted_ = false;
  double result_[3] = {};
};
