// BufferFile: the "RasterInfo" header and clone.  The description is the
// one of DataFile, whose checks and older header form are used.
#include "raster/buffer_file.h"

#include <cmath>
#include <cstring>
#include <string>

#include "raster/data_file.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "bufferfile";
constexpr const char* kSection = "RasterInfo";
constexpr int kChannel = 1;
constexpr int kIntMax = 2147483647;
// Length of the extension that readhdr() strips from a header name.
constexpr size_t kExtensionLength = 4;

}  // namespace

BufferFile::BufferFile() {
  createElementsVector(6);
}

BufferFile::BufferFile(const BufferFile& other) : GeneralSAR_Base(other) {
  other.clone(this);
}

BufferFile& BufferFile::operator=(const BufferFile& other) {
  if (this != &other) {
    GeneralSAR_Base::operator=(other);
    other.clone(this);
  }
  return *this;
}

void BufferFile::refreshParameters() {
  addElementInt("NrOfLinesPerImage", &lines_, 1, 0, kIntMax, true);
  addElementInt("NrOfPixelsPerLine", &samples_, 1, 0, kIntMax, true);
  // A whole number held as a double, so that offsets beyond 2 GiB survive
  // the document (as DataFile stores it).
  addElementDouble("HeaderOffset", &header_offset_field_, 1, 0.0,
                   static_cast<double>(DataFile::kMaxHeaderOffset), true);
  addElementInt("RowPrefix", &row_prefix_, 1, 0, kIntMax, true);
  addElementInt("ByteOrder", &byte_order_, 1, 0, 1, true);
  addElementInt("CellType", &unit_type_, 1, 0, kCellTypeCount - 1, true);
  setAllocationFlag(true);
}

// The limits of DataFile, checked without building one.
int BufferFile::check_description() const {
  return DataFile::check_description(lines_, samples_, row_prefix_, header_offset_, unit_type_,
                                     byte_order_);
}

int BufferFile::readhdr(const char* file) {
  VLR_SCOPE("BufferFile::readhdr", kModule);
  if (file == nullptr || std::strlen(file) <= kExtensionLength) {
    VLR_FAIL("Invalid raster header name!", vlr::kLibInconsistent);
  }
  const std::string header = file;
  name_ = header.substr(0, header.size() - kExtensionLength);
  header_offset_field_ = -1.0;
  if (readAuxiliaryFile(header.c_str(), kChannel, kSection)) {
    const double v = header_offset_field_;
    if (!(v >= 0.0 && v <= static_cast<double>(DataFile::kMaxHeaderOffset)) || std::floor(v) != v) {
      VLR_FAIL("Invalid raster header!", vlr::kLibInconsistent);
    }
    header_offset_ = static_cast<int64_t>(v);
  } else if (header == name_ + ".hdr") {
    // The older parameter-file form.
    DataFile df;
    VLR_CALL(df.read_hdr(name_.c_str()));
    lines_ = df.lines_per_image;
    samples_ = df.pixels_per_line;
    row_prefix_ = df.row_prefix;
    header_offset_ = df.header_offset;
    unit_type_ = df.cell_type;
    byte_order_ = df.byte_order;
  } else {
    VLR_FAIL("Cannot read raster header!", vlr::kLibInconsistent);
  }
  if (check_description() != 0) VLR_FAIL("Invalid raster header!", vlr::kLibInconsistent);
  return 0;
}

int BufferFile::readhdr() {
  VLR_SCOPE("BufferFile::readhdr", kModule);
  if (name_.empty()) VLR_FAIL("Missing raster file name!", vlr::kLibInconsistent);
  VLR_CALL(readhdr((name_ + ".hdr").c_str()));
  return 0;
}

int BufferFile::writehdr(const char* file) {
  VLR_SCOPE("BufferFile::writehdr", kModule);
  if (file == nullptr || file[0] == '\0') {
    VLR_FAIL("Missing raster header name!", vlr::kLibInconsistent);
  }
  if (check_description() != 0) VLR_FAIL("Invalid raster description!", vlr::kLibInconsistent);
  header_offset_field_ = static_cast<double>(header_offset_);
  VLR_CALL(writeAuxiliaryFile(file, kChannel, kSection));
  return 0;
}

int BufferFile::writehdr() {
  VLR_SCOPE("BufferFile::writehdr", kModule);
  if (name_.empty()) VLR_FAIL("Missing raster file name!", vlr::kLibInconsistent);
  VLR_CALL(writehdr((name_ + ".hdr").c_str()));
  return 0;
}

int BufferFile::clone(BufferFile* other) const {
  if (other == nullptr || other == this) return 0;
  other->name_ = name_;
  other->lines_ = lines_;
  other->samples_ = samples_;
  other->row_prefix_ = row_prefix_;
  other->header_offset_ = header_offset_;
  other->unit_type_ = unit_type_;
  other->byte_order_ = byte_order_;
  return 0;
}
