// Raster file description of the metadata container: the name and layout of
// a raster (lines, samples, row prefix, header offset, cell type, byte
// order) as its "RasterInfo" header block stores them.  The description
// follows the limits of DataFile (see data_file.h), whose reader also serves
// the older parameter-file form.
//
// Results: 0 success, 1 inconsistent request (no name, impossible
// description, missing block), 5 header not saved.
#pragma once

#include <cstdint>
#include <string>

#include "metadata_framework/general_sar_base.h"
#include "raster/cell_type.h"
#include "raster/data_file.h"
#include "runtime/call_scope.h"

class BufferFile : public GeneralSAR_Base {
 public:
  using UnitType = RasterCellType;
  // Unit type after construction: not set.
  static constexpr UnitType kTypeNotSet = static_cast<UnitType>(10);

  BufferFile();
  // Copies hold the name and the description.
  BufferFile(const BufferFile& other);
  BufferFile& operator=(const BufferFile& other);

  // Description.
  void setFilename(const char* name) { name_ = name != nullptr ? name : ""; }
  const std::string& filename() const { return name_; }
  void setSamples(int samples) { samples_ = samples; }
  void setLines(int lines) { lines_ = lines; }
  void setRowPrefix(int prefix) { row_prefix_ = prefix; }
  void setType(UnitType type) { unit_type_ = type; }
  // 1 = most significant byte first, 0 = least significant byte first.
  void setFileEndian(int order) { byte_order_ = order; }
  // 0 when the description is possible (see DataFile::check_description).
  int check_description() const;

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

  // Copies the name and the description into `other`.  0.
  int clone(BufferFile* other) const;

 protected:
  void refreshParameters() override;

 private:
  std::string name_;
  int32_t lines_ = 0;                // "NrOfLinesPerImage"
  int32_t samples_ = 0;              // "NrOfPixelsPerLine"
  int32_t row_prefix_ = 0;           // "RowPrefix"
  int64_t header_offset_ = 0;        // "HeaderOffset"
  int32_t unit_type_ = kTypeNotSet;  // "CellType"
  int32_t byte_order_ = 0;           // "ByteOrder"

  double header_offset_field_ = 0.0;  // the header offset as the document stores it
};
