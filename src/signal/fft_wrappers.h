// Batched one-dimensional FFTs over the rows or the columns of a
// single-precision complex matrix, on FFTW 3 (single precision).
//
// A matrix is stored row after row; rowStride is the number of elements
// allocated per row and rows the number of rows.  A plan transforms the
// first rowLen elements of the first colLen rows: along the rows (a batch of
// colLen transforms of length rowLen, element stride 1, distance rowStride),
// along the columns (a batch of rowLen transforms of length colLen, element
// stride rowStride, distance 1), or both, rows first.
//
// Directions: see FftDirection.  A dimension of length 1 is never
// transformed (its transform is the identity).
//
// Threads: planning (fft_makep_c, fft_c), release (fft_destp_c, the
// destructor) and the wisdom functions take a process-wide planner lock, as
// the FFTW planner is not thread-safe; they also use the report and the call
// graph, which are not, so call them from one thread.  pfft_c touches
// neither: one plan may be run from several threads at once on different
// arrays.
//
// Alignment: each transform is planned twice, on arrays from the checked
// allocator (16-byte blocks) and with FFTW_UNALIGNED.  pfft_c runs the first
// plan when both arrays have the alignment of the planning arrays in FFTW's
// sense (fftwf_alignment_of; blocks from the checked allocator and from
// fftwf_malloc do) and the second otherwise, so any fcomplex array may be
// passed; aligned arrays are faster.
#pragma once

#include <complex>
#include <utility>

struct fftwf_plan_s;

using fcomplex = std::complex<float>;

// Direction of the transform along one dimension.  The values are those of
// the integer direction codes used before, so a stored or converted code
// keeps its meaning; any other value is refused when planning.
enum class FftDirection : int {
  kNone = 0,             // no transform
  kForward = 1,          // exponent -2 pi i jk/n
  kBackwardScaled = -1,  // backward (+2 pi i jk/n), then division by the length
  kBackward = -2,        // backward without division
};

// Planning effort of the plans made after fft_set_effort.
enum FftEffort {
  kFftEstimate = 0,  // heuristics, no measurement (default; arrays untouched)
  kFftMeasure = 1,   // times a few algorithms; results go into the wisdom
  kFftPatient = 2,   // times many more
};

// One engine transform: the aligned and the unaligned FFTW plan of the same
// problem.  Owns both; released under the planner lock.
class FftEngine {
 public:
  FftEngine() = default;
  ~FftEngine() { reset(); }
  FftEngine(const FftEngine&) = delete;
  FftEngine& operator=(const FftEngine&) = delete;
  FftEngine(FftEngine&& other) noexcept;
  FftEngine& operator=(FftEngine&& other) noexcept;

  bool valid() const { return aligned_ != nullptr && unaligned_ != nullptr; }
  // Runs the transform from in to out (the same array for an in-place plan).
  void execute(fcomplex* in, fcomplex* out) const;
  void reset();

 private:
  friend class FftPlanner;
  fftwf_plan_s* aligned_ = nullptr;
  fftwf_plan_s* unaligned_ = nullptr;
  // fftwf_alignment_of of the planning arrays.
  int inAlignment_ = 0;
  int outAlignment_ = 0;
};

// A transform plan: the row and the column transform with their lengths,
// normalisation flags and directions.  Movable, not copyable; the engine
// plans are released with the object or by fft_destp_c.
class fft_plan_c {
 public:
  fft_plan_c() = default;
  // The moved-from plan is empty.
  fft_plan_c(fft_plan_c&& other) noexcept { *this = std::move(other); }
  fft_plan_c& operator=(fft_plan_c&& other) noexcept;
  fft_plan_c(const fft_plan_c&) = delete;
  fft_plan_c& operator=(const fft_plan_c&) = delete;

  bool made() const { return made_; }
  bool hasRowTransform() const { return row_.valid(); }
  int rowStride() const { return rowStride_; }
  int rowLen() const { return rowLen_; }
  int rowNorm() const { return rowNorm_; }
  FftDirection rowDir() const { return rowDir_; }
  bool hasColumnTransform() const { return col_.valid(); }
  int rows() const { return rows_; }
  int colLen() const { return colLen_; }
  int colNorm() const { return colNorm_; }
  FftDirection colDir() const { return colDir_; }
  bool inPlace() const { return inPlace_; }

 private:
  friend int fft_makep_c(fft_plan_c*, int, int, int, int, FftDirection, FftDirection, int);
  friend int pfft_c(const fft_plan_c*, fcomplex*, fcomplex*);
  friend int fft_destp_c(fft_plan_c*);
  void copyRegion(const fcomplex* in, fcomplex* out) const;
  void normalise(fcomplex* out) const;

  FftEngine row_;
  int rowStride_ = 0;
  int rowLen_ = 0;
  int rowNorm_ = 0;
  FftDirection rowDir_ = FftDirection::kNone;
  FftEngine col_;
  int rows_ = 0;
  int colLen_ = 0;
  int colNorm_ = 0;
  FftDirection colDir_ = FftDirection::kNone;
  bool inPlace_ = false;
  bool made_ = false;
};

// Plans the transforms (see above); inPlace non-zero for in-place
// transforms.  0; 1 rowStride < 1 or rows < 1; 2 rowLen > rowStride;
// 3 colLen > rows; 4 the row transform cannot be planned (length below 1,
// unknown direction, engine failure); 5 the same for the column transform;
// 7 no memory for the planning arrays.  A plan that held transforms is
// released first; on failure the plan is left empty.
int fft_makep_c(fft_plan_c* plan, int rowStride, int rowLen, int rows, int colLen,
                FftDirection rowDir, FftDirection colDir, int inPlace);

// Runs the row transform (in -> out), then the column transform (from out
// when a row transform ran, else from in, into out), then the normalisation
// of the first rowLen elements of the first colLen rows.  With an in-place
// plan and distinct arrays the region is copied to out and transformed
// there; when no transform is planned the region is copied, so out always
// holds the result.  0; 1 when the plan was never made, an array is null,
// or an out-of-place plan is given one array for both.  Reports nothing.
int pfft_c(const fft_plan_c* plan, fcomplex* in, fcomplex* out);

// Releases both engine plans; the plan is empty afterwards.  0.
int fft_destp_c(fft_plan_c* plan);

// Plans, runs and releases in one call, in place when in equals out.
// Returns the planning code, or the code of pfft_c when planning succeeded.
int fft_c(int rowStride, int rowLen, int rows, int colLen, FftDirection rowDir, FftDirection colDir,
          fcomplex* in, fcomplex* out);

// Planning effort for the plans made from now on.  0; 1 unknown effort.
int fft_set_effort(int effort);

// Wisdom (FFTW's record of measured plans) in the file "fftwf_wisdom.txt"
// of a directory.  Import: 0 (also when the file does not exist yet), 4 when
// the file cannot be read as wisdom.  Export: 0, 9 when the file cannot be
// written.
int fft_import_wisdom(const char* directory);
int fft_export_wisdom(const char* directory);
