// Calendar arithmetic of the generator: seconds since 1985-01-01 (every day
// 86400 s), ENVISAT date texts and the three-word MJD2000 record.  Kept apart
// from the tool's own time module on purpose: the generator is the reference
// the tool is checked against.
#pragma once

#include <cstdint>
#include <string>

namespace synth {

constexpr double kMjd2000In85 = 473299200.0;  // 2000-01-01 in seconds since 1985

struct Mjd {
  int32_t days = 0;
  uint32_t seconds = 0;
  uint32_t microseconds = 0;
};

// "DD-MMM-YYYY HH:MM:SS.ffffff" (27 characters); microseconds truncated.
std::string format_utc(double t85);
// Parses "D-MMM-YYYY[ HH:MM[:SS[.ffffff]]]"; false on malformed text.
bool parse_utc(const std::string& text, double* t85);
// Rounds to whole microseconds (the resolution of every stored time).
double round_us(double t85);
Mjd to_mjd(double t85);
double from_mjd(const Mjd& m);
// "YYYYMMDD_HHMMSS" for file names.
std::string format_compact(double t85);

}  // namespace synth
