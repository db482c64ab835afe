// Dating the first and last line of an image, and copying the image lines
// out of the product into the rasters.
#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cmath>
#include <cstring>

#include "extraction/asar_annotation.h"
#include "extraction/images.h"
#include "raster/buffer_io.h"
#include "raster/byte_order.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "time/date_text.h"
#include "time/mjd_time.h"

namespace {

constexpr const char* kModule = "images_v2";
// Read-ahead and write-behind buffers of the line copy.
constexpr int kCopyBufferBytes = 8 << 20;
// Lines between two progress updates.
constexpr int kProgressStep = 100;

// The time of a record's line prefix, or false when the line is blank (its
// quality flag is -1 or its time record is all zero).
bool LineTime(const unsigned char* prefix, double* t) {
  if (static_cast<signed char>(prefix[asar::mds::kQualityFlag]) == -1) return false;
  bool set = false;
  for (size_t i = 0; i < kMjdRecordSize; ++i) set = set || prefix[i] != 0;
  if (!set) return false;
  MjdRecord r;
  std::memcpy(r.bytes, prefix, kMjdRecordSize);
  *t = mjd2sec85(r);
  return std::isfinite(*t);
}

bool ReadPrefix(int fd, int64_t offset, unsigned char* out) {
  size_t n = asar::mds::kLinePrefixSize;
  while (n > 0) {
    const ssize_t got = pread(fd, out, n, static_cast<off_t>(offset));
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return false;
    out += got;
    n -= static_cast<size_t>(got);
    offset += got;
  }
  return true;
}

bool ParseUtc(const std::string& text, double* t) {
  DateFields fields;
  if (text.empty() || date2str(text.c_str(), &fields) != 0) return false;
  *t = ascii2sec85(text.c_str());
  return std::isfinite(*t);
}

}  // namespace

int get_first_last(const char* product, int64_t offset, int64_t recordSize, int64_t count,
                   const LineTiming& timing, bool wideSwath, double* first, double* last) {
  VLR_SCOPE("get_first_last", kModule);
  const double dt = timing.lineInterval;
  const int64_t burstLines = timing.linesPerBurst;
  if (count < 1 || offset < 0 || recordSize < static_cast<int64_t>(asar::mds::kLinePrefixSize) ||
      !(dt > 0.0) || !std::isfinite(dt) ||
      (wideSwath &&
       (burstLines < 1 || !(timing.burstCycle > 0.0) || !std::isfinite(timing.burstCycle)))) {
    VLR_FAIL("Invalid image layout or line timing", vlr::kLibInconsistent);
  }
  // Time of record r after record 0.
  auto position = [&](int64_t r) {
    return wideSwath ? static_cast<double>(r / burstLines) * timing.burstCycle +
                           static_cast<double>(r % burstLines) * dt
                     : static_cast<double>(r) * dt;
  };
  const int fd = open(product, O_RDONLY | O_CLOEXEC);
  if (fd < 0) VLR_FAIL("File not opened!", vlr::kLibOpen);
  struct FdCloser {
    int fd;
    ~FdCloser() { close(fd); }
  } closer{fd};

  unsigned char prefix[asar::mds::kLinePrefixSize];
  double t = 0.0;
  bool found = false;
  for (int64_t r = 0; r < count && !found; ++r) {
    if (!ReadPrefix(fd, offset + r * recordSize, prefix)) VLR_FAIL("File reading failed!", 4);
    if (LineTime(prefix, &t)) {
      *first = t - position(r);
      found = true;
    }
  }
  if (!found && !ParseUtc(timing.firstLineText, first)) {
    VLR_FAIL("No valid line and no first line time", vlr::kLibInconsistent);
  }
  found = false;
  for (int64_t r = count - 1; r >= 0 && !found; --r) {
    if (!ReadPrefix(fd, offset + r * recordSize, prefix)) VLR_FAIL("File reading failed!", 4);
    if (LineTime(prefix, &t)) {
      *last = t + position(count - 1) - position(r);
      found = true;
    }
  }
  if (!found && !ParseUtc(timing.lastLineText, last)) {
    VLR_FAIL("No valid line and no last line time", vlr::kLibInconsistent);
  }
  if (!(*last >= *first)) VLR_FAIL("Last line before the first line", vlr::kLibInconsistent);
  return 0;
}

int images::extractASARdata() {
  VLR_SCOPE("images::extractASARdata", kModule);
  for (int k = 0; k < nImages_; ++k) {
    const ImageData& d = data_[k];
    DataFile in;
    in.set_name(input.ASA_level1_filename);
    in.pixels_per_line = d.samples;
    in.lines_per_image = d.lines;
    in.row_prefix = static_cast<int32_t>(asar::mds::kLinePrefixSize);
    in.header_offset = d.offset;
    in.cell_type = d.inputCellType;
    in.byte_order = 1;
    DataFile out;
    out.set_name(rasterNames_[k]);
    out.pixels_per_line = d.samples;
    out.lines_per_image = d.lines;
    out.row_prefix = static_cast<int32_t>(asar::mds::kLinePrefixSize);
    out.header_offset = 0;
    out.cell_type = d.outputCellType;
    out.byte_order = endi() == 'm' ? 1 : 0;

    vlr::CkBuffer<char> line;
    const size_t lineBytes = static_cast<size_t>(d.samples) * 8;
    if (!line.allocate(lineBytes + asar::mds::kLinePrefixSize)) {
      VLR_FAIL("Cannot allocate the line buffer", vlr::kLibAlloc);
    }
    char* prefix = line.data() + lineBytes;
    in.set_buffer_size(kCopyBufferBytes);
    out.set_buffer_size(kCopyBufferBytes);
    VLR_CALL(in.open(DataFile::kOpenRead));
    VLR_CALL(out.open(DataFile::kOpenCreate));
    BufferIO reader(&in), writer(&out);
    reader.num_samples = writer.num_samples = d.samples;
    reader.num_lines = writer.num_lines = 1;
    reader.output_type = writer.output_type = d.outputCellType;

    const int bar = waitbar_open("Extracting data...");
    int rc = 0;
    for (int32_t l = 0; l < d.lines && rc == 0; ++l) {
      if (l % kProgressStep == 0) waitbar_update(bar, 100.0f * l / d.lines);
      reader.first_line = writer.first_line = l;
      rc = vlr_scope_.callee(reader.readprefix(prefix), __LINE__);
      if (rc == 0) rc = vlr_scope_.callee(reader.readbuffer(line.data()), __LINE__);
      if (rc == 0) rc = vlr_scope_.callee(writer.writeprefix(prefix), __LINE__);
      if (rc == 0) rc = vlr_scope_.callee(writer.writebuffer(line.data()), __LINE__);
    }
    waitbar_close(bar);
    in.close();
    const int closed = out.close();
    if (rc != 0) return rc;
    VLR_CALL(closed);
    VLR_CALL(out.write_hdr());
  }
  return 0;
}
