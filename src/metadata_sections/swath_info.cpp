#include "metadata_sections/swath_info.h"

#include <sys/stat.h>

#include <cfloat>
#include <climits>
#include <cstring>
#include <string>
#include <utility>

#include "metadata_sections/legacy_fields.h"
#include "profile/profile_values.h"
#include "raster/data_file.h"
#include "runtime/error_codes.h"
#include "time/mjd_time.h"

namespace {

constexpr const char* kModule = "swath_info";
constexpr int kChannel = 1;
constexpr const char* kSection = "SwathInfo";
constexpr const char* kSwstChangesKey = "Swst_changes_bursts";
constexpr int kFields = 12;
// The unset value of the counts.
constexpr int kUnset = -999;

// Keys of the parameter-file form: the field names; the change list is
// read separately once its size is known.
constexpr const char* kLegacyKeys[kFields] = {"Rank",
                                              "Rgate_bias",
                                              "Echoes_per_burst",
                                              "Lines_per_burst",
                                              "Bursts",
                                              "Order",
                                              "Acquisition_Start_Time",
                                              "Swst_changes",
                                              "ProcessorGain",
                                              "NoisePower",
                                              "ChirpPower",
                                              nullptr};

bool fileSize(const std::string& name, int64_t* size) {
  struct stat st;
  if (stat(name.c_str(), &st) != 0) return false;
  *size = static_cast<int64_t>(st.st_size);
  return true;
}

}  // namespace

SwathInfo::SwathInfo() {
  createElementsVector(kFields);
}

SwathInfo::~SwathInfo() = default;

void SwathInfo::refreshParameters() {
  addElementInt("Rank", &Rank, 1, INT_MIN, INT_MAX, true);
  addElementDouble("Rgate_bias", &Rgate_bias, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("Echoes_per_burst", &Echoes_per_burst, 1, INT_MIN, INT_MAX, true);
  addElementInt("Lines_per_burst", &Lines_per_burst, 1, INT_MIN, INT_MAX, true);
  addElementInt("Bursts", &Bursts, 1, INT_MIN, INT_MAX, true);
  addElementInt("Order", &Order, 1, INT_MIN, INT_MAX, true);
  addElementDouble("Acquisition_Start_Time", &Acquisition_Start_Time, 1, -DBL_MAX, DBL_MAX, true);
  addElementInt("Swst_changes", &Swst_changes, 1, INT_MIN, INT_MAX, true);
  addElementDouble("ProcessorGain", &ProcessorGain, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("NoisePower", &NoisePower, 1, -DBL_MAX, DBL_MAX, true);
  addElementDouble("ChirpPower", &ChirpPower, 1, -DBL_MAX, DBL_MAX, true);
  // Stored in the block as well, so that the changes survive a write and a
  // read; optional, as blocks of older files lack it.
  addElementInt(kSwstChangesKey, swstChanges_.data(), static_cast<int>(swstChanges_.size()), 0,
                INT_MAX, false);
  setAllocationFlag(true);
}

int SwathInfo::createBuffers() {
  VLR_SCOPE("SwathInfo::createBuffers", kModule);
  swstChanges_.reset();
  if (Swst_changes != 0 && Swst_changes != kUnset) {
    VLR_CALL(checkCount("Swst_changes", Swst_changes, kMaxSwstChanges));
    if (!swstChanges_.allocate(static_cast<size_t>(Swst_changes)))
      VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  refreshParameters();
  return 0;
}

int SwathInfo::destroyBuffers() {
  swstChanges_.reset();
  burstTimes_.reset();
  refreshParameters();
  return 0;
}

int SwathInfo::readhdr(const char* file) {
  VLR_SCOPE("SwathInfo::readhdr", kModule);
  if (readAuxiliaryFile(file, kChannel, kSection)) return 0;
  if (readLegacyFields(*this, file, kSection, kLegacyKeys) != 0) {
    destroyBuffers();
    return 1;
  }
  VLR_CALL(createBuffers());
  if (!swstChanges_.empty() &&
      GetMyProfileIntArray(kSection, kSwstChangesKey, swstChanges_.data(),
                           static_cast<int>(swstChanges_.size()), file) != 0) {
    destroyBuffers();
    return 1;
  }
  return 0;
}

int SwathInfo::writehdr(const char* file) {
  VLR_SCOPE("SwathInfo::writehdr", kModule);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int SwathInfo::clone(SwathInfo* other) const {
  VLR_SCOPE("SwathInfo::clone", kModule);
  if (other == nullptr || other == this) return 0;
  other->Rank = Rank;
  other->Rgate_bias = Rgate_bias;
  other->Echoes_per_burst = Echoes_per_burst;
  other->Lines_per_burst = Lines_per_burst;
  other->Bursts = Bursts;
  other->Order = Order;
  other->Acquisition_Start_Time = Acquisition_Start_Time;
  other->Swst_changes = Swst_changes;
  other->ProcessorGain = ProcessorGain;
  other->NoisePower = NoisePower;
  other->ChirpPower = ChirpPower;
  if (!other->swstChanges_.allocate(swstChanges_.size()) ||
      !other->burstTimes_.allocate(burstTimes_.size())) {
    other->destroyBuffers();
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  if (!swstChanges_.empty())
    std::memcpy(other->swstChanges_.data(), swstChanges_.data(), swstChanges_.size() * sizeof(int));
  if (!burstTimes_.empty())
    std::memcpy(other->burstTimes_.data(), burstTimes_.data(), burstTimes_.size() * sizeof(double));
  other->refreshParameters();
  return 0;
}

int SwathInfo::readBurstTimes(const char* base) {
  VLR_SCOPE("SwathInfo::readBurstTimes", kModule);
  if (base == nullptr || base[0] == '\0') VLR_FAIL("Missing file name!", vlr::kLibInconsistent);
  const std::string header = std::string(base) + ".hdr";
  VLR_CALL(readhdr(header.c_str()));
  DataFile raster;
  VLR_CALL(raster.read_hdr(base));
  if (Bursts < 1 || Lines_per_burst < 1) VLR_FAIL("No bursts to read!", vlr::kLibInconsistent);
  if (raster.row_prefix < kLinePrefixSize || raster.line_length() < 1)
    VLR_FAIL("The raster lines carry no time record!", vlr::kLibInconsistent);

  // Every burst's first line prefix must lie inside the file before the
  // burst count is trusted with an allocation.
  const int64_t stride = raster.line_length() * Lines_per_burst;
  int64_t size = 0;
  if (!fileSize(raster.name(), &size)) VLR_FAIL("File not opened!", vlr::kLibOpen);
  const int64_t room = size - raster.header_offset - kLinePrefixSize;
  if (room < 0 || (Bursts - 1) > room / stride) VLR_FAIL("File reading failed!", vlr::kLibRead);

  burstTimes_.reset();
  vlr::CkBuffer<double> times;
  if (!times.allocate(static_cast<size_t>(Bursts)))
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  VLR_CALL(raster.open(DataFile::kOpenRead));
  for (int b = 0; b < Bursts; ++b) {
    unsigned char prefix[kLinePrefixSize];
    VLR_CALL(raster.seek(raster.header_offset + b * stride, DataFile::kSeekSet));
    VLR_CALL(raster.read(prefix, kLinePrefixSize));
    MjdRecord record;
    std::memcpy(record.bytes, prefix, kMjdRecordSize);
    times[static_cast<size_t>(b)] = mjd2sec85(record);
  }
  VLR_CALL(raster.close());
  burstTimes_ = std::move(times);
  return 0;
}
