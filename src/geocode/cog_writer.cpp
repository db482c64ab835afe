// Cloud Optimized GeoTIFF output through GDAL.
#include "geocode/cog_writer.h"

#include <cpl_conv.h>
#include <cpl_error.h>
#include <cpl_string.h>
#include <gdal_priv.h>
#include <ogr_spatialref.h>
#include <unistd.h>

#include <mutex>

#include "runtime/run_outputs.h"

namespace {

std::once_flag gRegistered;
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
  return true;
}

bool CogWriter::write(int x, int y, int columns, int rows, const float* values) {
  if (work_ == nullptr) return false;
  return work_->GetRasterBand(1)->RasterIO(GF_Write, x, y, columns, rows,
                                           const_cast<float*>(values), columns, rows, GDT_Float32,
                                           0, 0, nullptr) == CE_None;
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
  options.SetNameValue("PREDICTOR", "YES");
  options.SetNameValue("BLOCKSIZE", "512");
  options.SetNameValue("OVERVIEWS", "IGNORE_EXISTING");
  options.SetNameValue("OVERVIEW_RESAMPLING", "AVERAGE");
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
