#include "synth_spectrum.h"

#include <cmath>

namespace synth {

namespace {
// Plain complex product: std::complex's operator* guards against infinities
// and NaNs in a slow library call, which no finite noise value needs.
inline cplx mul(cplx a, cplx b) {
  return {a.real() * b.real() - a.imag() * b.imag(), a.real() * b.imag() + a.imag() * b.real()};
}
}  // namespace

void fft_pow2(std::vector<cplx>& a, int sign) {
  const size_t n = a.size();
  for (size_t i = 1, j = 0; i < n; ++i) {
    size_t bit = n >> 1;
    for (; j & bit; bit >>= 1) j ^= bit;
    j ^= bit;
    if (i < j) std::swap(a[i], a[j]);
  }
  // Twiddle factors of the largest stage; stage `len` takes every (n/len)-th.
  // Kept between calls: the lines of a sub-swath share one length.
  static std::vector<cplx> tables[2];
  std::vector<cplx>& tw = tables[sign > 0];
  if (tw.size() != n / 2) {
    tw.resize(n / 2);
    for (size_t k = 0; k < n / 2; ++k) {
      const double ang = sign * 2.0 * M_PI * static_cast<double>(k) / static_cast<double>(n);
      tw[k] = cplx(std::cos(ang), std::sin(ang));
    }
  }
  for (size_t len = 2; len <= n; len <<= 1) {
    const size_t stride = n / len;
    for (size_t i = 0; i < n; i += len)
      for (size_t k = 0; k < len / 2; ++k) {
        const cplx u = a[i + k], v = mul(a[i + k + len / 2], tw[k * stride]);
        a[i + k] = u + v;
        a[i + k + len / 2] = u - v;
      }
  }
}

// The inverse DFT of length n is computed as a convolution with a chirp
// (Bluestein): exp(2 pi i b m / n) = W(b) W(m) conj(W(m - b)), W(j) =
// exp(i pi j^2 / n), so x[m] = W(m) sum_b (X[b] W(b)) conj(W(m - b)).
BandLimitedNoise::BandLimitedNoise(int n, double fs, double band) : n_(n) {
  const int half = static_cast<int>(std::floor(n * band / (2.0 * fs)));
  for (int b = 0; b < n; ++b) {
    const int f = b < (n + 1) / 2 ? b : b - n;  // signed bin number
    if (std::abs(f) <= half) bins_.push_back(b);
  }
  chirp_.resize(n);
  for (int m = 0; m < n; ++m) {
    // m^2 mod 2n keeps the phase exact for long lines.
    const long long q = (static_cast<long long>(m) * m) % (2LL * n);
    const double ph = M_PI * static_cast<double>(q) / n;
    chirp_[m] = cplx(std::cos(ph), std::sin(ph));
  }
  size_t len = 1;
  while (len < static_cast<size_t>(2 * n - 1)) len <<= 1;
  kernel_.assign(len, cplx(0.0, 0.0));
  for (int j = 0; j < n; ++j) {
    kernel_[j] = std::conj(chirp_[j]);
    if (j > 0) kernel_[len - j] = std::conj(chirp_[j]);
  }
  fft_pow2(kernel_, -1);
  work_.resize(len);
}

void BandLimitedNoise::line(const std::vector<cplx>& spectrum, std::vector<cplx>* out) {
  std::fill(work_.begin(), work_.end(), cplx(0.0, 0.0));
  for (size_t i = 0; i < bins_.size(); ++i) work_[bins_[i]] = mul(spectrum[i], chirp_[bins_[i]]);
  fft_pow2(work_, -1);
  for (size_t i = 0; i < work_.size(); ++i) work_[i] = mul(work_[i], kernel_[i]);
  fft_pow2(work_, +1);
  // 1/len undoes the unnormalised pair of transforms; 1/sqrt(bins) gives
  // each sample the variance of one spectral value.
  const double norm = 1.0 / (static_cast<double>(work_.size()) * std::sqrt(bins_.size()));
  out->resize(n_);
  for (int m = 0; m < n_; ++m) (*out)[m] = mul(chirp_[m], work_[m]) * norm;
}

}  // namespace synth
