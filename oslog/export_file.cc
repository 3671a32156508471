// SPDX-License-Identifier: MIT
#include "oslog/export_file.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>

namespace oslog {

bool ExportFile::create(const std::string& path) {
  close();
  fd_ = ::open(path.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
  buffer_.reserve(kBlockBytes + 4096);
  return fd_ >= 0;
}

void ExportFile::flush() {
  std::size_t done = 0;
  while (fd_ >= 0 && done < buffer_.size()) {
    const ssize_t n = ::write(fd_, buffer_.data() + done, buffer_.size() - done);
    if (n < 0 && errno == EINTR) continue;
    // A full disk loses the rest of the block; the export has no one to tell.
    if (n <= 0) break;
    done += static_cast<std::size_t>(n);
  }
  buffer_.clear();
}

void ExportFile::close() {
  if (fd_ < 0) return;
  flush();
  ::close(fd_);
  fd_ = -1;
}

}  // namespace oslog
