// Root of a function by bisection.
#pragma once

// Finds a root of func in [x1, x2] to within xacc by at most 200 halvings.
// 0 with the root in *root; 1 with the report "Root must be bracketed for
// bisection in rtbis" when func(x1) and func(x2) do not differ in sign, or
// "Too many bisections in rtbis" when 200 halvings do not reach xacc.
int rtbis(double (*func)(double), double x1, double x2, double xacc, double* root);
