// Raster data file: a flat binary file of equal-length lines.
//
//   [HeaderOffset bytes]
//   line 0: [RowPrefix bytes][NrOfPixelsPerLine samples of CellType]
//   line 1: ...
//
// Line length L = NrOfPixelsPerLine x element size + RowPrefix; line k
// starts at HeaderOffset + k x L.  The description lives beside the data in
// the header file "<data file>.hdr", as the block "RasterInfo" of channel 1
// of the XML auxiliary document, or in older files as the parameter-file
// section "RasterInfo".
//
// All offsets are 64-bit.  The file is read and written with positioned
// calls, so seeking costs no system call.  With a buffer size set before
// open(), reads are served from a read-ahead buffer and writes are collected
// in a write-behind buffer.
//
// Results: 0 success, 1 inconsistent request, 4 read failure, 5 write
// failure, 7 allocation failure, 9 open failure.
#pragma once

#include <cstdint>
#include <string>

#include "metadata_framework/general_sar_base.h"
#include "raster/cell_type.h"
#include "runtime/call_scope.h"

class DataFile : public GeneralSAR_Base {
 public:
  // Modes of open().
  enum OpenMode { kOpenRead = 0, kOpenCreate = 1, kOpenWrite = 2, kOpenUpdate = 3 };
  // Origins of seek().
  enum SeekOrigin { kSeekSet = 0, kSeekCurrent = 1, kSeekEnd = 2 };

  // Limits a header must respect: a line fits in an int, and the whole file
  // stays far below the 64-bit offset range.
  static constexpr int64_t kMaxLineLength = 2147483647;
  static constexpr int64_t kMaxHeaderOffset = int64_t{1} << 53;

  DataFile();
  ~DataFile() override;
  // Copies hold the name and the description; they start closed.
  DataFile(const DataFile& other);
  DataFile& operator=(const DataFile& other);

  // Description, set by the header reader or by the caller before writing.
  int32_t pixels_per_line = 0;  // "NrOfPixelsPerLine"
  int32_t lines_per_image = 0;  // "NrOfLinesPerImage"
  int32_t row_prefix = 0;       // "RowPrefix": bytes before the samples of each line
  int64_t header_offset = 0;    // "HeaderOffset": bytes before the first line
  int32_t cell_type = 0;        // "CellType": code of cell_type.h (-1 after a bad legacy text)
  int32_t byte_order = 0;       // "ByteOrder": 1 most significant byte first, 0 least

  // Stores `name` as data file name and "<name>.hdr" as header name, closes
  // the file if open and reads the header.  0, or 1 when the header is
  // missing, incomplete or describes an impossible file.
  int read_hdr(const char* name);
  // Writes the "RasterInfo" block into "<name>.hdr", keeping the other
  // blocks of that file.  0, 1 for an impossible description, or the code of
  // the document writer.
  int write_hdr();

  // Names the data file without reading a header (raw access).
  void set_name(const char* name);
  const std::string& name() const { return name_; }
  const std::string& header_name() const { return header_name_; }

  // Buffer size in bytes for the next open(); 0 = unbuffered.  close()
  // resets it to 0.
  void set_buffer_size(int bytes) { buffer_size_ = bytes > 0 ? bytes : 0; }
  int buffer_size() const { return buffer_size_; }

  // Opens the data file: kOpenRead for reading, kOpenCreate creates (or
  // truncates) for writing, kOpenWrite opens an existing file for writing,
  // kOpenUpdate an existing file for reading and writing.  An open file is
  // closed first.  0, 1 (unknown mode), 7 or 9.
  int open(int mode);
  // Flushes pending writes, frees the buffer, closes.  0, or 5 when the
  // flush or the close failed.  Closing a closed file does nothing.
  int close();
  // Origin kSeekSet or kSeekCurrent; a buffered file also takes kSeekEnd.
  // 0, 1 (bad origin, negative target, file not open) or 5 (flush failed).
  int seek(int64_t offset, int origin);
  // Reads exactly n bytes.  0, 1 (file open for writing only, n < 0), 4 on
  // a short read (also at the end of the file), 9 when not open.
  int read(void* buffer, int64_t n);
  // Zero-copy form of read() for buffered files: makes the next n bytes
  // available in the buffer, points *view at them and moves past them.  The
  // view stays valid until the next operation on the file.  0, 1 when the
  // file is not buffered for reading or n exceeds the buffer (use read()
  // then; nothing has changed), 4 on a short read.
  int read_view(int64_t n, const unsigned char** view);
  // Writes n bytes.  0, 1 (file open for reading, n < 0), 5, 9.
  int write(const void* buffer, int64_t n);
  // Current position.
  int64_t tell() const;

  int element_sizeof() const { return cell_type_size(cell_type); }
  bool is_open() const { return fd_ >= 0; }
  bool is_buffered() const { return is_open() && !buffer_.empty(); }
  // Open for writing (created or existing) or for updating.
  bool is_writing() const { return is_open() && mode_ != kModeRead; }
  bool is_complex() const { return cell_type_is_complex(cell_type); }
  // The data file can be opened for reading.
  bool exists() const;
  // The data file exists and holds at least data_size() bytes: readers that
  // allocate by the description check this first.
  bool holds_data() const;

  // Line length L and file offset of the first byte (prefix) of line k.
  int64_t line_length() const;
  int64_t line_offset(int64_t line) const { return header_offset + line * line_length(); }
  // HeaderOffset + NrOfLinesPerImage x L.
  int64_t data_size() const { return header_offset + lines_per_image * line_length(); }
  // 0 when the description is possible (counts not negative, known cell
  // type and byte order, line and file size within the limits above),
  // else 1.
  int check_description() const;
  // The same check on a description given by its values (for classes that
  // hold the description in members of their own).
  static int check_description(int lines, int pixels, int row_prefix, int64_t header_offset,
                               int cell_type, int byte_order);

  // Copies the description (not the name, not the open state) into `other`.
  int clone(DataFile* other) const;

 protected:
  void refreshParameters() override;

 private:
  enum InternalMode { kModeRead = 0, kModeWrite = 1, kModeUpdate = 2 };

  int read_legacy_hdr();
  void reset_position();
  int flush();
  int read_direct(unsigned char* out, int64_t offset, int64_t n, int64_t* got);
  int write_direct(const unsigned char* in, int64_t offset, int64_t n);
  int read_buffered(unsigned char* out, int64_t n);
  int refill(int64_t need);
  int write_buffered(const unsigned char* in, int64_t n);

  std::string name_;
  std::string header_name_;
  double header_offset_field_ = 0.0;  // the header offset as the document stores it

  int buffer_size_ = 0;
  int64_t buffer_offset_ = 0;  // file offset of buffer_[0]
  int64_t cursor_ = 0;         // position within the buffer
  int64_t valid_ = 0;          // bytes of the buffer that hold file data or pending writes
  int64_t fill_start_ = 0;     // file range of the last refill of the read buffer
  int64_t fill_end_ = 0;
  int64_t readahead_ = 0;  // bytes the last refill asked for
  vlr::CkBuffer<unsigned char> buffer_;
  int mode_ = kModeRead;
  int fd_ = -1;
  int64_t position_ = 0;  // position of an unbuffered file
};
