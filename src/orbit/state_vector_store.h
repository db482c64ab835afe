// The state vectors that both orbit sections keep in block
// "StateVectorData": n vectors (Earth-fixed positions in m, velocities in
// m/s) spaced dt s apart from the sec85 time t0, and the side the radar
// looks to.  The sections build their own models of the orbit on top.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "runtime/call_scope.h"

struct gr_pt_record;

// Largest number of vectors a header may declare.
constexpr int kMaxStateVectors = 100000;

class StateVectorStore : public GeneralSAR_Base {
 public:
  ~StateVectorStore() override;
  // The buffers are owned: copy with the sections' clone().
  StateVectorStore(const StateVectorStore&) = delete;
  StateVectorStore& operator=(const StateVectorStore&) = delete;

  // Releases the buffers.  Returns 0.
  int SVDestroy();

  double* positions() { return positions_.data(); }
  const double* positions() const { return positions_.data(); }
  double* velocities() { return velocities_.data(); }
  const double* velocities() const { return velocities_.data(); }
  double t0() const { return t0_; }
  double dt() const { return dt_; }
  int n() const { return n_; }
  int lookSign() const { return lookSign_; }
  // +1 (right of the track) or -1 (left); any other value counts as +1.
  void setLookSign(int sign) { lookSign_ = sign < 0 ? -1 : 1; }

 protected:
  // Registers the fields; t0, dt and n are the values before any read.
  StateVectorStore(double t0, double dt, int n);

  // Positions, velocities, t0, dt and n, in this order.
  void refreshParameters() override;

  // Allocates 3 n positions and velocities and `count` further buffers of
  // `size` values for the current n (checked by the caller), then registers
  // the fields and marks the buffers allocated.  False, after
  // destroyBuffers(), when an allocation fails.
  bool allocateVectors(vlr::CkBuffer<double>* extra, int count, size_t size);
  // Releases the vectors and the further buffers, registers the empty
  // fields and marks the buffers released.
  void releaseVectors(vlr::CkBuffer<double>* extra, int count);
  // Copies the positions and velocities of src, which holds as many.
  void copyVectorsFrom(const StateVectorStore& src);
  // Fills `record` with the five vectors from `window` (the first of them
  // at tw), the grid spacing and the look sign, and solves the ground point
  // at (t, tau, fdc) on the WGS84 ellipsoid.  gr_pt_lat_lon's code.
  int solveGroundPoint(const double* window, double tw, double t, double tau, double fdc,
                       double lambda, gr_pt_record* record) const;

  vlr::CkBuffer<double> positions_;
  vlr::CkBuffer<double> velocities_;
  double t0_;
  double dt_;
  int n_;
  int lookSign_ = 1;
};
