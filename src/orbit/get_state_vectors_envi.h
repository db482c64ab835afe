// State vectors on a regular grid from an ENVISAT DORIS orbit file.
#pragma once

#include "orbit/state_vectors.h"

// Fills positions and velocities (3 n values each) with the n vectors at
// t0 + i dt interpolated from the DORIS file `path`.  0 or the reader's code
// (interp_orb_l).
int GetStateVectorsENVI(const char* path, double t0, double dt, int n, double* positions,
                        double* velocities);

// SVCreate(t0, dt, n) on sv, the vectors from the DORIS file, then
// SVPolyCompute.  0 or the first failing code (1 from SVPolyCompute with
// more than kMaxFitStateVectors vectors; sv then holds them unfitted).
int GetStateVectorsENVI(const char* path, double t0, double dt, int n,
                        SAROrbitStateVectors_Obj* sv);

// The grid of the vectors that cover a scene of `duration` seconds from the
// sec85 time tStart: dt = 5 s; under 15 s five vectors centred on the scene
// centre (t0 = tStart + duration/2 - 10 s); otherwise from tStart - 0.2
// duration, n = 2 nint((1.4 duration / 5 + 1) / 2) + 1 (so 31 vectors from
// tStart - 20 s for 100 s).  0, or 1 when the duration is not finite or
// needs more than kMaxStateVectors vectors.
int StateVectorGridENVI(double tStart, double duration, double* t0, double* dt, int* n);
