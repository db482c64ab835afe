// Polynomial evaluation.
#pragma once

// c[0] + c[1] x + ... + c[d] x^d by Horner's rule; 0 when d < 0.
double polval(const double* c, int d, double x);
