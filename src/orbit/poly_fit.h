// Least-squares polynomial fits with ascending coefficients: coefficient k
// multiplies x^k.
#pragma once

// Degree-d least-squares polynomial through the m points (x, y) from the
// normal equations; coef receives d + 1 coefficients.  0; 1 when d < 0,
// m < d + 1 or the normal matrix is singular; 7 when memory runs out.
int dpolfit(const double* x, const double* y, int m, double* coef, int d);

// dpolfit on copies of x and y.
int polfit(const double* x, const double* y, int m, double* coef, int d);

// dpolfit with degree ncoef - 1; when sse is not null it receives the sum of
// the squared residuals.
int gen_polfit(int ncoef, const double* x, const double* y, int m, double* coef, double* sse);
