// Nine-point Lagrange interpolation of orbit samples.
#pragma once

// The value at time t of the Lagrange polynomial through nine samples (three
// components each) at the increasing times T[0..8].  The times are
// normalised to (T - T[0]) / (T[1] - T[0]) and the node weights are computed
// from the actual times, so nodes that are not exactly equally spaced are
// interpolated correctly (for equally spaced nodes the weights are the fixed
// products 40320, -5040, 1440, -720, 576, ...).  A time that falls on a node
// returns that node's sample unchanged.
void lagrange9(const double values[9][3], const double times[9], double t, double out[3]);

// lagrange9 for k output times t[0..k-1] into out[0..k-1].
void interp_orb_Lagrange(const double samples[9][3], const double times[9], double out[][3],
                         const double* t, int k);
