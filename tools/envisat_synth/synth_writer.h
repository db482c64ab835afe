// Writes the files of a scene into the output folder.
#pragma once

#include <string>

#include "synth_scene.h"

namespace synth {

// Orbit file (written for a Keplerian orbit, copied for a real one), the
// calibration and instrument files, the auxiliary list, the product with its
// defects and the truth file.  False with a message on an I/O failure.
bool write_scene(const Scene& scene, std::string* error);

// Byte offsets of the product's data sets, as laid out.
struct ProductLayout {
  int64_t sq_offset = 0, mpp_offset = 0, dop_offset = 0, chirp_offset = 0, ant_offset = 0,
          geo_offset = 0;
  int64_t mds_offset[kMaxImages] = {0, 0, 0, 0, 0};
  int geo_records = 0, dop_records = 0;
  int64_t tot_size = 0;
};
ProductLayout layout_of(const Scene& scene);

}  // namespace synth
