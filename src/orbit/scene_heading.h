// Heading of a scene: the direction of the satellite's ground track at a
// point of the image.
#pragma once

class GeneralSAROrbit;

// Heading at azimuth time t (sec85) and two-way range delay tau (s): the
// direction of the Earth-fixed satellite velocity at t in the local
// horizontal plane of the zero-Doppler ground point of (t, tau), in degrees
// clockwise from north, 0 <= heading < 360.  0, or the code of the ground
// point or velocity query (1 without vectors, -1 outside the orbit, 1 or 2
// when no ground point exists); `heading` is left untouched on failure.
int scene_heading(GeneralSAROrbit& orbit, double t, double tau, double* heading);
