// Closed forms the tests compare the tool against: calendar dates as seconds
// since 1985 and points of the WGS 84 ellipsoid as Earth-fixed coordinates.
// Written from the definitions, independently of the code under test.
#pragma once

#include <array>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <string>

namespace truth {

// Seconds since 01-JAN-1985 00:00:00 UTC of a civil date (proleptic Gregorian).
inline double Sec85(int year, int month, int day, int hour = 0, int minute = 0,
                    double second = 0.0) {
  const int y = year - (month <= 2 ? 1 : 0);
  const int era = (y >= 0 ? y : y - 399) / 400;
  const int yoe = y - era * 400;
  const int doy = (153 * ((month + 9) % 12) + 2) / 5 + day - 1;
  const long days = era * 146097L + yoe * 365 + yoe / 4 - yoe / 100 + doy - 719468;
  constexpr long kDays1970To1985 = 5479;
  return (days - kDays1970To1985) * 86400.0 + hour * 3600.0 + minute * 60.0 + second;
}

// Seconds since 1985 of "DD-MMM-YYYY HH:MM:SS[.ffffff]"; NaN when the text is no such date.
inline double Sec85(const std::string& text) {
  static const char* kMonths[] = {"JAN", "FEB", "MAR", "APR", "MAY", "JUN",
                                  "JUL", "AUG", "SEP", "OCT", "NOV", "DEC"};
  int day = 0, year = 0, hour = 0, minute = 0;
  char month[4] = {};
  double second = 0.0;
  if (std::sscanf(text.c_str(), "%2d-%3c-%4d %2d:%2d:%lf", &day, month, &year, &hour, &minute,
                  &second) != 6)
    return std::nan("");
  int m = 0;
  while (m < 12 && std::strcmp(month, kMonths[m]) != 0) ++m;
  if (m == 12) return std::nan("");
  return Sec85(year, m + 1, day, hour, minute, second);
}

using Vec3 = std::array<double, 3>;

// Earth-fixed position of a point at height h (m) above the WGS 84 ellipsoid.
inline Vec3 EarthFixed(double latDeg, double lonDeg, double h = 0.0) {
  constexpr double a = 6378137.0, f = 1.0 / 298.257223563, e2 = f * (2.0 - f);
  const double phi = latDeg * M_PI / 180.0, lambda = lonDeg * M_PI / 180.0;
  const double n = a / std::sqrt(1.0 - e2 * std::sin(phi) * std::sin(phi));
  return {(n + h) * std::cos(phi) * std::cos(lambda), (n + h) * std::cos(phi) * std::sin(lambda),
          (n * (1.0 - e2) + h) * std::sin(phi)};
}

inline double Distance(const Vec3& p, const Vec3& q) {
  return std::sqrt((p[0] - q[0]) * (p[0] - q[0]) + (p[1] - q[1]) * (p[1] - q[1]) +
                   (p[2] - q[2]) * (p[2] - q[2]));
}

// Straight-line distance in metres between two surface points given in degrees.
inline double SurfaceDistance(double lat1, double lon1, double lat2, double lon2) {
  return Distance(EarthFixed(lat1, lon1), EarthFixed(lat2, lon2));
}

}  // namespace truth
