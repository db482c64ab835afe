#include "sar_container/image_sar_data.h"

#include <cmath>
#include <cstring>

#include "orbit/earth_constants.h"
#include "runtime/call_scope.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "generalSAR";
constexpr const char* kRegion = "ROI";
constexpr const char* kHeaderExtension = ".hdr";
// c / 4: from the Doppler rate difference to the equivalent speed.
constexpr double kQuarterSpeedOfLight = 74948114.5;

bool positiveFinite(double v) {
  return std::isfinite(v) && v > 0.0;
}

}  // namespace

int ImageSARData_Obj::setImageFile(const char* name) {
  if (name == nullptr) name = "";
  if (std::strlen(name) > kMaxImageFileName) return vlr::kLibInconsistent;
  imageFile_ = name;
  return 0;
}

bool ImageSARData_Obj::headerName(std::string* name) const {
  if (imageFile_.empty()) return false;
  *name = imageFile_ + kHeaderExtension;
  return true;
}

int ImageSARData_Obj::readhdr(const char* file) {
  VLR_SCOPE("ImageSARData_Obj::readhdr", kModule);
  if (file == nullptr || file[0] == '\0')
    VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
  if (imageFile_.empty()) {
    const size_t n = std::strlen(file);
    const size_t ext = std::strlen(kHeaderExtension);
    if (n <= ext || std::strcmp(file + n - ext, kHeaderExtension) != 0)
      VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
    const std::string base(file, n - ext);
    if (setImageFile(base.c_str()) != 0)
      VLR_FAIL("Invalid header file name!", vlr::kLibInconsistent);
  }
  VLR_CALL(data.read_hdr(imageFile_.c_str()));
  VLR_CALL(roi.read_roi(file, kRegion));
  GeneralSAR_Base* const sections[] = {&sampling,        &stateVectors, &orbit, &attitude, &polys,
                                       &spectralWindows, &geoCoords,    &pulse, &swathInfo};
  for (GeneralSAR_Base* section : sections) VLR_CALL(section->readhdr(file));
  return 0;
}

int ImageSARData_Obj::writehdr() {
  VLR_SCOPE("ImageSARData_Obj::writehdr", kModule);
  std::string header;
  if (!headerName(&header)) VLR_FAIL("No image file name!", vlr::kLibInconsistent);
  const char* file = header.c_str();
  data.set_name(imageFile_.c_str());
  VLR_CALL(data.write_hdr());
  VLR_CALL(roi.write_roi(file, kRegion));
  // The attitude, spectral windows and pulse come last: readhdr() needs
  // them too.
  GeneralSAR_Base* const sections[] = {&sampling,  &orbit,    &polys,           &geoCoords,
                                       &swathInfo, &attitude, &spectralWindows, &pulse};
  for (GeneralSAR_Base* section : sections) VLR_CALL(section->writehdr(file));
  return 0;
}

int ImageSARData_Obj::destroyAll() {
  stateVectors.SVDestroy();
  polys.DestroyPolys();
  return 0;
}

int ImageSARData_Obj::compute_eqspeed() {
  VLR_SCOPE("ImageSARData_Obj::compute_eqspeed", kModule);
  if (polys.fr.empty()) VLR_FAIL("NO FR poly available", vlr::kLibMissing);
  if (polys.dc.empty()) VLR_FAIL("NO DC poly available", vlr::kLibMissing);

  const double lambda = kSpeedOfLight / sampling.fc_hz;
  const double window = data.pixels_per_line / sampling.frg_hz;  // range window, s
  const double tau1 = roi.FastStartTime;
  const double tau2 = tau1 + roi.FastTimeLength;

  // Doppler rate at near and far range: constant, range and range-squared
  // terms of the first data set.
  const polyFR& rate = polys.fr[0];
  const auto fr = [&rate](double tau) {
    const double r = tau - rate.trg0_s;
    return rate.pol[0] + rate.pol[1] * r + rate.pol[4] * r * r;
  };
  const double fr1 = fr(tau1);
  const double fr2 = fr(tau2);

  double fdc = 0.0;
  VLR_CALL(polys.EvaluateDC(0.5 * (tau1 + tau2), polys.dc[0].taz0_s, &fdc));

  // Without a wavelength, a range window or two distinct non-zero Doppler
  // rates the formulas give infinities or NaN: refuse rather than store them.
  if (!positiveFinite(lambda) || !positiveFinite(window) || !std::isfinite(fr1) ||
      !std::isfinite(fr2) || fr1 == 0.0 || fr2 == 0.0 || fr1 == fr2 || !std::isfinite(fdc))
    VLR_FAIL("Equivalent speed cannot be computed: invalid sampling, region or Doppler rate", 1);

  const double squint = 0.5 * lambda * fdc;
  const double veq = std::sqrt(lambda * (kQuarterSpeedOfLight / (1.0 / fr1 - 1.0 / fr2)) * window +
                               squint * squint);
  const double theta = std::asin(squint / veq);
  const double req = -(std::cos(theta) * window * kSpeedOfLight * 0.5) / (1.0 - fr1 / fr2);
  if (!positiveFinite(veq) || !std::isfinite(req))
    VLR_FAIL("Equivalent speed cannot be computed: invalid sampling, region or Doppler rate", 1);

  attitude.Eq_speed = veq;
  attitude.Eq_distance = req;
  return 0;
}

int GeneralSLCData::readhdr(const char* file) {
  VLR_SCOPE("GeneralSLCData::readhdr", kModule);
  VLR_CALL(ImageSARData_Obj::readhdr(file));
  VLR_CALL(dataSetInfo.readhdr(file));
  if (positiveFinite(sampling.lambda_m)) orbit.setLambda(sampling.lambda_m);
  orbit.setLookSign(dataSetInfo.LookDirection);
  stateVectors.setLookSign(dataSetInfo.LookDirection);
  return 0;
}

int GeneralSLCData::writehdr() {
  VLR_SCOPE("GeneralSLCData::writehdr", kModule);
  VLR_CALL(ImageSARData_Obj::writehdr());
  std::string header;
  headerName(&header);
  VLR_CALL(dataSetInfo.writehdr(header.c_str()));
  return 0;
}
