// Conversions between Earth-fixed Cartesian and geodetic coordinates.
#pragma once

// Latitude and longitude (radians) of the point g on the ellipsoid with
// semi-axes a and b, by Bowring's formula; on the polar axis the latitude
// is +pi/2 (z > 0) or -pi/2.
void xyz2geo(const double g[3], double out[2], double a, double b);

// Cartesian point of latitude, longitude (radians) and height (m) above the
// WGS84 ellipsoid.
void geo2cart(double out[3], const double llh[3]);
