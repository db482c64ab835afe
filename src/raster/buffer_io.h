// Window reads and writes of a raster data file.
//
// The window (first sample, number of samples, first line, number of lines)
// and the output cell type are set in the members before a call.  Reads
// deliver the window's samples line after line, converted to the output
// type and in host byte order; writes take them in that form and store them
// in the file's cell type and byte order.  Supported conversions: every pair
// of the cell types 0..7 except complex to real (see sample_convert.h).
//
// Results: 0, 1 (no file, cell type outside 0..7, unsupported conversion,
// window outside the raster, output too small), or the code of the failing
// file operation.
#pragma once

#include <cstdint>
#include <vector>

#include "raster/data_file.h"

class BufferIO {
 public:
  explicit BufferIO(DataFile* file = nullptr) : file(file) {}

  DataFile* file;            // the raster worked on (not owned)
  int32_t first_sample = 0;  // window
  int32_t num_samples = 0;
  int32_t first_line = 0;
  int32_t num_lines = 0;
  int32_t output_type = 0;  // cell type of the caller's samples

  // The RowPrefix bytes of each line of the window, one after another, as
  // they are stored (never swapped).  Opens the file for reading if closed
  // (reads that open the file give it a 1 MiB read buffer unless a buffer
  // size was set).
  int readprefix(char* out);
  // Stores the RowPrefix bytes of each line of the window from `in`.  Opens
  // the file for writing if closed: an existing file in place, keeping
  // everything outside the window; a missing one is created.
  int writeprefix(const char* in);

  // The window's samples into `out`: num_lines runs of num_samples elements
  // of the output type.  Opens the file for reading if closed.  The form
  // with `capacity` refuses (1) a window larger than `capacity` bytes.
  int readbuffer(char* out, int capacity);
  int readbuffer(char* out);
  // Stores the window from `in` (laid out as readbuffer delivers it).  Opens
  // the file for writing if closed, as writeprefix does.
  int writebuffer(const char* in);

  // Bytes of the caller's side of the window: num_lines x num_samples x the
  // output element size (0 for an invalid output type, INT64_MAX when the
  // product does not fit).
  int64_t window_bytes() const;

 private:
  enum Transfer { kPrefix, kRead, kWrite };
  int check_window(Transfer transfer) const;
  bool must_swap() const;
  int transfer_prefix(char* out, const char* in);
  int open_for_reading();
  int open_for_writing();

  std::vector<unsigned char> scratch_;  // one conversion chunk
};
