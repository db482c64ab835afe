#include "metadata_sections/sensor_attitude.h"

#include <cfloat>

#include "metadata_sections/envisat_aux_record.h"
#include "metadata_sections/legacy_fields.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "sensor_attitude";
constexpr int kChannel = 1;
constexpr const char* kSection = "SensorAttitude";
constexpr int kFields = 7;

// Instrument characterisation record (ASA_INS): its size, and the test
// structures of the five modes, each a float temperature followed by eight
// double droop gains, all stored most significant byte first.
constexpr int64_t kInsRecordSize = 171648;
constexpr size_t kInsModeEntries = 171232;
constexpr size_t kInsModeEntrySize = 68;
constexpr size_t kInsTemperature = 0;  // within an entry
constexpr size_t kInsDroopGain = 4;    // within an entry, 8 bytes per gain
constexpr int kInsModes = 5;

}  // namespace

SensorAttitude_Obj::SensorAttitude_Obj() {
  createElementsVector(kFields);
}

void SensorAttitude_Obj::refreshParameters() {
  addElementDouble("Eq_speed", &Eq_speed, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Eq_distance", &Eq_distance, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Mean_DC", &Mean_DC, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("SquintAngle", &SquintAngle, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("AntennaLength", &AntennaLength, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("DroopGain", DroopGain, kDroopGains, -DBL_MAX, DBL_MAX, true);
  addElementDouble("Temperature", &Temperature, 1, -DBL_MAX, DBL_MAX, true);
  setAllocationFlag(true);
}

int SensorAttitude_Obj::readhdr(const char* file) {
  VLR_SCOPE("SensorAttitude_Obj::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  return readLegacyFields(*this, file, kSection);
}

int SensorAttitude_Obj::writehdr(const char* file) {
  VLR_SCOPE("SensorAttitude_Obj::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SensorAttitude_Obj::clone(SensorAttitude_Obj* other) const {
  if (other != nullptr && other != this) *other = *this;
  return 0;
}

int SensorAttitude_Obj::getDroopGain(const char* file, int mode) {
  VLR_SCOPE("SensorAttitude_Obj::getDroopGain", kModule);
  vlr::CkBuffer<unsigned char> record;
  VLR_CALL(readEnvisatAuxRecord(file, kInsRecordSize, &record));
  if (mode < 0 || mode >= kInsModes) return 0;
  const size_t entry = kInsModeEntries + kInsModeEntrySize * static_cast<size_t>(mode);
  Temperature = auxFloat(record.data(), entry + kInsTemperature);
  for (int i = 0; i < kDroopGains; ++i)
    DroopGain[i] = auxDouble(record.data(), entry + kInsDroopGain + 8 * static_cast<size_t>(i));
  return 0;
}
