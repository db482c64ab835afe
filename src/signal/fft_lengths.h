// Transform lengths and spectrum rotation.
#pragma once

#include <complex>

using fcomplex = std::complex<float>;

// The first of n, n + step, n + 2 step, ... whose only prime factors are 2,
// 3 and 5.  5625 is never returned: the search then goes on from 5626.
// 0 when n <= 0 or no such length fits in an int (as when n and step share
// a prime factor above 5).  A step below 1 counts as 1.
int genpow(int n, int step);

// Rotate each of `rows` rows of n elements (stored one after the other) in
// place.  fftshift moves element k to (k + n/2) mod n, bringing the zero
// frequency to the centre; ifftshift is its inverse.  For even n both swap
// the halves.
void fftshift(fcomplex* data, int n, int rows);
void ifftshift(fcomplex* data, int n, int rows);
