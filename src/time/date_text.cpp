// Date texts and the sec85 time scale.
#include "time/date_text.h"

#include <cmath>
#include <cstdio>
#include <cstring>

#include "profile/profile_cache.h"
#include "time/microseconds.h"

namespace {

using vlr::timeconv::TruncateMicroseconds;

constexpr const char* kMonthNames[12] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                         "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
constexpr int kMonthDays[12] = {31, 28, 31, 30, 31, 30, 31, 31, 30, 31, 30, 31};

// Leading non-digit characters skipped before a date text, at most.
constexpr int kMaxDatePrefix = 40;

constexpr bool IsLeap(int64_t year) {
  return year % 4 == 0 && (year % 100 != 0 || year % 400 == 0);
}
constexpr int MonthLength(int64_t year, int monthIndex) {
  return monthIndex == 1 && IsLeap(year) ? 29 : kMonthDays[monthIndex];
}
constexpr int64_t FloorDiv(int64_t a, int64_t b) {
  return a / b - (a % b != 0 && (a < 0) != (b < 0));
}
// Leap years before year y.
constexpr int64_t LeapsBefore(int64_t y) {
  return FloorDiv(y - 1, 4) - FloorDiv(y - 1, 100) + FloorDiv(y - 1, 400);
}

// Days from 1985-01-01 to 10000-01-01: the written text has four year digits.
constexpr int64_t kDaysTo10000 = 365 * (10000 - 1985) + LeapsBefore(10000) - LeapsBefore(1985);

}  // namespace

int date2str(const char* text, DateFields* fields) {
  if (fields == nullptr) return -1;
  *fields = DateFields();
  if (text == nullptr || text[0] == '\0') return -1;
  const char* p = text;
  for (int i = 0; i < kMaxDatePrefix && *p != '\0' && (*p < '0' || *p > '9'); ++i) ++p;
  if (*p == '\0') return -1;

  long day = 0, year = 0, hour = 0, minute = 0;
  char month[4] = "";
  double seconds = 0.0;
  std::sscanf(p, "%2ld-%3s-%4ld %2ld:%2ld:%lf", &day, month, &year, &hour, &minute, &seconds);
  fields->year = static_cast<int32_t>(year);
  fields->hour = static_cast<int32_t>(hour);
  fields->minute = static_cast<int32_t>(minute);

  int monthIndex = -1;
  for (int i = 0; i < 12; ++i) {
    if (mystrcasecmp(month, kMonthNames[i]) == 0) {
      monthIndex = i;
      break;
    }
  }

  int flags = 0;
  if (monthIndex >= 0 && (day < 0 || day > MonthLength(year, monthIndex))) flags |= kDateBadDay;
  if (hour < 0 || hour > 24) flags |= kDateBadHour;
  if (year < 0) flags |= kDateBadYear;
  if (monthIndex < 0) flags |= kDateBadMonthOrMinute;
  if (minute < 0 || minute > 60) flags |= kDateBadMonthOrMinute;
  // The seconds scan without a width: anything past 60 (or not a number at
  // all) is refused before it is turned into an integer.
  const double whole = std::floor(seconds);
  if (!(whole >= 0.0 && whole <= 60.0)) {
    flags |= kDateBadSecond;
  } else {
    fields->second = static_cast<int32_t>(whole);
    fields->fraction = seconds - whole;
  }
  if (monthIndex >= 0) fields->month = monthIndex + 1;
  if (flags != 0) return flags;

  int dayOfYear = static_cast<int>(day);
  for (int i = 0; i < monthIndex; ++i) dayOfYear += MonthLength(year, i);
  fields->dayOfYear = dayOfYear;
  return 0;
}

int DateDiff(const char* a, const char* b, double* seconds) {
  DateFields fa, fb;
  const int ra = date2str(a, &fa);
  if (ra != 0) return ra;
  const int rb = date2str(b, &fb);
  if (rb != 0) return rb;
  const int64_t days = 365 * static_cast<int64_t>(fa.year - fb.year) + LeapsBefore(fa.year) -
                       LeapsBefore(fb.year) + (fa.dayOfYear - fb.dayOfYear);
  const int64_t whole = ((days * 24 + (fa.hour - fb.hour)) * 60 + (fa.minute - fb.minute)) * 60 +
                        (fa.second - fb.second);
  if (seconds != nullptr) *seconds = static_cast<double>(whole) + (fa.fraction - fb.fraction);
  return 0;
}

double ascii2sec85(const char* text) {
  double seconds = 0.0;
  const int code = DateDiff(text, "1-JAN-1985", &seconds);
  if (code != 0) {
    std::fprintf(stderr, "Error: incorrect date format, code %d\n", code);
    return 0.0;
  }
  return seconds;
}

bool parse_sec85(const char* text, double* t) {
  double seconds = 0.0;
  if (text == nullptr || DateDiff(text, "1-JAN-1985", &seconds) != 0 || !std::isfinite(seconds)) {
    return false;
  }
  *t = seconds;
  return true;
}

int sec852myascii(double t, char* buffer) {
  if (std::isnan(t)) {
    std::fputs("Date is not a valid time\n", stderr);
    return -1;
  }
  if (t < 0) {
    std::fputs("Date should be later than 1-JAN-1985\n", stderr);
    return -1;
  }
  if (!(t < static_cast<double>(kDaysTo10000) * 86400.0)) {
    std::fputs("Date should be earlier than 1-JAN-10000\n", stderr);
    return -1;
  }
  const double w = std::floor(t);
  const int32_t micro = TruncateMicroseconds(t - w, t);
  int64_t rest = static_cast<int64_t>(w);
  const int second = static_cast<int>(rest % 60);
  rest /= 60;
  const int minute = static_cast<int>(rest % 60);
  rest /= 60;
  const int hour = static_cast<int>(rest % 24);
  int64_t days = rest / 24;
  if (buffer == nullptr) return -1;
  int64_t year = 1985;
  while (days >= (IsLeap(year) ? 366 : 365)) {
    days -= IsLeap(year) ? 366 : 365;
    ++year;
  }
  int month = 0;
  while (MonthLength(year, month) <= days) {
    days -= MonthLength(year, month);
    ++month;
  }
  std::snprintf(buffer, kSec85TextSize, "%2.2u-%3s-%4.4u %2.2u:%2.2u:%2.2u.%06u",
                static_cast<unsigned>(days + 1), kMonthNames[month], static_cast<unsigned>(year),
                static_cast<unsigned>(hour), static_cast<unsigned>(minute),
                static_cast<unsigned>(second), static_cast<unsigned>(micro));
  return 0;
}

char* sec852ascii(double t, char* buffer) {
  sec852myascii(t, buffer);
  return buffer;
}

double utc_ch2num(const char* text) {
  if (text == nullptr) return -1.0;
  int day = 0, year = 0, hour = 0, minute = 0, second = 0, milli = 0;
  char month[4] = "";
  std::sscanf(text, "%2d-%3s-%4d %2d:%2d:%2d.%3d", &day, month, &year, &hour, &minute, &second,
              &milli);
  int monthNumber = 0;
  for (int i = 0; i < 12; ++i) {
    if (std::strncmp(month, kMonthNames[i], 3) == 0) {
      monthNumber = i + 1;
      break;
    }
  }
  if (monthNumber == 0) return -1.0;
  return ((year * 100.0 + monthNumber) * 100.0 + day) * 1e6 + hour * 10000.0 + minute * 100.0 +
         second + milli * 0.001;
}
