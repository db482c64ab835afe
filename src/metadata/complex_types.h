// Complex samples of the processing libraries: real part followed by the
// imaginary part, as two 32-bit floats or two 64-bit doubles.  std::complex
// has exactly that layout, so buffers can be handed to the raster writers and
// to the DFT engine as they are.
#pragma once

#include <complex>

using fcomplex = std::complex<float>;
using dcomplex = std::complex<double>;
