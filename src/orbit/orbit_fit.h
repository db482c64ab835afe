// Polynomial fits of equally spaced orbit samples.
#pragma once

// Fits, for every axis a = 0, 1, 2, a polynomial with ncoef coefficients to
// pos[3i + a] at the times t0 + i dt (i = 0 .. m-1), stores coefficient k
// (ascending) at cpos[3k + a] and the sum of squared residuals at
// ssePos[a]; the same for vel into cvel and sseVel when vel is not null.
// cvel, ssePos and sseVel may be null when not wanted.  0 or the fit's code
// (7 when memory runs out).
int orbffit(const double* pos, const double* vel, double t0, double dt, int m, double* cpos,
            double* cvel, int ncoef, double* ssePos, double* sseVel);

// The polynomial of degree m-1 through the m samples (x, y, z per sample) at
// t0 + i dt, per axis into cx, cy, cz (m coefficients each) in descending
// order: element 0 multiplies t^(m-1), element m-1 is the constant term.
int orb_interp(double t0, const double* samples, double dt, double* cx, double* cy, double* cz,
               int m);
