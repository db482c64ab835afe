#include "orbit/interp_orb_l.h"

#include <cmath>
#include <cstdint>
#include <cstdio>
#include <cstring>

#include "envisat/product_header.h"
#include "orbit/doris_record.h"
#include "orbit/orbit_window.h"
#include "orbit/rtbis.h"
#include "runtime/call_scope.h"
#include "runtime/file_handle.h"

namespace {

constexpr const char* kModule = "interp_orb";

// The ascending node is searched in the three minutes before the first
// record above the equator, to 10 microseconds.
constexpr double kNodeSearchSpan = 180.0;
constexpr double kNodeAccuracy = 1e-5;

// Size of the open file in bytes, the position left unchanged; -1 when it
// cannot be found.
int64_t StreamSize(std::FILE* f) {
  const off_t here = ftello(f);
  if (here < 0 || fseeko(f, 0, SEEK_END) != 0) return -1;
  const int64_t end = static_cast<int64_t>(ftello(f));
  return fseeko(f, here, SEEK_SET) == 0 ? end : -1;
}

// The time of record j of the data set at dataSetOffset.  False when the
// record cannot be read or its date text is malformed.
bool read_record_time(std::FILE* f, int64_t dataSetOffset, int j, double* t) {
  char text[kDorisRecordTime.width];
  const int64_t at = dataSetOffset + static_cast<int64_t>(kDorisRecordSize) * j +
                     static_cast<int64_t>(kDorisRecordTime.offset);
  return fseeko(f, static_cast<off_t>(at), SEEK_SET) == 0 &&
         std::fread(text, 1, sizeof text, f) == sizeof text &&
         parse_doris_time(text, sizeof text, t);
}

// Interpolates the n vectors at tc + (i - (n-1)/2) dt, each from the nine
// records around its own time: the window whose fifth record is the first
// at or after the vector's time, clamped at the file's ends.  One window
// serves only the minutes around its centre; beyond them the nine-point
// formula extrapolates and leaves the orbit by decimetres to hundreds of
// metres.  `first` is the first record at or after tc and `firstTime` its
// time; the window of that record is loaded.
int interpolate_grid(std::FILE* f, int64_t dataSetOffset, int numRecords, int first,
                     double firstTime, double tc, int n, double dt, double* pos, double* vel) {
  VLR_SCOPE("interpolate_grid", kModule);
  // Record j is the first at or after the vector's time (numRecords when
  // none is); tj is the time of record min(j, numRecords - 1).
  int j = first;
  double tj = firstTime;
  int loaded = first + 1;
  for (int i = 0; i < n; ++i) {
    const double t = tc + (i - (n - 1) * 0.5) * dt;
    while (j < numRecords && tj < t) {
      if (++j == numRecords) break;
      double next = 0.0;
      if (!read_record_time(f, dataSetOffset, j, &next)) {
        VLR_REPORT("Malformed orbit record", ARE_ERROR);
        VLR_FAIL("File reading failed!", 4);
      }
      if (!(next > tj)) {
        VLR_REPORT("Orbit records are not in time order", ARE_ERROR);
        VLR_FAIL("File reading failed!", 4);
      }
      tj = next;
    }
    while (j > 0) {
      double before = 0.0;
      if (!read_record_time(f, dataSetOffset, j - 1, &before)) {
        VLR_REPORT("Malformed orbit record", ARE_ERROR);
        VLR_FAIL("File reading failed!", 4);
      }
      if (j < numRecords && !(before < tj)) {
        VLR_REPORT("Orbit records are not in time order", ARE_ERROR);
        VLR_FAIL("File reading failed!", 4);
      }
      if (before < t) break;
      --j;
      tj = before;
    }
    // k counts the records up to and including record j, as the scan does.
    const int k = j < numRecords ? j + 1 : numRecords;
    if (k != loaded) {
      VLR_CALL(read_SVs(k, numRecords, f, dataSetOffset));
      loaded = k;
    }
    VLR_CALL(interp_orb_point(t, 'p', pos + 3 * i));
    if (vel != nullptr) VLR_CALL(interp_orb_point(t, 'v', vel + 3 * i));
  }
  return 0;
}

}  // namespace

int interp_orb_l(const char* path, double tc, int n, double dt, double* pos, double* vel,
                 int* orbitOut, int wantAnx, double* anxOut) {
  VLR_SCOPE("interp_orb_l", kModule);
  if (n < 0 || (n > 0 && pos == nullptr) || (n > 1 && !std::isfinite(dt)) ||
      (wantAnx == 1 && anxOut == nullptr))
    VLR_FAIL("Invalid orbit request", 1);
  const FileHandle file(path, "rb");
  std::FILE* f = file.get();
  if (f == nullptr) VLR_FAIL("File not opened!", 9);

  // Main and specific product headers; the specific header of an orbit file
  // is shorter than an image product's, the rest of the block stays zero.
  EnvisatHeaders headers;
  std::memset(headers.mph, 0, sizeof headers.mph);
  std::memset(headers.sph, 0, sizeof headers.sph);
  if (std::fread(headers.mph, 1, kMphSize, f) != kMphSize) VLR_FAIL("File reading failed!", 4);
  if (!is_doris_product_type(headers.mph + kDorisProductType.offset)) {
    VLR_REPORT("Not a DORIS orbit file", ARE_ERROR);
    return 12;
  }
  double start = 0.0, stop = 0.0;
  if (!parse_doris_time(headers.mph + kMphSensingStart.offset, kMphSensingStart.width, &start) ||
      !parse_doris_time(headers.mph + kMphSensingStop.offset, kMphSensingStop.width, &stop)) {
    VLR_REPORT("Orbit file sensing start or stop is not a date", ARE_ERROR);
    VLR_FAIL("File reading failed!", 4);
  }
  if (!(start <= tc && tc <= stop))
    VLR_FAIL(
        "Requested orbit information at an invalid time: centr_time < start_time || centr_time > "
        "stop_time)",
        13);
  if (std::fread(headers.sph, 1, kDorisSphSize, f) != kDorisSphSize)
    VLR_FAIL("File reading failed!", 4);

  // The record data set must lie inside the file.
  const EnvisatDataSet ds = headers.dataSet(kDorisDsdOffset);
  const int64_t fileSize = StreamSize(file.get());
  const int64_t available =
      ds.valid && fileSize >= ds.offset ? (fileSize - ds.offset) / kDorisRecordSize : -1;
  if (!ds.valid || (ds.dsrSize != 0 && ds.dsrSize != static_cast<int64_t>(kDorisRecordSize)) ||
      ds.numDsr > available || ds.numDsr > INT32_MAX) {
    VLR_REPORT("Orbit data set descriptor does not match the file", ARE_ERROR);
    VLR_FAIL("File reading failed!", 4);
  }
  const int numRecords = static_cast<int>(ds.numDsr);
  if (fseeko(f, static_cast<off_t>(ds.offset), SEEK_SET) != 0) VLR_FAIL("File reading failed!", 4);

  // Scan to the first record at or after tc, noting the last ascending
  // equator crossing on the way.
  DorisRecord previous, current;
  int k = 0;
  int crossing = -1;
  double crossingTime = 0.0;
  bool reached = false;
  char record[kDorisRecordSize];
  while (k < numRecords) {
    if (std::fread(record, 1, sizeof record, f) != sizeof record)
      VLR_FAIL("File reading failed!", 4);
    if (!parse_doris_record(record, &current)) {
      VLR_REPORT("Malformed orbit record", ARE_ERROR);
      VLR_FAIL("File reading failed!", 4);
    }
    if (k == 0) previous = current;
    if (k > 0 && !(current.time > previous.time)) {
      VLR_REPORT("Orbit records are not in time order", ARE_ERROR);
      VLR_FAIL("File reading failed!", 4);
    }
    if (current.position[2] > 0.0 && previous.position[2] <= 0.0) {
      crossing = k;
      crossingTime = current.time;
    }
    ++k;
    if (current.time >= tc) {
      reached = true;
      break;
    }
    previous = current;
  }
  if (!reached) VLR_FAIL("File reading failed!", 4);

  if (orbitOut != nullptr)
    *orbitOut = tc - previous.time < current.time - tc ? previous.orbit : current.orbit;

  VLR_CALL(read_SVs(k, numRecords, f, ds.offset));
  VLR_CALL(interpolate_grid(f, ds.offset, numRecords, k - 1, current.time, tc, n, dt, pos, vel));

  if (wantAnx == 1) {
    *anxOut = 0.0;
    if (crossing < 0) {
      std::fputs("Cannot compute ascending node time: no change in orbit number\n", stderr);
      VLR_FAIL("Cannot compute ascending node time: no change in orbit number", 1);
    }
    VLR_CALL(read_SVs(crossing, numRecords, f, ds.offset));
    VLR_CALL(rtbis(orb_z_at, crossingTime - kNodeSearchSpan, crossingTime, kNodeAccuracy, anxOut));
  }
  return 0;
}
