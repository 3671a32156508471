// SPDX-License-Identifier: MIT
#include "server/common/tree_removal.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "server/common/dir_stream.h"

namespace vorn::server {

namespace {

// Our own work folders are at most the walk's depth and a few more; a
// deeper tree is not ours to chase.
constexpr int kRemovalDepth = 128;
constexpr char kPartialSuffix[] = ".partial";

bool removeAt(int dirFd, const std::string& name, int depth) {
  struct stat st {};
  if (::fstatat(dirFd, name.c_str(), &st, AT_SYMLINK_NOFOLLOW) != 0) return errno == ENOENT;
  if (!S_ISDIR(st.st_mode)) return ::unlinkat(dirFd, name.c_str(), 0) == 0 || errno == ENOENT;
  if (depth > kRemovalDepth) return false;
  int fd = ::openat(dirFd, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC);
  if (fd < 0) return errno == ENOENT;
  {
    DirStream dir(fd);
    if (!dir.ok()) return false;
    // Entries removed while listing may shift the stream: list again until
    // a pass finds nothing.
    for (bool removed = true; removed;) {
      removed = false;
      std::string entry;
      dir.rewind();
      while (dir.next(&entry)) {
        if (!removeAt(dir.fd(), entry, depth + 1)) return false;
        removed = true;
      }
    }
  }
  return ::unlinkat(dirFd, name.c_str(), AT_REMOVEDIR) == 0 || errno == ENOENT;
}

}  // namespace

bool isPartialName(const std::string& name) {
  const size_t suffix = sizeof kPartialSuffix - 1;
  return name.size() > suffix + 1 && name[0] == '.' &&
         name.compare(name.size() - suffix, suffix, kPartialSuffix) == 0;
}

bool removeEntryAt(int dirFd, const std::string& name) { return removeAt(dirFd, name, 0); }

bool removePartialLeftovers(int dirFd) {
  int fd = ::dup(dirFd);
  if (fd < 0) return false;
  DirStream dir(fd);
  if (!dir.ok()) return false;
  bool ok = true;
  std::string name;
  while (dir.next(&name)) {
    if (isPartialName(name)) ok = removeEntryAt(dirFd, name) && ok;
  }
  return ok;
}

}  // namespace vorn::server
