#include "extraction/product_kind.h"

namespace {

// clang-format off
constexpr ProductKind kKinds[] = {
  // type   description images wide  mph    summed swath                  chirp power                         2nd noise droop mode                         unit                  image                      projection
  {"WSS", "ASA WSS", 5, true,  true,  false, SwathNaming::kSubSwath, ChirpPowerSource::kRecordOfImage,   false, 2, DS_ACQ_SCANSAR,             DS_UNIT_VOLT_COMPLEX, DS_IMAGE_AZIMUTH_FOCUSED, DS_PROJECTION_SLANT_RANGE},
  {"APS", nullptr,   2, false, false, false, SwathNaming::kIsDigit,  ChirpPowerSource::kNone,            false, 1, DS_ACQ_DOUBLE_POLARIZATION, DS_UNIT_VOLT_COMPLEX, DS_IMAGE_AZIMUTH_FOCUSED, DS_PROJECTION_SLANT_RANGE},
  {"APM", nullptr,   2, false, false, false, SwathNaming::kIsDigit,  ChirpPowerSource::kMatchingPolarDb, true,  1, DS_ACQ_DOUBLE_POLARIZATION, DS_UNIT_VOLT,         DS_IMAGE_MULTILOOK,       DS_PROJECTION_GROUND_RANGE},
  {"APP", nullptr,   2, false, false, false, SwathNaming::kIsDigit,  ChirpPowerSource::kMatchingPolarDb, true,  1, DS_ACQ_DOUBLE_POLARIZATION, DS_UNIT_VOLT,         DS_IMAGE_AZIMUTH_FOCUSED, DS_PROJECTION_SLANT_RANGE},
  {"WSM", nullptr,   1, false, false, true,  SwathNaming::kSphSwath, ChirpPowerSource::kNone,            false, 0, DS_ACQ_SCANSAR,             DS_UNIT_VOLT,         DS_IMAGE_MULTILOOK,       DS_PROJECTION_GROUND_RANGE},
  {"GM1", nullptr,   1, false, false, true,  SwathNaming::kSphSwath, ChirpPowerSource::kNone,            false, 2, DS_ACQ_SCANSAR,             DS_UNIT_VOLT,         DS_IMAGE_MULTILOOK,       DS_PROJECTION_GROUND_RANGE},
};
constexpr ProductKind kSingleImage =
  {"",    nullptr,   0, false, false, false, SwathNaming::kSphSwath, ChirpPowerSource::kNone,            false, 0, DS_ACQ_STRIPMAP,            DS_UNIT_VOLT_COMPLEX, DS_IMAGE_AZIMUTH_FOCUSED, DS_PROJECTION_SLANT_RANGE};
// clang-format on

}  // namespace

const ProductKind& FindProductKind(const std::string& type) {
  for (const ProductKind& k : kKinds) {
    if (type == k.type) return k;
  }
  return kSingleImage;
}
