// Burst and swath information of a ScanSAR sub-swath: burst layout, order in
// the burst sequence, acquisition start, gains and powers, the bursts at
// which the sampling window changes and the time of each burst.
#pragma once

#include "metadata_framework/general_sar_base.h"
#include "runtime/call_scope.h"

class SwathInfo : public GeneralSAR_Base {
 public:
  // Largest number of sampling-window changes accepted from a file.
  static constexpr int kMaxSwstChanges = 1 << 20;
  // Bytes at the start of each raster line that hold its time record.
  static constexpr int kLinePrefixSize = 17;

  SwathInfo();
  ~SwathInfo() override;
  SwathInfo(const SwathInfo&) = delete;
  SwathInfo& operator=(const SwathInfo&) = delete;

  // Allocates Swst_changes_bursts for "Swst_changes" entries: 0 (no array
  // for 0 or the unset value -999), 1 for any other count outside
  // 0..kMaxSwstChanges, 7 when the allocation fails.
  int createBuffers() override;
  int destroyBuffers() override;

  // Block "SwathInfo" of channel 1, or else the parameter-file section
  // "SwathInfo" (there also "Swst_changes_bursts" with "Swst_changes"
  // values).  Read: 0, 1 when neither form is complete, or the code of
  // createBuffers().
  int readhdr(const char* file) override;
  int writehdr(const char* file) override;
  using GeneralSAR_Base::writehdr;
  // Copies the fields and both arrays.  0 or 7.
  int clone(SwathInfo* other) const;

  // Reads the section from "<base>.hdr" and the raster header of `base`,
  // then the time of the first line of each burst from the line prefixes of
  // the raster.  0, 1 (incomplete section, no burst, or a raster without
  // line time prefixes), 4 (raster shorter than its bursts), 7, or the code
  // of the failing read.
  int readBurstTimes(const char* base);

  // The sampling-window changes (Swst_changes entries, or none) and the
  // burst times (Bursts entries after readBurstTimes, or none).
  int* swstChangesBursts() { return swstChanges_.data(); }
  const int* swstChangesBursts() const { return swstChanges_.data(); }
  const double* burstTimes() const { return burstTimes_.data(); }
  int burstTimeCount() const { return static_cast<int>(burstTimes_.size()); }

  int Rank = -999;
  double Rgate_bias = -999;
  int Echoes_per_burst = -999;
  int Lines_per_burst = -999;
  int Bursts = -999;
  int Order = -999;                      // place in the burst sequence
  double Acquisition_Start_Time = -999;  // sec85
  int Swst_changes = -999;
  double ProcessorGain = 1.0;
  double NoisePower = -999;
  double ChirpPower = -999;

 protected:
  void refreshParameters() override;

 private:
  vlr::CkBuffer<int> swstChanges_;
  vlr::CkBuffer<double> burstTimes_;
};
