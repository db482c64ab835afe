// The orbit window of the DORIS reader: nine consecutive records of a DORIS
// file, loaded by read_SVs and interpolated by interp_orb_point.  The window
// is process-wide state; every read_SVs replaces it.
#pragma once

#include <cstdint>
#include <cstdio>

// Loads the nine records around record k - 1 of the open DORIS file: the
// records first .. first + 8 with first = 0 when k < 5, numRecords - 9 when
// k > numRecords - 5, else k - 5 (so that record k - 1 is the fifth).  The
// data set starts at dataSetOffset and holds numRecords records.
// 0; 4 "File reading failed!" when fewer than nine records exist, a record
// cannot be read or is malformed, or the times are not increasing or a
// spacing differs from the window's mean by more than 5 % (a record missing
// or misplaced).  A failed load empties the window.
int read_SVs(int k, int numRecords, std::FILE* file, int64_t dataSetOffset);

// Position ('p') or velocity ('v') at sec85 time t from the window by
// nine-point Lagrange interpolation at the records' actual times.  0; 1 when the window is empty or
// `which` is neither 'p' nor 'v'.
int interp_orb_point(double t, char which, double out[3]);

// The z position at t from the window (0.0 when the window is empty).
double orb_z_at(double t);
