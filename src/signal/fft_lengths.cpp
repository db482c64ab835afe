#include "signal/fft_lengths.h"

#include <algorithm>
#include <climits>
#include <cstddef>
#include <cstdint>
#include <numeric>

namespace {

// A length that the lengths search skips and resumes after.
constexpr int64_t kSkippedLength = 5625;

bool smooth235(int64_t m) {
  for (int64_t p : {2, 3, 5})
    while (m % p == 0) m /= p;
  return m == 1;
}

// Rotates every row right by `shift` positions.
void rotateRows(fcomplex* data, int n, int rows, int shift) {
  if (data == nullptr || n < 2 || rows < 1 || shift % n == 0) return;
  const size_t len = static_cast<size_t>(n);
  for (size_t r = 0; r < static_cast<size_t>(rows); ++r) {
    fcomplex* row = data + r * len;
    std::rotate(row, row + (len - static_cast<size_t>(shift)), row + len);
  }
}

// The first smooth number of start, start + inc, ... up to INT_MAX, stopping
// at the skipped length; 0 when there is none.  When start and inc share a
// prime factor above 5 every term has it, so the walk is not made.
int64_t walkToSmooth(int64_t start, int64_t inc) {
  if (!smooth235(std::gcd(start, inc))) return 0;
  for (int64_t m = start; m <= INT_MAX; m += inc) {
    if (m == kSkippedLength || smooth235(m)) return m;
  }
  return 0;
}

}  // namespace

int genpow(int n, int step) {
  if (n <= 0) return 0;
  const int64_t inc = step < 1 ? 1 : step;
  int64_t m = walkToSmooth(n, inc);
  if (m == kSkippedLength) m = walkToSmooth(kSkippedLength + 1, inc);
  return static_cast<int>(m);
}

void fftshift(fcomplex* data, int n, int rows) {
  rotateRows(data, n, rows, n / 2);
}

void ifftshift(fcomplex* data, int n, int rows) {
  rotateRows(data, n, rows, n - n / 2);
}
