#include "signal/fft_wrappers.h"

#include <fftw3.h>

#include <atomic>
#include <cerrno>
#include <cstdint>
#include <cstdio>
#include <cstring>
#include <mutex>
#include <string>
#include <utility>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "fft_wrappers";
constexpr const char* kWisdomFile = "fftwf_wisdom.txt";

// Engine planning result, mapped by the caller onto its dimension's code.
constexpr int kPlanOk = 0;
constexpr int kPlanFailed = 1;

std::atomic<int> gEffort{kFftEstimate};

// The FFTW planner (plan creation and destruction, wisdom) is not
// thread-safe; every use of it holds this lock.  Never destroyed, so that
// plans held by static objects can still be released at exit.
std::mutex& plannerMutex() {
  static std::mutex* m = new std::mutex;
  return *m;
}

unsigned effortFlags() {
  switch (gEffort.load()) {
    case kFftMeasure:
      return FFTW_MEASURE;
    case kFftPatient:
      return FFTW_PATIENT;
    default:
      return FFTW_ESTIMATE;
  }
}

bool validDirection(FftDirection dir) {
  switch (dir) {
    case FftDirection::kNone:
    case FftDirection::kForward:
    case FftDirection::kBackwardScaled:
    case FftDirection::kBackward:
      return true;
  }
  return false;
}

int engineSign(FftDirection dir) {
  return dir == FftDirection::kForward ? FFTW_FORWARD : FFTW_BACKWARD;
}

fftwf_complex* engineArray(fcomplex* p) {
  return reinterpret_cast<fftwf_complex*>(p);
}

int alignmentOf(const fcomplex* p) {
  return fftwf_alignment_of(reinterpret_cast<float*>(const_cast<fcomplex*>(p)));
}

std::string wisdomPath(const char* directory) {
  std::string path(directory);
  if (!path.empty() && path.back() != '/') path += '/';
  return path + kWisdomFile;
}

}  // namespace

// Makes the two FFTW plans of one batched transform.
class FftPlanner {
 public:
  struct Problem {
    int length;
    int count;
    int stride;
    int distance;
    int sign;
    bool inPlace;
  };

  static int plan(FftEngine& engine, const Problem& p, fcomplex* in, fcomplex* out) {
    engine.reset();
    fftwf_complex* ein = engineArray(in);
    fftwf_complex* eout = engineArray(p.inPlace ? in : out);
    int n = p.length;
    const unsigned flags = effortFlags();
    std::lock_guard<std::mutex> lock(plannerMutex());
    engine.aligned_ = fftwf_plan_many_dft(1, &n, p.count, ein, nullptr, p.stride, p.distance, eout,
                                          nullptr, p.stride, p.distance, p.sign, flags);
    engine.unaligned_ =
        fftwf_plan_many_dft(1, &n, p.count, ein, nullptr, p.stride, p.distance, eout, nullptr,
                            p.stride, p.distance, p.sign, flags | FFTW_UNALIGNED);
    engine.inAlignment_ = alignmentOf(in);
    engine.outAlignment_ = alignmentOf(p.inPlace ? in : out);
    if (engine.valid()) return kPlanOk;
    destroyLocked(engine);
    return kPlanFailed;
  }

  // Destroys the plans of an engine; the caller holds the planner lock.
  static void destroyLocked(FftEngine& engine) {
    if (engine.aligned_ != nullptr) fftwf_destroy_plan(engine.aligned_);
    if (engine.unaligned_ != nullptr) fftwf_destroy_plan(engine.unaligned_);
    engine.aligned_ = nullptr;
    engine.unaligned_ = nullptr;
  }
};

FftEngine::FftEngine(FftEngine&& other) noexcept
    : aligned_(std::exchange(other.aligned_, nullptr)),
      unaligned_(std::exchange(other.unaligned_, nullptr)),
      inAlignment_(other.inAlignment_),
      outAlignment_(other.outAlignment_) {}

FftEngine& FftEngine::operator=(FftEngine&& other) noexcept {
  if (this != &other) {
    reset();
    aligned_ = std::exchange(other.aligned_, nullptr);
    unaligned_ = std::exchange(other.unaligned_, nullptr);
    inAlignment_ = other.inAlignment_;
    outAlignment_ = other.outAlignment_;
  }
  return *this;
}

void FftEngine::reset() {
  if (aligned_ == nullptr && unaligned_ == nullptr) return;
  std::lock_guard<std::mutex> lock(plannerMutex());
  FftPlanner::destroyLocked(*this);
}

void FftEngine::execute(fcomplex* in, fcomplex* out) const {
  // A plan may run on new arrays only when their alignment matches the
  // planning arrays'; the unaligned plan takes any.
  const bool sameAlignment = alignmentOf(in) == inAlignment_ && alignmentOf(out) == outAlignment_;
  fftwf_execute_dft(sameAlignment ? aligned_ : unaligned_, engineArray(in), engineArray(out));
}

fft_plan_c& fft_plan_c::operator=(fft_plan_c&& other) noexcept {
  if (this == &other) return *this;
  row_ = std::move(other.row_);
  col_ = std::move(other.col_);
  rowStride_ = std::exchange(other.rowStride_, 0);
  rowLen_ = std::exchange(other.rowLen_, 0);
  rowNorm_ = std::exchange(other.rowNorm_, 0);
  rowDir_ = std::exchange(other.rowDir_, FftDirection::kNone);
  rows_ = std::exchange(other.rows_, 0);
  colLen_ = std::exchange(other.colLen_, 0);
  colNorm_ = std::exchange(other.colNorm_, 0);
  colDir_ = std::exchange(other.colDir_, FftDirection::kNone);
  inPlace_ = std::exchange(other.inPlace_, false);
  made_ = std::exchange(other.made_, false);
  return *this;
}

void fft_plan_c::copyRegion(const fcomplex* in, fcomplex* out) const {
  const size_t stride = static_cast<size_t>(rowStride_);
  const size_t bytes = static_cast<size_t>(rowLen_) * sizeof(fcomplex);
  for (int r = 0; r < colLen_; ++r)
    std::memmove(out + static_cast<size_t>(r) * stride, in + static_cast<size_t>(r) * stride,
                 bytes);
}

void fft_plan_c::normalise(fcomplex* out) const {
  if (rowNorm_ == 0 && colNorm_ == 0) return;
  float factor = 1.0f;
  if (rowNorm_ != 0) factor *= 1.0f / static_cast<float>(rowLen_);
  if (colNorm_ != 0) factor *= 1.0f / static_cast<float>(colLen_);
  const size_t stride = static_cast<size_t>(rowStride_);
  for (int r = 0; r < colLen_; ++r) {
    fcomplex* row = out + static_cast<size_t>(r) * stride;
    for (int k = 0; k < rowLen_; ++k) row[k] *= factor;
  }
}

int fft_makep_c(fft_plan_c* plan, int rowStride, int rowLen, int rows, int colLen,
                FftDirection rowDir, FftDirection colDir, int inPlace) {
  VLR_SCOPE("fft_makep_c", kModule);
  if (plan == nullptr) VLR_FAIL("No FFT plan given", 1);
  fft_destp_c(plan);
  if (rowStride < 1 || rows < 1) VLR_FAIL("Row length and row count must be positive", 1);
  if (rowLen > rowStride) VLR_FAIL("Row transform longer than the row", 2);
  if (colLen > rows) VLR_FAIL("Column transform longer than the column", 3);
  if (rowLen < 1 || !validDirection(rowDir)) VLR_FAIL("Row FFT plan failed", 4);
  if (colLen < 1 || !validDirection(colDir)) VLR_FAIL("Column FFT plan failed", 5);

  const bool rowRuns = rowDir != FftDirection::kNone && rowLen > 1;
  const bool colRuns = colDir != FftDirection::kNone && colLen > 1;
  const bool inPlaceRows = inPlace != 0;
  // After a row transform the column transform runs on the output array.
  const bool inPlaceCols = inPlace != 0 || rowRuns;

  // Planning arrays covering the transformed region; FFTW_ESTIMATE leaves
  // them alone, the measuring efforts write into them.
  const size_t span = static_cast<size_t>(colLen - 1) * static_cast<size_t>(rowStride) +
                      static_cast<size_t>(rowLen);
  vlr::CkBuffer<fcomplex> scratchIn, scratchOut;
  if (rowRuns || colRuns) {
    if (!scratchIn.allocate(span)) VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
    const bool needOut = (rowRuns && !inPlaceRows) || (colRuns && !inPlaceCols);
    if (needOut && !scratchOut.allocate(span))
      VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  if (rowRuns) {
    const FftPlanner::Problem p{rowLen, colLen, 1, rowStride, engineSign(rowDir), inPlaceRows};
    if (FftPlanner::plan(plan->row_, p, scratchIn.data(), scratchOut.data()) != kPlanOk)
      VLR_FAIL("Row FFT plan failed", 4);
  }
  if (colRuns) {
    const FftPlanner::Problem p{colLen, rowLen, rowStride, 1, engineSign(colDir), inPlaceCols};
    if (FftPlanner::plan(plan->col_, p, scratchIn.data(), scratchOut.data()) != kPlanOk) {
      plan->row_.reset();
      VLR_FAIL("Column FFT plan failed", 5);
    }
  }
  plan->rowStride_ = rowStride;
  plan->rowLen_ = rowLen;
  plan->rowNorm_ = rowRuns && rowDir == FftDirection::kBackwardScaled ? 1 : 0;
  plan->rowDir_ = rowDir;
  plan->rows_ = rows;
  plan->colLen_ = colLen;
  plan->colNorm_ = colRuns && colDir == FftDirection::kBackwardScaled ? 1 : 0;
  plan->colDir_ = colDir;
  plan->inPlace_ = inPlace != 0;
  plan->made_ = true;
  return 0;
}

// Runs on worker threads: no report, no call graph.
int pfft_c(const fft_plan_c* plan, fcomplex* in, fcomplex* out) {
  if (plan == nullptr || !plan->made_ || in == nullptr || out == nullptr) return 1;
  const bool rowRuns = plan->row_.valid();
  const bool colRuns = plan->col_.valid();
  const bool outOfPlaceFirst = !plan->inPlace_ && (rowRuns || colRuns);
  if (outOfPlaceFirst && in == out) return 1;
  fcomplex* src = in;
  if (!outOfPlaceFirst && in != out) {
    plan->copyRegion(in, out);
    src = out;
  }
  if (rowRuns) {
    plan->row_.execute(src, out);
    src = out;
  }
  if (colRuns) plan->col_.execute(src, out);
  plan->normalise(out);
  return 0;
}

int fft_destp_c(fft_plan_c* plan) {
  if (plan != nullptr) *plan = fft_plan_c();
  return 0;
}

int fft_c(int rowStride, int rowLen, int rows, int colLen, FftDirection rowDir, FftDirection colDir,
          fcomplex* in, fcomplex* out) {
  VLR_SCOPE("fft_c", kModule);
  fft_plan_c plan;
  VLR_CALL(fft_makep_c(&plan, rowStride, rowLen, rows, colLen, rowDir, colDir, in == out));
  const int rc = pfft_c(&plan, in, out);
  if (rc != 0) VLR_FAIL("FFT arrays missing", rc);
  return 0;
}

int fft_set_effort(int effort) {
  VLR_SCOPE("fft_set_effort", kModule);
  if (effort != kFftEstimate && effort != kFftMeasure && effort != kFftPatient)
    VLR_FAIL("Unknown FFT planning effort", 1);
  gEffort.store(effort);
  return 0;
}

int fft_import_wisdom(const char* directory) {
  VLR_SCOPE("fft_import_wisdom", kModule);
  if (directory == nullptr) VLR_FAIL("No FFT wisdom directory given", vlr::kLibMissing);
  const std::string path = wisdomPath(directory);
  std::FILE* f = std::fopen(path.c_str(), "r");
  if (f == nullptr) {
    // No wisdom saved yet: plans are made from scratch.
    errno = 0;
    VLR_REPORT("No FFT wisdom file", ARE_MESSAGE);
    return 0;
  }
  int ok = 0;
  {
    std::lock_guard<std::mutex> lock(plannerMutex());
    ok = fftwf_import_wisdom_from_file(f);
  }
  std::fclose(f);
  errno = 0;
  if (ok == 0) VLR_FAIL("File reading failed!", vlr::kLibRead);
  return 0;
}

int fft_export_wisdom(const char* directory) {
  VLR_SCOPE("fft_export_wisdom", kModule);
  if (directory == nullptr) VLR_FAIL("No FFT wisdom directory given", vlr::kLibMissing);
  const std::string path = wisdomPath(directory);
  std::FILE* f = std::fopen(path.c_str(), "w");
  if (f == nullptr) {
    errno = 0;
    VLR_FAIL("File not opened!", vlr::kLibOpen);
  }
  {
    std::lock_guard<std::mutex> lock(plannerMutex());
    fftwf_export_wisdom_to_file(f);
  }
  const bool written = std::ferror(f) == 0;
  const bool closed = std::fclose(f) == 0;
  errno = 0;
  if (!written || !closed) VLR_FAIL("File writing failed!", vlr::kLibWrite);
  return 0;
}
