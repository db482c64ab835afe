// Band-limited complex noise for the range lines: white in the bins of the
// line's own discrete Fourier transform that lie inside the band, zero in all
// others, so that a DFT over the whole line finds no power outside the band.
#pragma once

#include <complex>
#include <vector>

namespace synth {

using cplx = std::complex<double>;

// In-place radix-2 transform of a power-of-two length; sign -1 forward,
// +1 inverse (unnormalised).
void fft_pow2(std::vector<cplx>& a, int sign);

class BandLimitedNoise {
 public:
  // n samples at rate fs, two-sided bandwidth `band` centred on 0 Hz.
  BandLimitedNoise(int n, double fs, double band);
  int bins() const { return static_cast<int>(bins_.size()); }
  // Line from one independent complex normal value per in-band bin (the
  // callers draw them): each sample's real and imaginary parts have unit
  // variance.  `spectrum` holds bins() values, E|v|^2 = 2.
  void line(const std::vector<cplx>& spectrum, std::vector<cplx>* out);

 private:
  int n_ = 0;
  std::vector<int> bins_;     // in-band bin numbers, 0..n-1
  std::vector<cplx> chirp_;   // exp(i pi m^2 / n), m = 0..n-1
  std::vector<cplx> kernel_;  // transform of the conjugate chirp, length m_
  std::vector<cplx> work_;
};

}  // namespace synth
