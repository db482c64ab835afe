// Interpolation kernels for fractional shifts of band-limited signals.
#pragma once

// Fills kernel[0 .. L-1] with the taps that estimate a signal at the
// fractional position s (in samples) from L samples around it: with
// c = (L - 1) / 2 (integer division), tap k weights the sample at offset
// k - c, and the estimate is at offset s.  The taps are the least-squares
// interpolator for a spectrum flat over the band B (a fraction of the
// sampling rate) with a weak guard term near the Nyquist frequency of width
// 1 - eps - B, normalised to sum to 1.
// 0; 1 when L is outside 1 .. 1024, an argument is not finite or the
// system is singular; 7 when memory runs out.
int glsF(float* kernel, int L, double s, double B, double eps);
