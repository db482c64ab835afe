// Helpers shared by the parts of the multilook processor.
#pragma once

#include <string>

namespace mlook_detail {

// The temporary power file of sub-swath k (0..4): "<output>SS<k+1>".
std::string TempName(const char* output, int k);

// Azimuth weight at v burst cycles from the burst centre: 1 up to w1, then
// a cosine roll-off over w2, 0 beyond; 0 everywhere when w1 < 0.  The cosine
// comes from a table of 101 values cos(k pi / 100) with linear
// interpolation.
float AzimuthWeight(double v, double w1, double w2);

}  // namespace mlook_detail

#include "multilook/mlook_parallel.h"
