// Linear systems by Gauss-Jordan elimination.
#pragma once

// Solves a * x = b in place by Gauss-Jordan elimination with full pivoting:
// a (n x n, row-major) is replaced by its inverse and b by the solution.
// 0, or 1 "Singular matrix in ldgaussj" when a pivot is zero.
int ldgaussj(double* a, int n, double* b);
