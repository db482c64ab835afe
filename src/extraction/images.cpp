#include "extraction/images.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>

#include "envisat/product_header.h"
#include "extraction/asar_annotation.h"
#include "extraction/elevation_pattern.h"
#include "extraction/geolocation_polys.h"
#include "extraction/product_file.h"
#include "extraction/product_kind.h"
#include "metadata_framework/tessal_xml.h"
#include "metadata_sections/antenna_pattern.h"
#include "metadata_sections/data_set_info.h"
#include "metadata_sections/geo_coords.h"
#include "metadata_sections/gs_roi.h"
#include "metadata_sections/poly_sar.h"
#include "metadata_sections/sampling_constants.h"
#include "metadata_sections/sar_pulse.h"
#include "metadata_sections/sensor_attitude.h"
#include "metadata_sections/spectral_windows.h"
#include "metadata_sections/swath_info.h"
#include "orbit/general_sar_orbit.h"
#include "orbit/scene_heading.h"
#include "raster/byte_order.h"
#include "raster/cell_type.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_handle.h"
#include "runtime/file_utility.h"
#include "runtime/light_speed.h"
#include "time/date_text.h"

namespace {

constexpr const char* kModule = "images_v2";
// Place of each sub-swath in the burst sequence SS1 SS4 SS2 SS5 SS3.
constexpr int kBurstOrder[kMaxImages] = {0, 2, 4, 1, 3};
// More samples per line than any ASAR product holds: a larger value is a
// damaged record, not a raster to allocate.
constexpr uint32_t kMaxSamples = 1u << 20;

// Copies `text` into a section's fixed text field.
void SetText(char* field, const std::string& text) {
  std::snprintf(field, kParStringSize, "%s", text.c_str());
}

bool Finite(double v) {
  return std::isfinite(v);
}

}  // namespace

// Working state of one run: released when run() returns.
struct images::Run {
  EnvisatHeaders h;
  const ProductKind* kind = nullptr;
  EnvisatDataSet mds[kMaxImages];
  int mdsFound = 0;
  asar::AnnotationTable mpp, doppler, geolocation, antenna, chirp;
  bool complex = true;
  int elementSize = 4;  // bytes of one sample in the product
  double sensingStart = 0.0, sensingStop = 0.0;
  double burstCycle = 0.0;
  int64_t summedLines = 0;  // output lines over all main-parameters records
};

int images::run() {
  VLR_SCOPE("images::run", kModule);
  nImages_ = 0;
  for (int k = 0; k < kMaxImages; ++k) {
    headerNames_[k][0] = '\0';
    rasterNames_[k][0] = '\0';
    data_[k] = ImageData();
  }
  Run r;
  int rc = vlr_scope_.callee(runSteps(r), __LINE__);
  if (rc == 0 && conf.ExtractData != 0) rc = vlr_scope_.callee(extractASARdata(), __LINE__);
  if (rc != 0) {
    removeOutputs();
    return rc;
  }
  if (conf.Verbose != 0) VLR_REPORT("The program exits normally", ARE_CHECKPOINT);
  return 0;
}

void images::removeOutputs() {
  for (int k = 0; k < kMaxImages; ++k) {
    if (conf.ExtractData != 0 && rasterNames_[k][0] != '\0') std::remove(rasterNames_[k]);
    if (headerNames_[k][0] != '\0') {
      std::remove(headerNames_[k]);
      std::remove(AntennaPattern_Obj::patternFileName(headerNames_[k]).c_str());
    }
  }
}

int images::runSteps(Run& r) {
  VLR_SCOPE("images::runSteps", kModule);
  const char* product = input.ASA_level1_filename;
  VLR_CALL(read_envisat_headers(product, &r.h));
  const EnvisatHeaders& h = r.h;
  r.kind = &FindProductKind(h.productType);
  const ProductKind& kind = *r.kind;

  // Measurement data sets.
  const EnvisatDsdLayout& layout = h.layout();
  if (kind.wideSwath) {
    r.mdsFound = h.imageDataSets(r.mds);
    VLR_REPORT(NVLR_UTILITY_Format("There are %d SWATH (MDS)", r.mdsFound).c_str(), ARE_CHECKPOINT);
    if (r.mdsFound != kMaxImages) {
      VLR_FAIL(NVLR_UTILITY_Format("Wide-swath product with %d measurement data sets: %d needed",
                                   r.mdsFound, kMaxImages)
                   .c_str(),
               vlr::kLibInconsistent);
    }
  } else {
    r.mds[0] = h.dataSet(layout.mds[0]);
    r.mds[1] = h.dataSet(layout.mds[1]);
    r.mdsFound = r.mds[0].present() ? (r.mds[1].present() ? 2 : 1) : 0;
  }

  // Annotation data sets, read whole.
  const asar::ScopedFd file(open(product, O_RDONLY | O_CLOEXEC));
  if (!file.valid()) VLR_FAIL("File not opened!", vlr::kLibOpen);
  const struct Table {
    asar::AnnotationTable* table;
    size_t sphOffset;
    size_t minRecordSize;
    const char* name;
  } tables[] = {
      {&r.mpp, layout.mainProcessing, asar::mpp::kMinRecordSize, "MAIN PROCESSING PARAMS ADS"},
      {&r.doppler, layout.doppler, asar::dop::kMinRecordSize, "DOP CENTROID COEFFS ADS"},
      {&r.geolocation, layout.geolocation, asar::geo::kMinRecordSize, "GEOLOCATION GRID ADS"},
      {&r.antenna, layout.antenna, asar::antenna::kMinRecordSize, "ANTENNA ELEV PATT ADS"},
      {&r.chirp, layout.chirp, asar::chirp::kMinRecordSize, "CHIRP PARAMS ADS"},
  };
  for (const Table& t : tables) {
    VLR_CALL(
        t.table->read(file.get(), h.fileSize, h.dataSet(t.sphOffset), t.minRecordSize, t.name));
  }
  if (r.mpp.count() == 0) {
    VLR_REPORT("WARNING: A number of 0 MPP is not supported!", ARE_CHECKPOINT);
  } else {
    VLR_REPORT(NVLR_UTILITY_Format("There are %ld MPP\n", static_cast<long>(r.mpp.count())).c_str(),
               ARE_CHECKPOINT);
  }
  VLR_REPORT(
      NVLR_UTILITY_Format("There are %ld DCCADS", static_cast<long>(r.doppler.count())).c_str(),
      ARE_CHECKPOINT);
  if (r.geolocation.count() == 0) {
    VLR_REPORT("WARINING: A number of 0 DCC is not supported!", ARE_CHECKPOINT);
  }
  if (r.antenna.count() == 0) {
    VLR_REPORT("WARNING: A number of 0 ANT is not supported", ARE_CHECKPOINT);
  }

  // Sample and data type.
  r.complex = h.sampleType == "COMPLEX";
  if (h.dataType == "SWOR" || h.dataType == "UWOR") {
    r.elementSize = r.complex ? 4 : 2;
  } else if (h.dataType == "BYTE") {
    r.elementSize = r.complex ? 2 : 1;
  } else {
    VLR_FAIL(NVLR_UTILITY_Format("Data type %s not supported", h.dataType.c_str()).c_str(),
             vlr::kLibInconsistent);
  }
  if (!h.spacingsValid || !(h.rangeSpacing > 0.0) || !(h.lineTimeInterval > 0.0)) {
    VLR_FAIL("Range spacing or line time interval missing from the SPH", vlr::kLibInconsistent);
  }

  // Number of images.
  nImages_ = kind.images > 0 ? kind.images : r.mpp.count();
  if (nImages_ < 1 || nImages_ > kMaxImages) {
    VLR_FAIL(NVLR_UTILITY_Format("Product with %d images", nImages_).c_str(),
             vlr::kLibInconsistent);
  }
  if (r.mpp.count() < 1) VLR_FAIL("No main processing parameters record", vlr::kLibInconsistent);
  for (int i = 0; i < r.mpp.count(); ++i) {
    r.summedLines += r.mpp.record(i).u32(asar::mpp::kNumOutputLines);
  }

  // Sensing start and stop.
  const std::string& startText = kind.sensingFromMph ? h.sensingStart : h.firstLineTime;
  const std::string& stopText = kind.sensingFromMph ? h.sensingStop : h.lastLineTime;
  if (!parse_sec85(startText.c_str(), &r.sensingStart) ||
      !parse_sec85(stopText.c_str(), &r.sensingStop)) {
    VLR_FAIL("Sensing start or stop time does not parse", vlr::kLibInconsistent);
  }
  VLR_REPORT(NVLR_UTILITY_Format("Sensing start time from SPH: %f\n", r.sensingStart).c_str(),
             ARE_CHECKPOINT);
  VLR_REPORT(NVLR_UTILITY_Format("Sensing stop time from SPH: %f\n", r.sensingStop).c_str(),
             ARE_CHECKPOINT);

  // Burst cycle of a wide-swath product: every sub-swath's share of it.
  if (kind.wideSwath) {
    if (r.mpp.count() < kMaxImages) {
      VLR_FAIL(NVLR_UTILITY_Format("Wide-swath product with %d main processing parameters "
                                   "records: %d needed",
                                   r.mpp.count(), kMaxImages)
                   .c_str(),
               vlr::kLibInconsistent);
    }
    for (int k = 0; k < kMaxImages; ++k) {
      const asar::Record m = r.mpp.record(k);
      const double prf = m.f32(asar::mpp::kPrf);
      const double share =
          (static_cast<double>(m.i32(asar::mpp::kRank)) + m.i32(asar::mpp::kEchoesPerBurst)) / prf;
      if (!(prf > 0.0) || !Finite(share) || !(share > 0.0)) {
        VLR_FAIL(NVLR_UTILITY_Format("Sub-swath %d: invalid PRF, rank or echoes per burst", k + 1)
                     .c_str(),
                 vlr::kLibInconsistent);
      }
      r.burstCycle += share;
    }
  }

  for (int k = 0; k < nImages_; ++k) VLR_CALL(processImage(r, k));
  r.mpp.release();
  r.doppler.release();
  r.geolocation.release();
  r.antenna.release();
  r.chirp.release();
  return 0;
}

// What one image is: its main processing parameters, range sampling,
// measurement data set, line times and output names.  Every header section
// is filled from it.
struct images::Image {
  int k = 0;
  bool wss = false;
  bool second = false;  // second image of an alternating-polarisation product
  asar::Record m{nullptr, 0};
  GeolocationRows rows;
  double rangeInterval = 0.0;  // s between samples
  double lineInterval = 0.0;   // s between lines
  double nearTime = 0.0, farTime = 0.0;
  uint32_t samples = 0;
  const EnvisatDataSet* mds = nullptr;
  int32_t records = 0;
  int linesPerBurst = 0;
  double first = 0.0, last = 0.0;  // zero-Doppler times of the first and last line
  int64_t lineTimes = 0;           // lines of the region's time grid
  std::string polar;
  std::string raster;
  const char* hdr = nullptr;
};

int images::processImage(Run& r, int k) {
  VLR_SCOPE("images::processImage", kModule);
  Image im;
  VLR_CALL(planImage(r, k, &im));
  VLR_CALL(prepareOutputNames(k, &im));
  VLR_REPORT(NVLR_UTILITY_Format("Writing Header file: %s\n", im.hdr).c_str(), ARE_CHECKPOINT);

  // The sections are gathered in memory and the header written once, whole;
  // a step that fails leaves no header behind.
  HeldXmlDocument header(im.hdr);
  // The data-set information is written after the orbit step, which adds
  // the scene heading.
  DataSetInfo_Obj info;
  fillDataSetInfo(r, im, &info);
  VLR_CALL(writeSwathInfo(r, im));
  double lambda = 0.0;
  VLR_CALL(writeSamplingConstants(r, im, &lambda));
  VLR_CALL(writeSpectralWindows(im));
  VLR_CALL(describeRaster(r, im));
  VLR_CALL(writeOrbitAndCorners(im, lambda, &info));
  VLR_CALL(info.writehdr(im.hdr));
  VLR_CALL(writeRegion(im));
  VLR_CALL(writePolynomials(r, im));
  VLR_CALL(writeAttitude(r, im));
  VLR_CALL(writeElevationPattern(r, k, im.hdr));
  VLR_CALL(writePulse(im));
  VLR_CALL(header.save());
  return 0;
}

int images::planImage(const Run& r, int k, Image* im) {
  VLR_SCOPE("images::planImage", kModule);
  const EnvisatHeaders& h = r.h;
  const ProductKind& kind = *r.kind;
  const bool wss = kind.wideSwath;
  im->k = k;
  im->wss = wss;
  im->second = !wss && k == 1;

  // The image's main processing parameters.
  if (k >= r.mpp.count() && !(kind.images == 2 && r.mpp.count() >= 1)) {
    VLR_FAIL(
        NVLR_UTILITY_Format("Image %d has no main processing parameters record", k + 1).c_str(),
        vlr::kLibInconsistent);
  }
  im->m = r.mpp.record(k < r.mpp.count() ? k : r.mpp.count() - 1);
  const asar::Record& m = im->m;
  if (wss) {
    const char digit = m.ch(asar::mpp::kSwathDigit);
    if (digit != '1' + k && digit != ' ') {
      VLR_FAIL(NVLR_UTILITY_Format("Main processing parameters record %d is not of sub-swath %d",
                                   k + 1, k + 1)
                   .c_str(),
               vlr::kLibInconsistent);
    }
  }

  // Range sampling and near range.
  im->rangeInterval = h.rangeSpacing / kHalfSpeedOfLight;
  im->lineInterval = h.lineTimeInterval;
  VLR_CALL(SelectGeolocationRows(r.geolocation, wss ? k + 1 : 0, &im->rows));
  if (im->rows.empty()) {
    VLR_FAIL(NVLR_UTILITY_Format("No geolocation record of image %d", k + 1).c_str(),
             vlr::kLibInconsistent);
  }
  const asar::Record g = r.geolocation.record(im->rows.front());
  im->nearTime = g.f32(asar::geo::kSlantRangeTimes) * 1e-9 -
                 (static_cast<double>(g.u32(asar::geo::kFirstTieSample)) - 1.0) * im->rangeInterval;
  const uint32_t samples = m.u32(asar::mpp::kSamplesPerLine);
  if (samples < 1 || samples > kMaxSamples || !Finite(im->nearTime)) {
    VLR_FAIL(NVLR_UTILITY_Format("Image %d: %u samples per line", k + 1, samples).c_str(),
             vlr::kLibInconsistent);
  }
  im->samples = samples;

  // The image's measurement data set.
  const int mdsIndex = wss ? k : (k < r.mdsFound ? k : -1);
  if (mdsIndex < 0) {
    VLR_FAIL(NVLR_UTILITY_Format("Image %d has no measurement data set", k + 1).c_str(),
             vlr::kLibInconsistent);
  }
  const EnvisatDataSet& mds = r.mds[mdsIndex];
  const int64_t recordSize =
      static_cast<int64_t>(asar::mds::kLinePrefixSize) + int64_t{samples} * r.elementSize;
  if (mds.dsrSize != recordSize) {
    VLR_FAIL(NVLR_UTILITY_Format("MDS%d: records of %lld bytes, %lld expected for %u samples",
                                 mdsIndex + 1, static_cast<long long>(mds.dsrSize),
                                 static_cast<long long>(recordSize), samples)
                 .c_str(),
             vlr::kLibInconsistent);
  }
  if (!mds.fitsIn(h.fileSize) || mds.numDsr < 1 || mds.numDsr > INT32_MAX) {
    VLR_REPORT(
        NVLR_UTILITY_Format("MDS%d: records beyond the end of the file", mdsIndex + 1).c_str(),
        ARE_ERROR);
    VLR_FAIL("File reading failed!", vlr::kLibRead);
  }
  im->mds = &mds;
  im->records = static_cast<int32_t>(mds.numDsr);

  // Azimuth limits.
  LineTiming timing;
  timing.lineInterval = h.lineTimeInterval;
  timing.firstLineText = kind.sensingFromMph ? h.sensingStart : h.firstLineTime;
  timing.lastLineText = kind.sensingFromMph ? h.sensingStop : h.lastLineTime;
  im->linesPerBurst = m.i32(asar::mpp::kLinesPerBurst);
  timing.linesPerBurst = im->linesPerBurst;
  timing.burstCycle = r.burstCycle;
  VLR_CALL(get_first_last(input.ASA_level1_filename, mds.offset, mds.dsrSize, mds.numDsr, timing,
                          wss, &im->first, &im->last));

  // Derived geometry.  A wide-swath raster keeps every record (bursts
  // overlap in time); its region describes the zero-Doppler line grid.
  im->farTime = im->nearTime + (samples - 1.0) * im->rangeInterval;
  if (wss) {
    const double steps = (im->last - im->first) / im->lineInterval;
    // Far beyond any product: a damaged time or interval, not a line grid.
    if (!(steps >= 0.0 && steps < 1e9)) {
      VLR_FAIL(NVLR_UTILITY_Format("Image %d: impossible line timing", k + 1).c_str(),
               vlr::kLibInconsistent);
    }
    im->lineTimes = std::llround(steps) + 1;
  } else {
    im->lineTimes = kind.linesSummed ? r.summedLines : m.u32(asar::mpp::kNumOutputLines);
    if (im->lineTimes != im->records) {
      VLR_FAIL(NVLR_UTILITY_Format("Image %d: %lld output lines but %d records", k + 1,
                                   static_cast<long long>(im->lineTimes), im->records)
                   .c_str(),
               vlr::kLibInconsistent);
    }
  }
  if (im->lineTimes < 1) VLR_FAIL("Image without lines", vlr::kLibInconsistent);
  const std::string& polar = im->second ? h.mds2Polar : h.mds1Polar;
  im->polar = polar;
  return 0;
}

int images::prepareOutputNames(int k, Image* im) {
  VLR_SCOPE("images::prepareOutputNames", kModule);
  const bool numbered = im->wss || nImages_ > 1;
  const char* root = conf.ExtractData != 0 ? output.OutputFile : input.ASA_level1_filename;
  const std::string raster =
      numbered ? NVLR_UTILITY_Format("%s%d", root, k + 1) : std::string(root);
  const std::string header = NVLR_UTILITY_Format("%s.hdr", raster.c_str());
  if (header.size() >= kImagesNameSize) {
    VLR_FAIL(NVLR_UTILITY_Format("Output name too long (%zu characters)", header.size()).c_str(),
             vlr::kLibInconsistent);
  }
  struct stat st;
  if (conf.ExtractData != 0 && stat(raster.c_str(), &st) == 0 && std::remove(raster.c_str()) != 0)
    VLR_REPORT("Cannot remove file", ARE_WARNING);
  if (stat(header.c_str(), &st) == 0 && std::remove(header.c_str()) != 0)
    VLR_REPORT("Cannot remove file", ARE_WARNING);
  // The antenna pattern raster of an earlier header of the same name.
  const std::string patternRaster = AntennaPattern_Obj::patternFileName(header.c_str());
  if (stat(patternRaster.c_str(), &st) == 0 && std::remove(patternRaster.c_str()) != 0)
    VLR_REPORT("Cannot remove file", ARE_WARNING);
  // A raster or header that is not there yet leaves ENOENT behind.
  errno = 0;
  std::snprintf(rasterNames_[k], kImagesNameSize, "%s", raster.c_str());
  std::snprintf(headerNames_[k], kImagesNameSize, "%s", header.c_str());
  im->raster = raster;
  im->hdr = headerNames_[k];
  return 0;
}

void images::fillDataSetInfo(const Run& r, const Image& im, DataSetInfo_Obj* info) const {
  const EnvisatHeaders& h = r.h;
  const ProductKind& kind = *r.kind;
  SetText(info->OrbitNumber, h.absOrbit);
  SetText(info->Track, h.relOrbit);
  SetText(info->SenseDate, h.sensingStart);
  SetText(info->SceneID, h.product);
  SetText(info->Description, kind.description != nullptr ? kind.description : h.sphDescriptor);
  SetText(info->AcquisitionStation, h.acquisitionStation);
  SetText(info->ProcessingCenter, h.procCenter);
  SetText(info->ProcessingDate, h.procTime);
  SetText(info->ProcessingSoftware, h.softwareVer);
  // The pass direction: the composed product's heading is chosen by it.
  if (h.pass == "ASCENDING" || h.pass == "DESCENDING") SetText(info->OrbitConfiguration, h.pass);
  switch (kind.swath) {
    case SwathNaming::kSubSwath:
      SetText(info->Swath, NVLR_UTILITY_Format("SS%d", im.k + 1));
      break;
    case SwathNaming::kSphSwath:
      SetText(info->Swath, h.swath);
      break;
    case SwathNaming::kIsDigit:
      SetText(info->Swath,
              "IS" + (h.swath.empty() ? std::string() : h.swath.substr(h.swath.size() - 1)));
      break;
  }
  if (im.polar.size() >= 3)
    SetText(info->Polarization, NVLR_UTILITY_Format("%c/%c", im.polar[0], im.polar[2]));
  info->ExternalCalibrationFactor = im.m.f32(asar::mpp::kExternalCalibrationFactor);
  info->SetType(kind.image, DS_SENSOR_ASAR, kind.mode, kind.projection, kind.unit,
                DS_REFSYS_UNDEFINED);
}

int images::writeSwathInfo(const Run& r, const Image& im) {
  VLR_SCOPE("images::writeSwathInfo", kModule);
  const ProductKind& kind = *r.kind;
  const asar::Record& m = im.m;
  const int k = im.k;
  SwathInfo swath;
  swath.Acquisition_Start_Time =
      m.time(asar::mpp::kFirstZeroDopplerTime) + m.f32(asar::mpp::kTimeDiffZeroDoppler);
  swath.ProcessorGain = m.f32(asar::mpp::kProcessorGain);
  swath.NoisePower = m.f32(im.second && kind.secondNoiseField ? asar::mpp::kNoisePowerSecond
                                                              : asar::mpp::kNoisePower);
  if (im.wss) {
    if (im.linesPerBurst < 1) {
      VLR_FAIL(
          NVLR_UTILITY_Format("Sub-swath %d: %d lines per burst", k + 1, im.linesPerBurst).c_str(),
          vlr::kLibInconsistent);
    }
    const uint32_t outputLines = m.u32(asar::mpp::kNumOutputLines);
    if (outputLines != static_cast<uint32_t>(im.records)) {
      VLR_REPORT(NVLR_UTILITY_Format("Sub-swath %d: %u output lines, %d records; the records are "
                                     "kept",
                                     k + 1, outputLines, im.records)
                     .c_str(),
                 ARE_WARNING);
    }
    swath.Rank = m.i32(asar::mpp::kRank);
    swath.Echoes_per_burst = m.i32(asar::mpp::kEchoesPerBurst);
    swath.Lines_per_burst = im.linesPerBurst;
    swath.Bursts = im.records / im.linesPerBurst;
    swath.Order = kBurstOrder[k];
  }
  if (r.chirp.count() > 0) {
    if (kind.chirpPower == ChirpPowerSource::kRecordOfImage && k < r.chirp.count()) {
      swath.ChirpPower = r.chirp.record(k).f32(asar::chirp::kChirpPower);
    } else if (kind.chirpPower == ChirpPowerSource::kMatchingPolarDb) {
      for (int i = 0; i < r.chirp.count(); ++i) {
        const asar::Record c = r.chirp.record(i);
        if (c.token(asar::chirp::kPolarisation, 3) == im.polar) {
          swath.ChirpPower = std::pow(10.0, c.f32(asar::chirp::kElevationChirpPowerDb) / 10.0);
          break;
        }
      }
    }
  }
  VLR_CALL(swath.writehdr(im.hdr));
  return 0;
}

int images::writeSamplingConstants(const Run& r, const Image& im, double* lambda) {
  VLR_SCOPE("images::writeSamplingConstants", kModule);
  const asar::Record& m = im.m;
  SamplingConstants_Obj sampling;
  sampling.fc_hz = m.f32(asar::mpp::kRadarFrequency);
  sampling.lambda_m = kSpeedOfLight / sampling.fc_hz;
  sampling.frg_hz = m.f32(asar::mpp::kRangeSamplingRate);
  sampling.Trg_s = 1.0 / sampling.frg_hz;
  sampling.Brg_hz = m.f32(asar::mpp::kRangeBandwidth);
  sampling.prf_hz = m.f32(asar::mpp::kPrf);
  sampling.pri_s = 1.0 / sampling.prf_hz;
  sampling.Baz_hz = sampling.prf_hz;
  sampling.bri_s = r.burstCycle;
  // Products without bursts have no burst rate: stored as 0.
  sampling.brf_hz = r.burstCycle > 0.0 ? 1.0 / r.burstCycle : 0.0;
  if (!(sampling.fc_hz > 0.0) || !(sampling.frg_hz > 0.0) || !(sampling.prf_hz > 0.0)) {
    VLR_FAIL(
        NVLR_UTILITY_Format("Image %d: carrier, range sampling rate or PRF not positive", im.k + 1)
            .c_str(),
        vlr::kLibInconsistent);
  }
  VLR_CALL(sampling.writehdr(im.hdr));
  *lambda = sampling.lambda_m;
  return 0;
}

int images::writeSpectralWindows(const Image& im) {
  VLR_SCOPE("images::writeSpectralWindows", kModule);
  const asar::Record& m = im.m;
  SpectralWindows_Obj windows;
  SetText(windows.RgMatchedFilterType,
          m.token(asar::mpp::kRangeWindowType, asar::mpp::kWindowTypeWidth));
  windows.RgMatchedFilterCoef = m.f32(asar::mpp::kRangeWindowCoef);
  SetText(windows.AzMatchedFilterType,
          m.token(asar::mpp::kAzimuthWindowType, asar::mpp::kWindowTypeWidth));
  windows.AzMatchedFilterCoef = m.f32(asar::mpp::kAzimuthWindowCoef);
  // A wide-swath record holds one range look bandwidth per sub-swath.
  windows.RgLookBandwidth = m.f32(asar::mpp::kRangeLookBandwidth + 4 * (im.wss ? im.k : 0));
  windows.AzLookBandwidth = m.f32(asar::mpp::kAzimuthLookBandwidth);
  VLR_CALL(windows.writehdr(im.hdr));
  return 0;
}

int images::describeRaster(const Run& r, const Image& im) {
  VLR_SCOPE("images::describeRaster", kModule);
  // The lines inside the product.
  ImageData& d = data_[im.k];
  d.offset = im.mds->offset;
  d.recordSize = im.mds->dsrSize;
  d.samples = static_cast<int32_t>(im.samples);
  d.lines = im.records;
  if (r.elementSize == 4 || r.elementSize == 2) {
    d.inputCellType = r.complex ? CT_SHORT_COMPLEX : CT_INT16;
  } else {
    d.inputCellType = r.complex ? CT_INT8_COMPLEX : CT_INT8;
  }
  d.outputCellType = r.complex ? CT_FLOAT_COMPLEX : CT_FLOAT32;
  DataFile described;
  described.set_name(im.raster.c_str());
  described.pixels_per_line = d.samples;
  described.lines_per_image = d.lines;
  described.row_prefix = static_cast<int32_t>(asar::mds::kLinePrefixSize);
  described.header_offset = d.offset;
  described.cell_type = d.inputCellType;
  described.byte_order = 1;
  VLR_CALL(described.write_hdr());
  return 0;
}

int images::writeOrbitAndCorners(const Image& im, double lambda, DataSetInfo_Obj* info) {
  VLR_SCOPE("images::writeOrbitAndCorners", kModule);
  // Only an orbit file that opens gives state vectors.
  if (input.ASA_dor_vor[0] == '\0' || !FileHandle(input.ASA_dor_vor, "rb").valid()) {
    if (conf.Verbose != 0)
      VLR_REPORT("No DOR_VOR file provided. Skipping state vectors informations", ARE_WARNING);
    return 0;
  }
  const double span = im.last - im.first;
  GeneralSAROrbit orbit(lambda);
  VLR_CALL(orbit.GetStateVectorsENVI(input.ASA_dor_vor, im.first, span));
  VLR_CALL(orbit.writehdr(im.hdr));
  GSRoi_Obj extent;
  extent.roi.FastStartTime = im.nearTime;
  extent.roi.FastTimeLength = im.farTime - im.nearTime;
  extent.roi.SlowStartTime = im.first;
  extent.roi.SlowTimeLength = span;
  geoCoords_Obj corners;
  // The corners, and the centre at the middle of the zero-Doppler span and
  // of the range span: the image's own middle, whatever blank records or
  // overlapping bursts the data set holds.
  VLR_CALL(orbit.SVGetGeoCoords(&corners, &extent));
  VLR_CALL(corners.writehdr(im.hdr));
  VLR_CALL(scene_heading(orbit, im.first + 0.5 * span,
                         im.nearTime + 0.5 * (im.farTime - im.nearTime), &info->SceneHeading));
  return 0;
}

int images::writeRegion(const Image& im) {
  VLR_SCOPE("images::writeRegion", kModule);
  GSRoi_Obj region;
  region.roi.FastStartTime = im.nearTime;
  region.roi.FastTimeDelta = im.rangeInterval;
  region.roi.Samples = static_cast<int32_t>(im.samples);
  region.roi.FastTimeLength = im.farTime - im.nearTime;
  // The region starts at the image's own first line, so that each sub-swath
  // header says when its lines were taken (the sub-swaths of one product
  // start up to a burst cycle apart).
  region.roi.SlowStartTime = im.first;
  region.roi.SlowTimeDelta = im.lineInterval;
  region.roi.Lines = static_cast<int>(im.lineTimes);
  region.roi.SlowTimeLength = im.last - im.first;
  VLR_CALL(region.writehdr(im.hdr));
  return 0;
}

int images::writePolynomials(const Run& r, const Image& im) {
  VLR_SCOPE("images::writePolynomials", kModule);
  polySAR polys;
  VLR_CALL(
      MakeImagePolynomials(r.doppler, r.geolocation, im.rows, im.wss ? im.k : -1, im.m, &polys));
  VLR_CALL(polys.writehdr(im.hdr));
  return 0;
}

int images::writeAttitude(const Run& r, const Image& im) {
  VLR_SCOPE("images::writeAttitude", kModule);
  SensorAttitude_Obj attitude;
  attitude.Eq_speed = -1.0;
  attitude.Mean_DC = -1.0;
  attitude.SquintAngle = -1.0;
  attitude.AntennaLength = 10.0;
  if (input.ASA_INS_Filename[0] != '\0') {
    VLR_CALL(attitude.getDroopGain(input.ASA_INS_Filename, r.kind->droopMode));
  }
  VLR_CALL(attitude.writehdr(im.hdr));
  return 0;
}

int images::writePulse(const Image& im) {
  VLR_SCOPE("images::writePulse", kModule);
  const asar::Record& m = im.m;
  SARPulse_Obj pulse;
  pulse.PulseLength = m.f32(asar::mpp::kPulseLength);
  pulse.Bandwidth = m.f32(asar::mpp::kRangeBandwidth);
  pulse.PulseSamplingRate = m.f32(asar::mpp::kRangeSamplingRate);
  VLR_CALL(pulse.writehdr(im.hdr));
  return 0;
}

int images::writeElevationPattern(const Run& r, int k, const char* hdr) {
  VLR_SCOPE("images::writeElevationPattern", kModule);
  // One record per sub-swath in sub-swath order; of the other products the
  // table read is that of the first image.
  const bool wss = r.kind->wideSwath;
  if (!(wss || k == 0) || k >= r.antenna.count()) return 0;
  const asar::Record a = r.antenna.record(k);
  const std::string beam = a.token(asar::antenna::kBeamId, asar::antenna::kBeamIdWidth);
  std::string problem;
  AntennaPattern_Obj pattern;
  if (wss && !beam.empty() && beam != NVLR_UTILITY_Format("SS%d", k + 1)) {
    problem = "the record is that of beam " + beam;
  } else {
    const int rc = ElevationPatternOfRecord(a, &pattern, &problem);
    if (rc != 0 && problem.empty()) VLR_CALL(rc);
  }
  if (!problem.empty()) {
    VLR_REPORT(NVLR_UTILITY_Format("Image %d: antenna elevation pattern left out: %s", k + 1,
                                   problem.c_str())
                   .c_str(),
               ARE_WARNING);
    return 0;
  }
  VLR_CALL(pattern.writehdr(hdr));
  return 0;
}
