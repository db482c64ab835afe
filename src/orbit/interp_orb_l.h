// State vectors from a DORIS orbit file.
#pragma once

// Interpolates n state vectors spaced dt and centred on the sec85 time tc
// (vector i at tc + (i - (n-1)/2) dt) from the DORIS file `path`, each from
// the nine records around its own time (the first or last nine at the
// file's ends).  pos (and vel when not null) receive 3 n values,
// x, y, z per vector, Earth-fixed, m and m/s.  orbitOut (when not null)
// receives the absolute orbit number of the record nearer to tc (the later
// one at equal distance).  With wantAnx = 1, anxOut receives the time of the
// last ascending node crossing before tc.
// Results: 0; 9 "File not opened!"; 4 "File reading failed!" (short header,
// malformed or missing records, records out of time order, a record count
// the file cannot hold, fewer than nine records, end of data before tc);
// 12 when the file is not a DOR_VOR, DOR_POR, AUX_FRO or AUX_FPO file; 13
// when tc lies outside the file's sensing start and stop; 1 when no
// ascending crossing precedes tc or the node time cannot be bracketed, or
// the arguments are invalid (n < 0, no pos, dt not finite with n > 1).
int interp_orb_l(const char* path, double tc, int n, double dt, double* pos, double* vel,
                 int* orbitOut, int wantAnx, double* anxOut);
