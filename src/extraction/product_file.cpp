#include "extraction/product_file.h"

#include <unistd.h>

#include <cerrno>

namespace asar {

ScopedFd::~ScopedFd() {
  close();
}

int ScopedFd::close() {
  if (fd_ < 0) return 0;
  const int rc = ::close(fd_);
  fd_ = -1;
  return rc;
}

bool ReadFullyAt(int fd, void* out, size_t n, int64_t offset) {
  unsigned char* p = static_cast<unsigned char*>(out);
  while (n > 0) {
    const ssize_t got = pread(fd, p, n, static_cast<off_t>(offset));
    if (got < 0 && errno == EINTR) continue;
    if (got <= 0) return false;
    p += got;
    n -= static_cast<size_t>(got);
    offset += got;
  }
  return true;
}

}  // namespace asar
