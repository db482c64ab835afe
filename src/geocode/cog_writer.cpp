// Cloud Optimized GeoTIFF output through GDAL.
#include "geocode/cog_writer.h"

#include <cpl_conv.h>
#include <cpl_error.h>
#include <cpl_string.h>
#include <gdal_priv.h>
#include <ogr_spatialref.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <mutex>
#include <string>

#include "runtime/run_outputs.h"

namespace {

std::once_flag gRegistered;
// Tile size of the target COG.
constexpr int kCogBlock = 512;
// GDAL's block cache unless the user set one: the map's blocks pass through
// it on their way to the file, so it bounds the memory the writing takes
// whatever the size of the map.
constexpr GIntBig kCacheBytes = GIntBig{64} << 20;

std::string LastGdalError(const char* what) {
  const char* text = CPLGetLastErrorMsg();
  return std::string(what) + (text != nullptr && *text ? std::string(": ") + text : "");
}

}  // namespace

CogWriter::~CogWriter() {
  discard();
}

void CogWriter::discard() {
  if (work_ != nullptr) {
    GDALClose(work_);
    work_ = nullptr;
  }
  if (!workName_.empty()) {
    unlink(workName_.c_str());
    VlrRunOutputRemoved(workName_.c_str());
    workName_.clear();
  }
}

bool CogWriter::create(const std::string& target, const MapGrid& map, float noData, int blockSize,
                       std::string* message) {
  std::call_once(gRegistered, [] {
    GDALAllRegister();
    if (CPLGetConfigOption("GDAL_CACHEMAX", nullptr) == nullptr) GDALSetCacheMax64(kCacheBytes);
  });
  target_ = target;
  workName_ = target + ".work.tif";
  GDALDriver* gtiff = GetGDALDriverManager()->GetDriverByName("GTiff");
  if (gtiff == nullptr) {
    *message = "GDAL has no GeoTIFF driver";
    return false;
  }
  const std::string block = std::to_string(blockSize);
  CPLStringList options;
  options.SetNameValue("TILED", "YES");
  options.SetNameValue("BLOCKXSIZE", block.c_str());
  options.SetNameValue("BLOCKYSIZE", block.c_str());
  options.SetNameValue("BIGTIFF", "IF_SAFER");
  options.SetNameValue("SPARSE_OK", "TRUE");
  CPLErrorReset();
  VlrRunOutputBegun(workName_.c_str());
  work_ = gtiff->Create(workName_.c_str(), map.width, map.height, 1, GDT_Float32, options.List());
  if (work_ == nullptr) {
    *message = LastGdalError(("Cannot create " + workName_).c_str());
    VlrRunOutputRemoved(workName_.c_str());
    workName_.clear();
    return false;
  }
  double gt[6];
  map.geoTransform(gt);
  OGRSpatialReference srs;
  srs.importFromEPSG(map.epsg);
  srs.SetAxisMappingStrategy(OAMS_TRADITIONAL_GIS_ORDER);
  if (work_->SetGeoTransform(gt) != CE_None || work_->SetSpatialRef(&srs) != CE_None ||
      work_->GetRasterBand(1)->SetNoDataValue(noData) != CE_None) {
    *message = LastGdalError("Cannot georeference the map image");
    discard();
    return false;
  }
  // Overview levels halve the image until it fits one COG tile, as the COG
  // driver's own choice does; they are made empty here and filled block by
  // block, which spares the driver a second pass over the whole image.
  noData_ = noData;
  factors_.clear();
  for (int f = 2; f <= blockSize; f *= 2) {
    factors_.push_back(f);
    if ((map.width + f - 1) / f <= kCogBlock && (map.height + f - 1) / f <= kCogBlock) break;
  }
  if (std::max(map.width, map.height) <= kCogBlock) factors_.clear();
  if (!factors_.empty() &&
      work_->BuildOverviews("NONE", static_cast<int>(factors_.size()), factors_.data(), 0, nullptr,
                            nullptr, nullptr) != CE_None) {
    *message = LastGdalError("Cannot make the overviews of the map image");
    discard();
    return false;
  }
  return true;
}

void CogWriter::reduce(int columns, int rows, const float* values, OverviewBlock* block) const {
  const size_t levels = factors_.size();
  block->levels.resize(levels);
  block->columns.assign(levels, 0);
  block->rows.assign(levels, 0);
  // Sums and counts of the level below: the block itself at first.
  int below = 0, belowColumns = columns, belowRows = rows;
  for (size_t level = 0; level < levels; ++level) {
    const int oc = (belowColumns + 1) / 2, orows = (belowRows + 1) / 2;
    const int to = static_cast<int>(level % 2);
    std::vector<double>& sum = block->sum[to];
    std::vector<int>& count = block->count[to];
    sum.assign(static_cast<size_t>(oc) * orows, 0.0);
    count.assign(sum.size(), 0);
    for (int r = 0; r < belowRows; ++r) {
      double* s = &sum[static_cast<size_t>(r / 2) * oc];
      int* n = &count[static_cast<size_t>(r / 2) * oc];
      if (level == 0) {
        const float* row = values + static_cast<size_t>(r) * columns;
        for (int c = 0; c < belowColumns; ++c)
          if (row[c] != noData_ && !std::isnan(row[c])) {
            s[c / 2] += row[c];
            ++n[c / 2];
          }
      } else {
        const double* rs = &block->sum[below][static_cast<size_t>(r) * belowColumns];
        const int* rn = &block->count[below][static_cast<size_t>(r) * belowColumns];
        for (int c = 0; c < belowColumns; ++c) {
          s[c / 2] += rs[c];
          n[c / 2] += rn[c];
        }
      }
    }
    std::vector<float>& mean = block->levels[level];
    mean.assign(sum.size(), noData_);
    for (size_t k = 0; k < sum.size(); ++k)
      if (count[k] > 0) mean[k] = static_cast<float>(sum[k] / count[k]);
    block->columns[level] = oc;
    block->rows[level] = orows;
    below = to;
    belowColumns = oc;
    belowRows = orows;
  }
}

bool CogWriter::write(int x, int y, int columns, int rows, const float* values,
                      const OverviewBlock& block) {
  if (work_ == nullptr || block.levels.size() != factors_.size()) return false;
  GDALRasterBand* band = work_->GetRasterBand(1);
  if (band->RasterIO(GF_Write, x, y, columns, rows, const_cast<float*>(values), columns, rows,
                     GDT_Float32, 0, 0, nullptr) != CE_None)
    return false;
  for (size_t level = 0; level < factors_.size(); ++level) {
    const int f = factors_[level];
    GDALRasterBand* overview = band->GetOverview(static_cast<int>(level));
    if (overview == nullptr || x % f != 0 || y % f != 0) return false;
    const int ox = x / f, oy = y / f, width = block.columns[level];
    const int oc = std::min(width, overview->GetXSize() - ox);
    const int orows = std::min(block.rows[level], overview->GetYSize() - oy);
    if (oc <= 0 || orows <= 0) continue;
    if (overview->RasterIO(GF_Write, ox, oy, oc, orows,
                           const_cast<float*>(block.levels[level].data()), oc, orows, GDT_Float32,
                           0, static_cast<GSpacing>(width) * sizeof(float), nullptr) != CE_None)
      return false;
  }
  return true;
}

bool CogWriter::finish(std::string* message) {
  if (work_ == nullptr) {
    *message = "No map image to write";
    return false;
  }
  GDALDriver* cog = GetGDALDriverManager()->GetDriverByName("COG");
  if (cog == nullptr) {
    *message = "GDAL has no COG driver";
    discard();
    return false;
  }
  work_->FlushCache();
  CPLStringList options;
  options.SetNameValue("COMPRESS", "DEFLATE");
  options.SetNameValue("LEVEL", "1");
  options.SetNameValue("PREDICTOR", "NO");
  options.SetNameValue("BLOCKSIZE", std::to_string(kCogBlock).c_str());
  options.SetNameValue("OVERVIEWS", factors_.empty() ? "NONE" : "FORCE_USE_EXISTING");
  options.SetNameValue("NUM_THREADS", "2");
  options.SetNameValue("BIGTIFF", "IF_SAFER");
  unlink(target_.c_str());
  VlrRunOutputBegun(target_.c_str());
  CPLErrorReset();
  GDALDataset* out =
      cog->CreateCopy(target_.c_str(), work_, FALSE, options.List(), nullptr, nullptr);
  bool ok = out != nullptr;
  if (!ok) *message = LastGdalError(("Cannot write " + target_).c_str());
  if (out != nullptr) {
    CPLErrorReset();
    GDALClose(out);
    if (CPLGetLastErrorType() >= CE_Failure) {
      ok = false;
      *message = LastGdalError(("Cannot write " + target_).c_str());
    }
  }
  discard();
  if (!ok) unlink(target_.c_str());
  return ok;
}
