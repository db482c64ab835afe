// Dating the first and last line of an image, and copying the image lines
// out of the product into the rasters.
#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cmath>
#include <cstring>

#include "extraction/asar_annotation.h"
#include "extraction/block_writer.h"
#include "extraction/images.h"
#include "extraction/product_file.h"
#include "raster/buffer_io.h"
#include "raster/byte_order.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"
#include "runtime/ckerr.h"
#include "runtime/error_codes.h"
#include "runtime/file_utility.h"
#include "runtime/run_outputs.h"
#include "time/date_text.h"
#include "time/mjd_time.h"

namespace {

constexpr const char* kModule = "images_v2";
// Read-ahead buffer of the line copy, and the blocks of converted lines
// that go to the writer.  Small enough that the read data and each
// converted block are still in the processor's cache when they are used
// again (by the conversion, by the writer's copy into the page cache):
// 1 MiB copies about 20 % faster than 8 MiB.
constexpr int kCopyBufferBytes = 1 << 20;
constexpr int64_t kCopyBlockBytes = 1 << 20;
constexpr int kCopyBlocks = 4;
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
  const asar::ScopedFd file(open(product, O_RDONLY | O_CLOEXEC));
  if (!file.valid()) VLR_FAIL("File not opened!", vlr::kLibOpen);

  unsigned char prefix[asar::mds::kLinePrefixSize];
  double t = 0.0;
  bool found = false;
  for (int64_t r = 0; r < count && !found; ++r) {
    if (!asar::ReadFullyAt(file.get(), prefix, sizeof prefix, offset + r * recordSize))
      VLR_FAIL("File reading failed!", 4);
    if (LineTime(prefix, &t)) {
      *first = t - position(r);
      found = true;
    }
  }
  if (!found && !parse_sec85(timing.firstLineText.c_str(), first)) {
    VLR_FAIL("No valid line and no first line time", vlr::kLibInconsistent);
  }
  found = false;
  for (int64_t r = count - 1; r >= 0 && !found; --r) {
    if (!asar::ReadFullyAt(file.get(), prefix, sizeof prefix, offset + r * recordSize))
      VLR_FAIL("File reading failed!", 4);
    if (LineTime(prefix, &t)) {
      *last = t + position(count - 1) - position(r);
      found = true;
    }
  }
  if (!found && !parse_sec85(timing.lastLineText.c_str(), last)) {
    VLR_FAIL("No valid line and no last line time", vlr::kLibInconsistent);
  }
  if (!(*last >= *first)) VLR_FAIL("Last line before the first line", vlr::kLibInconsistent);
  return 0;
}

int images::extractASARdata() {
  VLR_SCOPE("images::extractASARdata", kModule);
  for (int k = 0; k < nImages_; ++k) VLR_CALL(copyImage(k));
  return 0;
}

// Copies the lines of image k: the main thread reads and converts blocks of
// lines through the buffered raster reader while the block writer hands the
// previous blocks to the file system.  Memory: the read buffer and
// kCopyBlocks blocks, whatever the product's length.
int images::copyImage(int k) {
  VLR_SCOPE("images::copyImage", kModule);
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
  VLR_CALL(in.check_description());
  VLR_CALL(out.check_description());

  const int64_t outLine = out.line_length();
  const int32_t blockLines = static_cast<int32_t>(std::max<int64_t>(1, kCopyBlockBytes / outLine));
  vlr::CkBuffer<char> blocks[kCopyBlocks];
  for (auto& b : blocks) {
    if (!b.allocate(static_cast<size_t>(blockLines * outLine))) {
      VLR_FAIL("Cannot allocate the line blocks", vlr::kLibAlloc);
    }
  }
  in.set_buffer_size(kCopyBufferBytes);
  VLR_CALL(in.open(DataFile::kOpenRead));
  asar::ScopedFd raster(open(rasterNames_[k], O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644));
  if (!raster.valid()) VLR_FAIL("File not opened!", vlr::kLibOpen);
  VlrRunOutputBegun(rasterNames_[k]);

  BufferIO reader(&in);
  reader.num_samples = d.samples;
  reader.num_lines = 1;
  reader.output_type = d.outputCellType;
  const int bar = waitbar_open("Extracting data...");
  int rc = 0;
  uint64_t tickets[kCopyBlocks] = {};
  {
    BlockWriter writer(raster.get());
    for (int32_t first = 0, b = 0; first < d.lines && rc == 0; first += blockLines, ++b) {
      const int32_t n = std::min(blockLines, d.lines - first);
      char* block = blocks[b % kCopyBlocks].data();
      writer.wait(tickets[b % kCopyBlocks]);
      for (int32_t l = 0; l < n && rc == 0; ++l) {
        const int32_t line = first + l;
        if (line % kProgressStep == 0) waitbar_update(bar, 100.0f * line / d.lines);
        char* dst = block + l * outLine;
        reader.first_line = line;
        rc = vlr_scope_.callee(reader.readprefix(dst), __LINE__);
        if (rc == 0) rc = vlr_scope_.callee(reader.readbuffer(dst + out.row_prefix), __LINE__);
      }
      if (rc == 0) {
        tickets[b % kCopyBlocks] =
            writer.submit(block, static_cast<size_t>(n * outLine), first * outLine);
      }
    }
    const int error = writer.finish();
    if (rc == 0 && error != 0) {
      VLR_REPORT(NVLR_UTILITY_Format("%s: %s", rasterNames_[k], std::strerror(error)).c_str(),
                 ARE_ERROR);
      rc = vlr_scope_.fail("File writing failed!", vlr::kLibWrite, __LINE__);
    }
  }
  waitbar_close(bar);
  in.close();
  const int closed = raster.close();
  if (rc != 0) return rc;
  if (closed != 0) VLR_FAIL("File writing failed!", vlr::kLibWrite);
  VLR_CALL(out.write_hdr());
  return 0;
}
