// Buffered raster file: the raster layout and "RasterInfo" header of
// DataFile (see data_file.h) with an optional buffer that keeps part of the
// data already passed, typed window readers and writers, and single-sample
// readers.
//
// The buffer mirrors one contiguous range of the file, starting at the file
// offset position_: its first valid_ bytes hold the file's current content,
// where bytes written through this object replace what the disk holds.  The
// range [dirty_begin_, dirty_end_) of it has not reached the disk yet.  So a
// read through the object always sees the object's own writes, whatever the
// mode.
//
// Buffered reading: when a read runs past the valid bytes, the buffer is
// refilled; the last min(history, bytes passed / 2) bytes are moved to its
// start first, so that a backward seek of up to that many bytes is served
// from memory.  Requests of a buffer or more go straight to the caller.
//
// Buffered writing (write and update mode alike): bytes collect in the
// buffer; when it is full they are written out and the buffer slides on,
// keeping the same history.  Pending bytes reach the disk
//   - when the buffer slides or is refilled,
//   - at a seek that leaves the buffered range,
//   - before a request that bypasses the buffer,
//   - at flush(), initbuffer(), copy() and close() (also from the destructor).
// Update mode follows the same rules as write mode, so nothing written is
// dropped: a failing disk write is reported ("File writing failed!", 5) by
// the call that triggered it, and the bytes stay pending for the next try
// (close() reports its failure and then lets them go with the file).  Other
// readers of the file (another object, another process) see the bytes after
// flush() or close().
//
// A forward seek in write or update mode, while bytes are pending, that
// stays within the buffer's capacity keeps the buffer: the skipped bytes are
// loaded from the file (zeros beyond its end), so that writing a line after
// its prefix does not cost a disk write per line.  Zeros loaded this way are
// written out only when later writes lie beyond them (as a hole in the file
// would read).
//
// Without a buffer every transfer goes to the file at once.
//
// Results: 0 success, 1 inconsistent request (bad size, window outside the
// raster, unsupported cell type, wrong mode), 4 read failure, 5 write
// failure, 7 allocation failure, 9 file not open or not openable.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "metadata_framework/general_sar_base.h"
#include "raster/cell_type.h"
#include "raster/complex_sample.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"

class BufferFile : public GeneralSAR_Base {
 public:
  using UnitType = RasterCellType;
  // Unit type after construction: not set.
  static constexpr UnitType kTypeNotSet = static_cast<UnitType>(10);

  enum OperationType : int32_t { kOpRead = 1, kOpWrite = 2, kOpUpdate = 3 };
  enum SeekType : int32_t { kSeekSet = 0, kSeekCurrent = 1, kSeekEnd = 2 };

  // Largest buffer initbuffer() accepts.
  static constexpr int kMaxBufferSize = 1 << 30;
  // Size of the legacy name buffers (getFilename()).
  static constexpr size_t kFileNameSize = 512;

  BufferFile();
  ~BufferFile() override;
  // Copies hold the name and the description; they start closed and
  // unbuffered.
  BufferFile(const BufferFile& other);
  BufferFile& operator=(const BufferFile& other);

  // Description.
  void setFilename(const char* name);
  // Copies the name into `out` (`size` bytes, always terminated).  0, or 1
  // when it does not fit (the copy is cut).
  int getFilename(char* out, size_t size = kFileNameSize) const;
  const std::string& filename() const { return name_; }
  void setSamples(int samples) { samples_ = samples; }
  void setLines(int lines) { lines_ = lines; }
  void setRowPrefix(int prefix) { row_prefix_ = prefix; }
  void setType(UnitType type) { unit_type_ = type; }
  // 1 = most significant byte first, 0 = least significant byte first.
  void setFileEndian(int order) { byte_order_ = order; }
  int getSamples() const { return samples_; }
  int getLines() const { return lines_; }
  int getRowPrefix() const { return row_prefix_; }
  int64_t getOffsetSize() const { return header_offset_; }
  UnitType getType() const { return static_cast<UnitType>(unit_type_); }
  int getFileEndian() const { return byte_order_; }
  int getOpType() const { return op_type_; }

  // Element size of the unit type (0 when not set) and line length.
  int pixelsizeof() const { return cell_type_size(unit_type_); }
  int64_t line_length() const;
  // 0 when the description is possible (see DataFile::check_description).
  int check_description() const;

  bool is_open() const { return io_.is_open(); }
  bool is_buffered() const { return !buffer_.empty(); }
  // Open for writing or updating.
  bool is_writing() const { return is_open() && (op_type_ == kOpWrite || op_type_ == kOpUpdate); }
  bool is_complex() const { return cell_type_is_complex(unit_type_); }
  // The file can be opened for reading.
  bool exists() const;
  // Current position (buffer offset plus cursor when buffered).
  int64_t tell() const;

  // Header.  readhdr(file): the data file name becomes `file` without its
  // last four characters and the "RasterInfo" block of channel 1 is read
  // from `file` (from the older parameter-file form when `file` is the data
  // file name followed by ".hdr" and has no such block).  0, or 1 when the
  // name is too short, the block is missing or describes an impossible
  // file.  readhdr() reads "<file name>.hdr"; writehdr() writes there,
  // writehdr(file) into `file` (0, 1 for an impossible description or no
  // name, 5 when the document cannot be saved).
  int readhdr(const char* file) override;
  int readhdr();
  int writehdr() override;
  int writehdr(const char* file) override;

  // kOpRead opens for reading, kOpWrite creates (or truncates) for reading
  // and writing, kOpUpdate opens an existing file for reading and writing;
  // an open file is closed first.  Any other value closes nothing and only
  // resets the position (result 1).  The position becomes 0; a buffer set
  // by initbuffer() before open() is kept.  0, 1, 5 or 9.
  int open(int op_type);
  // Writes pending bytes out, frees the buffer, closes; position 0.  0, or 5
  // when pending bytes or the close failed.  Closing a closed file does
  // nothing.
  int close();
  // Writes pending bytes out.  0 or 5.
  int flush();

  // A zeroed buffer of `size` bytes (0: unbuffered) keeping `history` bytes
  // for backward seeks.  Pending bytes are written out first; when the file
  // is open, the position becomes 0 and in read and update mode the buffer
  // is filled from there.  0, 1 (size outside 0..kMaxBufferSize, negative
  // history), 4, 5 or 7.
  int initbuffer(int size, int history);
  int buffer_size() const { return static_cast<int>(buffer_.size()); }
  int history_size() const { return history_; }

  // Bytes delivered: fewer than n at the end of the file or on a failure
  // (reported), 0 in write mode, when not open or for n < 0.
  int64_t read(void* buf, int64_t n);
  // Bytes accepted: fewer than n on a failure (reported), 0 in read mode,
  // when not open or for n < 0.
  int64_t write(const void* buf, int64_t n);
  // Origin kSeekSet, kSeekCurrent or kSeekEnd (the end includes pending
  // bytes).  0, 1 (not open, bad origin, target before the file start or
  // beyond the 64-bit range), 4 or 5.
  int seek(int64_t offset, int origin);

  // Window transfers: `num_lines` lines from `first_line`, `num_samples`
  // samples from `first_sample` (0: up to the end of the line), laid out
  // line after line.  Reads convert the file's samples to the caller's type
  // and writes the other way round, by value (floating point to integer
  // rounded half away from zero, saturated at the type's limits), with the
  // file's byte order.  Real callers' types take the real unit types
  // FLOAT32, FLOAT64, INT32 and INT16, complex ones the complex unit types
  // FLOAT_COMPLEX, DOUBLE_COMPLEX, 4 and SHORT_COMPLEX; other unit types are
  // refused (1) and the output is left untouched.  0, 1, 4, 5 or 9 (file not
  // open).
  int readbuffer(float* out, int first_line, int num_lines, int first_sample, int num_samples);
  int readbuffer(double* out, int first_line, int num_lines, int first_sample, int num_samples);
  int readbuffer(int* out, int first_line, int num_lines, int first_sample, int num_samples);
  int readbuffer(short* out, int first_line, int num_lines, int first_sample, int num_samples);
  int readbuffer(fcomplex* out, int first_line, int num_lines, int first_sample, int num_samples);
  int readbuffer(dcomplex* out, int first_line, int num_lines, int first_sample, int num_samples);
  int writebuffer(const float* in, int first_line, int num_lines, int first_sample,
                  int num_samples);
  int writebuffer(const double* in, int first_line, int num_lines, int first_sample,
                  int num_samples);
  int writebuffer(const int* in, int first_line, int num_lines, int first_sample, int num_samples);
  int writebuffer(const short* in, int first_line, int num_lines, int first_sample,
                  int num_samples);
  int writebuffer(const fcomplex* in, int first_line, int num_lines, int first_sample,
                  int num_samples);
  int writebuffer(const dcomplex* in, int first_line, int num_lines, int first_sample,
                  int num_samples);

  // The RowPrefix bytes of each line of the window, as stored.  0, 1, 4, 5
  // or 9.
  int readprefix(char* out, int first_line, int num_lines);
  int writeprefix(const char* in, int first_line, int num_lines);
  // Writes `size` header bytes at the file start and makes `size` the
  // header offset.  0, 1, 5 or 9.
  int writeOffset(const char* in, int size);

  // One sample at (line, sample) of a file whose unit type is the reader's
  // own, in host byte order; 0 when the file is not open, the unit type
  // differs, the sample lies outside the raster or cannot be read.
  float readFloat(int line, int sample);
  double readDouble(int line, int sample);
  int readInt(int line, int sample);
  short readShort(int line, int sample);
  fcomplex readFloatComplex(int line, int sample);
  dcomplex readDoubleComplex(int line, int sample);

  // Copies the name and the description into `other` (not the open state
  // or the buffer).  0.
  int clone(BufferFile* other) const;
  // Copies the data into `new_name` in pieces of `piece_size` bytes and
  // writes its header (see DataFile::copy); pending bytes are written out
  // first.  0, 1, 4, 5, 7 or 9.
  int copy(const char* new_name, int piece_size);

 protected:
  void refreshParameters() override;

 private:
  void describe(DataFile* df) const;
  void reset_buffer(int64_t position);
  bool must_swap() const;
  int64_t logical_end() const;
  int64_t disk_size() const;
  int64_t readable() const;
  int read_at(unsigned char* out, int64_t offset, int64_t n, int64_t* got);
  int write_at(const unsigned char* in, int64_t offset, int64_t n);
  int flush_pending();
  int refill();
  int slide();
  int fill_gap(int64_t target);
  int read_buffered(unsigned char* out, int64_t n, int64_t* delivered);
  int write_buffered(const unsigned char* in, int64_t n, int64_t* accepted);
  int check_window(int first_line, int num_lines, int first_sample, int* num_samples) const;
  int read_window(void* out, int out_type, int first_line, int num_lines, int first_sample,
                  int num_samples);
  int write_window(const void* in, int in_type, int first_line, int num_lines, int first_sample,
                   int num_samples);
  int transfer_prefix(char* out, const char* in, int first_line, int num_lines);
  template <class T>
  T read_sample(int type, int line, int sample);

  std::string name_;
  int32_t lines_ = 0;                // "NrOfLinesPerImage"
  int32_t samples_ = 0;              // "NrOfPixelsPerLine"
  int32_t row_prefix_ = 0;           // "RowPrefix"
  int64_t header_offset_ = 0;        // "HeaderOffset"
  DataFile io_;                      // the open file, unbuffered
  int32_t unit_type_ = kTypeNotSet;  // "CellType"
  int32_t byte_order_ = 0;           // "ByteOrder"
  int32_t op_type_ = 0;
  int64_t position_ = 0;  // file offset of buffer_[0], or of the next transfer when unbuffered

  vlr::CkBuffer<unsigned char> buffer_;
  int32_t history_ = 0;
  int64_t cursor_ = 0;  // position within the buffer, never beyond valid_
  int64_t valid_ = 0;
  int64_t dirty_begin_ = 0;  // pending range of the buffer (empty when equal)
  int64_t dirty_end_ = 0;
  int64_t disk_end_ = 0;  // file size on disk as last known

  double header_offset_field_ = 0.0;    // the header offset as the document stores it
  std::vector<unsigned char> scratch_;  // one conversion chunk
};
