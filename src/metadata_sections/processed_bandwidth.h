// The bandwidths a focused data set actually holds.
#pragma once

#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/spectral_windows.h"

// Processed bandwidths, Hz: the system bandwidth ("Baz_hz", "Brg_hz") when
// the matched filter of the axis has no weighting (coefficient 0), otherwise
// the smaller of the system and the look bandwidth.  Returns 0.
int GetProcessedBandwidth(const SamplingConstants_Obj& sampling, const SpectralWindows_Obj& windows,
                          double* azimuth, double* range);
