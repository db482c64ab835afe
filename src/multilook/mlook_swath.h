// What the multilook keeps of one sub-swath during a run: its header, its
// range looks, where it lies on the output's range grid, its burst times
// and what its burst processing produced.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "sar_container/general_sar.h"

// More range looks than this are refused.
constexpr int kMlookMaxLooks = 15;

struct mlook_swath {
  std::unique_ptr<GeneralSAR> header;

  // Range looks: bandwidth of a look and the centre frequency of each.
  double lookBandwidth = 0.0;
  double lookFrequency[kMlookMaxLooks] = {};

  // Range grid: transform length, look length, the samples dropped for
  // alignment, the first output sample, the number of output samples that
  // hold data, the range time of the first sample kept, where the swath
  // starts in the composite (as a range time) and its look power scale.
  int fftLength = 0;
  int lookLength = 0;
  int skip = 0;
  int offset = 0;
  int valid = 0;
  double rangeTime = 0.0;
  double boundaryTime = 0.0;
  double powerScale = 0.0;

  // Time of the first line of every burst.
  std::vector<double> burstTimes;

  // The temporary power file exists; lines that went through the
  // transforms.
  bool tempWritten = false;
  int64_t transformedLines = 0;
};
