// SPDX-License-Identifier: MIT
#include "oslog/export_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>

namespace oslog {

bool ExportFile::create(const std::string& path) {
  close();
  writeError_ = 0;
  // Opened without waiting: a FIFO that nobody reads fails at once (ENXIO)
  // instead of hanging before the export's time bound even starts.
  fd_ = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC | O_NONBLOCK | O_NOCTTY, 0666);
  if (fd_ < 0) return false;
  // Writes block as usual, so a reader that is slower than the journal gets
  // every line rather than a short write.
  const int flags = ::fcntl(fd_, F_GETFL);
  if (flags >= 0) ::fcntl(fd_, F_SETFL, flags & ~O_NONBLOCK);
  buffer_.reserve(kBlockBytes + 4096);
  return true;
}

void ExportFile::flush() {
  std::size_t done = 0;
  // After a failed write (a full disk, say) nothing more is written: the
  // file would have a hole in it. The failure is reported by close().
  while (fd_ >= 0 && writeError_ == 0 && done < buffer_.size()) {
    const ssize_t n = ::write(fd_, buffer_.data() + done, buffer_.size() - done);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) {
      writeError_ = n < 0 ? errno : ENOSPC;
      break;
    }
    done += static_cast<std::size_t>(n);
  }
  buffer_.clear();
}

bool ExportFile::close() {
  if (fd_ < 0) return writeError_ == 0;
  flush();
  if (::close(fd_) != 0 && writeError_ == 0) writeError_ = errno;
  fd_ = -1;
  return writeError_ == 0;
}

}  // namespace oslog
