// The speed of light, and half of it: the factor between a two-way echo
// delay and the slant range it stands for.
#pragma once

constexpr double kSpeedOfLight = 299792458.0;              // m/s
constexpr double kHalfSpeedOfLight = kSpeedOfLight / 2.0;  // m/s, two-way delay to range
