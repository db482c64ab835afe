// Date texts and the sec85 time scale.
//
// sec85: a double, seconds since 1 January 1985 00:00:00; every day has
// 86400 seconds.  Date texts read as "DD-MON-YYYY hh:mm:ss.ffffff" (month as
// a three-letter abbreviation in any letter case, trailing parts optional)
// and are written as "DD-MON-YYYY hh:mm:ss.uuuuuu" (27 characters).
#pragma once

#include <cstddef>
#include <cstdint>

// Seconds from 1985-01-01 to 2000-01-01 (5478 days).
constexpr double kSec85At2000 = 473299200.0;

// Size of the buffers that receive a written date text (27 characters and
// the terminating NUL).
constexpr size_t kSec85TextSize = 28;

// A parsed date text.
struct DateFields {
  int32_t year = 0;
  int32_t month = 0;      // 1..12
  int32_t dayOfYear = 0;  // 1 for 1 January
  int32_t hour = 0;
  int32_t minute = 0;
  int32_t second = 0;     // whole seconds
  double fraction = 0.0;  // 0 <= fraction < 1
};

// Error flags of date2str, OR-ed together.
constexpr int kDateBadDay = 0x1;
constexpr int kDateBadHour = 0x10;
constexpr int kDateBadYear = 0x100;
constexpr int kDateBadMonthOrMinute = 0x1000;
constexpr int kDateBadSecond = 0x10000;

// Parses a date text into `fields` (zeroed first).  Up to 40 leading
// characters that are not digits are skipped.  Returns 0, -1 for an empty
// text or one without a digit, or the error flags above.  Hour 24, minute 60
// and second 60 are accepted.
int date2str(const char* text, DateFields* fields);

// Seconds from date text b to date text a into `seconds`.  0, or the first
// non-zero result of date2str on a, then on b (`seconds` untouched).
int DateDiff(const char* a, const char* b, double* seconds);

// A date text as sec85.  On an invalid text prints "Error: incorrect date
// format, code %d" to stderr and returns 0.0.
double ascii2sec85(const char* text);
// The checked form for texts read from files: false (t untouched) when the
// text is not a date, so that a broken date never passes for 1-JAN-1985.
bool parse_sec85(const char* text, double* t);

// Writes the date text of sec85 time t into `buffer` (kSec85TextSize bytes).
// The fraction is truncated to whole microseconds; a time within one unit of
// double resolution below a microsecond boundary counts as on it, so that a
// text read back and written again never changes.  Returns 0; -1 for a
// negative time ("Date should be later than 1-JAN-1985" on stderr) or for a
// time past the year 9999 or not finite ("Date should be earlier than
// 1-JAN-10000"), with the buffer untouched.
int sec852myascii(double t, char* buffer);

// As sec852myascii; returns the buffer.
char* sec852ascii(double t, char* buffer);

// Packs a date text "DD-MON-YYYY hh:mm:ss.mmm" (upper-case month) into the
// number YYYYMMDDhhmmss.mmm.  -1.0 when the month is not one of the twelve
// upper-case abbreviations or the text is missing.
double utc_ch2num(const char* text);
