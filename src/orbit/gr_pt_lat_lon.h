// The ground point of an azimuth time and range delay from five state
// vectors, with its geographic coordinates and the angles, speeds and
// Doppler rate seen there.
#pragma once

// Request and result of gr_pt_lat_lon.
struct gr_pt_record {
  // In.
  double positions[15];  // five Earth-fixed position vectors (m)
  double tw;             // time of the first of them (sec85)
  double dt;             // their spacing (s)
  double t;              // azimuth time of the request (sec85)
  double tau;            // two-way range delay (s)
  double fdc;            // Doppler centroid (Hz)
  double lambda;         // wavelength (m)
  double lookSign;       // +1 right of the track, -1 left
  double height;         // above the ellipsoid (m)
  // Out.
  double ground[3];       // the ground point (m)
  double lat, lon;        // degrees
  double heading;         // degrees, signed
  double incidence;       // degrees
  double look;            // degrees
  double groundSpeed;     // m/s
  double effectiveSpeed;  // m/s
  double dopplerRate;     // Hz/s
};

// Fits the five positions, evaluates position, velocity and acceleration at
// t and solves the ground point (gr_pt_lat_lon_s_osculated) on the
// ellipsoid with semi-axes a and b.  0; -1 when t lies more than half a
// spacing outside the five vectors; the fit's or gr_pt's code.
int gr_pt_lat_lon(gr_pt_record* record, double a, double b);

// The ground point and its outputs from the satellite position P, velocity V
// and acceleration A (Earth-fixed) at the request time.  0 or gr_pt's code.
int gr_pt_lat_lon_s_osculated(gr_pt_record* record, const double P[3], const double V[3],
                              const double A[3], double a, double b);
