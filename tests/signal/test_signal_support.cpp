// Transform lengths, spectrum rotation, polynomial evaluation and the
// interpolation kernels.
#include <gtest/gtest.h>

#include <algorithm>
#include <climits>
#include <cmath>
#include <cstdint>
#include <vector>

#include "signal/fft_lengths.h"
#include "signal/glsf.h"
#include "signal/polval.h"

namespace {

// Every number 2^a 3^b 5^c up to INT_MAX, ascending, built by enumeration.
std::vector<int64_t> SmoothNumbers() {
  std::vector<int64_t> v;
  for (int64_t a = 1; a <= INT_MAX; a *= 2)
    for (int64_t b = a; b <= INT_MAX; b *= 3)
      for (int64_t c = b; c <= INT_MAX; c *= 5) v.push_back(c);
  std::sort(v.begin(), v.end());
  return v;
}

// The first smooth number on the walk n, n + step, ...; a walk that meets
// 5625 goes on from 5626.
int64_t ExpectedLength(const std::vector<int64_t>& smooth, int64_t n, int64_t step) {
  for (int64_t m : smooth) {
    if (m < n || (m - n) % step != 0) continue;
    if (m == 5625) return ExpectedLength(smooth, 5626, step);
    return m;
  }
  return 0;
}

TEST(Genpow, NextSmoothLengthFromAnEnumeratedTable) {
  const std::vector<int64_t> smooth = SmoothNumbers();
  for (int step : {1, 2, 3, 7})
    for (int n = 1; n <= 7000; ++n)
      ASSERT_EQ(genpow(n, step), ExpectedLength(smooth, n, step)) << n << " step " << step;
  EXPECT_EQ(genpow(5625, 1), 5760);
  EXPECT_EQ(genpow(5621, 4), 6250);
  EXPECT_EQ(genpow(0, 1), 0);
  EXPECT_EQ(genpow(-8, 1), 0);
  EXPECT_EQ(genpow(97, 0), 100);  // a step below 1 counts as 1
  // The largest length an int holds is found; beyond it there is none.
  EXPECT_EQ(genpow(static_cast<int>(smooth.back()), 1), smooth.back());
  EXPECT_EQ(genpow(static_cast<int>(smooth.back()) + 1, 1), 0);
  EXPECT_EQ(genpow(INT_MAX - 1, INT_MAX), 0);
}

TEST(SpectrumShift, PositionRuleAndRoundTrip) {
  for (int n : {1, 2, 5, 6, 7}) {
    const int rows = 3;
    std::vector<fcomplex> data(static_cast<size_t>(n) * rows);
    for (int r = 0; r < rows; ++r)
      for (int k = 0; k < n; ++k) data[r * n + k] = fcomplex(static_cast<float>(k), r);
    const std::vector<fcomplex> original = data;
    fftshift(data.data(), n, rows);
    for (int r = 0; r < rows; ++r)
      for (int k = 0; k < n; ++k)
        ASSERT_EQ(data[r * n + (k + n / 2) % n], original[r * n + k]) << n << " " << k;
    std::vector<fcomplex> other = original;
    ifftshift(other.data(), n, rows);
    if (n % 2 == 0) {
      EXPECT_EQ(other, data) << "even lengths swap the halves both ways";
    }
    ifftshift(data.data(), n, rows);
    EXPECT_EQ(data, original) << n;
  }
}

TEST(Polval, AscendingCoefficients) {
  const double c[] = {1.5, -2.0, 0.25, 3.0};
  EXPECT_NEAR(polval(c, 3, -2.5), 1.5 + 5.0 + 0.25 * 6.25 - 3.0 * 15.625, 1e-12);
  EXPECT_EQ(polval(c, 0, 9.0), 1.5);
  EXPECT_EQ(polval(c, -1, 9.0), 0.0);
}

// Taps from an independent double-precision solution of the same system
// (Gauss-Jordan elimination in Python): exact taps at one shift say more
// than the interpolation error of a test signal.
TEST(GlsF, MatchesAnIndependentSolution) {
  const float want[] = {-4.2012185e-02f, 5.6719719e-02f,  -6.2593938e-02f, 5.2199413e-02f,
                        -1.3859406e-02f, -8.9552497e-02f, 7.8122277e-01f,  4.1834570e-01f,
                        -1.6504089e-01f, 7.6616007e-02f,  -2.6375909e-02f, -2.9929401e-03f,
                        1.7324163e-02f};
  float k[13];
  ASSERT_EQ(glsF(k, 13, 0.3, 0.8, 0.15), 0);
  for (int i = 0; i < 13; ++i) EXPECT_NEAR(k[i], want[i], 2e-6) << i;
}

TEST(GlsF, RefusesBadArguments) {
  std::vector<float> k(16);
  EXPECT_EQ(glsF(k.data(), 0, 0.0, 0.8, 0.15), 1);
  EXPECT_EQ(glsF(k.data(), 5000, 0.0, 0.8, 0.15), 1);
  EXPECT_EQ(glsF(nullptr, 8, 0.0, 0.8, 0.15), 1);
  EXPECT_EQ(glsF(k.data(), 8, std::nan(""), 0.8, 0.15), 1);
  EXPECT_EQ(glsF(k.data(), 8, 0.1, 0.0, 0.15), 1);  // no band: singular system
  ASSERT_EQ(glsF(k.data(), 1, 0.3, 0.8, 0.15), 0);
  EXPECT_EQ(k[0], 1.0f);
}

}  // namespace
