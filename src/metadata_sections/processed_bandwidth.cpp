#include "metadata_sections/processed_bandwidth.h"

#include <algorithm>

int GetProcessedBandwidth(const SamplingConstants_Obj& sampling, const SpectralWindows_Obj& windows,
                          double* azimuth, double* range) {
  *range = windows.RgMatchedFilterCoef == 0.0 ? sampling.Brg_hz
                                              : std::min(sampling.Brg_hz, windows.RgLookBandwidth);
  *azimuth = windows.AzMatchedFilterCoef == 0.0
                 ? sampling.Baz_hz
                 : std::min(sampling.Baz_hz, windows.AzLookBandwidth);
  return 0;
}
