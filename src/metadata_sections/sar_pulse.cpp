#include "metadata_sections/sar_pulse.h"

#include <cfloat>
#include <cmath>
#include <vector>

#include "metadata_sections/legacy_fields.h"
#include "metadata_sections/one_line_raster.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "sar_pulse";
constexpr int kChannel = 1;
constexpr const char* kSection = "Pulse";
constexpr int kFields = 5;
constexpr double kPi = 3.14159265358979323846;

}  // namespace

SARPulse_Obj::SARPulse_Obj() {
  createElementsVector(kFields);
}

void SARPulse_Obj::refreshParameters() {
  addElementDouble("PulseLength", &PulseLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Bandwidth", &Bandwidth, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("PulseKRate", &PulseKRate, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("PulseEnergy", &PulseEnergy, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("PulseSamplingRate", &PulseSamplingRate, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int SARPulse_Obj::readhdr(const char* file) {
  VLR_SCOPE("SARPulse_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  return readLegacyFields(*this, file, kSection);
}

int SARPulse_Obj::writehdr(const char* file) {
  VLR_SCOPE("SARPulse_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SARPulse_Obj::clone(SARPulse_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}

int SARPulse_Obj::chirpSamples() const {
  const double T = PulseLength, B = Bandwidth, fs = PulseSamplingRate;
  if (!std::isfinite(T) || !std::isfinite(B) || !std::isfinite(fs)) return -1;
  if (T <= 0.0 || fs <= 0.0 || B == 0.0) return -1;
  const double n = std::round(fs * T);
  if (!(n >= 1.0 && n <= kMaxChirpSamples)) return -1;
  return static_cast<int>(n);
}

int SARPulse_Obj::generateChirp(fcomplex* out, int capacity) const {
  VLR_SCOPE("SARPulse_Obj::generateChirp", kModule);
  const int n = chirpSamples();
  if (n < 0) VLR_FAIL("The pulse does not describe a chirp!", vlr::kLibInconsistent);
  if (out == nullptr || n > capacity) VLR_FAIL("Chirp buffer too small!", vlr::kLibInconsistent);
  const double T = PulseLength, B = Bandwidth, fs = PulseSamplingRate;
  const double k = kPi * B / T;
  const double g = std::sqrt(std::fabs(n * fs / B));
  const double centre = (n - 1) / 2.0;
  for (int i = 0; i < n; ++i) {
    const double t = (i - centre) / fs;
    const double phi = k * t * t;
    out[i] = fcomplex(static_cast<float>(std::cos(phi) / g), static_cast<float>(std::sin(phi) / g));
  }
  return 0;
}

int SARPulse_Obj::generateChirp(fcomplex* out) const {
  return generateChirp(out, chirpSamples());
}

int SARPulse_Obj::writeChirp(const char* file) const {
  VLR_SCOPE("SARPulse_Obj::writeChirp", kModule);
  if (file == nullptr || file[0] == '\0') VLR_FAIL("Missing file name!", vlr::kLibInconsistent);
  const int n = chirpSamples();
  if (n < 0) VLR_FAIL("The pulse does not describe a chirp!", vlr::kLibInconsistent);
  std::vector<fcomplex> chirp(static_cast<size_t>(n));
  VLR_CALL(generateChirp(chirp.data(), n));

  DataFile raster;
  raster.set_name(file);
  describeOneLine(&raster, n, CT_FLOAT_COMPLEX);
  BufferIO window = oneLineWindow(&raster, n, CT_FLOAT_COMPLEX);
  VLR_CALL(window.writebuffer(reinterpret_cast<const char*>(chirp.data())));
  VLR_CALL(raster.close());
  VLR_CALL(raster.write_hdr());
  return 0;
}
