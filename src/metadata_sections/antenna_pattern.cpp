#include "metadata_sections/antenna_pattern.h"

#include <cfloat>
#include <cmath>
#include <cstring>

#include "metadata_sections/envisat_aux_record.h"
#include "metadata_sections/legacy_fields.h"
#include "metadata_sections/one_line_raster.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "antenna_pattern";
constexpr int kChannel = 1;
constexpr const char* kSection = "AntennaPattern";
constexpr int kFields = 3;
constexpr int kUnset = -999;
constexpr const char* kHeaderExtension = ".hdr";
constexpr const char* kPatternSuffix = "_pattern";

// External calibration record (ASA_XCA): its size, the reference elevation
// angles of the eight swath slots (floats), and the patterns, one per slot
// and polarisation (HH, VV, HV, VH), each 201 floats of two-way gain in dB,
// all stored most significant byte first.
constexpr int64_t kXcaRecordSize = 26552;
constexpr size_t kXcaReferenceAngles = 760;
constexpr size_t kXcaPatterns = 792;
constexpr size_t kXcaPatternSize = 4 * AntennaPattern_Obj::kEnviPatternSamples;
constexpr int kXcaPolarisations = 4;
constexpr int kXcaSwathSlots = 8;
// The patterns span +-5 degrees about the reference angle.
constexpr double kXcaHalfSpan = 5.0;
constexpr double kXcaStep = 0.05;

}  // namespace

AntennaPattern_Obj::AntennaPattern_Obj() {
  createElementsVector(kFields);
}

AntennaPattern_Obj::~AntennaPattern_Obj() = default;

void AntennaPattern_Obj::refreshParameters() {
  addElementDouble("StartAngle", &StartAngle, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("DeltaAngle", &DeltaAngle, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("PatternSamples", &PatternSamples, 1, 0, kMaxPatternSamples, false);
  setAllocationFlag(true);
}

std::string AntennaPattern_Obj::patternFileName(const char* headerFile) {
  std::string name = headerFile != nullptr ? headerFile : "";
  const size_t n = std::strlen(kHeaderExtension);
  if (name.size() > n && name.compare(name.size() - n, n, kHeaderExtension) == 0)
    name.resize(name.size() - n);
  return name + kPatternSuffix;
}

int AntennaPattern_Obj::createBuffers() {
  VLR_SCOPE("AntennaPattern_Obj::createBuffers", kModule);
  pattern_.reset();
  if (PatternSamples != 0 && PatternSamples != kUnset) {
    VLR_CALL(checkCount("PatternSamples", PatternSamples, kMaxPatternSamples));
    if (!pattern_.allocate(static_cast<size_t>(PatternSamples)))
      VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  return 0;
}

int AntennaPattern_Obj::destroyBuffers() {
  pattern_.reset();
  return 0;
}

void AntennaPattern_Obj::describeRaster() {
  describeOneLine(&data, PatternSamples > 0 ? PatternSamples : 0, CT_FLOAT32);
}

int AntennaPattern_Obj::readhdr(const char* file) {
  VLR_SCOPE("AntennaPattern_Obj::readhdr", kModule);
  data.set_name(patternFileName(file).c_str());
  if (!readAuxiliaryFile(file, kChannel, kSection)) {
    if (readLegacyFields(*this, file, kSection) != 0) {
      destroyBuffers();
      return 1;
    }
    VLR_CALL(createBuffers());
  }
  describeRaster();
  return 0;
}

int AntennaPattern_Obj::writehdr(const char* file) {
  VLR_SCOPE("AntennaPattern_Obj::writehdr", kModule);
  const std::string raster = patternFileName(file);
  // A pattern read with its header stays in its raster until it is asked
  // for: a header written under another name takes it along, or the new
  // header would name a raster that nobody wrote.
  if (!pattern_.empty() && pattern_[0] == 0.0f && !data.name().empty() && data.name() != raster) {
    vlr::CkBuffer<float> held;
    if (!held.allocate(pattern_.size())) VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
    VLR_CALL(getPatternArray(held.data()));
  }
  data.set_name(raster.c_str());
  describeRaster();
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  if (!pattern_.empty() && pattern_[0] != 0.0f) VLR_CALL(WritePatternArray());
  return 0;
}

int AntennaPattern_Obj::clone(AntennaPattern_Obj* other) const {
  VLR_SCOPE("AntennaPattern_Obj::clone", kModule);
  if (other == nullptr || other == this) return 0;
  other->StartAngle = StartAngle;
  other->DeltaAngle = DeltaAngle;
  other->PatternSamples = PatternSamples;
  VLR_CALL(other->createBuffers());
  if (!pattern_.empty() && other->pattern_.size() == pattern_.size())
    std::memcpy(other->pattern_.data(), pattern_.data(), pattern_.size() * sizeof(float));
  other->data.set_name(data.name().c_str());
  data.clone(&other->data);
  return 0;
}

int AntennaPattern_Obj::WritePatternArray() {
  VLR_SCOPE("AntennaPattern_Obj::WritePatternArray", kModule);
  if (pattern_.empty() || static_cast<int>(pattern_.size()) != PatternSamples)
    VLR_FAIL("No antenna pattern!", vlr::kLibInconsistent);
  if (data.name().empty()) VLR_FAIL("Missing file name!", vlr::kLibInconsistent);
  describeRaster();
  BufferIO window = oneLineWindow(&data, PatternSamples, CT_FLOAT32);
  const int rc = window.writebuffer(reinterpret_cast<const char*>(pattern_.data()));
  if (rc != 0) {
    data.close();
    VLR_CALL(rc);
  }
  VLR_CALL(data.close());
  return 0;
}

int AntennaPattern_Obj::getPatternArray(float* out) {
  VLR_SCOPE("AntennaPattern_Obj::getPatternArray", kModule);
  if (out == nullptr || pattern_.empty() || static_cast<int>(pattern_.size()) != PatternSamples)
    VLR_FAIL("No antenna pattern!", vlr::kLibInconsistent);
  const size_t bytes = pattern_.size() * sizeof(float);
  if (pattern_[0] == 0.0f) {
    describeRaster();
    BufferIO window = oneLineWindow(&data, PatternSamples, CT_FLOAT32);
    const int rc = window.readbuffer(reinterpret_cast<char*>(out), static_cast<int>(bytes));
    data.close();
    VLR_CALL(rc);
    std::memcpy(pattern_.data(), out, bytes);
    return 0;
  }
  std::memcpy(out, pattern_.data(), bytes);
  return 0;
}

int AntennaPattern_Obj::setPattern(double startAngle, double deltaAngle, const float* gains,
                                   int count) {
  VLR_SCOPE("AntennaPattern_Obj::setPattern", kModule);
  if (gains == nullptr || count < 1 || count > kMaxPatternSamples || !std::isfinite(startAngle) ||
      !std::isfinite(deltaAngle))
    VLR_FAIL("Invalid antenna pattern!", vlr::kLibInconsistent);
  for (int i = 0; i < count; ++i) {
    // A zero first gain would read as "not loaded" (getPatternArray).
    if (!std::isfinite(gains[i]) || !(gains[i] > 0.0f))
      VLR_FAIL("Invalid antenna pattern gain!", vlr::kLibInconsistent);
  }
  PatternSamples = count;
  VLR_CALL(createBuffers());
  std::memcpy(pattern_.data(), gains, static_cast<size_t>(count) * sizeof(float));
  StartAngle = startAngle;
  DeltaAngle = deltaAngle;
  describeRaster();
  return 0;
}

int AntennaPattern_Obj::getPatternENVI(const char* file, int polarisation, int swath) {
  VLR_SCOPE("AntennaPattern_Obj::getPatternENVI", kModule);
  if (polarisation < 0 || polarisation >= kXcaPolarisations || swath < 0 ||
      swath >= kXcaSwathSlots) {
    VLR_FAIL("Invalid polarisation or swath!", vlr::kLibInconsistent);
  }
  vlr::CkBuffer<unsigned char> record;
  VLR_CALL(readEnvisatAuxRecord(file, kXcaRecordSize, &record));
  PatternSamples = kEnviPatternSamples;
  VLR_CALL(createBuffers());
  const size_t entry =
      kXcaPatterns +
      static_cast<size_t>(polarisation + kXcaPolarisations * swath) * kXcaPatternSize;
  for (int i = 0; i < kEnviPatternSamples; ++i) {
    const double db = auxFloat(record.data(), entry + 4 * static_cast<size_t>(i));
    pattern_[static_cast<size_t>(i)] = static_cast<float>(std::pow(10.0, db / 20.0));
  }
  StartAngle =
      auxFloat(record.data(), kXcaReferenceAngles + 4 * static_cast<size_t>(swath)) - kXcaHalfSpan;
  DeltaAngle = kXcaStep;
  describeRaster();
  return 0;
}
