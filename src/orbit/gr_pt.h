// The range-Doppler ground point: the point G on an ellipsoid with
// semi-axes a, b (equatorial, polar) that lies at slant range tau c / 2 from
// the satellite position P and is seen with the Doppler centroid fdc.
#pragma once

// G by Newton iteration on the three conditions (range sphere, Doppler with
// W = V - omega x G, ellipsoid) from the first guess of gr_pt0.  lookSign
// +1 selects the point right of the track, -1 the left one.  0; 1 or 2 from
// gr_pt0; 1 when the Newton system is singular.
int gr_pt(const double P[3], const double V[3], double tau, double fdc, double lambda, double omega,
          int lookSign, double a, double b, double G[3]);

// First guess: the Earth replaced by the sphere through the ellipsoid at P's
// geocentric latitude, the Doppler cone by the plane through P normal to
// V + omega x P; the line where range sphere and Doppler plane meet is cut
// with the sphere.  0; 1 when P and the velocity are parallel (degenerate);
// 2 when the line misses the sphere.
int gr_pt0(const double P[3], const double V[3], double tau, double fdc, double lambda,
           double omega, int lookSign, double a, double b, double G[3]);
