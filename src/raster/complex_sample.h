// Complex samples: real part followed by the imaginary part, as two 32-bit
// floats or two 64-bit doubles (the layout of std::complex), so that the
// cell types FLOAT_COMPLEX and DOUBLE_COMPLEX map onto them directly.
#pragma once

#include <complex>

using fcomplex = std::complex<float>;
using dcomplex = std::complex<double>;
