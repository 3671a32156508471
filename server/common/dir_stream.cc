// SPDX-License-Identifier: MIT
#include "server/common/dir_stream.h"
#include "platform/linux/errno_text.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace vorn::server {

DirStream::DirStream(int fd) {
  dir_ = ::fdopendir(fd);
  if (dir_ == nullptr) {
    error_ = errnoText(errno);
    if (fd >= 0) ::close(fd);
    return;
  }
  // A dup'ed descriptor shares its position with the original, which an
  // earlier reader may have left at the end.
  ::rewinddir(dir_);
}

DirStream::~DirStream() {
  if (dir_ != nullptr) ::closedir(dir_);
}

int DirStream::fd() const { return dir_ != nullptr ? ::dirfd(dir_) : -1; }

bool DirStream::next(std::string* name) {
  if (dir_ == nullptr) return false;
  for (;;) {
    errno = 0;
    const dirent* e = ::readdir(dir_);
    if (e == nullptr) {
      if (errno != 0) error_ = errnoText(errno);
      return false;
    }
    if (std::strcmp(e->d_name, ".") == 0 || std::strcmp(e->d_name, "..") == 0) continue;
    *name = e->d_name;
    return true;
  }
}

void DirStream::rewind() {
  if (dir_ != nullptr) ::rewinddir(dir_);
}

}  // namespace vorn::server
