#include "convert/imagesar_kestova.h"

#include <sys/stat.h>

#include <cerrno>
#include <cmath>
#include <cstdio>
#include <cstring>
#include <memory>
#include <string>

#include "convert/imagesar_kestova_internal.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/run_outputs.h"
#include "sar_container/general_sar.h"
#include "suite/description_header.h"
#include "time/date_text.h"

namespace kestova {

namespace {

const struct {
  const char* name;
  int code;
} kCellTypes[] = {{"FLOAT_COMPLEX", CT_FLOAT_COMPLEX},
                  {"FLOAT", CT_FLOAT32},
                  {"DOUBLE_COMPLEX", CT_DOUBLE_COMPLEX},
                  {"DOUBLE", CT_FLOAT64},
                  {"INT", CT_INT32},
                  {"SHORT_COMPLEX", CT_SHORT_COMPLEX},
                  {"SHORT", CT_INT16},
                  {"BYTE_COMPLEX", CT_INT8_COMPLEX},
                  {"BYTE", CT_INT8}};

}  // namespace

const char* SuiteCellType(int cellType) {
  for (const auto& t : kCellTypes) {
    if (t.code == cellType) return t.name;
  }
  return nullptr;
}

int LibraryCellType(const std::string& name) {
  for (const auto& t : kCellTypes) {
    if (name == t.name) return t.code;
  }
  return -1;
}

bool TimeText(double t, std::string* text) {
  char buffer[kSec85TextSize] = {};
  if (sec852myascii(t, buffer) != 0) return false;
  *text = buffer;
  return true;
}

bool PathExists(const std::string& path) {
  const int saved = errno;
  struct stat st {};
  const bool exists = ::stat(path.c_str(), &st) == 0;
  errno = saved;
  return exists;
}

}  // namespace kestova

namespace {

using namespace kestova;

// Suffix of the orbit header an older conversion may have left beside the
// suite header.
constexpr const char* kOrbitHeaderSuffix = "_orb.sml";
// The image's mid time and mid range, where the orbit gives the ground speed.
constexpr double kMidImage = 0.5;
// Sub-swaths of a wide-swath import.
constexpr int kSubSwaths = 5;

bool UsableName(const char* name) {
  return name != nullptr && name[0] != '\0' && std::strlen(name) <= kKestovaMaxName;
}

bool PositiveFinite(double v) {
  return std::isfinite(v) && v > 0.0;
}

// First line time of the image.  A region that starts at an absolute time
// gives it; the extraction writes regions relative to the first line (start
// 0), and then the data set's sensing date does: the product's first
// zero-Doppler line for an import, the first processed burst for a composed
// product.  Without a usable date the swath information's acquisition start
// is the last resort.
int FirstLineTime(const GeneralSAR& gs, double* first) {
  VLR_SCOPE("FirstLineTime", kModule);
  if (PositiveFinite(gs.roi.roi.SlowStartTime)) {
    *first = gs.roi.roi.SlowStartTime;
    return 0;
  }
  double sensed = 0.0;
  if (gs.GSexists(GeneralSAR::GS_DATASETINFO) && parse_sec85(gs.dataSetInfo.SenseDate, &sensed) &&
      sensed > 0.0) {
    *first = sensed;
    return 0;
  }
  if (gs.GSexists(GeneralSAR::GS_SWATHINFO) &&
      PositiveFinite(gs.swathInfo.Acquisition_Start_Time)) {
    *first = gs.swathInfo.Acquisition_Start_Time;
    return 0;
  }
  VLR_FAIL("No first line time in the header (region, sensing date or acquisition start)",
           vlr::kLibInconsistent);
}

// The speed behind "ProcessingVelocity" and "PixelSpacingAz".  A positive
// stored equivalent speed is used as it is.  Otherwise (the extraction stores
// -1 for "not computed", a composed product 0) the ground speed of the beam
// at the image's mid time and mid range comes from the orbit.  A sub-swath
// without orbit keeps its stored value and gets no azimuth spacing; a
// composed product must have one.
int GroundSpeed(GeneralSAR& gs, ImageTiming* timing) {
  VLR_SCOPE("GroundSpeed", kModule);
  const double stored = gs.attitude.Eq_speed;
  if (gs.GSexists(GeneralSAR::GS_ATTITUDE) && PositiveFinite(stored)) {
    timing->velocity = stored;
    timing->spacingKnown = true;
    return 0;
  }
  if (!gs.GSexists(GeneralSAR::GS_ORBIT) && !timing->composed) {
    VLR_REPORT("No orbit in the header: azimuth pixel spacing not computed", ARE_WARNING);
    timing->velocity = stored;
    timing->spacingKnown = false;
    return 0;
  }
  const ROI_Obj& roi = gs.roi.roi;
  const double t = timing->firstLine + kMidImage * roi.SlowTimeLength;
  const double tau = roi.FastStartTime + kMidImage * roi.FastTimeLength;
  double speed = 0.0;
  VLR_CALL(gs.orbit.SVGetSatSpeed(t, tau, &speed));
  if (!PositiveFinite(speed)) VLR_FAIL("The orbit gives no ground speed", vlr::kLibInconsistent);
  timing->velocity = speed;
  timing->spacingKnown = true;
  return 0;
}

// Removes a leftover orbit header; only an existing file that stays is
// reported.
void RemoveOrbitHeader(const std::string& suiteHeader, vlr::CallScope& scope) {
  const std::string orbitHeader = suiteHeader + kOrbitHeaderSuffix;
  if (PathExists(orbitHeader) && std::remove(orbitHeader.c_str()) != 0)
    scope.report("Cannot remove file", ARE_WARNING, __LINE__);
  errno = 0;
}

// Moves the raster of sub-swath k to its final name.
int MoveRaster(const std::string& raster, const std::string& target) {
  VLR_SCOPE("MoveRaster", kModule);
  if (PathExists(target) && std::remove(target.c_str()) != 0) {
    VLR_REPORT("Cannot remove file", ARE_WARNING);
  }
  errno = 0;
  if (std::rename(raster.c_str(), target.c_str()) != 0) {
    const int code = errno == ENOENT ? vlr::kLibMissing : vlr::kLibWrite;
    errno = 0;
    VLR_FAIL(
        NVLR_UTILITY_Format("Cannot rename file %s to %s", raster.c_str(), target.c_str()).c_str(),
        code);
  }
  VlrRunOutputMoved(raster.c_str(), target.c_str());
  return 0;
}

}  // namespace

int writehdr_kestova(const char* libraryHeader, const char* suiteHeader, const char* auxiliaryFile,
                     int /*spare*/) {
  CDescriptionHeader header(NVLR_UTILITY_ProductHeaderSections());
  CDescriptionHeader fixed(std::vector<std::string>{kFixHeaderSection});
  VLR_SCOPE("writehdr_kestova", kModule);
  if (!UsableName(libraryHeader) || !UsableName(suiteHeader))
    VLR_FAIL("Missing or too long header name", vlr::kLibInconsistent);

  // The container holds buffers of every section: kept off the stack.
  const auto gs = std::make_unique<GeneralSAR>();
  VLR_CALL(gs->GSread(libraryHeader));
  for (const GeneralSAR::GSObject needed : {GeneralSAR::GS_DATAFILE, GeneralSAR::GS_DATASETINFO,
                                            GeneralSAR::GS_ROI, GeneralSAR::GS_SAMPLING}) {
    if (!gs->GSexists(needed)) {
      VLR_FAIL(NVLR_UTILITY_Format("%s lacks the raster description, data-set information, "
                                   "region or sampling constants",
                                   libraryHeader)
                   .c_str(),
               vlr::kLibInconsistent);
    }
  }

  ImageTiming timing;
  timing.composed = std::strcmp(gs->dataSetInfo.Swath, kComposedSwath) == 0;
  VLR_CALL(FirstLineTime(*gs, &timing.firstLine));
  timing.lastLine = timing.firstLine + gs->roi.roi.SlowTimeLength;
  VLR_CALL(GroundSpeed(*gs, &timing));

  VLR_CALL(WriteMappedFields(*gs, timing, header));

  RemoveOrbitHeader(suiteHeader, vlr_scope_);
  writeHeader(header, suiteHeader);
  errno = 0;

  if (timing.composed) VLR_CALL(CarryEnvisatFixHeader(header, fixed, suiteHeader, auxiliaryFile));
  return 0;
}

int tessal2kestova(const char* root, const char* auxiliaryFile, int /*reportLevel*/) {
  VLR_SCOPE("tessal2kestova", kModule);
  if (root == nullptr || root[0] == '\0') VLR_FAIL("No output root name", vlr::kLibInconsistent);
  for (int k = 1; k <= kSubSwaths; ++k) {
    const std::string library = NVLR_UTILITY_Format("%s%d.hdr", root, k);
    const std::string suite = NVLR_UTILITY_Format("%s%d_slc_hdr", root, k);
    const std::string raster = NVLR_UTILITY_Format("%s%d", root, k);
    const std::string target = NVLR_UTILITY_Format("%s%d_slc", root, k);
    for (const std::string* name : {&library, &suite, &raster, &target}) {
      if (name->size() > kKestovaMaxName) {
        VLR_FAIL(NVLR_UTILITY_Format("File name too long (%zu characters)", name->size()).c_str(),
                 vlr::kLibInconsistent);
      }
    }
    VLR_CALL(writehdr_kestova(library.c_str(), suite.c_str(), auxiliaryFile, 0));
    VLR_CALL(MoveRaster(raster, target));
  }
  return 0;
}

int tessal2kestova(const char* root, const char* auxiliaryFile) {
  return tessal2kestova(root, auxiliaryFile, 0);
}
