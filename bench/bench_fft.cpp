// Time of the batched FFTs of the wide-swath multilook, on one thread and
// split over two (one plan for half the batch, run on both halves at once).
//
//   bench_fft [REPEATS [measure]]   prints the median time of each batch in
//                                   ms; with "measure" the plans are made
//                                   with FFTW_MEASURE instead of estimated
//
// Row batches: forward transforms along 1000 rows of 2048 and of 2250
// points.  Column batches: transforms of 64 points down 5000 columns.  The
// row batch is also timed on an array one element off the allocator's
// alignment (the unaligned plan).
#include <algorithm>
#include <chrono>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <functional>
#include <thread>
#include <vector>

#include "signal/fft_wrappers.h"

namespace {

// Direction codes of the tables below: 1 forward, -1 and -2 backward, 0 none.
FftDirection Dir(int code) {
  return static_cast<FftDirection>(code);
}

struct Batch {
  const char* name;
  int rowStride, rowLen, rows, colLen, rowDir, colDir;
  // Offset of the second half when the batch is split over two threads.
  size_t halfOffset() const {
    return rowDir != 0 ? static_cast<size_t>(rowStride) * (colLen / 2) : rowLen / 2;
  }
};

double MedianMs(int repeats, const std::function<void()>& run) {
  std::vector<double> times;
  run();  // warm up
  for (int i = 0; i < repeats; ++i) {
    const auto t0 = std::chrono::steady_clock::now();
    run();
    const auto t1 = std::chrono::steady_clock::now();
    times.push_back(std::chrono::duration<double, std::milli>(t1 - t0).count());
  }
  std::sort(times.begin(), times.end());
  return times[times.size() / 2];
}

int Time(const Batch& b, int repeats, size_t misalign) {
  std::vector<fcomplex> data(static_cast<size_t>(b.rowStride) * b.rows + misalign);
  for (size_t i = 0; i < data.size(); ++i) data[i] = fcomplex(i % 7 * 0.1f, i % 5 * 0.2f);
  fcomplex* base = data.data() + misalign;
  fft_plan_c whole, half;
  const bool rowsSplit = b.rowDir != 0;
  if (fft_makep_c(&whole, b.rowStride, b.rowLen, b.rows, b.colLen, Dir(b.rowDir), Dir(b.colDir),
                  1) != 0 ||
      fft_makep_c(&half, b.rowStride, rowsSplit ? b.rowLen : b.rowLen / 2, b.rows,
                  rowsSplit ? b.colLen / 2 : b.colLen, Dir(b.rowDir), Dir(b.colDir), 1) != 0) {
    std::fprintf(stderr, "planning failed for %s\n", b.name);
    return 1;
  }
  const double one = MedianMs(repeats, [&] { pfft_c(&whole, base, base); });
  const double two = MedianMs(repeats, [&] {
    fcomplex* second = base + b.halfOffset();
    std::thread t([&] { pfft_c(&half, second, second); });
    pfft_c(&half, base, base);
    t.join();
  });
  std::printf("%-34s %s  1 thread %8.2f ms   2 threads %8.2f ms   speed-up %.2f\n", b.name,
              misalign != 0 ? "unaligned" : "aligned  ", one, two, one / two);
  return 0;
}

}  // namespace

int main(int argc, char** argv) {
  const int repeats = argc > 1 ? std::max(1, std::atoi(argv[1])) : 20;
  if (argc > 2 && std::strcmp(argv[2], "measure") == 0) fft_set_effort(kFftMeasure);
  const Batch batches[] = {
      {"rows: 1000 x 2048-point forward", 2048, 2048, 1000, 1000, 1, 0},
      {"rows: 1000 x 2250-point forward", 2250, 2250, 1000, 1000, 1, 0},
      {"columns: 5000 x 64-point forward", 5000, 5000, 64, 64, 0, 1},
  };
  int rc = 0;
  for (const Batch& b : batches) rc |= Time(b, repeats, 0);
  rc |= Time(batches[0], repeats, 1);
  return rc;
}
