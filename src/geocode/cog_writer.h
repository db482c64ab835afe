// Writing a float32 map image as a Cloud Optimized GeoTIFF through GDAL:
// blocks go into a tiled working GeoTIFF beside the target, together with
// their averages at every overview level, and GDAL's COG driver then copies
// the image and those overviews into the target with DEFLATE compression.
// The working file is removed in every case.
#pragma once

#include <string>
#include <vector>

#include "geocode/map_grid.h"

class GDALDataset;

// The averages of one block at every overview level: each overview pixel the
// mean of the valid pixels it covers, no data where it covers none.  Level k
// is summed from level k - 1's sums and counts, so the block is read once.
struct OverviewBlock {
  std::vector<std::vector<float>> levels;  // mean values, rows of the level's width
  std::vector<int> columns, rows;          // size of the block at each level
  std::vector<double> sum[2];              // sums and counts of the last two levels
  std::vector<int> count[2];
};

class CogWriter {
 public:
  CogWriter() = default;
  ~CogWriter();
  CogWriter(const CogWriter&) = delete;
  CogWriter& operator=(const CogWriter&) = delete;

  // Creates the working file for `target`.  False with *message.
  bool create(const std::string& target, const MapGrid& map, float noData, int blockSize,
              std::string* message);
  // The overview averages of a block of columns x rows values (rows one
  // after another).  May run on several threads at once.
  void reduce(int columns, int rows, const float* values, OverviewBlock* block) const;
  // Writes a block of columns x rows values at (x, y), and its averages made
  // by reduce into the overviews.  Blocks start on multiples of the block
  // size given to create, so that every overview pixel lies within one
  // block.  Not thread-safe.
  bool write(int x, int y, int columns, int rows, const float* values, const OverviewBlock& block);
  // Copies the working file into the target COG and removes the working
  // file.  False with *message (no target is left behind then).
  bool finish(std::string* message);

 private:
  void discard();

  GDALDataset* work_ = nullptr;
  float noData_ = 0.0f;
  std::vector<int> factors_;  // reduction of each overview level
  std::string target_;
  std::string workName_;
};
