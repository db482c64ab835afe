// Burst processing of one sub-swath: azimuth weighting, range looks and the
// accumulation of look powers on the output's line grid.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <exception>
#include <memory>
#include <mutex>
#include <new>
#include <string>
#include <vector>

#include "metadata_sections/poly_selection.h"
#include "multilook/mlook.h"
#include "multilook/mlook_internal.h"
#include "raster/cell_type.h"
#include "raster/sample_convert.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/progress.h"
#include "signal/fft_lengths.h"
#include "signal/fft_wrappers.h"

namespace {

constexpr const char* kModule = "mlook_v2";
constexpr const char* kProgressTitle = "MULTILOOK PROCESSING";
constexpr int kTaperEntries = 101;
constexpr double kPi = 3.14159265358979323846;

struct CosineTable {
  float value[kTaperEntries];
  CosineTable() {
    for (int k = 0; k < kTaperEntries; ++k)
      value[k] = static_cast<float>(std::cos(k * kPi / (kTaperEntries - 1)));
  }
};

const CosineTable& Cosines() {
  static const CosineTable table;
  return table;
}

// The data set that the plain evaluation of a family uses at azimuth az.
template <class P>
const P& PlainSet(const std::vector<P>& family, double az) {
  return family[static_cast<size_t>(poly_select_set(family, az))];
}

// Samples between the exact weights of a partly weighted line; the weights
// in between are interpolated (the Doppler term varies smoothly in range).
constexpr int kWeightStride = 32;

// Everything one burst line needs; set per burst by the thread processing
// the burst.
struct LineJob {
  const unsigned char* raw;  // first raw line read
  int firstRawLine;          // burst line of raw
  int64_t lineLength;        // bytes per raw line
  int firstByte;             // prefix and skipped samples
  int cellType;
  bool swap;
  int samples;  // samples used per line
  int fftLength;
  int lookLength;
  int looks;
  bool plain;
  const float* gain;        // per used sample, or null
  const double* shift;      // Doppler centroid over rate per used sample, s
  double shiftLo, shiftHi;  // their range
  double firstLineTime;     // grid time of the burst's first line
  double lineInterval;
  double centreTime;
  double burstCycle;
  double w1, w2;
  const int* lookCentre;  // spectrum bin of each look centre
  int halfWidth;
  float scale;
  const fft_plan_c* forward;
  const fft_plan_c* inverse;
  fcomplex* block;
  fcomplex* lookBuffer;  // one look, inverse transformed in place
  float* ring;
  int ringLines;
  int firstRingLine;
};

enum LineWeights { kAllZero, kAllOne, kPartly };

// A raster opened for positioned reads.
class RawFile {
 public:
  explicit RawFile(const char* name) : name_(name) {}
  ~RawFile() {
    if (fd_ >= 0) close(fd_);
  }
  RawFile(const RawFile&) = delete;
  RawFile& operator=(const RawFile&) = delete;
  bool open() {
    fd_ = ::open(name_.c_str(), O_RDONLY | O_CLOEXEC);
    return fd_ >= 0;
  }
  // Reads exactly n bytes at `offset`.
  bool read(unsigned char* to, int64_t n, int64_t offset) const {
    while (n > 0) {
      const ssize_t got = pread(fd_, to, static_cast<size_t>(n), static_cast<off_t>(offset));
      if (got <= 0) return false;
      to += got;
      n -= got;
      offset += got;
    }
    return true;
  }

 private:
  std::string name_;
  int fd_ = -1;
};

// The temporary power file, written with positioned writes.
class OutFile {
 public:
  explicit OutFile(const char* name) : name_(name) {}
  ~OutFile() { close(); }
  OutFile(const OutFile&) = delete;
  OutFile& operator=(const OutFile&) = delete;
  bool open() {
    fd_ = ::open(name_.c_str(), O_WRONLY | O_CLOEXEC);
    return fd_ >= 0;
  }
  // Writes exactly n bytes at `offset`.
  bool write(const void* from, int64_t n, int64_t offset) const {
    const char* at = static_cast<const char*>(from);
    while (n > 0) {
      const ssize_t put = pwrite(fd_, at, static_cast<size_t>(n), static_cast<off_t>(offset));
      if (put <= 0) return false;
      at += put;
      n -= put;
      offset += put;
    }
    return true;
  }
  bool close() {
    if (fd_ < 0) return true;
    const bool ok = ::close(fd_) == 0;
    fd_ = -1;
    return ok;
  }

 private:
  std::string name_;
  int fd_ = -1;
};

float Weight(const LineJob& job, double dt, double shift) {
  return mlook_detail::AzimuthWeight(std::fabs(dt + shift) / job.burstCycle, job.w1, job.w2);
}

double LineOffset(const LineJob& job, int j) {
  return job.firstLineTime + j * job.lineInterval - job.centreTime;
}

// The weight falls with the distance from the burst centre: its values on
// a line lie between those at the nearest and the farthest distance.
LineWeights Classify(const LineJob& job, int j) {
  const double dt = LineOffset(job, j);
  const double a = dt + job.shiftLo, b = dt + job.shiftHi;
  const double nearest = a * b <= 0.0 ? 0.0 : std::min(std::fabs(a), std::fabs(b));
  const double farthest = std::max(std::fabs(a), std::fabs(b));
  const float wNear = Weight(job, nearest, 0.0), wFar = Weight(job, farthest, 0.0);
  if (wNear == 0.0f && wFar == 0.0f) return kAllZero;
  if (wNear == 1.0f && wFar == 1.0f) return kAllOne;
  return kPartly;
}

void WeightLine(const LineJob& job, int j, fcomplex* row) {
  const double dt = LineOffset(job, j);
  const int n = job.samples;
  for (int x0 = 0; x0 < n; x0 += kWeightStride) {
    const int x1 = std::min(x0 + kWeightStride, n - 1);
    const float w0 = Weight(job, dt, job.shift[x0]);
    const float step = x1 > x0 ? (Weight(job, dt, job.shift[x1]) - w0) / (x1 - x0) : 0.0f;
    const int end = std::min(x0 + kWeightStride, n);
    for (int x = x0; x < end; ++x) row[x] *= w0 + step * (x - x0);
  }
}

// Copies `count` elements of the periodic array `from` (period n) starting
// at index `first` (any integer) into `to`.
void CopyPeriodic(const fcomplex* from, int n, int first, int count, fcomplex* to) {
  int at = first % n;
  if (at < 0) at += n;
  while (count > 0) {
    const int run = std::min(count, n - at);
    std::copy(from + at, from + at + run, to);
    to += run;
    count -= run;
    at = 0;
  }
}

// Processes line j of the burst; true when it went through the transforms.
bool ProcessLine(const LineJob& job, int j) {
  const LineWeights weights = Classify(job, j);
  if (weights == kAllZero) return false;
  fcomplex* row = job.block + static_cast<size_t>(j) * job.fftLength;
  float* out =
      job.ring + static_cast<size_t>((job.firstRingLine + j) % job.ringLines) * job.lookLength;
  convert_samples(job.raw + (j - job.firstRawLine) * job.lineLength + job.firstByte, job.cellType,
                  job.swap, row, CT_FLOAT_COMPLEX, static_cast<size_t>(job.samples));
  std::fill(row + job.samples, row + job.fftLength, fcomplex(0.0f, 0.0f));
  if (job.gain != nullptr)
    for (int x = 0; x < job.samples; ++x) row[x] *= job.gain[x];
  if (weights == kPartly) WeightLine(job, j, row);
  if (job.plain) {
    for (int x = 0; x < job.samples; ++x) out[x] += std::norm(row[x]);
    return false;
  }
  pfft_c(job.forward, row, row);
  fcomplex* look = job.lookBuffer;
  const int m = job.lookLength, h = job.halfWidth, n = job.fftLength;
  for (int l = 0; l < job.looks; ++l) {
    // The sub-band around the look centre, moved to zero frequency: the
    // upper half to the start of the buffer, the lower half to its end.
    const int c = job.lookCentre[l];
    CopyPeriodic(row, n, c, h, look);
    std::fill(look + h, look + m - h, fcomplex(0.0f, 0.0f));
    CopyPeriodic(row, n, c - h, h, look + m - h);
    pfft_c(job.inverse, look, look);
    for (int x = 0; x < m; ++x) out[x] += std::norm(look[x]) * job.scale;
  }
  return true;
}

}  // namespace

namespace mlook_detail {

std::string TempName(const char* output, int k) {
  return NVLR_UTILITY_Format("%sSS%d", output, k + 1);
}

float AzimuthWeight(double v, double w1, double w2) {
  if (w1 < 0.0) return 0.0f;
  if (v <= w1) return 1.0f;
  const double u = (v - w1) / w2;
  if (!(u > 0.0 && u <= 1.0)) return 0.0f;
  // cos(pi u / 2) = cos(k pi / 100) at k = 50 u.
  const double x = u * 0.5 * (kTaperEntries - 1);
  const int i = std::min(static_cast<int>(x), kTaperEntries - 2);
  const double f = x - i;
  const CosineTable& t = Cosines();
  return static_cast<float>((1.0 - f) * t.value[i] + f * t.value[i + 1]);
}

}  // namespace mlook_detail

// One sub-swath's burst processing: its buffers, plans, input and temporary
// file, and how far it has come.  Its bursts run in order on one thread at
// a time, so that each output line sums its bursts in burst order.
struct mlook::SwathRun {
  LineJob job{};
  vlr::CkBuffer<unsigned char> raw;
  vlr::CkBuffer<fcomplex> block, look;
  vlr::CkBuffer<float> ring;
  vlr::CkBuffer<double> shift;
  std::vector<float> gain;
  fft_plan_c forward, inverse;
  int lookCentre[kMaxLooks] = {};
  std::unique_ptr<RawFile> raster;
  std::unique_ptr<OutFile> temp;
  const GeneralSAR* gs = nullptr;
  const std::vector<double>* times = nullptr;
  int64_t firstLineOffset = 0;  // raster offset of line 0
  int linesPerBurst = 0;
  double burstCycle = 0.0;
  double rangeTime = 0.0;
  double fsSwath = 0.0;
  int written = 0;    // output lines written to the temporary file
  int nextBurst = 0;  // next burst to process
  bool busy = false;  // a thread is processing one of its bursts
  int64_t transformed = 0;
  BurstError error = BurstError::kNone;
};

// Writes the output lines before `upTo` to the temporary file and clears
// their ring lines.  Only computes and writes: runs on either thread.
bool mlook::flushswath(SwathRun* w, int upTo) const {
  const int L = w->linesPerBurst, m = w->job.lookLength;
  while (w->written < upTo) {
    // The lines up to the end of the ring or to upTo lie together.
    const int row = w->written % L;
    const int count = std::min(upTo - w->written, L - row);
    float* lines = w->ring.data() + static_cast<size_t>(row) * m;
    const int64_t bytes = static_cast<int64_t>(count) * m * sizeof(float);
    if (!w->temp->write(lines, bytes, static_cast<int64_t>(w->written) * m * sizeof(float)))
      return false;
    std::fill(lines, lines + static_cast<size_t>(count) * m, 0.0f);
    w->written += count;
  }
  return true;
}

// Processes burst b of a sub-swath.  Only computes, reads and writes: runs
// on either thread; a failure is left in w->error.
void mlook::processburst(SwathRun* w, int b) const {
  LineJob& job = w->job;
  const int L = w->linesPerBurst;
  const int n = job.samples;
  const std::vector<double>& times = *w->times;
  const int p = static_cast<int>(
      std::nearbyint((times[static_cast<size_t>(b)] - outputStartTime_) / lineInterval_));
  if (!flushswath(w, p)) {
    w->error = BurstError::kWrite;
    return;
  }
  // The burst centre from the burst cycle; the weight of a sample is
  // evaluated where its Doppler centroid puts it in the burst.
  job.centreTime = times[0] + b * w->burstCycle + 0.5 * (L - 1) * lineInterval_;
  job.firstLineTime = outputStartTime_ + p * lineInterval_;
  job.firstRingLine = p;
  const poly& dc = PlainSet(w->gs->polys.dc, job.centreTime);
  const poly& fr = PlainSet(w->gs->polys.fr, job.centreTime);
  double* shift = w->shift.data();
  for (int x = 0; x < n; ++x) {
    const double rt = w->rangeTime + x / w->fsSwath;
    shift[x] = poly::Value(dc.pol, rt - dc.trg0_s, job.centreTime - dc.taz0_s) /
               poly::Value(fr.pol, rt - fr.trg0_s, job.centreTime - fr.taz0_s);
    if (!std::isfinite(shift[x])) {
      w->error = BurstError::kDoppler;
      return;
    }
  }
  job.shiftLo = *std::min_element(shift, shift + n);
  job.shiftHi = *std::max_element(shift, shift + n);
  // Only the lines with a weight above 0 are read and processed.
  int first = 0, last = L;
  while (first < L && Classify(job, first) == kAllZero) ++first;
  while (last > first && Classify(job, last - 1) == kAllZero) --last;
  if (first == last) return;
  job.firstRawLine = first;
  const int64_t lineLength = job.lineLength;
  const int64_t offset = w->firstLineOffset + (static_cast<int64_t>(b) * L + first) * lineLength;
  if (!w->raster->read(w->raw.data(), (last - first) * lineLength, offset)) {
    w->error = BurstError::kRead;
    return;
  }
  for (int j = first; j < last; ++j) w->transformed += ProcessLine(job, j) ? 1 : 0;
}

int mlook::setupswath(int k, SwathRun* w) {
  VLR_SCOPE("setupswath", kModule);
  GeneralSAR& gs = *headers_[k];
  const mlook_swath_par& s = swathPar[k];
  const int L = s.linesPerBurst;
  const int nfft = fftLength_[k];
  const int m = lookLength_[k];
  const int n = s.samples - skip_[k];
  const bool plain = looks_ == 1 && decimation_ == 1;
  if (gs.polys.ndc < 1) VLR_FAIL("NO DC poly available", vlr::kLibMissing);
  if (gs.polys.nfr < 1) VLR_FAIL("NO FR poly available", vlr::kLibMissing);

  if (conf_->RgAnt_flag != 0) VLR_CALL(envi_beam_corr(k, &w->gain));

  if (!plain) {
    VLR_CALL(fft_makep_c(&w->forward, nfft, nfft, 1, 1, 1, 0, 1));
    // Backward transform without its division by m: the division goes into
    // the power scale.
    VLR_CALL(fft_makep_c(&w->inverse, m, m, 1, 1, -2, 0, 1));
  }
  // Spectrum bin of each look centre (negative frequencies count from the
  // end of the spectrum).
  for (int l = 0; l < looks_; ++l)
    w->lookCentre[l] = static_cast<int>(std::lround(lookFrequency_[l][k] / fs * nfft));
  const int halfWidth = static_cast<int>(std::lround(lookBandwidth_[k] / fs * nfft)) / 2;

  const DataFile& in = gs.datafile.data;
  const int64_t lineLength = in.line_length();
  bool allocated = w->raw.allocate(static_cast<size_t>(lineLength) * L) &&
                   w->block.allocate(static_cast<size_t>(nfft) * L) &&
                   w->ring.allocate(static_cast<size_t>(m) * L) && w->shift.allocate(n) &&
                   (plain || w->look.allocate(m));
  if (!allocated) VLR_FAIL("Cannot allocate the burst buffers", vlr::kLibAlloc);

  // The temporary file is created as an output of the run, then written
  // with positioned writes from whichever thread processes a burst.
  DataFile& temp = output_->swath[k];
  temp.set_name(mlook_detail::TempName(output_->OutputFilename, k).c_str());
  temp.pixels_per_line = m;
  temp.lines_per_image = outputLines_;
  temp.cell_type = CT_FLOAT32;
  temp.byte_order = 0;
  temp.row_prefix = 0;
  temp.header_offset = 0;
  VLR_CALL(temp.open(DataFile::kOpenCreate));
  tempWritten_[k] = true;
  VLR_CALL(temp.close());
  w->temp.reset(new (std::nothrow) OutFile(temp.name().c_str()));
  w->raster.reset(new (std::nothrow) RawFile(in.name().c_str()));
  if (!w->temp || !w->raster) VLR_FAIL("Cannot allocate the burst buffers", vlr::kLibAlloc);
  if (!w->temp->open()) VLR_FAIL("File not opened!", vlr::kLibOpen);
  if (!w->raster->open()) VLR_FAIL("File not opened!", vlr::kLibOpen);

  LineJob& job = w->job;
  job.raw = w->raw.data();
  job.lineLength = lineLength;
  job.firstByte = in.row_prefix + skip_[k] * in.element_sizeof();
  job.cellType = in.cell_type;
  job.swap = in.byte_order != 0;
  job.samples = n;
  job.fftLength = nfft;
  job.lookLength = m;
  job.looks = looks_;
  job.plain = plain;
  job.gain = w->gain.empty() ? nullptr : w->gain.data() + skip_[k];
  job.shift = w->shift.data();
  job.lineInterval = lineInterval_;
  job.burstCycle = s.burstCycle;
  job.w1 = conf_->W1;
  job.w2 = conf_->W2;
  job.lookCentre = w->lookCentre;
  job.halfWidth = halfWidth;
  job.scale = static_cast<float>(powerScale_[k] / (static_cast<double>(m) * m));
  job.forward = &w->forward;
  job.inverse = &w->inverse;
  job.block = w->block.data();
  job.lookBuffer = w->look.data();
  job.ring = w->ring.data();
  job.ringLines = L;

  w->gs = &gs;
  w->times = &burstTimes_[k];
  w->firstLineOffset = in.line_offset(0);
  w->linesPerBurst = L;
  w->burstCycle = s.burstCycle;
  w->rangeTime = rangeTime_[k];
  w->fsSwath = gs.sampling.frg_hz;
  w->nextBurst = firstBurst_;
  return 0;
}

// The bursts of all sub-swaths on both threads: a free thread takes the
// next burst of the sub-swath with the most work left that the other
// thread is not processing, so that the threads never wait for each other
// within a sub-swath and finish together.
int mlook::processswaths() {
  VLR_SCOPE("processswaths", kModule);
  std::unique_ptr<SwathRun> runs[kMlookSwaths];
  for (int k = 0; k < kMlookSwaths; ++k) {
    runs[k].reset(new (std::nothrow) SwathRun);
    if (!runs[k]) VLR_FAIL("Cannot allocate the burst buffers", vlr::kLibAlloc);
    VLR_CALL(setupswath(k, runs[k].get()));
    transformedLines_[k] = 0;
  }
  const int end = firstBurst_ + burstCount_;
  const int total = kMlookSwaths * burstCount_;
  std::mutex mutex;
  bool failed = false;
  std::exception_ptr raised;
  int done = 0;      // bursts finished
  int reported = 0;  // bursts whose start the progress has shown
  // Takes the next burst for the calling thread: false when none is left
  // (or a burst failed).  Called with the mutex held.
  auto take = [&](int* k, int* b) {
    if (failed) return false;
    double most = 0.0;
    *k = -1;
    for (int i = 0; i < kMlookSwaths; ++i) {
      const SwathRun& r = *runs[i];
      if (r.busy || r.nextBurst >= end) continue;
      const double left = static_cast<double>(end - r.nextBurst) * fftLength_[i];
      if (left > most) {
        most = left;
        *k = i;
      }
    }
    if (*k < 0) return false;
    *b = runs[*k]->nextBurst++;
    runs[*k]->busy = true;
    return true;
  };
  auto busyCount = [&runs] {
    int n = 0;
    for (const auto& r : runs) n += r->busy ? 1 : 0;
    return n;
  };
  auto worker = [&](bool reports) {
    std::unique_lock<std::mutex> lock(mutex);
    for (;;) {
      // Progress goes to the working file from the calling thread only: the
      // share of bursts begun, for every burst begun since the last report
      // (the other thread's too), so that no percentage is left out.  A
      // withdrawn run raises here: the burst loop stops and the raise goes
      // on once the other thread is done with the buffers.
      while (reports && !raised && reported < total && reported <= done + busyCount()) {
        const int percent = static_cast<int>(100LL * reported / total);
        lock.unlock();
        try {
          getAndSetPerc(percentShown_, percent, kProgressTitle);
          percentShown_ = percent;
        } catch (...) {
          raised = std::current_exception();
        }
        lock.lock();
        ++reported;
      }
      if (raised) {
        failed = true;
        return;
      }
      int k = 0, b = 0;
      if (!take(&k, &b)) return;
      lock.unlock();
      processburst(runs[k].get(), b);
      lock.lock();
      runs[k]->busy = false;
      failed = failed || runs[k]->error != BurstError::kNone;
      ++done;
    }
  };
  mlook_detail::ParallelChunks(helper_, 2, 1,
                               [&worker](int, int, int thread) { worker(thread == 0); });
  if (raised) std::rethrow_exception(raised);
  burstsDone_ = done;
  for (int k = 0; k < kMlookSwaths; ++k) {
    const BurstError error = runs[k]->error;
    if (error == BurstError::kRead) VLR_FAIL("File reading failed!", vlr::kLibRead);
    if (error == BurstError::kWrite) VLR_FAIL("File writing failed!", vlr::kLibWrite);
    if (error == BurstError::kDoppler)
      VLR_FAIL("Doppler centroid over Doppler rate is not a number", vlr::kLibInconsistent);
  }
  for (int k = 0; k < kMlookSwaths; ++k) {
    SwathRun& w = *runs[k];
    transformedLines_[k] = w.transformed;
    if (!flushswath(&w, outputLines_) || !w.temp->close())
      VLR_FAIL("File writing failed!", vlr::kLibWrite);
  }
  return 0;
}
