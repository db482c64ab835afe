// The metadata header of the multilooked image.
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>
#include <string>

#include "multilook/mlook.h"
#include "orbit/scene_heading.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/light_speed.h"
#include "time/date_text.h"

namespace {

constexpr const char* kModule = "mlook_v2";
constexpr double kCalibrationFactor = 1.0176;
// "SceneHeading" where no orbit gives one.
constexpr double kUnsetHeading = -999.0;

void CopyText(char* field, const char* text) {
  std::snprintf(field, kParStringSize, "%s", text);
}

}  // namespace

int mlook::writepar() {
  VLR_SCOPE("MLwritepars", kModule);
  if (!swath_[0].header || outputLines_ < 1 || outputSamples_ < 1)
    VLR_FAIL("Nothing processed", vlr::kLibInconsistent);
  std::unique_ptr<GeneralSAR> gs;
  try {
    gs.reset(new GeneralSAR);
  } catch (const std::bad_alloc&) {
    VLR_FAIL("Cannot allocate the output header", vlr::kLibAlloc);
  }
  VLR_CALL(swath_[0].header->GSclone(gs.get()));
  // Burst layout and per-swath polynomials describe the inputs only.
  gs->GSdisable(GeneralSAR::GS_SWATHINFO);
  gs->GSdisable(GeneralSAR::GS_POLYSAR);
  gs->GSdisable(GeneralSAR::GS_BUFFERFILE);
  gs->GSdisable(GeneralSAR::GS_ANTENNA);

  DataSetInfo_Obj& info = gs->dataSetInfo;
  char date[kSec85TextSize] = {};
  const double first =
      swath_[0].burstTimes.empty()
          ? outputStartTime_
          : swath_[0].burstTimes[0] + input_->BurstsToSkip * swathPar[0].burstCycle;
  sec852ascii(first, date);
  CopyText(info.SenseDate, date);
  CopyText(info.Description, "WideSwath MULTILOOKING IMAGE");
  CopyText(info.ProcessingCenter, DataSetInfo_Obj::kProcessingCentre);
  CopyText(info.ProcessingSoftware, "Quillan v1.1");
  info.SceneHeading = kUnsetHeading;  // the orbit's, below
  CopyText(info.Swath, "ALL");
  info.SWST_MIN = -1.0;
  info.SWST_MAX = -1.0;
  info.RangeLooks = looks_;
  info.ExternalCalibrationFactor *= kCalibrationFactor;
  const bool ground = conf_->geometry() == OutputGeometry::kGroundRange;
  info.SetType(DS_IMAGE_MULTILOOK, DS_SENSOR_ASAR, DS_ACQ_SCANSAR,
               ground ? DS_PROJECTION_GROUND_RANGE : DS_PROJECTION_SLANT_RANGE, DS_UNIT_VOLT,
               DS_REFSYS_UNDEFINED);
  gs->GSenable(GeneralSAR::GS_DATASETINFO);

  SamplingConstants_Obj& sampling = gs->sampling;
  sampling.frg_hz = ground ? kHalfSpeedOfLight / conf_->GrSamplingStep : fs / decimation_;
  sampling.Trg_s = 1.0 / sampling.frg_hz;
  gs->GSenable(GeneralSAR::GS_SAMPLING);

  SpectralWindows_Obj& windows = gs->spectralWindows;
  CopyText(windows.RgMatchedFilterType, "HAMMING");
  windows.RgMatchedFilterCoef = conf_->W1;
  CopyText(windows.AzMatchedFilterType, "NONE");
  gs->GSenable(GeneralSAR::GS_SPECTRALWINDOWS);

  // The region: output lines on the azimuth axis; on the range axis the
  // range times of the first and last output samples, with the output's
  // sample step (in ground range the step of the sampling constants).
  ROI_Obj& roi = gs->roi.roi;
  roi.FastStartTime = swath_[0].rangeTime;
  roi.FastTimeLength = outputFarRangeTime_ - swath_[0].rangeTime;
  roi.FastTimeDelta = sampling.Trg_s;
  roi.Samples = outputSamples_;
  roi.SlowStartTime = outputStartTime_;
  roi.SlowTimeDelta = lineInterval_;
  roi.SlowTimeLength = (outputLines_ - 1) * lineInterval_;
  roi.Lines = outputLines_;
  gs->GSenable(GeneralSAR::GS_ROI);

  DataFile& data = gs->datafile.data;
  data.set_name(output_->OutputFilename);
  data.pixels_per_line = outputSamples_;
  data.lines_per_image = outputLines_;
  data.row_prefix = 0;
  data.header_offset = 0;
  data.cell_type = CT_FLOAT32;
  data.byte_order = 0;
  gs->GSenable(GeneralSAR::GS_DATAFILE);

  if (gs->GSexists(GeneralSAR::GS_ORBIT)) {
    VLR_CALL(gs->orbit.SVGetGeoCoords(&gs->geoCoords, &gs->roi));
    // The heading of the track at the centre of the output.
    VLR_CALL(scene_heading(gs->orbit, roi.SlowStartTime + 0.5 * roi.SlowTimeLength,
                           roi.FastStartTime + 0.5 * roi.FastTimeLength, &info.SceneHeading));
    gs->GSenable(GeneralSAR::GS_GEOCOORDS);
  }
  gs->GSenable(GeneralSAR::GS_ATTITUDE);
  const std::string name = NVLR_UTILITY_Format("%s.hdr", output_->OutputFilename);
  VLR_CALL(gs->GSwrite(name.c_str()));
  return 0;
}
