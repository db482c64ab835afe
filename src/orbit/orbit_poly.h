// Evaluation of orbit polynomials stored in descending order: element 0
// multiplies t^(m-1), element m-1 is the constant term.
#pragma once

// Value, first and second derivative of the polynomial c (m coefficients).
double POSMACRO(double t, const double* c, int m);
double VELMACRO(double t, const double* c, int m);
double ACCMACRO(double t, const double* c, int m);

// Value, first and second derivative of three degree-4 polynomials (5
// coefficients each) at t.
void POSVELACC_5(double t, const double* cx, const double* cy, const double* cz, double pos[3],
                 double vel[3], double acc[3]);
