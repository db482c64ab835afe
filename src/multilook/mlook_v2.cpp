// The multilook processor's lifecycle: reading the sub-swath headers, the
// burst timing of the output, the run over the sub-swaths, and release.
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>
#include <new>
#include <string>

#include "convert/imagesar_kestova.h"
#include "multilook/mlook.h"
#include "multilook/mlook_internal.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/run_outputs.h"
#include "time/mjd_time.h"

namespace {

constexpr const char* kModule = "mlook_v2";
// Bytes of the line prefix that hold the line's time record.
constexpr int kLineTimeBytes = static_cast<int>(kMjdRecordSize);
// Quality flag of the line prefix, after the time: -1 marks a blank line.
constexpr int kQualityByte = 12;
// Sub-swaths must share their line interval to this relative precision.
constexpr double kLineIntervalTolerance = 1e-3;
// Most output lines per raster line of the longest sub-swath: the bursts of
// a sub-swath overlap, so an output longer than its input means broken times.
constexpr int kMaxOutputLinesPerInputLine = 4;

bool Positive(double v) {
  return v > 0.0 && std::isfinite(v);
}

// The time of a line prefix of `bytes` bytes (the quality flag counts when
// it is among them), or NaN for a blank line.
double LineTime(const unsigned char* prefix, int bytes) {
  if (bytes > kQualityByte && static_cast<signed char>(prefix[kQualityByte]) == -1) return NAN;
  bool set = false;
  for (int i = 0; i < kLineTimeBytes; ++i) set = set || prefix[i] != 0;
  if (!set) return NAN;
  MjdRecord record;
  std::memcpy(record.bytes, prefix, kLineTimeBytes);
  return mjd2sec85(record);
}

}  // namespace

mlook::mlook(mlook_conf* conf, mlook_input* input, mlook_output* output)
    : conf_(conf), input_(input), output_(output) {}

mlook::~mlook() {
  release();
}

void mlook::release() {
  for (mlook_swath& s : swath_) {
    s.header.reset();
    std::vector<double>().swap(s.burstTimes);
  }
  std::vector<double>().swap(gridTimes_);
}

int mlook::readimages() {
  VLR_SCOPE("readimages", kModule);
  for (int k = 0; k < kMlookSwaths; ++k) {
    const std::string header = NVLR_UTILITY_Format("%s%d.hdr", input_->Level1Filename, k + 1);
    VLR_CALL(readswath(k, header.c_str(), false));
  }
  VLR_CALL(checkbursts());
  return 0;
}

int mlook::readimages_kestova() {
  VLR_SCOPE("readimages_kestova", kModule);
  for (int k = 0; k < kMlookSwaths; ++k) {
    const std::string header = NVLR_UTILITY_Format("%s%d_slc_hdr", input_->Level1Filename, k + 1);
    VLR_CALL(readswath(k, header.c_str(), true));
  }
  VLR_CALL(checkbursts());
  return 0;
}

int mlook::readswath(int k, const char* header, bool kestova) {
  VLR_SCOPE("readswath", kModule);
  if (std::string(header).size() >= kMlookNameSize)
    VLR_FAIL("Sub-swath file name too long", vlr::kLibInconsistent);
  try {
    swath_[k].header.reset(new GeneralSAR);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the sub-swath header", vlr::kLibAlloc);
  }
  GeneralSAR& gs = *swath_[k].header;
  if (kestova) {
    VLR_CALL(readhdr_kestova(header, &gs));
  } else {
    VLR_CALL(gs.GSread(header));
  }
  for (const GeneralSAR::GSObject o :
       {GeneralSAR::GS_DATAFILE, GeneralSAR::GS_ROI, GeneralSAR::GS_POLYSAR,
        GeneralSAR::GS_SAMPLING, GeneralSAR::GS_SWATHINFO, GeneralSAR::GS_DATASETINFO}) {
    if (!gs.GSexists(o))
      VLR_FAIL(
          NVLR_UTILITY_Format("Sub-swath %d: header %s lacks a section", k + 1, header).c_str(),
          vlr::kLibMissing);
  }
  const DataFile& data = gs.datafile.data;
  const ROI_Obj& roi = gs.roi.roi;
  mlook_swath_par& s = swathPar[k];
  s.samples = data.pixels_per_line;
  s.lines = data.lines_per_image;
  s.bursts = gs.swathInfo.Bursts;
  s.linesPerBurst = gs.swathInfo.Lines_per_burst;
  s.firstRangeTime = roi.FastStartTime;
  s.bandwidth = gs.sampling.Brg_hz;
  s.lineInterval = roi.SlowTimeDelta;
  s.burstCycle = gs.sampling.bri_s;
  const int polar = gs.dataSetInfo.getPolarizationNbr();
  s.polarisation = polar == 0 || polar == 1 ? polar : 2;
  if (!data.is_complex() || data.row_prefix < kLineTimeBytes || data.check_description() != 0)
    VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: raster %s is not a complex raster with line times",
                                 k + 1, data.name().c_str())
                 .c_str(),
             vlr::kLibInconsistent);
  if (s.samples < 1 || s.linesPerBurst < 1 || s.bursts < 1 ||
      static_cast<int64_t>(s.bursts) * s.linesPerBurst > s.lines)
    VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: %d bursts of %d lines do not fit %d lines", k + 1,
                                 s.bursts, s.linesPerBurst, s.lines)
                 .c_str(),
             vlr::kLibInconsistent);
  if (!Positive(s.lineInterval) || !Positive(s.burstCycle) || !Positive(s.firstRangeTime))
    VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: line interval, burst cycle or range time not "
                                 "positive",
                                 k + 1)
                 .c_str(),
             vlr::kLibInconsistent);
  if (!data.holds_data())
    VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: raster %s missing or shorter than its header",
                                 k + 1, data.name().c_str())
                 .c_str(),
             vlr::kLibMissing);
  if (gs.polys.nsl2theta < 1) VLR_FAIL("NO SL2THETA poly available", vlr::kLibMissing);
  const double fsSwath = gs.sampling.frg_hz;
  if (!Positive(fsSwath)) VLR_FAIL("Range sampling frequency not positive", vlr::kLibInconsistent);
  if (k == 0) fs = fsSwath;
  const double midRange = s.firstRangeTime + 0.5 * (s.samples - 1) / fsSwath;
  const double midAzimuth = roi.SlowStartTime + 0.5 * roi.SlowTimeLength;
  s.incidence = gs.polys.EvaluateSL2THETA(midRange, midAzimuth);
  return 0;
}

int mlook::checkbursts() {
  VLR_SCOPE("checkbursts", kModule);
  int available = swathPar[0].bursts;
  for (const mlook_swath_par& s : swathPar) available = std::min(available, s.bursts);
  const int skip = input_->BurstsToSkip;
  const int process = input_->BurstsToProcess == 0 ? available - skip : input_->BurstsToProcess;
  if (skip < 0 || process < 1 || static_cast<int64_t>(skip) + process > available)
    VLR_FAIL("Bursts To Skip + Bursts To Process are greater than available bursts",
             vlr::kLibInconsistent);
  firstBurst_ = skip;
  burstCount_ = process;
  for (int k = 1; k < kMlookSwaths; ++k) {
    if (std::fabs(swathPar[k].lineInterval / swathPar[0].lineInterval - 1.0) >
        kLineIntervalTolerance)
      VLR_FAIL("Sub-swaths with different line intervals", vlr::kLibInconsistent);
  }
  return 0;
}

// Times of the first line of every burst of sub-swath k, on the burst
// structure: record r is line r mod L of burst r / L, bursts one burst cycle
// apart.  The structure is anchored at the first line that carries a time
// (blank lines, quality -1 or an all-zero time, carry none, and products
// may begin or end with them); without any, at the start time of the
// sub-swath's header.
int mlook::readbursttimes(int k, std::vector<double>* times) {
  VLR_SCOPE("readbursttimes", kModule);
  const mlook_swath_par& s = swathPar[k];
  const DataFile& described = swath_[k].header->datafile.data;
  try {
    times->assign(static_cast<size_t>(s.bursts), 0.0);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the burst times", vlr::kLibAlloc);
  }
  const int prefixBytes = described.row_prefix > kQualityByte ? kQualityByte + 1 : kLineTimeBytes;
  DataFile data(described);
  VLR_CALL(data.open(DataFile::kOpenRead));
  double anchor = NAN;
  for (int64_t r = 0; r < s.lines && std::isnan(anchor); ++r) {
    unsigned char prefix[kQualityByte + 1] = {};
    int rc = data.seek(data.line_offset(r), DataFile::kSeekSet);
    if (rc == 0) rc = data.read(prefix, prefixBytes);
    if (rc != 0) {
      data.close();
      VLR_FAIL("File reading failed!", vlr::kLibRead);
    }
    const double t = LineTime(prefix, prefixBytes);
    if (std::isfinite(t))
      anchor = t - static_cast<double>(r / s.linesPerBurst) * s.burstCycle -
               static_cast<double>(r % s.linesPerBurst) * s.lineInterval;
  }
  data.close();
  if (std::isnan(anchor)) {
    anchor = swath_[k].header->roi.roi.SlowStartTime;
    if (!Positive(anchor))
      VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: no line time and no start time", k + 1).c_str(),
               vlr::kLibInconsistent);
  }
  for (int b = 0; b < s.bursts; ++b)
    (*times)[static_cast<size_t>(b)] = anchor + static_cast<double>(b) * s.burstCycle;
  return 0;
}

// The azimuth grid of the output: it starts at the earliest first processed
// line of all sub-swaths, keeps the line interval, and ends after the last
// line of the latest processed burst.
int mlook::timing() {
  VLR_SCOPE("timing", kModule);
  lineInterval_ = swathPar[0].lineInterval;
  int longest = 0;
  for (int k = 0; k < kMlookSwaths; ++k) {
    VLR_CALL(readbursttimes(k, &swath_[k].burstTimes));
    longest = std::max(longest, swathPar[k].lines);
  }
  outputStartTime_ = swath_[0].burstTimes[static_cast<size_t>(firstBurst_)];
  for (int k = 1; k < kMlookSwaths; ++k)
    outputStartTime_ =
        std::min(outputStartTime_, swath_[k].burstTimes[static_cast<size_t>(firstBurst_)]);
  const double maxLines = static_cast<double>(kMaxOutputLinesPerInputLine) * longest;
  double end = 0.0;
  for (int k = 0; k < kMlookSwaths; ++k) {
    const double last = swath_[k].burstTimes[static_cast<size_t>(firstBurst_ + burstCount_ - 1)];
    const double lines =
        std::nearbyint((last - outputStartTime_) / lineInterval_) + swathPar[k].linesPerBurst;
    end = std::max(end, lines);
  }
  if (!(end <= maxLines))
    VLR_FAIL("Burst times span more lines than the sub-swaths hold", vlr::kLibInconsistent);
  outputLines_ = static_cast<int>(end);
  return 0;
}

int mlook::run() {
  VLR_SCOPE("run", kModule);
  for (const mlook_swath& s : swath_)
    if (!s.header) VLR_FAIL("Sub-swath headers not read", vlr::kLibMissing);
  VLR_CALL(fclook());
  VLR_CALL(setuprange());
  VLR_CALL(timing());
  burstsDone_ = 0;
  percentShown_ = -1;
  mlook_detail::HelperThread helper;
  helper_ = &helper;
  int rc = 0;
  for (int k = 0; k < kMlookSwaths && rc == 0; ++k) rc = processswath(k);
  if (rc == 0) rc = composeswaths();
  helper_ = nullptr;
  VLR_CALL(rc);
  if (conf_->geometry() == OutputGeometry::kGroundRange) {
    VLR_REPORT(
        NVLR_UTILITY_Format("Samples: %d, Lines: %d\n", outputSamples_, outputLines_).c_str(),
        ARE_CHECKPOINT);
  } else {
    VLR_REPORT(
        NVLR_UTILITY_Format("\nSamples: %d, Lines: %d\n", outputSamples_, outputLines_).c_str(),
        ARE_CHECKPOINT);
  }
  return 0;
}

int mlook::freeimages() {
  VLR_SCOPE("freeimages", kModule);
  for (int k = 0; k < kMlookSwaths; ++k) {
    output_->swath[k].close();
    if (conf_->DeleteTempFile != 0 && swath_[k].tempWritten) {
      const std::string name = mlook_detail::TempName(output_->OutputFilename, k);
      if (unlink(name.c_str()) != 0 && errno != ENOENT)
        VLR_REPORT("Cannot remove file", ARE_WARNING);
      VlrRunOutputRemoved(name.c_str());
      errno = 0;
      swath_[k].tempWritten = false;
    }
  }
  output_->image.close();
  release();
  return 0;
}
