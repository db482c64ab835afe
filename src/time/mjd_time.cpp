// The ENVISAT MJD time record.
#include "time/mjd_time.h"

#include <cmath>
#include <cstring>
#include <limits>

#include "time/microseconds.h"

namespace {

using vlr::timeconv::TruncateMicroseconds;

constexpr double kSecondsPerDay = 86400.0;
constexpr int64_t kSecondsPerDayInt = 86400;

// Offsets of the three big-endian words in the record.
constexpr size_t kDaysOffset = 0;
constexpr size_t kSecondsOffset = 4;
constexpr size_t kMicrosecondsOffset = 8;

void PutBigEndian(uint8_t* p, int32_t value) {
  const uint32_t u = static_cast<uint32_t>(value);
  p[0] = static_cast<uint8_t>(u >> 24);
  p[1] = static_cast<uint8_t>(u >> 16);
  p[2] = static_cast<uint8_t>(u >> 8);
  p[3] = static_cast<uint8_t>(u);
}

int32_t GetBigEndian(const uint8_t* p) {
  const uint32_t u = static_cast<uint32_t>(p[0]) << 24 | static_cast<uint32_t>(p[1]) << 16 |
                     static_cast<uint32_t>(p[2]) << 8 | static_cast<uint32_t>(p[3]);
  return static_cast<int32_t>(u);
}

}  // namespace

MjdRecord MjdRecordFromWords(int32_t days, int32_t seconds, int32_t microseconds) {
  MjdRecord record;
  PutBigEndian(record.bytes + kDaysOffset, days);
  PutBigEndian(record.bytes + kSecondsOffset, seconds);
  PutBigEndian(record.bytes + kMicrosecondsOffset, microseconds);
  return record;
}

void MjdRecordWords(const MjdRecord& record, int32_t* days, int32_t* seconds,
                    int32_t* microseconds) {
  if (days != nullptr) *days = GetBigEndian(record.bytes + kDaysOffset);
  if (seconds != nullptr) *seconds = GetBigEndian(record.bytes + kSecondsOffset);
  if (microseconds != nullptr) *microseconds = GetBigEndian(record.bytes + kMicrosecondsOffset);
}

double mjd2sec85(MjdRecord record) {
  int32_t days, seconds, microseconds;
  MjdRecordWords(record, &days, &seconds, &microseconds);
  // The whole seconds are summed exactly first, so that the result is the
  // double nearest to the record's time.
  const double whole = days * kSecondsPerDay + seconds + kSec85At2000;
  return whole + microseconds * 1e-6;
}

int sec852mjd(double t, void* buffer) {
  if (buffer == nullptr || !std::isfinite(t)) return -1;
  // Whole seconds and the fraction are split on t itself (both exact), so
  // the microseconds agree with the date text of t.
  const double whole = std::floor(t);
  const double approxDays = std::floor((whole - kSec85At2000) / kSecondsPerDay);
  if (!(std::fabs(approxDays) < std::numeric_limits<int32_t>::max())) return -1;
  const int64_t wholeSince2000 = static_cast<int64_t>(whole - kSec85At2000);
  int64_t days = static_cast<int64_t>(approxDays);
  int64_t seconds = wholeSince2000 - days * kSecondsPerDayInt;
  // The division may have rounded across a day boundary.
  if (seconds < 0) {
    --days;
    seconds += kSecondsPerDayInt;
  } else if (seconds >= kSecondsPerDayInt) {
    ++days;
    seconds -= kSecondsPerDayInt;
  }
  const int32_t micro = TruncateMicroseconds(t - whole, t);
  const MjdRecord record =
      MjdRecordFromWords(static_cast<int32_t>(days), static_cast<int32_t>(seconds), micro);
  std::memcpy(buffer, record.bytes, kMjdRecordSize);
  return 0;
}

char* mjd2ascii(MjdRecord record, char* buffer) {
  return sec852ascii(mjd2sec85(record), buffer);
}
