#include "orbit/orbit_window.h"

#include <cmath>
#include <cstdio>

#include "orbit/doris_record.h"
#include "orbit/lagrange9.h"
#include "runtime/call_scope.h"

namespace {

constexpr const char* kModule = "interp_orb";

// The interpolation weights follow the actual record times, so a record
// somewhat early or late is interpolated correctly.  A spacing that differs
// from the window's mean by more than this fraction means a record is
// missing or misplaced (a leap second changes a 60 s spacing by less than
// 2 %): such a file is refused.
constexpr double kSpacingTolerance = 0.05;

struct OrbitWindow {
  bool loaded = false;
  double times[kDorisWindowSize];
  double positions[kDorisWindowSize][3];
  double velocities[kDorisWindowSize][3];
};

OrbitWindow g_window;

}  // namespace

int read_SVs(int k, int numRecords, std::FILE* file, int64_t dataSetOffset) {
  VLR_SCOPE("read_SVs", kModule);
  g_window.loaded = false;
  if (numRecords < kDorisWindowSize) {
    char text[120];
    std::snprintf(text, sizeof text, "Orbit file holds %d state vectors, at least %d are needed",
                  numRecords, kDorisWindowSize);
    VLR_REPORT(text, ARE_ERROR);
    VLR_FAIL("File reading failed!", 4);
  }
  int first = k - 5;
  if (k < 5) first = 0;
  if (k > numRecords - 5) first = numRecords - kDorisWindowSize;
  char buffer[kDorisWindowSize * kDorisRecordSize];
  const int64_t offset = dataSetOffset + static_cast<int64_t>(kDorisRecordSize) * first;
  if (file == nullptr || fseeko(file, static_cast<off_t>(offset), SEEK_SET) != 0 ||
      std::fread(buffer, 1, sizeof buffer, file) != sizeof buffer)
    VLR_FAIL("File reading failed!", 4);
  OrbitWindow w;
  for (int i = 0; i < kDorisWindowSize; ++i) {
    DorisRecord r;
    if (!parse_doris_record(buffer + i * kDorisRecordSize, &r)) {
      VLR_REPORT("Malformed orbit record", ARE_ERROR);
      VLR_FAIL("File reading failed!", 4);
    }
    w.times[i] = r.time;
    for (int a = 0; a < 3; ++a) {
      w.positions[i][a] = r.position[a];
      w.velocities[i][a] = r.velocity[a];
    }
  }
  const double mean = (w.times[kDorisWindowSize - 1] - w.times[0]) / (kDorisWindowSize - 1);
  for (int i = 1; i < kDorisWindowSize; ++i) {
    const double step = w.times[i] - w.times[i - 1];
    if (!(step > 0.0) || std::fabs(step - mean) > kSpacingTolerance * mean) {
      VLR_REPORT("Orbit records are not in time order or not equally spaced", ARE_ERROR);
      VLR_FAIL("File reading failed!", 4);
    }
  }
  w.loaded = true;
  g_window = w;
  return 0;
}

int interp_orb_point(double t, char which, double out[3]) {
  if (!g_window.loaded || (which != 'p' && which != 'v')) return 1;
  lagrange9(which == 'p' ? g_window.positions : g_window.velocities, g_window.times, t, out);
  return 0;
}

double orb_z_at(double t) {
  double p[3] = {0.0, 0.0, 0.0};
  if (interp_orb_point(t, 'p', p) != 0) return 0.0;
  return p[2];
}
