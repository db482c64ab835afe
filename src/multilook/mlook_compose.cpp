// Recomposition of the five sub-swath power files into one image: side by
// side on the common range grid, range-spreading corrected amplitude, in
// slant range or resampled to ground range.
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <string>
#include <vector>

#include "metadata_sections/poly_selection.h"
#include "multilook/mlook.h"
#include "multilook/mlook_internal.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/light_speed.h"
#include "runtime/progress.h"
#include "signal/glsf.h"
#include "signal/polval.h"

namespace {

constexpr const char* kModule = "mlook_v2";
constexpr const char* kProgressTitle = "MULTILOOK SWATHS RECOMPOSITION";
constexpr int kProgressLines = 25;
constexpr double kDefaultReferenceRange = 800000.0;  // m
constexpr int kBufferBytes = 1 << 20;
// Output lines read, composed and written together; both threads compose
// the lines of a block, a few at a time.
constexpr int kBlockLines = 32;
constexpr int kComposeChunk = 2;
constexpr int kComposeThreads = 2;
// Interpolation kernels of the ground-range resampling.
constexpr int kKernelHalf = 6;
constexpr int kKernelTaps = 2 * kKernelHalf + 1;
constexpr float kKernelStep = 0.01f;
constexpr double kKernelBand = 0.8;
constexpr double kKernelGuard = 0.15;
// Newton iteration of the ground-to-slant mapping.
constexpr double kNewtonTolerance = 0.05;  // in range samples
constexpr int kNewtonSteps = 30;
// The resampling takes its range times from a grid of exact solutions,
// every kNodeSamples-th output sample of every kNodeLines-th line (and the
// last of each), interpolated bilinearly in between: the mapping is smooth
// in both directions.  On a full-size product the interpolated times stay
// within 0.005 composite samples of the exact solution (0.0014 from the
// range steps alone); with 16 lines between grid lines it would be 0.014.
constexpr int kNodeSamples = 8;
constexpr int kNodeLines = 8;

// c0 + c1 r + ... + c4 r^4 in r = rt - trg0: a data set's range polynomial
// with its azimuth terms taken at one azimuth time.
struct RangePoly {
  double c[5] = {};
  double trg0 = 0.0;
  void set(const poly& p, double az) {
    const double a = az - p.taz0_s;
    c[0] = p.pol[0] + p.pol[2] * a;
    c[1] = p.pol[1] + p.pol[3] * a;
    c[2] = p.pol[4];
    c[3] = p.pol[5];
    c[4] = p.pol[6];
    trg0 = p.trg0_s;
  }
  double value(double rt) const { return polval(c, 4, rt - trg0); }
  double slope(double rt) const {
    const double d[4] = {c[1], 2.0 * c[2], 3.0 * c[3], 4.0 * c[4]};
    return polval(d, 3, rt - trg0);
  }
};

// A family at one azimuth time: the two data sets around it, linearly
// weighted (the nearest one alone outside the family's span).
struct FamilyAt {
  RangePoly lo, hi;
  double w = 0.0;
  bool empty = true;
  template <class P>
  void set(const std::vector<P>& family, double az) {
    empty = family.empty();
    if (empty) return;
    const int n = static_cast<int>(family.size());
    const int i = poly_bracket_set(family, az);
    const int j = std::min(i + 1, n - 1);
    const double t0 = family[static_cast<size_t>(i)].taz0_s;
    const double t1 = family[static_cast<size_t>(j)].taz0_s;
    w = (j == i || !(t1 > t0)) ? 0.0 : std::min(1.0, std::max(0.0, (az - t0) / (t1 - t0)));
    lo.set(family[static_cast<size_t>(i)], az);
    hi.set(family[static_cast<size_t>(j)], az);
  }
  double value(double rt) const { return (1.0 - w) * lo.value(rt) + w * hi.value(rt); }
  double slope(double rt) const { return (1.0 - w) * lo.slope(rt) + w * hi.slope(rt); }
};

// Ground range along one line, measured from the first composite sample:
// each sub-swath's slant-to-ground polynomial holds on its own range span,
// and the polynomials are chained at the composition boundaries so that the
// ground range is continuous across the swath.
struct GroundLine {
  FamilyAt toGround[kMlookSwaths];
  FamilyAt toSlant[kMlookSwaths];
  double offset[kMlookSwaths] = {};  // added to a swath's own ground range
  double start[kMlookSwaths] = {};   // ground range where a swath's span starts
  double startTime[kMlookSwaths] = {};

  void set(const mlook_swath* swath, double az) {
    for (int i = 0; i < kMlookSwaths; ++i) {
      toGround[i].set(swath[i].header->polys.sl2gr, az);
      toSlant[i].set(swath[i].header->polys.gr2sl, az);
    }
    offset[0] = -toGround[0].value(swath[0].boundaryTime);
    start[0] = 0.0;
    startTime[0] = swath[0].boundaryTime;
    for (int i = 1; i < kMlookSwaths; ++i) {
      const double g = toGround[i - 1].value(swath[i].boundaryTime) + offset[i - 1];
      offset[i] = g - toGround[i].value(swath[i].boundaryTime);
      start[i] = g;
      startTime[i] = swath[i].boundaryTime;
    }
  }
  double ground(double rt) const {
    int i = kMlookSwaths - 1;
    while (i > 0 && rt < startTime[i]) --i;
    return toGround[i].value(rt) + offset[i];
  }
  // Two-way range time of ground range g; `guess` is a start value or NaN.
  double slant(double g, double guess, double tolerance) const {
    int i = kMlookSwaths - 1;
    while (i > 0 && g < start[i]) --i;
    const FamilyAt& f = toGround[i];
    double rt = guess;
    if (!std::isfinite(rt)) {
      rt = toSlant[i].empty ? startTime[i] : toSlant[i].value(g - offset[i]);
      if (!std::isfinite(rt)) rt = startTime[i];
    }
    for (int step = 0; step < kNewtonSteps; ++step) {
      const double slope = f.slope(rt);
      if (!(slope != 0.0) || !std::isfinite(slope)) return NAN;
      const double delta = (f.value(rt) + offset[i] - g) / slope;
      rt -= delta;
      if (std::fabs(delta) <= tolerance) return rt;
    }
    return NAN;
  }
};

// Node k of n + 1 nodes `stride` apart over positions 0 .. last.
int NodeCount(int last, int stride) {
  return last / stride + 1 + (last % stride != 0 ? 1 : 0);
}
int NodePosition(int k, int last, int stride) {
  return std::min(k * stride, last);
}

// Weights of position x between its two nodes: the lower node and the
// fraction towards the next.
void Bracket(int x, int last, int stride, int nodes, int* k, double* f) {
  *k = std::min(x / stride, nodes - 1);
  const int k1 = std::min(*k + 1, nodes - 1);
  const int x0 = NodePosition(*k, last, stride), x1 = NodePosition(k1, last, stride);
  *f = x1 > x0 ? static_cast<double>(x - x0) / (x1 - x0) : 0.0;
  if (k1 == *k) *f = 0.0;
}

// Whether the ground axis between two node times is not one smooth curve:
// the nodes lie in different sub-swaths (the axis bends at their boundary)
// or one of them has no solution.
bool Bends(double t0, double t1, const GroundLine& axis) {
  if (!std::isfinite(t0) || !std::isfinite(t1)) return true;
  for (int i = 1; i < kMlookSwaths; ++i)
    if ((t0 < axis.startTime[i]) != (t1 < axis.startTime[i])) return true;
  return false;
}

// Range time of output sample j of a line from the line's node times:
// linear between the two nodes around it, except where the axis bends
// between them; there the sample is solved exactly.
double SampleTime(const double* nodes, int lastNode, int last, int j, const GroundLine& axis,
                  double step, double tolerance) {
  const int k = std::min(j / kNodeSamples, lastNode);
  const int k1 = std::min(k + 1, lastNode);
  const int j0 = k * kNodeSamples, j1 = std::min(k1 * kNodeSamples, last);
  const double t0 = nodes[k], t1 = nodes[k1];
  const bool exact = Bends(t0, t1, axis);
  if (j == j0) return exact && !std::isfinite(t0) ? axis.slant(j * step, NAN, tolerance) : t0;
  const double tau = j1 > j0 ? t0 + (t1 - t0) * (j - j0) / (j1 - j0) : t0;
  if (!exact) return tau;
  return axis.slant(j * step, std::isfinite(tau) ? tau : NAN, tolerance);
}

}  // namespace

// Range times of the grid nodes, each by Newton iteration from the node
// of the previous grid line.
int mlook::groundgrid() {
  VLR_SCOPE("groundgrid", kModule);
  const int lastSample = outputSamples_ - 1, lastLine = outputLines_ - 1;
  gridColumns_ = NodeCount(lastSample, kNodeSamples);
  gridRows_ = NodeCount(lastLine, kNodeLines);
  try {
    gridTimes_.assign(static_cast<size_t>(gridColumns_) * gridRows_, NAN);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the ground-range grid", vlr::kLibAlloc);
  }
  const double tolerance = kNewtonTolerance / fs;
  GroundLine axis;
  for (int r = 0; r < gridRows_; ++r) {
    axis.set(swath_, outputStartTime_ + NodePosition(r, lastLine, kNodeLines) * lineInterval_);
    double* row = &gridTimes_[static_cast<size_t>(r) * gridColumns_];
    const double* above = r > 0 ? row - gridColumns_ : nullptr;
    for (int c = 0; c < gridColumns_; ++c)
      row[c] = axis.slant(NodePosition(c, lastSample, kNodeSamples) * conf_->GrSamplingStep,
                          above != nullptr ? above[c] : NAN, tolerance);
  }
  return 0;
}

// The range times of one line at the grid's node columns.
void mlook::gridline(int line, double* nodes) const {
  int r = 0;
  double v = 0.0;
  Bracket(line, outputLines_ - 1, kNodeLines, gridRows_, &r, &v);
  const int r1 = std::min(r + 1, gridRows_ - 1);
  const double* above = &gridTimes_[static_cast<size_t>(r) * gridColumns_];
  const double* below = &gridTimes_[static_cast<size_t>(r1) * gridColumns_];
  for (int k = 0; k < gridColumns_; ++k) nodes[k] = above[k] + (below[k] - above[k]) * v;
}

int mlook::resampledRangeTime(int column, int line, double* range) const {
  if (conf_->geometry() != OutputGeometry::kGroundRange || gridTimes_.empty() || column < 0 ||
      column >= outputSamples_ || line < 0 || line >= outputLines_)
    return vlr::kLibInconsistent;
  GroundLine axis;
  axis.set(swath_, outputStartTime_ + line * lineInterval_);
  std::vector<double> nodes(static_cast<size_t>(gridColumns_));
  gridline(line, nodes.data());
  *range = SampleTime(nodes.data(), gridColumns_ - 1, outputSamples_ - 1, column, axis,
                      conf_->GrSamplingStep, kNewtonTolerance / fs);
  return std::isfinite(*range) ? 0 : vlr::kLibInconsistent;
}

int mlook::composeswaths() {
  VLR_SCOPE("composeswaths", kModule);
  const int D = decimation_;
  const double spacing = D / fs;  // composite sample spacing, s
  // Extent of each swath in the composite; neighbours meet in the middle of
  // their overlap.
  int begin[kMlookSwaths], end[kMlookSwaths];
  for (int i = 0; i < kMlookSwaths; ++i) {
    begin[i] = swath_[i].offset;
    end[i] = swath_[i].offset + swath_[i].valid;
  }
  for (int i = 1; i < kMlookSwaths; ++i) {
    if (end[i - 1] > swath_[i].offset) {
      begin[i] = swath_[i].offset + (end[i - 1] - swath_[i].offset) / 2;
      end[i - 1] = begin[i];
    }
  }
  int width = 0;
  for (int i = 0; i < kMlookSwaths; ++i) width = std::max(width, end[i]);
  compositeSamples_ = width;
  for (int i = 0; i < kMlookSwaths; ++i)
    swath_[i].boundaryTime = swath_[0].rangeTime + begin[i] * spacing;

  // Range-spreading correction: amplitude sqrt(P r^3 / 3), r the range over
  // the reference range.
  double reference = swath_[0].header->dataSetInfo.RO_REF;
  if (!(reference > 0.0) || !std::isfinite(reference)) reference = kDefaultReferenceRange;
  const double referenceTime = reference / kHalfSpeedOfLight;
  // The composite line with kKernelHalf copies of its edge samples on
  // either side, so that the kernels never leave it.
  // One padded composite line per thread; the sub-swath lines of two
  // blocks of output lines (one composed while the next is read).
  vlr::CkBuffer<float> spread, padded[kComposeThreads];
  vlr::CkBuffer<float> lines[2][kMlookSwaths];
  bool allocated = spread.allocate(width);
  for (auto& b : padded) allocated = allocated && b.allocate(width + 2 * kKernelHalf);
  for (auto& set : lines)
    for (int i = 0; i < kMlookSwaths; ++i)
      allocated =
          allocated && set[i].allocate(static_cast<size_t>(swath_[i].lookLength) * kBlockLines);
  if (!allocated) VLR_FAIL("Cannot allocate the composition buffers", vlr::kLibAlloc);
  for (int k = 0; k < width; ++k) {
    const double r = (swath_[0].rangeTime + k * spacing) / referenceTime;
    spread[k] = static_cast<float>(r * r * r / 3.0);
  }

  // Ground range: the ground width of the swath changes along the scene
  // (the far edge moves by several samples over a long product), so the
  // output is as wide as the widest line; shorter lines end in zeros.
  const bool ground = conf_->geometry() == OutputGeometry::kGroundRange;
  GroundLine axis;
  std::vector<float> kernels;
  if (ground) {
    for (int k = 0; k < kMlookSwaths; ++k)
      if (swath_[k].header->polys.nsl2gr < 1) VLR_FAIL("NO SL2GR poly available", vlr::kLibMissing);
    if (!(conf_->GrSamplingStep > 0))
      VLR_FAIL("Ground sampling step not positive", vlr::kLibInconsistent);
    const double farTime = swath_[0].rangeTime + (width - 1) * spacing;
    double far = -1.0;
    int widest = 0;
    for (int line = 0; line < outputLines_; ++line) {
      axis.set(swath_, outputStartTime_ + line * lineInterval_);
      const double g = axis.ground(farTime);
      if (!std::isfinite(g)) {
        far = NAN;
        break;
      }
      if (g > far) {
        far = g;
        widest = line;
      }
    }
    const double count = std::floor(far / conf_->GrSamplingStep + 1.0);
    if (!(count >= 1.0) || count > 16.0 * width)
      VLR_FAIL("Slant-to-ground polynomials give no ground range across the swath",
               vlr::kLibInconsistent);
    outputSamples_ = static_cast<int>(count);
    axis.set(swath_, outputStartTime_ + widest * lineInterval_);
    outputFarRangeTime_ =
        axis.slant((outputSamples_ - 1) * conf_->GrSamplingStep, NAN, kNewtonTolerance / fs);
    const int phases = static_cast<int>(1.0f + 1.0f / kKernelStep);
    try {
      kernels.assign(static_cast<size_t>(phases) * kKernelTaps, 0.0f);
    } catch (const std::bad_alloc&) {
      VLR_FAIL("Cannot allocate the interpolation kernels", vlr::kLibAlloc);
    }
    float shift = -0.5f;
    for (int p = 0; p < phases; ++p, shift += kKernelStep)
      VLR_CALL(glsF(&kernels[static_cast<size_t>(p) * kKernelTaps], kKernelTaps, shift, kKernelBand,
                    kKernelGuard));
  } else {
    outputSamples_ = width;
    outputFarRangeTime_ = swath_[0].rangeTime + (width - 1) * spacing;
  }
  vlr::CkBuffer<float> outLines[2];
  vlr::CkBuffer<double> lineNodes[kComposeThreads];
  if (!outLines[0].allocate(static_cast<size_t>(outputSamples_) * kBlockLines) ||
      !outLines[1].allocate(static_cast<size_t>(outputSamples_) * kBlockLines))
    VLR_FAIL("Cannot allocate the output lines", vlr::kLibAlloc);
  if (ground) {
    VLR_CALL(groundgrid());
    for (auto& b : lineNodes)
      if (!b.allocate(gridColumns_)) VLR_FAIL("Cannot allocate the ground line", vlr::kLibAlloc);
  }

  for (int i = 0; i < kMlookSwaths; ++i) {
    DataFile& f = output_->swath[i];
    f.set_buffer_size(kBufferBytes);
    VLR_CALL(f.open(DataFile::kOpenRead));
  }
  const std::string name = output_->OutputFilename;
  if (NVLR_UTILITY_FileExists(name.c_str()) && unlink(name.c_str()) != 0)
    VLR_REPORT("Cannot remove file", ARE_WARNING);
  errno = 0;
  DataFile& image = output_->image;
  image.set_name(name.c_str());
  image.pixels_per_line = outputSamples_;
  image.lines_per_image = outputLines_;
  image.cell_type = CT_FLOAT32;
  image.byte_order = 0;
  image.row_prefix = 0;
  image.header_offset = 0;
  image.set_buffer_size(kBufferBytes);
  VLR_CALL(image.open(DataFile::kOpenCreate));

  const double tolerance = kNewtonTolerance / fs;
  const int phases = static_cast<int>(kernels.size() / kKernelTaps);
  // Output line `line` from the sub-swath lines at `row` of block buffer
  // `set`, into that block's output row.  Only computes: the two threads run
  // it on different lines.
  auto composeLine = [&](int line, int row, int set, int thread) {
    float* composite = padded[thread].data() + kKernelHalf;
    float* out = outLines[set].data() + static_cast<size_t>(row) * outputSamples_;
    std::fill(composite, composite + width, 0.0f);
    for (int i = 0; i < kMlookSwaths; ++i) {
      const float* from = lines[set][i].data() + static_cast<size_t>(row) * swath_[i].lookLength;
      for (int k = begin[i]; k < end[i]; ++k) composite[k] = from[k - swath_[i].offset];
    }
    if (!ground) {
      for (int k = 0; k < width; ++k) out[k] = std::sqrt(std::max(0.0f, composite[k]) * spread[k]);
      return;
    }
    for (int k = 0; k < width; ++k)
      composite[k] = std::sqrt(std::max(0.0f, composite[k]) * spread[k]);
    GroundLine axis;
    axis.set(swath_, outputStartTime_ + line * lineInterval_);
    std::fill(padded[thread].begin(), composite, composite[0]);
    std::fill(composite + width, padded[thread].end(), composite[width - 1]);
    const float* c = composite;
    const double step = conf_->GrSamplingStep;
    const double first = swath_[0].rangeTime;
    const float* table = kernels.data();
    const double phaseScale = 1.0 / kKernelStep;
    // This line's range times at the grid's node columns, then between
    // them.
    double* nodes = lineNodes[thread].data();
    gridline(line, nodes);
    const int count = outputSamples_;
    const int last = count - 1;
    const int lastNode = gridColumns_ - 1;
    // Composite sample x resampled: the kernel of x's phase around the
    // nearest composite sample; 0 outside the composite line.
    auto resample = [&](double x) -> float {
      if (!(x >= -0.5 && x <= width - 0.5)) return 0.0f;
      // x >= -0.5 here, so truncation rounds to nearest.
      const int i0 = static_cast<int>(x + 0.5);
      int phase = static_cast<int>((x - i0) * phaseScale + 0.5 + phases / 2);
      phase = std::min(std::max(phase, 0), phases - 1);
      const float* kernel = table + static_cast<size_t>(phase) * kKernelTaps;
      float sum = 0.0f;
      const float* around = c + std::min(i0, width - 1) - kKernelHalf;
      for (int t = 0; t < kKernelTaps; ++t) sum += kernel[t] * around[t];
      // Kernel side lobes may undershoot next to dark samples; an
      // amplitude is never negative.
      return std::max(sum, 0.0f);
    };
    for (int k = 0; k < lastNode; ++k) {
      const int j0 = k * kNodeSamples, j1 = std::min(j0 + kNodeSamples, last);
      if (Bends(nodes[k], nodes[k + 1], axis)) {
        for (int j = j0; j < j1; ++j)
          out[j] = resample((SampleTime(nodes, lastNode, last, j, axis, step, tolerance) - first) /
                            spacing);
        continue;
      }
      // Linear in range time, so linear in composite position.
      const double x0 = (nodes[k] - first) / spacing;
      const double dx = ((nodes[k + 1] - first) / spacing - x0) / (j1 - j0);
      for (int j = j0; j < j1; ++j) out[j] = resample(x0 + dx * (j - j0));
    }
    out[last] = resample((SampleTime(nodes, lastNode, last, last, axis, step, tolerance) - first) /
                         spacing);
  };
  // Blocks of lines, composed on both threads; this thread first writes
  // the block before and reads the block after, so that the file traffic
  // overlaps the composition.
  auto readBlock = [&](int block, int set) -> bool {
    const int count = std::min(kBlockLines, outputLines_ - block);
    for (int i = 0; i < kMlookSwaths; ++i)
      if (output_->swath[i].read(lines[set][i].data(), static_cast<int64_t>(swath_[i].lookLength) *
                                                           count * sizeof(float)) != 0)
        return false;
    return true;
  };
  auto writeBlock = [&](int block, int set) -> bool {
    const int count = std::min(kBlockLines, outputLines_ - block);
    return image.write(outLines[set].data(),
                       static_cast<int64_t>(outputSamples_) * count * sizeof(float)) == 0;
  };
  if (!readBlock(0, 0)) VLR_FAIL("File reading failed!", vlr::kLibRead);
  int percent = -1;
  for (int block = 0, set = 0; block < outputLines_; block += kBlockLines, set ^= 1) {
    const int count = std::min(kBlockLines, outputLines_ - block);
    for (int line = block; line < block + count; ++line) {
      if (line % kProgressLines == 0) {
        const int now = static_cast<int>(100LL * line / outputLines_);
        getAndSetPerc(percent, now, kProgressTitle);
        percent = now;
      }
    }
    bool readOk = true, writeOk = true;
    const int next = block + kBlockLines;
    mlook_detail::ParallelChunks(
        helper_, count, kComposeChunk,
        [&composeLine, block, set](int from, int to, int thread) {
          for (int row = from; row < to; ++row) composeLine(block + row, row, set, thread);
        },
        [&] {
          if (block > 0) writeOk = writeBlock(block - kBlockLines, set ^ 1);
          if (next < outputLines_) readOk = readBlock(next, set ^ 1);
        });
    if (!writeOk) VLR_FAIL("File writing failed!", vlr::kLibWrite);
    if (!readOk) VLR_FAIL("File reading failed!", vlr::kLibRead);
    if (next >= outputLines_ && !writeBlock(block, set))
      VLR_FAIL("File writing failed!", vlr::kLibWrite);
  }
  for (int i = 0; i < kMlookSwaths; ++i) output_->swath[i].close();
  VLR_CALL(image.close());
  return 0;
}

int mlook::outputPixelTimes(double column, double row, double* azimuth, double* range) {
  VLR_SCOPE("outputPixelTimes", kModule);
  if (swath_[0].header == nullptr || !(fs > 0.0) || decimation_ < 1 || outputLines_ < 1)
    VLR_FAIL("The output geometry is not known", vlr::kLibInconsistent);
  const double az = outputStartTime_ + row * lineInterval_;
  double rt = swath_[0].rangeTime + column * decimation_ / fs;
  if (conf_->geometry() == OutputGeometry::kGroundRange) {
    // The same chained ground axis as the resampling, at the pixel's line.
    GroundLine axis;
    axis.set(swath_, az);
    rt = axis.slant(column * conf_->GrSamplingStep, NAN, kNewtonTolerance / fs);
    if (!std::isfinite(rt)) VLR_FAIL("No slant range for the ground range", vlr::kLibInconsistent);
  }
  *azimuth = az;
  *range = rt;
  return 0;
}

int mlook::geolocate(double column, double row, double* lat, double* lon) {
  VLR_SCOPE("geolocate", kModule);
  double az = 0.0, rt = 0.0;
  VLR_CALL(outputPixelTimes(column, row, &az, &rt));
  VLR_CALL(swath_[0].header->orbit.SVGetLatLon(az, rt, lat, lon));
  return 0;
}
