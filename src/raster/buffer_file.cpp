// BufferFile: opening, the buffer with its history, byte transfers, seeks.
// The file itself is an unbuffered DataFile, used for positioned transfers.
#include "raster/buffer_file.h"

#include <sys/stat.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "raster/byte_order.h"
#include "raster/file_messages.h"
#include "runtime/error_codes.h"

namespace {

constexpr const char* kModule = "bufferfile";

using namespace raster_messages;

}  // namespace

BufferFile::BufferFile() {
  createElementsVector(6);
}

BufferFile::BufferFile(const BufferFile& other) : GeneralSAR_Base(other) {
  other.clone(this);
}

BufferFile& BufferFile::operator=(const BufferFile& other) {
  if (this != &other) {
    if (is_open()) close();
    buffer_.reset();
    history_ = 0;
    GeneralSAR_Base::operator=(other);
    other.clone(this);
  }
  return *this;
}

BufferFile::~BufferFile() {
  if (is_open()) close();
}

void BufferFile::setFilename(const char* name) {
  name_ = name != nullptr ? name : "";
}

int BufferFile::getFilename(char* out, size_t size) const {
  if (out == nullptr || size == 0) return 1;
  const size_t n = std::min(name_.size(), size - 1);
  std::memcpy(out, name_.data(), n);
  out[n] = '\0';
  return n == name_.size() ? 0 : 1;
}

int64_t BufferFile::line_length() const {
  return int64_t{samples_} * pixelsizeof() + row_prefix_;
}

bool BufferFile::exists() const {
  DataFile df;
  df.set_name(name_.c_str());
  return df.exists();
}

bool BufferFile::must_swap() const {
  return (byte_order_ == 1 ? 'm' : 'l') != endi();
}

int64_t BufferFile::tell() const {
  return is_buffered() ? position_ + cursor_ : position_;
}

// Empties the buffer (nothing may be pending) and places it at `position`.
void BufferFile::reset_buffer(int64_t position) {
  position_ = position;
  cursor_ = 0;
  valid_ = 0;
  dirty_begin_ = 0;
  dirty_end_ = 0;
}

// End of the file including the pending bytes.
int64_t BufferFile::logical_end() const {
  return dirty_end_ > dirty_begin_ ? std::max(disk_end_, position_ + dirty_end_) : disk_end_;
}

// Buffer bytes a read may deliver: all valid bytes, except, when writing,
// the zeros of a skipped range beyond the end of the file.
int64_t BufferFile::readable() const {
  if (op_type_ == kOpRead) return valid_;
  return std::max<int64_t>(0, std::min(valid_, logical_end() - position_));
}

// Size of the file on disk, 0 when it cannot be determined.
int64_t BufferFile::disk_size() const {
  struct stat st;
  if (::stat(io_.name().c_str(), &st) != 0) {
    errno = 0;
    return 0;
  }
  return static_cast<int64_t>(st.st_size);
}

// Up to n bytes at offset; *got receives the count, short only at the end of
// the file.  0, or 4 on a read failure.
int BufferFile::read_at(unsigned char* out, int64_t offset, int64_t n, int64_t* got) {
  *got = 0;
  // Only what the file holds is asked for, so that the end of the file is
  // not a failure of the raw file; a reader takes a grown file into account.
  if (op_type_ == kOpRead && offset + n > disk_end_) disk_end_ = disk_size();
  const int64_t want = std::min(n, disk_end_ - offset);
  if (want <= 0) return 0;
  if (io_.seek(offset, DataFile::kSeekSet) != 0) return vlr::kLibRead;
  const int rc = io_.read(out, want);
  *got = io_.tell() - offset;
  return rc == 0 ? 0 : vlr::kLibRead;
}

int BufferFile::write_at(const unsigned char* in, int64_t offset, int64_t n) {
  if (io_.seek(offset, DataFile::kSeekSet) != 0 || io_.write(in, n) != 0) return vlr::kLibWrite;
  disk_end_ = std::max(disk_end_, offset + n);
  return 0;
}

// Writes the pending range out; it stays pending when that fails.
int BufferFile::flush_pending() {
  if (dirty_end_ <= dirty_begin_) return 0;
  if (write_at(buffer_.data() + dirty_begin_, position_ + dirty_begin_,
               dirty_end_ - dirty_begin_) != 0) {
    return vlr::kLibWrite;
  }
  dirty_begin_ = 0;
  dirty_end_ = 0;
  return 0;
}

// Writes pending bytes out and moves the buffer on to the cursor, keeping
// the last min(history, cursor / 2) bytes before it.
int BufferFile::slide() {
  if (flush_pending() != 0) return vlr::kLibWrite;
  const int64_t keep = std::min<int64_t>(history_, cursor_ / 2);
  const int64_t shift = cursor_ - keep;
  if (keep > 0) std::memmove(buffer_.data(), buffer_.data() + shift, static_cast<size_t>(keep));
  position_ += shift;
  cursor_ = keep;
  valid_ = keep;
  return 0;
}

// slide(), then reads on from the cursor to the end of the buffer.
int BufferFile::refill() {
  if (slide() != 0) return vlr::kLibWrite;
  const int64_t size = static_cast<int64_t>(buffer_.size());
  int64_t got = 0;
  const int rc = read_at(buffer_.data() + cursor_, position_ + cursor_, size - cursor_, &got);
  valid_ += got;
  return rc;
}

// Extends the buffered range up to `target` (within the buffer) with the
// file's bytes, zeros beyond its end, and moves the cursor there.
int BufferFile::fill_gap(int64_t target) {
  const int64_t from = position_ + valid_;
  const int64_t n = target - from;
  int64_t got = 0;
  if (from < disk_end_ && read_at(buffer_.data() + valid_, from, n, &got) != 0) {
    return vlr::kLibRead;
  }
  std::memset(buffer_.data() + valid_ + got, 0, static_cast<size_t>(n - got));
  valid_ = target - position_;
  cursor_ = valid_;
  return 0;
}

int BufferFile::open(int op_type) {
  VLR_SCOPE("BufferFile::open", kModule);
  if (op_type != kOpRead && op_type != kOpWrite && op_type != kOpUpdate) {
    if (flush_pending() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
    reset_buffer(0);
    VLR_FAIL("Unknown file operation type!", vlr::kLibInconsistent);
  }
  if (is_open()) VLR_CALL(close());
  if (name_.empty()) VLR_FAIL(kNotOpened, vlr::kLibOpen);
  io_.set_name(name_.c_str());
  if (op_type == kOpRead) {
    VLR_CALL(io_.open(DataFile::kOpenRead));
  } else {
    // A new file is created empty, then opened for reading and writing.
    if (op_type == kOpWrite) {
      VLR_CALL(io_.open(DataFile::kOpenCreate));
      VLR_CALL(io_.close());
    }
    VLR_CALL(io_.open(DataFile::kOpenUpdate));
  }
  disk_end_ = disk_size();
  op_type_ = op_type;
  reset_buffer(0);
  return 0;
}

int BufferFile::close() {
  VLR_SCOPE("BufferFile::close", kModule);
  if (!is_open()) return 0;
  const int pending = flush_pending();
  buffer_.reset();
  const int closed = io_.close();
  disk_end_ = 0;
  reset_buffer(0);
  if (pending != 0 || closed != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  return 0;
}

int BufferFile::flush() {
  VLR_SCOPE("BufferFile::flush", kModule);
  if (flush_pending() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  return 0;
}

int BufferFile::initbuffer(int size, int history) {
  VLR_SCOPE("BufferFile::initbuffer", kModule);
  if (size < 0 || size > kMaxBufferSize || history < 0) {
    VLR_FAIL("Invalid buffer size!", vlr::kLibInconsistent);
  }
  if (flush_pending() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  reset_buffer(0);
  history_ = history;
  if (!buffer_.allocate(static_cast<size_t>(size))) {
    VLR_FAIL("Memory allocation failed!", vlr::kLibAlloc);
  }
  if (is_open() && size > 0 && op_type_ != kOpWrite) {
    if (read_at(buffer_.data(), 0, size, &valid_) != 0) VLR_FAIL(kReadFailed, vlr::kLibRead);
  }
  return 0;
}

// Serves a read from the buffer, refilling it as needed; *delivered counts
// the bytes delivered, fewer than n at the end of the file.  0, 4 or 5.
int BufferFile::read_buffered(unsigned char* out, int64_t n, int64_t* delivered) {
  const int64_t size = static_cast<int64_t>(buffer_.size());
  *delivered = 0;
  while (n > 0) {
    const int64_t available = readable() - cursor_;
    if (available > 0) {
      const int64_t take = std::min(available, n);
      std::memcpy(out, buffer_.data() + cursor_, static_cast<size_t>(take));
      cursor_ += take;
      out += take;
      n -= take;
      *delivered += take;
      continue;
    }
    if (n >= size) {
      // A buffer or more goes straight to the caller; its last bytes stay
      // behind as history.
      if (flush_pending() != 0) return vlr::kLibWrite;
      const int64_t at = position_ + cursor_;
      int64_t got = 0;
      const int rc = read_at(out, at, n, &got);
      const int64_t keep = std::min({int64_t{history_}, got, size / 2});
      std::memcpy(buffer_.data(), out + got - keep, static_cast<size_t>(keep));
      reset_buffer(at + got - keep);
      cursor_ = keep;
      valid_ = keep;
      *delivered += got;
      return rc;
    }
    const int rc = refill();
    if (rc != 0) return rc;
    if (readable() <= cursor_) break;  // end of the file
  }
  return 0;
}

int64_t BufferFile::read(void* buf, int64_t n) {
  if (!is_open() || op_type_ == kOpWrite || n <= 0 || buf == nullptr) return 0;
  auto* out = static_cast<unsigned char*>(buf);
  int64_t delivered = 0;
  int rc = 0;
  if (is_buffered()) {
    rc = read_buffered(out, n, &delivered);
  } else {
    rc = read_at(out, position_, n, &delivered);
    position_ += delivered;
  }
  if (rc != 0) {
    VLR_SCOPE("BufferFile::read", kModule);
    VLR_REPORT(rc == vlr::kLibWrite ? kWriteFailed : kReadFailed, 0);
  }
  return delivered;
}

// Takes a write into the buffer, writing full buffers out; *accepted counts
// the bytes taken.  0 or 5.
int BufferFile::write_buffered(const unsigned char* in, int64_t n, int64_t* accepted) {
  const int64_t size = static_cast<int64_t>(buffer_.size());
  *accepted = 0;
  while (n > 0) {
    const int64_t space = size - cursor_;
    if (n > space && n >= size) {
      // A buffer or more goes straight to the file; its last bytes stay
      // behind as history, replacing whatever the buffer held there.
      if (flush_pending() != 0 || write_at(in, position_ + cursor_, n) != 0) {
        return vlr::kLibWrite;
      }
      const int64_t at = position_ + cursor_;
      const int64_t keep = std::min({int64_t{history_}, n, size / 2});
      std::memcpy(buffer_.data(), in + n - keep, static_cast<size_t>(keep));
      reset_buffer(at + n - keep);
      cursor_ = keep;
      valid_ = keep;
      *accepted += n;
      return 0;
    }
    if (space == 0) {
      if (slide() != 0) return vlr::kLibWrite;
      continue;
    }
    const int64_t take = std::min(space, n);
    std::memcpy(buffer_.data() + cursor_, in, static_cast<size_t>(take));
    if (dirty_end_ > dirty_begin_) {
      dirty_begin_ = std::min(dirty_begin_, cursor_);
      dirty_end_ = std::max(dirty_end_, cursor_ + take);
    } else {
      dirty_begin_ = cursor_;
      dirty_end_ = cursor_ + take;
    }
    cursor_ += take;
    valid_ = std::max(valid_, cursor_);
    in += take;
    n -= take;
    *accepted += take;
  }
  return 0;
}

int64_t BufferFile::write(const void* buf, int64_t n) {
  if (!is_writing() || n <= 0 || buf == nullptr) return 0;
  const auto* in = static_cast<const unsigned char*>(buf);
  int64_t accepted = 0;
  int rc = 0;
  if (is_buffered()) {
    rc = write_buffered(in, n, &accepted);
  } else {
    rc = write_at(in, position_, n);
    if (rc == 0) {
      position_ += n;
      accepted = n;
    }
  }
  if (rc != 0) {
    VLR_SCOPE("BufferFile::write", kModule);
    VLR_REPORT(kWriteFailed, 0);
  }
  return accepted;
}

int BufferFile::seek(int64_t offset, int origin) {
  VLR_SCOPE("BufferFile::seek", kModule);
  if (!is_open()) VLR_FAIL(kNotOpened, vlr::kLibInconsistent);
  int64_t base = 0;
  if (origin == kSeekCurrent) {
    base = tell();
  } else if (origin == kSeekEnd) {
    disk_end_ = std::max(disk_end_, disk_size());
    base = logical_end();
  } else if (origin != kSeekSet) {
    VLR_FAIL("File seeking failed!", vlr::kLibInconsistent);
  }
  if ((offset > 0 && base > INT64_MAX - offset) || base + offset < 0) {
    VLR_FAIL("File seeking failed!", vlr::kLibInconsistent);
  }
  const int64_t target = base + offset;
  if (!is_buffered()) {
    position_ = target;
    return 0;
  }
  if (target >= position_ && target - position_ <= valid_) {
    cursor_ = target - position_;  // inside the buffered range
    return 0;
  }
  if (is_writing() && dirty_end_ > dirty_begin_ && target > position_ &&
      target - position_ <= static_cast<int64_t>(buffer_.size())) {
    if (fill_gap(target) != 0) VLR_FAIL(kReadFailed, vlr::kLibRead);
    return 0;
  }
  if (flush_pending() != 0) VLR_FAIL(kWriteFailed, vlr::kLibWrite);
  reset_buffer(target);
  return 0;
}
