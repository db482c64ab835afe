// Nine-point Lagrange interpolation of orbit samples.
#pragma once

// The value at time t of the Lagrange polynomial through nine samples (three
// components each) at the times T[0..8].  The times are normalised to
// (T - T[0]) / (T[1] - T[0]) and taken as equally spaced: the weights are the
// fixed node products of nine equally spaced nodes.  A time that falls on a
// node returns that node's sample unchanged.
void lagrange9(const double values[9][3], const double times[9], double t, double out[3]);

// lagrange9 for k output times t[0..k-1] into out[0..k-1].
void interp_orb_Lagrange(const double samples[9][3], const double times[9], double out[][3],
                         const double* t, int k);
