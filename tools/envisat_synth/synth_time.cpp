#include "synth_time.h"

#include <cctype>
#include <cmath>
#include <cstdio>
#include <cstring>

namespace synth {
namespace {

const char* const kMonths[12] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                 "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};

// Days since 1970-01-01 of a proleptic Gregorian date (H. Hinnant's algorithm).
int64_t days_from_civil(int64_t y, unsigned m, unsigned d) {
  y -= m <= 2;
  const int64_t era = (y >= 0 ? y : y - 399) / 400;
  const unsigned yoe = static_cast<unsigned>(y - era * 400);
  const unsigned doy = (153 * (m + (m > 2 ? -3 : 9)) + 2) / 5 + d - 1;
  const unsigned doe = yoe * 365 + yoe / 4 - yoe / 100 + doy;
  return era * 146097 + static_cast<int64_t>(doe) - 719468;
}

void civil_from_days(int64_t z, int* y, int* m, int* d) {
  z += 719468;
  const int64_t era = (z >= 0 ? z : z - 146096) / 146097;
  const unsigned doe = static_cast<unsigned>(z - era * 146097);
  const unsigned yoe = (doe - doe / 1460 + doe / 36524 - doe / 146096) / 365;
  const unsigned doy = doe - (365 * yoe + yoe / 4 - yoe / 100);
  const unsigned mp = (5 * doy + 2) / 153;
  *d = static_cast<int>(doy - (153 * mp + 2) / 5 + 1);
  *m = static_cast<int>(mp < 10 ? mp + 3 : mp - 9);
  *y = static_cast<int>(static_cast<int64_t>(yoe) + era * 400 + (*m <= 2));
}

int64_t floor_div(int64_t a, int64_t b) {
  return a / b - ((a % b != 0) && ((a < 0) != (b < 0)));
}

const int64_t kDays1985 = days_from_civil(1985, 1, 1);

void split(double t85, int64_t* days, int64_t* sec, int64_t* us) {
  // Whole microseconds first, so that the three parts never disagree; the
  // quarter microsecond absorbs the representation error of stored times.
  const int64_t total = static_cast<int64_t>(std::floor(t85 * 1e6 + 0.25));
  const int64_t s = floor_div(total, 1000000);
  *us = total - s * 1000000;
  *days = floor_div(s, 86400);
  *sec = s - *days * 86400;
}

}  // namespace

double round_us(double t85) {
  return std::floor(t85 * 1e6 + 0.5) / 1e6;
}

std::string format_utc(double t85) {
  int64_t days, sec, us;
  split(t85, &days, &sec, &us);
  int y, m, d;
  civil_from_days(days + kDays1985, &y, &m, &d);
  char buf[40];
  std::snprintf(buf, sizeof buf, "%02d-%s-%04d %02d:%02d:%02d.%06d", d, kMonths[m - 1], y,
                static_cast<int>(sec / 3600), static_cast<int>(sec / 60 % 60),
                static_cast<int>(sec % 60), static_cast<int>(us));
  return buf;
}

std::string format_compact(double t85) {
  int64_t days, sec, us;
  split(t85, &days, &sec, &us);
  int y, m, d;
  civil_from_days(days + kDays1985, &y, &m, &d);
  char buf[24];
  std::snprintf(buf, sizeof buf, "%04d%02d%02d_%02d%02d%02d", y, m, d, static_cast<int>(sec / 3600),
                static_cast<int>(sec / 60 % 60), static_cast<int>(sec % 60));
  return buf;
}

bool parse_utc(const std::string& text, double* t85) {
  int d = 0, y = 0, hh = 0, mm = 0;
  double ss = 0.0;
  char mon[4] = {0};
  const int n = std::sscanf(text.c_str(), "%d-%3c-%d %d:%d:%lf", &d, mon, &y, &hh, &mm, &ss);
  if (n < 3) return false;
  int month = 0;
  for (int i = 0; i < 12; ++i) {
    bool same = true;
    for (int k = 0; k < 3; ++k)
      if (std::toupper(static_cast<unsigned char>(mon[k])) != kMonths[i][k]) same = false;
    if (same) month = i + 1;
  }
  if (month == 0 || d < 1 || d > 31 || y < 1985 || y > 2100 || hh < 0 || hh > 23 || mm < 0 ||
      mm > 59 || ss < 0.0 || ss >= 60.0)
    return false;
  const int64_t days = days_from_civil(y, month, d) - kDays1985;
  *t85 = static_cast<double>(days) * 86400.0 + hh * 3600.0 + mm * 60.0 + ss;
  return true;
}

Mjd to_mjd(double t85) {
  int64_t days, sec, us;
  split(t85 - kMjd2000In85, &days, &sec, &us);
  // split() floors, so negative times still give 0 <= sec < 86400.
  Mjd m;
  m.days = static_cast<int32_t>(days);
  m.seconds = static_cast<uint32_t>(sec);
  m.microseconds = static_cast<uint32_t>(us);
  return m;
}

double from_mjd(const Mjd& m) {
  return m.days * 86400.0 + m.seconds + m.microseconds * 1e-6 + kMjd2000In85;
}

}  // namespace synth
