#include "sar_container/general_sar.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cmath>
#include <string>

#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSAR";

// The file opens for reading and is not a directory.
bool readableFile(const char* file) {
  if (file == nullptr || file[0] == '\0') return false;
  const int fd = ::open(file, O_RDONLY);
  if (fd < 0) return false;
  struct stat st {};
  const bool regular = ::fstat(fd, &st) == 0 && !S_ISDIR(st.st_mode);
  ::close(fd);
  return regular;
}

}  // namespace

GeneralSAR::GeneralSAR() {
  objects_[GS_DATAFILE] = &datafile;
  objects_[GS_ROI] = &roi;
  objects_[GS_POLYSAR] = &polys;
  objects_[GS_SAMPLING] = &sampling;
  objects_[GS_STATEVECTORS] = &stateVectors;
  objects_[GS_ORBIT] = &orbit;
  objects_[GS_PULSE] = &pulse;
  objects_[GS_ANTENNA] = &antenna;
  objects_[GS_DATASETINFO] = &dataSetInfo;
  objects_[GS_ATTITUDE] = &attitude;
  objects_[GS_SPECTRALWINDOWS] = &spectralWindows;
  objects_[GS_GEOCOORDS] = &geoCoords;
  objects_[GS_SWATHINFO] = &swathInfo;
  objects_[GS_BUFFERFILE] = &bufferfile;
}

GeneralSAR_Base* GeneralSAR::GSget(GSObject object) {
  return valid(object) ? objects_[object] : nullptr;
}

void GeneralSAR::GSenable(GSObject object) {
  if (valid(object)) enabled_[object] = true;
}

void GeneralSAR::GSdisable(GSObject object) {
  if (valid(object)) enabled_[object] = false;
}

bool GeneralSAR::GSexists(GSObject object) const {
  return valid(object) && enabled_[object];
}

int GeneralSAR::GSread(const char* file) {
  VLR_SCOPE("GeneralSAR::GSread", kModule);
  if (!readableFile(file)) {
    errno = 0;
    const std::string message =
        "File : " + std::string(file != nullptr ? file : "") + " DOES NOT EXIST!";
    VLR_FAIL(message.c_str(), vlr::kLibInconsistent);
  }
  GSdestroy();
  // A section that the file does not hold (or holds damaged) fails to read
  // and stays disabled; that is not an error of the container.
  for (int i = 0; i < kObjects; ++i) {
    enabled_[i] = true;
    if (objects_[i]->readhdr(file) != 0) enabled_[i] = false;
  }
  errno = 0;
  if (enabled_[GS_SAMPLING] && enabled_[GS_ORBIT]) {
    // An unset or damaged wavelength would spoil every Doppler computation
    // of the orbit: it keeps its own then.
    if (std::isfinite(sampling.lambda_m) && sampling.lambda_m > 0.0)
      orbit.setLambda(sampling.lambda_m);
    else
      VLR_REPORT("Invalid wavelength in the sampling constants: the orbit keeps its own", 1);
  }
  if (enabled_[GS_DATASETINFO]) {
    if (enabled_[GS_ORBIT]) orbit.setLookSign(dataSetInfo.LookDirection);
    if (enabled_[GS_STATEVECTORS]) stateVectors.setLookSign(dataSetInfo.LookDirection);
  }
  return 0;
}

int GeneralSAR::GSwrite(const char* file) {
  VLR_SCOPE("GeneralSAR::GSwrite", kModule);
  if (file == nullptr || file[0] == '\0')
    VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
  int first = 0;
  for (int i = kObjects - 1; i >= 0; --i) {
    if (!enabled_[i]) continue;
    const int rc = vlr_scope_.callee(objects_[i]->writehdr(file), __LINE__);
    if (rc != 0 && first == 0) first = rc;
  }
  return first;
}

int GeneralSAR::cloneObject(int object, GeneralSAR* other) const {
  switch (object) {
    case GS_DATAFILE:
      return datafile.clone(&other->datafile);
    case GS_ROI:
      return roi.clone(&other->roi);
    case GS_POLYSAR:
      return polys.clone(&other->polys);
    case GS_SAMPLING:
      return sampling.clone(&other->sampling);
    case GS_STATEVECTORS:
      return stateVectors.clone(&other->stateVectors);
    case GS_ORBIT:
      return orbit.clone(&other->orbit);
    case GS_PULSE:
      return pulse.clone(&other->pulse);
    case GS_ANTENNA:
      return antenna.clone(&other->antenna);
    case GS_DATASETINFO:
      return dataSetInfo.clone(&other->dataSetInfo);
    case GS_ATTITUDE:
      return attitude.clone(&other->attitude);
    case GS_SPECTRALWINDOWS:
      return spectralWindows.clone(&other->spectralWindows);
    case GS_GEOCOORDS:
      return geoCoords.clone(&other->geoCoords);
    case GS_SWATHINFO:
      return swathInfo.clone(&other->swathInfo);
    case GS_BUFFERFILE:
      return bufferfile.clone(&other->bufferfile);
  }
  return vlr::kLibInconsistent;
}

int GeneralSAR::GSclone(GeneralSAR* other) const {
  VLR_SCOPE("GeneralSAR::GSclone", kModule);
  if (other == nullptr || other == this) return 0;
  int first = 0;
  for (int i = 0; i < kObjects; ++i) {
    if (!enabled_[i]) continue;
    const int rc = vlr_scope_.callee(cloneObject(i, other), __LINE__);
    other->enabled_[i] = rc == 0;
    if (rc != 0 && first == 0) first = rc;
  }
  return first;
}

int GeneralSAR::GSdestroy() {
  polys.DestroyPolys();
  stateVectors.SVDestroy();
  orbit.SVDestroy();
  swathInfo.destroyBuffers();
  antenna.destroyBuffers();
  return 0;
}
