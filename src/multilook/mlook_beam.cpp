// Elevation antenna pattern correction from the external calibration file.
#include <fcntl.h>
#include <unistd.h>

#include <cmath>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <string>
#include <vector>

#include "multilook/mlook.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"

namespace {

constexpr const char* kModule = "mlook_v2";
constexpr int kMainHeaderSize = 1247;
constexpr int kSpecificHeaderSize = 378;
constexpr int kRecordSize = 26552;
// Offsets inside the calibration record.
constexpr int kReferenceAngles = 760;  // one float per slot
constexpr int kPatterns = 792;         // per slot 4 polarisations x 201 values
constexpr int kPatternValues = 201;
constexpr int kPatternCentre = 100;
constexpr int kPolarisations = 4;
constexpr int kSlotSS1 = 7;
// Angular steps of the patterns.
constexpr double kStep = 0.0008726646259971648;     // 0.05 degrees
constexpr double kWideStep = 0.001256637061435917;  // 0.072 degrees
constexpr double kDegToRad = 3.14159265358979323846 / 180.0;
// Range points at which the look angle is computed from the orbit.
constexpr int kAnglePoints = 33;

float ch2float4(const unsigned char* p) {
  const uint32_t u =
      (uint32_t{p[0]} << 24) | (uint32_t{p[1]} << 16) | (uint32_t{p[2]} << 8) | uint32_t{p[3]};
  float f;
  std::memcpy(&f, &u, sizeof f);
  return f;
}

bool ReadExact(int fd, void* buffer, size_t n, off_t at) {
  unsigned char* p = static_cast<unsigned char*>(buffer);
  while (n > 0) {
    const ssize_t got = pread(fd, p, n, at);
    if (got <= 0) return false;
    p += got;
    n -= static_cast<size_t>(got);
    at += got;
  }
  return true;
}

// The value of "DS_OFFSET=+000...<bytes>" in the specific header, or -1.
long long DataSetOffset(const char* sph, size_t size) {
  const std::string text(sph, size);
  const size_t at = text.find("DS_OFFSET=");
  if (at == std::string::npos) return -1;
  const char* begin = text.c_str() + at + std::strlen("DS_OFFSET=");
  char* end = nullptr;
  const long long value = std::strtoll(begin, &end, 10);
  return end == begin ? -1 : value;
}

}  // namespace

// Gain correction per range sample of sub-swath k.  The pattern is a
// function of the look angle (the elevation angle at the antenna), which the
// headers give as the slant-to-look-angle polynomial or, without it, the
// orbit geometry does.
int mlook::envi_beam_corr(int k, std::vector<float>* gain) {
  VLR_SCOPE("envi_beam_corr", kModule);
  const mlook_swath_par& s = swathPar[k];
  GeneralSAR& gs = *swath_[k].header;
  const int fd = open(input_->ASA_XCA_Filename, O_RDONLY);
  if (fd < 0) VLR_FAIL("File not opened!", vlr::kLibOpen);
  std::vector<unsigned char> record(kRecordSize);
  char sph[kSpecificHeaderSize];
  bool ok = ReadExact(fd, sph, sizeof sph, kMainHeaderSize);
  const long long offset = ok ? DataSetOffset(sph, sizeof sph) : -1;
  ok = ok && offset >= 0 && ReadExact(fd, record.data(), record.size(), static_cast<off_t>(offset));
  close(fd);
  if (!ok) VLR_FAIL("File reading failed!", vlr::kLibRead);

  const int slot = k == 0 ? kSlotSS1 : k + 1;
  double theta0 = ch2float4(&record[kReferenceAngles + 4 * slot]) * kDegToRad;
  double step = kStep;
  if (theta0 < 0.0) {
    theta0 = -theta0;
    step = kWideStep;
  }
  const int polar = s.polarisation < kPolarisations ? s.polarisation : kPolarisations - 1;
  double g[kPatternValues];
  const unsigned char* pattern = &record[static_cast<size_t>(
      kPatterns + (slot * kPolarisations + polar) * kPatternValues * 4)];
  for (int m = 0; m < kPatternValues; ++m) g[m] = std::pow(10.0, ch2float4(pattern + 4 * m) / 20.0);

  // Look angle (degrees) at a few range points of the middle line.
  const double fsSwath = gs.sampling.frg_hz;
  const ROI_Obj& roi = gs.roi.roi;
  const double az = roi.SlowStartTime + 0.5 * roi.SlowTimeLength;
  double look[kAnglePoints];
  for (int p = 0; p < kAnglePoints; ++p) {
    const double rt = s.firstRangeTime + (s.samples - 1) / fsSwath * p / (kAnglePoints - 1);
    if (gs.polys.nsl2phi > 0) {
      look[p] = gs.polys.EvaluateSL2PHI(rt, az);
    } else {
      double incidence = 0.0;
      VLR_CALL(gs.orbit.SVGetAngles(az, rt, &incidence, &look[p]));
    }
    if (!std::isfinite(look[p])) VLR_FAIL("Look angle is not a number", vlr::kLibInconsistent);
  }
  try {
    gain->assign(static_cast<size_t>(s.samples), 1.0f);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the antenna gains", vlr::kLibAlloc);
  }
  bool outside = false;
  for (int x = 0; x < s.samples; ++x) {
    const double at =
        s.samples > 1 ? static_cast<double>(x) * (kAnglePoints - 1) / (s.samples - 1) : 0.0;
    const int p = std::min(static_cast<int>(at), kAnglePoints - 2);
    const double f = at - p;
    const double theta = ((1.0 - f) * look[p] + f * look[p + 1]) * kDegToRad;
    const double pos = (theta - theta0) / step + kPatternCentre;
    const int i = static_cast<int>(std::floor(pos));
    const double frac = pos - i;
    if (i >= 0 && i <= kPatternValues - 2) {
      (*gain)[static_cast<size_t>(x)] =
          static_cast<float>(1.0 / ((1.0 - frac) * g[i] + frac * g[i + 1]));
    } else {
      outside = true;
    }
  }
  if (outside) VLR_REPORT("ERROR: out of antenna beam range", ARE_WARNING);
  return 0;
}
