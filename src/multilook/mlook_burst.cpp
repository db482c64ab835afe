// Burst processing of one sub-swath: azimuth weighting, range looks and the
// accumulation of look powers on the output's line grid.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <cstring>
#include <new>
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
constexpr int kTempBufferBytes = 1 << 20;
constexpr int kThreads = 2;
// Burst lines a thread reads and processes at a time: one, so that the
// threads finish a burst together (a burst has a few dozen lines).
constexpr int kChunkLines = 1;
// Output lines kept in memory, in bursts: two, so that the lines a burst
// completes are written while the next one is processed.
constexpr int kRingBursts = 2;
// Samples whose Doppler shift a thread evaluates at a time.
constexpr int kShiftChunk = 512;

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

class RawFile;

// What the lines of every burst of a sub-swath share: the raster layout,
// the transforms, the gains, the look sub-bands and the azimuth weighting.
struct SwathLines {
  const RawFile* raster;
  int64_t lineLength;  // bytes per raw line
  int64_t firstByte;   // of the used samples in raster line 0
  int cellType;
  bool swap;
  bool native;                       // raw samples are the transforms' own
  unsigned char* rawLine[kThreads];  // the used raw samples of one line
  int samples;                       // samples used per line
  int fftLength;
  int lookLength;
  int looks;
  bool plain;
  const float* gain;  // per used sample, or null
  double lineInterval;
  double burstCycle;
  double w1, w2;
  const int* lookCentre;  // spectrum bin of each look centre
  int halfWidth;
  float scale;
  const fft_plan_c* forward;
  const fft_plan_c* inverse;
  fcomplex* block;  // one transform line per burst line
  fcomplex* lookBuffer[kThreads];
  float* ring;  // output lines, one burst long, used in turn
  int ringLines;
};

// What changes from one burst to the next; shared read-only by the threads.
struct BurstLines {
  int64_t firstLine;        // raster line of the burst's first line
  const double* shift;      // Doppler centroid over rate per used sample, s
  double shiftLo, shiftHi;  // their range
  double firstLineTime;     // grid time of the burst's first line
  double centreTime;
  int firstRingLine;  // output line of the burst's first line
};

// One line job: the sub-swath's part and the burst's part.
struct LineJob {
  const SwathLines& swath;
  const BurstLines& burst;
};

enum LineWeights { kAllZero, kAllOne, kPartly };

// A raster opened for positioned reads from several threads.
class RawFile {
 public:
  explicit RawFile(const char* name) : name_(name) {}
  ~RawFile() {
    if (fd_ >= 0) close(fd_);
  }
  RawFile(const RawFile&) = delete;
  RawFile& operator=(const RawFile&) = delete;
  bool open() {
    fd_ = ::open(name_, O_RDONLY);
    return fd_ >= 0;
  }
  // Asks the system to start reading n bytes at `offset` in the
  // background; only a hint.
  void prefetch(int64_t n, int64_t offset) const {
    (void)posix_fadvise(fd_, static_cast<off_t>(offset), static_cast<off_t>(n),
                        POSIX_FADV_WILLNEED);
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
  const char* name_;
  int fd_ = -1;
};

float Weight(const LineJob& job, double dt, double shift) {
  return mlook_detail::AzimuthWeight(std::fabs(dt + shift) / job.swath.burstCycle, job.swath.w1,
                                     job.swath.w2);
}

double LineOffset(const LineJob& job, int j) {
  return job.burst.firstLineTime + j * job.swath.lineInterval - job.burst.centreTime;
}

// The weight falls with the distance from the burst centre: its values on
// a line lie between those at the nearest and the farthest distance.
LineWeights Classify(const LineJob& job, int j) {
  const double dt = LineOffset(job, j);
  const double a = dt + job.burst.shiftLo, b = dt + job.burst.shiftHi;
  const double nearest = a * b <= 0.0 ? 0.0 : std::min(std::fabs(a), std::fabs(b));
  const double farthest = std::max(std::fabs(a), std::fabs(b));
  const float wNear = Weight(job, nearest, 0.0), wFar = Weight(job, farthest, 0.0);
  if (wNear == 0.0f && wFar == 0.0f) return kAllZero;
  if (wNear == 1.0f && wFar == 1.0f) return kAllOne;
  return kPartly;
}

void WeightLine(const LineJob& job, int j, fcomplex* row) {
  const double dt = LineOffset(job, j);
  const int n = job.swath.samples;
  for (int x0 = 0; x0 < n; x0 += kWeightStride) {
    const int x1 = std::min(x0 + kWeightStride, n - 1);
    const float w0 = Weight(job, dt, job.burst.shift[x0]);
    const float step = x1 > x0 ? (Weight(job, dt, job.burst.shift[x1]) - w0) / (x1 - x0) : 0.0f;
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

enum LineResult { kSkipped, kTransformed, kReadFailed };

// Processes line j of the burst.  Only the samples it uses are read, into
// the transform line itself when they are stored as the transforms take
// them.
LineResult ProcessLine(const LineJob& job, int j, int thread) {
  const LineWeights weights = Classify(job, j);
  if (weights == kAllZero) return kSkipped;
  fcomplex* row = job.swath.block + static_cast<size_t>(j) * job.swath.fftLength;
  float* out =
      job.swath.ring + static_cast<size_t>((job.burst.firstRingLine + j) % job.swath.ringLines) *
                           job.swath.lookLength;
  const SwathLines& sl = job.swath;
  const int64_t at = (job.burst.firstLine + j) * sl.lineLength + sl.firstByte;
  const int64_t bytes = static_cast<int64_t>(sl.samples) * cell_type_size(sl.cellType);
  if (sl.native) {
    if (!sl.raster->read(reinterpret_cast<unsigned char*>(row), bytes, at)) return kReadFailed;
  } else {
    if (!sl.raster->read(sl.rawLine[thread], bytes, at)) return kReadFailed;
    convert_samples(sl.rawLine[thread], sl.cellType, sl.swap, row, CT_FLOAT_COMPLEX,
                    static_cast<size_t>(sl.samples));
  }
  std::fill(row + job.swath.samples, row + job.swath.fftLength, fcomplex(0.0f, 0.0f));
  if (job.swath.gain != nullptr)
    for (int x = 0; x < job.swath.samples; ++x) row[x] *= job.swath.gain[x];
  if (weights == kPartly) WeightLine(job, j, row);
  if (job.swath.plain) {
    for (int x = 0; x < job.swath.samples; ++x) out[x] += std::norm(row[x]);
    return kSkipped;
  }
  pfft_c(job.swath.forward, row, row);
  fcomplex* look = job.swath.lookBuffer[thread];
  const int m = job.swath.lookLength, h = job.swath.halfWidth, n = job.swath.fftLength;
  for (int l = 0; l < job.swath.looks; ++l) {
    // The sub-band around the look centre, moved to zero frequency: the
    // upper half to the start of the buffer, the lower half to its end.
    const int c = job.swath.lookCentre[l];
    CopyPeriodic(row, n, c, h, look);
    std::fill(look + h, look + m - h, fcomplex(0.0f, 0.0f));
    CopyPeriodic(row, n, c - h, h, look + m - h);
    pfft_c(job.swath.inverse, look, look);
    for (int x = 0; x < m; ++x) out[x] += std::norm(look[x]) * job.swath.scale;
  }
  return kTransformed;
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

int mlook::processswath(int k) {
  VLR_SCOPE("processswath", kModule);
  mlook_swath& sw = swath_[k];
  GeneralSAR& gs = *sw.header;
  const mlook_swath_par& s = swathPar[k];
  const int L = s.linesPerBurst;
  const int nfft = sw.fftLength;
  const int m = sw.lookLength;
  const int n = s.samples - sw.skip;
  const bool plain = looks_ == 1 && decimation_ == 1;
  if (gs.polys.ndc < 1) VLR_FAIL("NO DC poly available", vlr::kLibMissing);
  if (gs.polys.nfr < 1) VLR_FAIL("NO FR poly available", vlr::kLibMissing);

  std::vector<float> gain;
  if (conf_->RgAnt_flag != 0) VLR_CALL(envi_beam_corr(k, &gain));

  fft_plan_c forward, inverse;
  if (!plain) {
    VLR_CALL(
        fft_makep_c(&forward, nfft, nfft, 1, 1, FftDirection::kForward, FftDirection::kNone, 1));
    // Backward transform without its division by m: the division goes into
    // the power scale.
    VLR_CALL(fft_makep_c(&inverse, m, m, 1, 1, FftDirection::kBackward, FftDirection::kNone, 1));
  }
  int lookCentre[kMaxLooks] = {};
  // Spectrum bin of each look centre (negative frequencies count from the
  // end of the spectrum).
  for (int l = 0; l < looks_; ++l)
    lookCentre[l] = static_cast<int>(std::lround(sw.lookFrequency[l] / fs * nfft));
  const int halfWidth = static_cast<int>(std::lround(sw.lookBandwidth / fs * nfft)) / 2;

  const DataFile& in = gs.datafile.data;
  const int64_t lineLength = in.line_length();
  vlr::CkBuffer<unsigned char> rawLine[kThreads];
  vlr::CkBuffer<fcomplex> block, lookBuffer[kThreads];
  vlr::CkBuffer<float> ring;
  vlr::CkBuffer<double> shift;
  const bool native = in.cell_type == CT_FLOAT_COMPLEX && in.byte_order == 0;
  bool allocated = block.allocate(static_cast<size_t>(nfft) * L) &&
                   ring.allocate(static_cast<size_t>(m) * kRingBursts * L) && shift.allocate(n);
  for (auto& b : lookBuffer) allocated = allocated && (plain || b.allocate(m));
  for (auto& b : rawLine) allocated = allocated && (native || b.allocate(lineLength));
  if (!allocated) VLR_FAIL("Cannot allocate the burst buffers", vlr::kLibAlloc);

  DataFile& temp = output_->swath[k];
  temp.set_name(mlook_detail::TempName(output_->OutputFilename, k).c_str());
  temp.pixels_per_line = m;
  temp.lines_per_image = outputLines_;
  temp.cell_type = CT_FLOAT32;
  temp.byte_order = 0;
  temp.row_prefix = 0;
  temp.header_offset = 0;
  temp.set_buffer_size(kTempBufferBytes);
  VLR_CALL(temp.open(DataFile::kOpenCreate));
  sw.tempWritten = true;
  // Both threads read the lines they process, with positioned reads on one
  // descriptor.
  RawFile raster(in.name().c_str());
  if (!raster.open()) VLR_FAIL("File not opened!", vlr::kLibOpen);

  const int64_t rowBytes = static_cast<int64_t>(m) * sizeof(float);
  const int ringLines = kRingBursts * L;
  int written = 0;
  // Writes the output lines before `upTo` and clears their ring lines.
  auto flush = [&](int upTo) -> int {
    for (; written < upTo; ++written) {
      float* line = ring.data() + static_cast<size_t>(written % ringLines) * m;
      const int rc = temp.write(line, rowBytes);
      if (rc != 0) return rc;
      std::fill(line, line + m, 0.0f);
    }
    return 0;
  };

  SwathLines lines{};
  lines.raster = &raster;
  lines.lineLength = lineLength;
  lines.firstByte = in.line_offset(0) + in.row_prefix + sw.skip * in.element_sizeof();
  lines.cellType = in.cell_type;
  lines.swap = in.byte_order != 0;
  lines.native = native;
  for (int t = 0; t < kThreads; ++t) lines.rawLine[t] = rawLine[t].data();
  lines.samples = n;
  lines.fftLength = nfft;
  lines.lookLength = m;
  lines.looks = looks_;
  lines.plain = plain;
  lines.gain = gain.empty() ? nullptr : gain.data() + sw.skip;
  lines.lineInterval = lineInterval_;
  lines.burstCycle = s.burstCycle;
  lines.w1 = conf_->W1;
  lines.w2 = conf_->W2;
  lines.lookCentre = lookCentre;
  lines.halfWidth = halfWidth;
  lines.scale = static_cast<float>(sw.powerScale / (static_cast<double>(m) * m));
  lines.forward = &forward;
  lines.inverse = &inverse;
  lines.block = block.data();
  for (int t = 0; t < kThreads; ++t) lines.lookBuffer[t] = lookBuffer[t].data();
  lines.ring = ring.data();
  lines.ringLines = ringLines;
  BurstLines burst{};
  burst.shift = shift.data();
  const LineJob job{lines, burst};

  sw.transformedLines = 0;
  const std::vector<double>& times = sw.burstTimes;
  const double fsSwath = gs.sampling.frg_hz;
  for (int b = firstBurst_; b < firstBurst_ + burstCount_; ++b) {
    const int total = kMlookSwaths * burstCount_;
    const int percent = static_cast<int>(100LL * burstsDone_ / total);
    getAndSetPerc(percentShown_, percent, kProgressTitle);
    percentShown_ = percent;
    ++burstsDone_;
    const int p = static_cast<int>(
        std::nearbyint((times[static_cast<size_t>(b)] - outputStartTime_) / lineInterval_));
    // The lines before p are complete.  Those that share ring lines with
    // this burst's are written now, the others while the burst is
    // processed.
    if (flush(p + L - ringLines) != 0) VLR_FAIL("File writing failed!", vlr::kLibWrite);
    // The burst centre from the burst cycle; the weight of a sample is
    // evaluated where its Doppler centroid puts it in the burst.
    burst.centreTime = times[0] + b * s.burstCycle + 0.5 * (L - 1) * lineInterval_;
    burst.firstLineTime = outputStartTime_ + p * lineInterval_;
    burst.firstRingLine = p;
    const double centre = burst.centreTime;
    const poly& dc = PlainSet(gs.polys.dc, centre);
    const poly& fr = PlainSet(gs.polys.fr, centre);
    // Both threads evaluate the polynomials, a stretch of samples at a time.
    bool notFinite[kThreads] = {};
    const double rangeTime = sw.rangeTime;
    mlook_detail::ParallelChunks(
        helper_, n, kShiftChunk,
        [&dc, &fr, &shift, &notFinite, rangeTime, fsSwath, centre](int from, int to, int thread) {
          for (int x = from; x < to; ++x) {
            const double rt = rangeTime + x / fsSwath;
            shift[x] = poly::Value(dc.pol, rt - dc.trg0_s, centre - dc.taz0_s) /
                       poly::Value(fr.pol, rt - fr.trg0_s, centre - fr.taz0_s);
            if (!std::isfinite(shift[x])) notFinite[thread] = true;
          }
        });
    if (notFinite[0] || notFinite[1])
      VLR_FAIL("Doppler centroid over Doppler rate is not a number", vlr::kLibInconsistent);
    burst.shiftLo = *std::min_element(shift.begin(), shift.end());
    burst.shiftHi = *std::max_element(shift.begin(), shift.end());
    // Only the lines with a weight above 0 are read and processed.
    int first = 0, last = L;
    while (first < L && Classify(job, first) == kAllZero) ++first;
    while (last > first && Classify(job, last - 1) == kAllZero) --last;
    if (first == last) continue;
    burst.firstLine = static_cast<int64_t>(b) * L;
    // The next burst is read from storage while this one is processed.
    if (b + 1 < firstBurst_ + burstCount_)
      raster.prefetch(L * lineLength, in.line_offset(static_cast<int64_t>(b + 1) * L));
    int transformed[kThreads] = {};
    bool readFailed[kThreads] = {};
    int flushed = 0;
    // Both threads take a line at a time, read it and process it; this
    // thread writes the complete lines first.
    mlook_detail::ParallelChunks(
        helper_, last - first, kChunkLines,
        [&job, &transformed, &readFailed, first](int from, int to, int thread) {
          for (int j = first + from; j < first + to && !readFailed[thread]; ++j) {
            const LineResult r = ProcessLine(job, j, thread);
            transformed[thread] += r == kTransformed ? 1 : 0;
            readFailed[thread] = r == kReadFailed;
          }
        },
        [&flush, &flushed, p] { flushed = flush(p); });
    if (flushed != 0) VLR_FAIL("File writing failed!", vlr::kLibWrite);
    if (readFailed[0] || readFailed[1]) VLR_FAIL("File reading failed!", vlr::kLibRead);
    sw.transformedLines += transformed[0] + transformed[1];
  }
  if (flush(outputLines_) != 0) VLR_FAIL("File writing failed!", vlr::kLibWrite);
  VLR_CALL(temp.close());
  return 0;
}
