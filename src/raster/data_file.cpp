#include "raster/data_file.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "raster/file_messages.h"
#include "runtime/error_codes.h"
#include "runtime/run_outputs.h"

namespace {

constexpr const char* kModule = "datafile";

using namespace raster_messages;

// Smallest refill of a read buffer.
constexpr int64_t kMinRefill = 16 * 1024;

// Largest single read or write handed to the system at once.
constexpr int64_t kMaxTransfer = int64_t{1} << 30;

}  // namespace

DataFile::DataFile() {
  createElementsVector(6);
}

DataFile::DataFile(const DataFile& other) : GeneralSAR_Base(other) {
  set_name(other.name_.c_str());
  other.clone(this);
}

DataFile& DataFile::operator=(const DataFile& other) {
  if (this != &other) {
    if (is_open()) close();
    GeneralSAR_Base::operator=(other);
    set_name(other.name_.c_str());
    other.clone(this);
  }
  return *this;
}

DataFile::~DataFile() {
  if (is_open()) close();
}

void DataFile::set_name(const char* name) {
  name_ = name != nullptr ? name : "";
  header_name_ = name_ + ".hdr";
}

int64_t DataFile::line_length() const {
  return int64_t{pixels_per_line} * cell_type_size(cell_type) + row_prefix;
}

int DataFile::check_description() const {
  return check_description(lines_per_image, pixels_per_line, row_prefix, header_offset, cell_type,
                           byte_order);
}

int DataFile::check_description(int lines, int pixels, int row_prefix, int64_t header_offset,
                                int cell_type, int byte_order) {
  if (pixels < 0 || lines < 0 || row_prefix < 0) return 1;
  if (header_offset < 0 || header_offset > kMaxHeaderOffset) return 1;
  if (!cell_type_is_valid(cell_type)) return 1;
  if (byte_order != 0 && byte_order != 1) return 1;
  if (int64_t{pixels} * cell_type_size(cell_type) + row_prefix > kMaxLineLength) return 1;
  // lines x L < 2^31 x 2^31: the file size fits easily in 64 bits.
  return 0;
}

bool DataFile::exists() const {
  if (name_.empty()) return false;
  const int fd = ::open(name_.c_str(), O_RDONLY | O_CLOEXEC);
  if (fd < 0) {
    errno = 0;
    return false;
  }
  ::close(fd);
  return true;
}

bool DataFile::holds_data() const {
  struct stat st;
  if (name_.empty() || check_description() != 0 || ::stat(name_.c_str(), &st) != 0) {
    errno = 0;
    return false;
  }
  return st.st_size >= data_size();
}

int DataFile::open(int mode) {
  VLR_SCOPE("DataFile::open", kModule);
  int flags = 0;
  int internal = kModeRead;
  switch (mode) {
    case kOpenRead:
      flags = O_RDONLY;
      break;
    case kOpenCreate:
      flags = O_WRONLY | O_CREAT | O_TRUNC;
      internal = kModeWrite;
      break;
    case kOpenWrite:
      flags = O_RDWR;
      internal = kModeWrite;
      break;
    case kOpenUpdate:
      flags = O_RDWR;
      internal = kModeUpdate;
      break;
    default:
      VLR_FAIL("Unknown file open mode!", vlr::kLibInconsistent);
  }
  if (is_open()) VLR_CALL(close());
  if (name_.empty()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  const int fd = ::open(name_.c_str(), flags | O_CLOEXEC, 0666);
  if (fd < 0) {
    errno = 0;
    VLR_FAIL(kNotOpened, vlr::kLibOpen);
  }
  if (mode == kOpenCreate) VlrRunOutputBegun(name_.c_str());
  if (buffer_size_ > 0 && !buffer_.allocate(static_cast<size_t>(buffer_size_))) {
    ::close(fd);
    buffer_size_ = 0;
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  fd_ = fd;
  mode_ = internal;
  reset_position();
  return 0;
}

void DataFile::reset_position() {
  position_ = 0;
  buffer_offset_ = 0;
  cursor_ = 0;
  valid_ = 0;
  fill_start_ = 0;
  fill_end_ = 0;
  readahead_ = 0;
}

int DataFile::flush() {
  if (mode_ != kModeWrite || buffer_.empty() || valid_ == 0) return 0;
  const int rc = write_direct(buffer_.data(), buffer_offset_, valid_);
  if (rc != 0) return rc;
  buffer_offset_ += valid_;
  cursor_ = 0;
  valid_ = 0;
  return 0;
}

int DataFile::close() {
  VLR_SCOPE("DataFile::close", kModule);
  if (!is_open()) return 0;
  int rc = flush();
  buffer_.reset();
  buffer_size_ = 0;
  if (::close(fd_) != 0 && rc == 0 && mode_ != kModeRead) rc = vlr::kLibWrite;
  errno = 0;
  fd_ = -1;
  mode_ = kModeRead;
  reset_position();
  if (rc != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  return 0;
}

int64_t DataFile::tell() const {
  return buffer_.empty() ? position_ : buffer_offset_ + cursor_;
}

int DataFile::seek(int64_t offset, int origin) {
  VLR_SCOPE("DataFile::seek", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibInconsistent);
  int64_t base = 0;
  if (origin == kSeekSet) {
    base = 0;
  } else if (origin == kSeekCurrent) {
    base = tell();
  } else if (origin == kSeekEnd && !buffer_.empty()) {
    if (flush() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    struct stat st;
    if (::fstat(fd_, &st) != 0) {
      errno = 0;
      VLR_FAIL("File seeking failed!", vlr::kLibInconsistent);
    }
    base = st.st_size;
  } else {
    VLR_FAIL("File seeking failed!", vlr::kLibInconsistent);
  }
  if ((offset > 0 && base > INT64_MAX - offset) || base + offset < 0) {
    VLR_FAIL("File seeking failed!", vlr::kLibInconsistent);
  }
  const int64_t target = base + offset;
  if (buffer_.empty()) {
    position_ = target;
    return 0;
  }
  if (mode_ == kModeWrite) {
    if (flush() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    buffer_offset_ = target;
    cursor_ = 0;
    valid_ = 0;
  } else if (target >= buffer_offset_ && target <= buffer_offset_ + valid_) {
    cursor_ = target - buffer_offset_;  // already in the read buffer
  } else {
    buffer_offset_ = target;
    cursor_ = 0;
    valid_ = 0;
  }
  return 0;
}

// Reads up to n bytes at offset; *got receives the count.  Stops early only
// at the end of the file.  0, or 4 on a system error.
int DataFile::read_direct(unsigned char* out, int64_t offset, int64_t n, int64_t* got) {
  *got = 0;
  while (*got < n) {
    const size_t chunk = static_cast<size_t>(std::min(n - *got, kMaxTransfer));
    const ssize_t r = ::pread(fd_, out + *got, chunk, static_cast<off_t>(offset + *got));
    if (r < 0) {
      if (errno == EINTR) continue;
      errno = 0;
      return vlr::kLibRead;
    }
    if (r == 0) break;
    *got += r;
  }
  return 0;
}

int DataFile::write_direct(const unsigned char* in, int64_t offset, int64_t n) {
  int64_t done = 0;
  while (done < n) {
    const size_t chunk = static_cast<size_t>(std::min(n - done, kMaxTransfer));
    const ssize_t w = ::pwrite(fd_, in + done, chunk, static_cast<off_t>(offset + done));
    if (w < 0 && errno == EINTR) continue;
    if (w <= 0) {
      errno = 0;
      return vlr::kLibWrite;
    }
    done += w;
  }
  return 0;
}

// Moves the read buffer to the current position and fills it with at least
// `need` bytes where the file has them.  Reading on from the last fill (or
// less than a buffer beyond it, as when line prefixes are skipped) doubles
// the amount read each time up to the buffer size; a jump backwards or far
// ahead starts small again, so that scattered reads do not pull whole
// buffers.
int DataFile::refill(int64_t need) {
  const int64_t size = static_cast<int64_t>(buffer_.size());
  const int64_t at = buffer_offset_ + cursor_;
  const int64_t smallest = std::min(size, kMinRefill);
  if (at >= fill_start_ && at - fill_end_ <= size) {
    readahead_ = std::min(size, std::max(2 * readahead_, smallest));
  } else {
    readahead_ = smallest;
  }
  buffer_offset_ = at;
  cursor_ = 0;
  valid_ = 0;
  int64_t got = 0;
  const int rc = read_direct(buffer_.data(), at, std::min(size, std::max(need, readahead_)), &got);
  valid_ = got;
  fill_start_ = at;
  fill_end_ = at + got;
  return rc;
}

int DataFile::read_buffered(unsigned char* out, int64_t n) {
  const int64_t size = static_cast<int64_t>(buffer_.size());
  while (n > 0) {
    const int64_t available = valid_ - cursor_;
    if (available > 0) {
      const int64_t take = std::min(available, n);
      std::memcpy(out, buffer_.data() + cursor_, static_cast<size_t>(take));
      cursor_ += take;
      out += take;
      n -= take;
      continue;
    }
    if (n >= size) {
      // A request of a buffer or more goes straight to the caller.
      buffer_offset_ += cursor_;
      cursor_ = 0;
      valid_ = 0;
      int64_t got = 0;
      if (read_direct(out, buffer_offset_, n, &got) != 0) return vlr::kLibRead;
      buffer_offset_ += got;
      return got == n ? 0 : vlr::kLibRead;
    }
    if (refill(n) != 0 || valid_ == 0) return vlr::kLibRead;  // end of file comes first
  }
  return 0;
}

int DataFile::read(void* buffer, int64_t n) {
  VLR_SCOPE("DataFile::read", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (mode_ == kModeWrite) VLR_FAIL("File open for writing!", vlr::kLibInconsistent);
  if (n < 0 || (n > 0 && buffer == nullptr)) VLR_FAIL(kReadFailed, vlr::kLibInconsistent);
  if (n == 0) return 0;
  auto* out = static_cast<unsigned char*>(buffer);
  if (!buffer_.empty()) {
    if (read_buffered(out, n) != 0) VLR_FAIL(kReadFailed, vlr::kLibRead);
    return 0;
  }
  int64_t got = 0;
  const int rc = read_direct(out, position_, n, &got);
  position_ += got;
  if (rc != 0 || got != n) VLR_FAIL(kReadFailed, vlr::kLibRead);
  return 0;
}

int DataFile::read_view(int64_t n, const unsigned char** view) {
  if (!is_open() || buffer_.empty() || mode_ == kModeWrite || n < 0 ||
      n > static_cast<int64_t>(buffer_.size())) {
    return vlr::kLibInconsistent;  // not a failure: the caller reads instead
  }
  VLR_SCOPE("DataFile::read_view", kModule);
  if (valid_ - cursor_ < n) {
    // Refill from the current position so that the n bytes are contiguous.
    if (refill(n) != 0 || valid_ < n) VLR_FAIL(kReadFailed, vlr::kLibRead);
  }
  *view = buffer_.data() + cursor_;
  cursor_ += n;
  return 0;
}

int DataFile::write_buffered(const unsigned char* in, int64_t n) {
  const int64_t size = static_cast<int64_t>(buffer_.size());
  while (n > 0) {
    if (valid_ == 0 && n >= size) {
      // Whole buffers go straight to the file.
      if (write_direct(in, buffer_offset_, n) != 0) return vlr::kLibWrite;
      buffer_offset_ += n;
      return 0;
    }
    const int64_t take = std::min(size - valid_, n);
    std::memcpy(buffer_.data() + valid_, in, static_cast<size_t>(take));
    valid_ += take;
    cursor_ = valid_;
    in += take;
    n -= take;
    if (valid_ == size && flush() != 0) return vlr::kLibWrite;
  }
  return 0;
}

int DataFile::write(const void* buffer, int64_t n) {
  VLR_SCOPE("DataFile::write", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  if (mode_ == kModeRead) VLR_FAIL("File open for reading!", vlr::kLibInconsistent);
  if (n < 0 || (n > 0 && buffer == nullptr)) VLR_FAIL(kWriteFailed, vlr::kLibInconsistent);
  if (n == 0) return 0;
  const auto* in = static_cast<const unsigned char*>(buffer);
  if (buffer_.empty()) {
    if (write_direct(in, position_, n) != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    position_ += n;
    return 0;
  }
  if (mode_ == kModeWrite) {
    if (write_buffered(in, n) != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    return 0;
  }
  // Updating through a read buffer: write through, and drop the buffered
  // bytes so that a later read sees what was written.
  const int64_t at = buffer_offset_ + cursor_;
  if (write_direct(in, at, n) != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  buffer_offset_ = at + n;
  cursor_ = 0;
  valid_ = 0;
  return 0;
}

int DataFile::clone(DataFile* other) const {
  if (other == nullptr || other == this) return 0;
  other->pixels_per_line = pixels_per_line;
  other->lines_per_image = lines_per_image;
  other->row_prefix = row_prefix;
  other->header_offset = header_offset;
  other->cell_type = cell_type;
  other->byte_order = byte_order;
  return 0;
}
