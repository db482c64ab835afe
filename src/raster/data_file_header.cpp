// The "RasterInfo" header of a raster data file.
#include <cmath>
#include <cstring>

#include "profile/profile.h"
#include "raster/data_file.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "datafile";
constexpr const char* kSection = "RasterInfo";
constexpr int kChannel = 1;
constexpr int kIntMax = 2147483647;

}  // namespace

void DataFile::refreshParameters() {
  addElementInt("NrOfLinesPerImage", &lines_per_image, 1, 0, kIntMax, true);
  addElementInt("NrOfPixelsPerLine", &pixels_per_line, 1, 0, kIntMax, true);
  // Stored as a whole number like the other fields; held as a double so that
  // offsets beyond 2 GiB survive the document.
  addElementDouble("HeaderOffset", &header_offset_field_, 1, 0.0,
                   static_cast<double>(kMaxHeaderOffset), true);
  addElementInt("RowPrefix", &row_prefix, 1, 0, kIntMax, true);
  addElementInt("ByteOrder", &byte_order, 1, 0, 1, true);
  addElementInt("CellType", &cell_type, 1, 0, kCellTypeCount - 1, true);
  setAllocationFlag(true);
}

// The older parameter-file form: every key required, the cell type and the
// byte order as texts.
int DataFile::read_legacy_hdr() {
  const char* file = header_name_.c_str();
  int value = 0;
  int64_t offset = 0;
  if (GetMyProfileInt64Array(kSection, "HeaderOffset", &offset, 1, file) != 0) return 1;
  header_offset = offset;
  if (GetMyProfileIntArray(kSection, "RowPrefix", &value, 1, file) != 0) return 1;
  row_prefix = value;
  if (GetMyProfileIntArray(kSection, "NrOfPixelsPerLine", &value, 1, file) != 0) return 1;
  pixels_per_line = value;
  if (GetMyProfileIntArray(kSection, "NrOfLinesPerImage", &value, 1, file) != 0) return 1;
  lines_per_image = value;
  char text[kProfileBufferSize];
  if (GetMyProfileString(kSection, "CellType", text, sizeof text, file) != 0) return 1;
  cell_type = cell_type_from_text(text);
  if (cell_type < 0) return 1;
  if (GetMyProfileString(kSection, "ByteOrder", text, sizeof text, file) != 0) return 1;
  byte_order = std::strcmp(text, "MSBFirst") == 0 ? 1 : 0;
  return 0;
}

int DataFile::read_hdr(const char* name) {
  VLR_SCOPE("DataFile::read_hdr", kModule);
  if (name == nullptr || name[0] == '\0')
    VLR_FAIL("Missing raster file name!", vlr::kLibInconsistent);
  if (is_open()) close();
  set_name(name);
  buffer_size_ = 0;
  header_offset_field_ = -1.0;
  if (readAuxiliaryFile(header_name_.c_str(), kChannel, kSection)) {
    // Whole numbers only, within the supported range.
    const double v = header_offset_field_;
    if (!(v >= 0.0 && v <= static_cast<double>(kMaxHeaderOffset)) || std::floor(v) != v) {
      VLR_FAIL("Invalid raster header!", vlr::kLibInconsistent);
    }
    header_offset = static_cast<int64_t>(v);
  } else if (read_legacy_hdr() != 0) {
    VLR_FAIL("Cannot read raster header!", vlr::kLibInconsistent);
  }
  if (check_description() != 0) VLR_FAIL("Invalid raster header!", vlr::kLibInconsistent);
  return 0;
}

int DataFile::write_hdr() {
  VLR_SCOPE("DataFile::write_hdr", kModule);
  if (name_.empty()) VLR_FAIL("Missing raster file name!", vlr::kLibInconsistent);
  if (check_description() != 0) VLR_FAIL("Invalid raster description!", vlr::kLibInconsistent);
  header_offset_field_ = static_cast<double>(header_offset);
  VLR_CALL(writeAuxiliaryFile(header_name_.c_str(), kChannel, kSection));
  return 0;
}
