// Range looks: the look count and look frequencies matched to the ground
// resolution, and the range grid that every sub-swath is processed on.
#include <cmath>

#include "multilook/mlook.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/light_speed.h"
#include "signal/fft_lengths.h"

namespace {

constexpr const char* kModule = "mlook_v2";
constexpr double kDegToRad = 3.14159265358979323846 / 180.0;
// Fraction of the range bandwidth that is processed.
constexpr double kProcessedFraction = 0.8;
// Looks per processed bandwidth over the resolution bandwidth.
constexpr double kLookOversampling = 1.3;
// Longest line the range grid accepts, in samples.
constexpr int kMaxSamples = 1 << 20;
// Range offsets within this part of a sample of a whole count are whole.
constexpr double kWholeSampleTolerance = 1e-6;

}  // namespace

int mlook::fclook() {
  VLR_SCOPE("fclook", kModule);
  if (conf_->GrResolution <= 0)
    VLR_FAIL("Ground resolution is not positive", vlr::kLibInconsistent);
  int looksPerSwath[kMlookSwaths] = {};
  looks_ = 0;
  for (int i = 0; i < kMlookSwaths; ++i) {
    const mlook_swath_par& s = swathPar[i];
    if (!(s.bandwidth > 0.0) || !std::isfinite(s.bandwidth) || !(s.incidence > 0.0) ||
        !(s.incidence < 90.0)) {
      VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: range bandwidth %g Hz or incidence %g deg "
                                   "out of range",
                                   i + 1, s.bandwidth, s.incidence)
                   .c_str(),
               vlr::kLibInconsistent);
    }
    const double processed = kProcessedFraction * s.bandwidth;
    // The bandwidth that gives the requested ground resolution.
    const double resolution =
        kHalfSpeedOfLight / (std::sin(s.incidence * kDegToRad) * conf_->GrResolution);
    if (processed < resolution) {
      looksPerSwath[i] = 1;
      swath_[i].lookBandwidth = processed;
    } else {
      const double m = std::ceil(kLookOversampling * processed / resolution);
      if (m > kMaxLooks + 1) {
        looksPerSwath[i] = kMaxLooks + 2;
      } else {
        const int whole = static_cast<int>(m);
        looksPerSwath[i] = whole % 2 == 1 ? whole : whole - 1;
      }
      swath_[i].lookBandwidth = resolution;
    }
    if (looksPerSwath[i] > looks_) looks_ = looksPerSwath[i];
  }
  if (looks_ > kMaxLooks) {
    VLR_FAIL(
        "Number of estimated range looks must be lower than 15, try changing Ground Resolution",
        vlr::kLibInconsistent);
  }
  // Centres 0, +1, -1, +2, -2, ... steps apart, spanning the whole band.
  for (int i = 0; i < kMlookSwaths; ++i) {
    const double b = swath_[i].lookBandwidth;
    const double d = looks_ > 1 ? (looks_ - swathPar[i].bandwidth / b) / (looks_ - 1) : 0.0;
    swath_[i].lookFrequency[0] = 0.0;
    for (int j = 1; 2 * j - 1 < looks_; ++j) {
      swath_[i].lookFrequency[2 * j - 1] = j * (1.0 - d) * b;
      swath_[i].lookFrequency[2 * j] = -j * (1.0 - d) * b;
    }
  }
  return 0;
}

// The range grid of the output: sample spacing D / fs for every sub-swath.
// Each sub-swath drops the few first samples that put it off the grid of
// sub-swath 1 and is transformed with a length that is a multiple of D, so
// that its looks are exactly D times shorter.
int mlook::setuprange() {
  VLR_SCOPE("setuprange", kModule);
  decimation_ = 0;
  for (int i = 0; i < kMlookSwaths; ++i) {
    const int d = static_cast<int>(fs / swath_[i].lookBandwidth);
    if (decimation_ == 0 || d < decimation_) decimation_ = d;
  }
  if (decimation_ < 1) decimation_ = 1;
  const int D = decimation_;
  const double tau1 = swathPar[0].firstRangeTime;
  int previousOffset = -1;
  for (int i = 0; i < kMlookSwaths; ++i) {
    const mlook_swath_par& s = swathPar[i];
    if (s.samples < 1 || s.samples > kMaxSamples)
      VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: %d samples per line", i + 1, s.samples).c_str(),
               vlr::kLibInconsistent);
    const double shift = (s.firstRangeTime - tau1) * fs + kWholeSampleTolerance;
    if (!(shift >= 0.0) || shift > 64.0 * kMaxSamples)
      VLR_FAIL(
          NVLR_UTILITY_Format("Sub-swath %d starts before sub-swath 1 or too far from it", i + 1)
              .c_str(),
          vlr::kLibInconsistent);
    const int q = static_cast<int>(shift);
    const int r = q % D;
    swath_[i].skip = r == 0 ? 0 : D - r;
    if (swath_[i].skip >= s.samples)
      VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: too few samples", i + 1).c_str(),
               vlr::kLibInconsistent);
    swath_[i].rangeTime = s.firstRangeTime + swath_[i].skip / fs;
    swath_[i].offset = (q + swath_[i].skip) / D;
    if (swath_[i].offset <= previousOffset)
      VLR_FAIL("Sub-swaths are not in order of range", vlr::kLibInconsistent);
    previousOffset = swath_[i].offset;
    const int blocks = genpow((s.samples + D - 1) / D, 1);
    if (blocks < 1 || blocks > kMaxSamples)
      VLR_FAIL("No transform length for the range lines", vlr::kLibInconsistent);
    swath_[i].fftLength = blocks * D;
    swath_[i].lookLength = blocks;
    // Output samples whose input sample lies inside the line.
    swath_[i].valid = (s.samples - swath_[i].skip - 1) / D + 1;
  }
  // Look power: the share of a swath's spectrum that one look takes differs
  // between swaths (bandwidths differ), so each swath is brought to the
  // share of swath 1; a uniform scene then has one level across the swath.
  const bool plain = looks_ == 1 && D == 1;
  const double n3 = static_cast<double>(looks_) * looks_ * looks_;
  const double share1 = swath_[0].lookBandwidth / swathPar[0].bandwidth;
  for (int i = 0; i < kMlookSwaths; ++i) {
    const double share = swath_[i].lookBandwidth / swathPar[i].bandwidth;
    swath_[i].powerScale = plain ? 1.0 : share1 / share / n3;
  }
  return 0;
}
