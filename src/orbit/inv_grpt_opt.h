// The inverse range-Doppler search on one orbit polynomial.
#pragma once

// The time at which the Earth-fixed point G is seen with the Doppler
// centroid fdc (Hz) from the orbit of the degree-4 polynomials cx, cy, cz
// (5 coefficients each, descending order, time counted from their start),
// searched in [0, span] by Newton steps from span / 2 on
//   f(t) = W.(G - P) + lambda fdc |G - P| / 2,  W = omega x G - (V + omega x P),
// the Doppler condition with the Earth's rotation (omega about z).  At most
// 8 steps; the search has converged when a step is at most 1e-8 s.  t
// receives the time from the polynomials' start, tau the two-way delay
// 2 |G - P| / c at the last evaluated time.  0; 12 when t leaves [0, span]
// or the search does not converge.
int inv_grpt_opt(const double G[3], const double* cx, const double* cy, const double* cz,
                 double span, double lambda, double fdc, double* t, double* tau);
