// The FFT wrappers against a direct DFT computed in double precision.
#include <gtest/gtest.h>

#include <algorithm>
#include <cmath>
#include <complex>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <random>
#include <string>
#include <thread>
#include <vector>

#include "signal/fft_wrappers.h"

namespace {

using cd = std::complex<double>;
using Matrix = std::vector<fcomplex>;

constexpr double kPi = 3.14159265358979323846;
// Relative L2 error allowed between a single-precision FFT and the DFT.
constexpr double kTol = 1e-5;

// Direct DFT with direction codes as the wrappers': 1 forward (exponent
// -2 pi i jk/n), -1 backward divided by n, -2 backward.
std::vector<cd> Dft(const std::vector<cd>& x, int dir) {
  const size_t n = x.size();
  const double sign = dir == 1 ? -1.0 : 1.0;
  std::vector<cd> w(n), out(n);
  for (size_t m = 0; m < n; ++m) w[m] = std::polar(1.0, sign * 2.0 * kPi * m / n);
  for (size_t k = 0; k < n; ++k) {
    double re = 0.0, im = 0.0;
    for (size_t j = 0, m = 0; j < n; ++j, m = (m + k < n) ? m + k : m + k - n) {
      re += x[j].real() * w[m].real() - x[j].imag() * w[m].imag();
      im += x[j].real() * w[m].imag() + x[j].imag() * w[m].real();
    }
    out[k] = dir == -1 ? cd(re, im) / static_cast<double>(n) : cd(re, im);
  }
  return out;
}

// The wrappers' direction from a code of the tables: 1 forward, -1 backward
// divided by n, -2 backward, 0 none; other codes are invalid directions.
FftDirection Dir(int code) {
  return static_cast<FftDirection>(code);
}

Matrix Random(size_t n, unsigned seed) {
  std::mt19937 rng(seed);
  std::uniform_real_distribution<float> u(-1.0f, 1.0f);
  Matrix m(n);
  for (fcomplex& v : m) v = fcomplex(u(rng), u(rng));
  return m;
}

double RelError(const Matrix& got, const std::vector<cd>& want) {
  double e = 0.0, w = 0.0;
  for (size_t i = 0; i < want.size(); ++i) {
    e += std::norm(cd(got[i]) - want[i]);
    w += std::norm(want[i]);
  }
  return std::sqrt(e / (w > 0.0 ? w : 1.0));
}

struct Geometry {
  int rowStride, rowLen, rows, colLen, rowDir, colDir;
};

bool Inside(const Geometry& g, size_t i) {
  return static_cast<int>(i % g.rowStride) < g.rowLen &&
         static_cast<int>(i / g.rowStride) < g.colLen;
}

// Row DFTs, then column DFTs, over the first rowLen elements of the first
// colLen rows.
std::vector<cd> Reference(const Matrix& in, const Geometry& g) {
  std::vector<cd> m(in.begin(), in.end());
  const size_t s = static_cast<size_t>(g.rowStride);
  for (int r = 0; r < g.colLen && g.rowDir != 0; ++r) {
    const std::vector<cd> row = Dft({m.begin() + r * s, m.begin() + r * s + g.rowLen}, g.rowDir);
    std::copy(row.begin(), row.end(), m.begin() + r * s);
  }
  for (int c = 0; c < g.rowLen && g.colDir != 0; ++c) {
    std::vector<cd> col(g.colLen);
    for (int r = 0; r < g.colLen; ++r) col[r] = m[r * s + c];
    col = Dft(col, g.colDir);
    for (int r = 0; r < g.colLen; ++r) m[r * s + c] = col[r];
  }
  return m;
}

// Runs the plan on a random matrix in place and out of place (into a
// sentinel-filled array that must keep its sentinels outside the region).
void CheckPlan(const Geometry& g) {
  SCOPED_TRACE(::testing::Message() << g.rowStride << "x" << g.rows << " len " << g.rowLen << "x"
                                    << g.colLen << " dirs " << g.rowDir << "," << g.colDir);
  const Matrix in = Random(static_cast<size_t>(g.rowStride) * g.rows, g.rowLen * 131 + g.colLen);
  const fcomplex sentinel(7.0f, -7.0f);
  const std::vector<cd> reference = Reference(in, g);
  for (int inPlace : {1, 0}) {
    fft_plan_c plan;
    ASSERT_EQ(fft_makep_c(&plan, g.rowStride, g.rowLen, g.rows, g.colLen, Dir(g.rowDir),
                          Dir(g.colDir), inPlace),
              0);
    Matrix work = in, out(in.size(), sentinel);
    ASSERT_EQ(pfft_c(&plan, work.data(), inPlace ? work.data() : out.data()), 0);
    std::vector<cd> want = reference;
    for (size_t i = 0; i < want.size() && !inPlace; ++i)
      if (!Inside(g, i)) want[i] = cd(sentinel);
    EXPECT_LT(RelError(inPlace ? work : out, want), kTol) << "in place " << inPlace;
    if (!inPlace) {
      EXPECT_EQ(work, in) << "input changed";
    }
  }
}

TEST(FftWrappers, SingleAndBatchedTransformsMatchTheDft) {
  for (int n : {1, 2, 3, 5, 7, 64, 96, 125, 5626})
    for (int dir : {1, -1, -2}) {
      CheckPlan({n, n, 1, 1, dir, 0});  // one row
      CheckPlan({3, 1, n, n, 0, dir});  // one column, stride 3
    }
  // Strided batches over rows, columns and both: strides beyond the
  // length, fewer rows or columns than the array holds.
  CheckPlan({100, 96, 12, 9, -1, 0});
  CheckPlan({70, 64, 130, 125, 0, 1});
  CheckPlan({20, 15, 10, 8, -1, -1});
  CheckPlan({100, 96, 130, 125, 1, -2});
}

TEST(FftWrappers, ArraysThatDoNotFitThePlan) {
  Matrix in = Random(32, 3), out(32), got(32);
  fft_plan_c plan;
  // A dimension of length 1 is the identity: out of place it still fills out.
  ASSERT_EQ(fft_makep_c(&plan, 1, 1, 32, 1, Dir(1), Dir(0), 0), 0);
  EXPECT_FALSE(plan.hasRowTransform());
  EXPECT_EQ(pfft_c(&plan, in.data(), out.data()), 0);
  EXPECT_EQ(out[0], in[0]);
  // An in-place plan given two arrays fills out and leaves the input.
  const Matrix before = in;
  ASSERT_EQ(fft_c(32, 32, 1, 1, Dir(1), Dir(0), in.data(), out.data()), 0);
  ASSERT_EQ(fft_makep_c(&plan, 32, 32, 1, 1, Dir(1), Dir(0), 1), 0);
  EXPECT_EQ(pfft_c(&plan, in.data(), got.data()), 0);
  EXPECT_EQ(in, before);
  EXPECT_EQ(got, out);
  // An out-of-place plan cannot run on one array; a moved-from or released
  // plan cannot run at all.
  ASSERT_EQ(fft_makep_c(&plan, 32, 32, 1, 1, Dir(1), Dir(0), 0), 0);
  EXPECT_EQ(pfft_c(&plan, in.data(), in.data()), 1);
  EXPECT_EQ(pfft_c(&plan, in.data(), nullptr), 1);
  fft_plan_c moved(std::move(plan));
  EXPECT_EQ(pfft_c(&plan, in.data(), got.data()), 1);
  EXPECT_EQ(pfft_c(&moved, in.data(), got.data()), 0);
  EXPECT_EQ(got, out);
  EXPECT_EQ(fft_destp_c(&moved), 0);
  EXPECT_EQ(pfft_c(&moved, in.data(), got.data()), 1);
}

TEST(FftWrappers, PlanningCodes) {
  // rowStride, rowLen, rows, colLen, rowDir, colDir, code
  const int cases[][7] = {{0, 0, 4, 4, 1, 0, 1}, {8, 8, 0, 0, 1, 0, 1},  {8, 9, 4, 4, 1, 0, 2},
                          {8, 8, 4, 5, 1, 0, 3}, {8, 0, 4, 4, 1, 0, 4},  {8, 8, 4, 4, 2, 0, 4},
                          {8, 8, 4, 0, 0, 1, 5}, {8, 8, 4, 4, 0, -3, 5}, {8, 8, 4, 4, -2, -1, 0},
                          {1, 1, 1, 1, 1, 1, 0}};
  for (const auto& c : cases) {
    fft_plan_c plan;
    EXPECT_EQ(fft_makep_c(&plan, c[0], c[1], c[2], c[3], Dir(c[4]), Dir(c[5]), 0), c[6])
        << c[0] << c[1];
    EXPECT_EQ(plan.made(), c[6] == 0);
  }
}

TEST(FftWrappers, OnePlanRunsFromTwoThreadsAndOnMisalignedArrays) {
  const Geometry g{2048, 2048, 8, 8, 1, 0};
  const size_t total = 2048 * 8;
  fft_plan_c plan;
  ASSERT_EQ(fft_makep_c(&plan, g.rowStride, g.rowLen, g.rows, g.colLen, Dir(1), Dir(0), 1), 0);
  const Matrix startA = Random(total, 21), startB = Random(total, 22);
  Matrix wantA = startA, wantB = startB, a, b;
  ASSERT_EQ(pfft_c(&plan, wantA.data(), wantA.data()), 0);
  ASSERT_EQ(pfft_c(&plan, wantB.data(), wantB.data()), 0);
  // Both threads run the plan many times at once; each result must equal
  // the single-threaded one bit for bit.
  auto worker = [&plan](Matrix* m, const Matrix* start) {
    for (int i = 0; i < 20; ++i) {
      *m = *start;
      pfft_c(&plan, m->data(), m->data());
    }
  };
  std::thread ta(worker, &a, &startA), tb(worker, &b, &startB);
  ta.join();
  tb.join();
  EXPECT_EQ(a, wantA);
  EXPECT_EQ(b, wantB);
  // One element off the allocator's alignment: the unaligned plan serves.
  Matrix raw = Random(total + 1, 23);
  const Matrix src(raw.begin() + 1, raw.end());
  ASSERT_EQ(pfft_c(&plan, raw.data() + 1, raw.data() + 1), 0);
  EXPECT_LT(RelError(Matrix(raw.begin() + 1, raw.end()), Reference(src, g)), kTol);
}

TEST(FftWrappers, WisdomRoundTrip) {
  char dirTemplate[] = "/tmp/fft_wisdom_XXXXXX";
  ASSERT_NE(mkdtemp(dirTemplate), nullptr);
  const std::string dir = dirTemplate, file = dir + "/fftwf_wisdom.txt";
  EXPECT_EQ(fft_import_wisdom(dir.c_str()), 0);  // nothing saved yet
  ASSERT_EQ(fft_set_effort(kFftMeasure), 0);
  fft_plan_c plan;
  ASSERT_EQ(fft_makep_c(&plan, 96, 96, 4, 4, Dir(1), Dir(0), 0), 0);
  ASSERT_EQ(fft_set_effort(kFftEstimate), 0);
  EXPECT_EQ(fft_set_effort(7), 1);
  EXPECT_EQ(fft_export_wisdom(dir.c_str()), 0);
  EXPECT_EQ(fft_import_wisdom((dir + "/").c_str()), 0);
  std::ofstream(file) << "not wisdom\n";
  EXPECT_EQ(fft_import_wisdom(dir.c_str()), 4);
  EXPECT_EQ(fft_export_wisdom((dir + "/missing/").c_str()), 9);
  std::remove(file.c_str());
  std::remove(dir.c_str());
}

}  // namespace
