// Constants of the orbit geometry: the WGS84 ellipsoid and the Earth's
// rotation; the speed of light comes with them.
#pragma once

#include "runtime/light_speed.h"

constexpr double kWgs84A = 6378137.0;                    // semi-major axis (m)
constexpr double kWgs84B = 6356752.314245;               // semi-minor axis (m)
constexpr double kWgs84A2 = 40680631590769.0;            // a squared
constexpr double kWgs84B2 = 40408299984659.16;           // b squared
constexpr double kWgs84OneMinusE2 = 0.9933056200098587;  // 1 - e^2 = b^2 / a^2
constexpr double kWgs84SecondE2 = 0.006739496742276434;  // e'^2 = a^2 / b^2 - 1
constexpr double kEarthRotation = 7.292115189334571e-5;  // rad/s
constexpr double kPi = 3.141592653589793;
constexpr double kRadToDeg = 180.0 / kPi;
