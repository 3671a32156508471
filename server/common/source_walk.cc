// SPDX-License-Identifier: MIT
#include "server/common/source_walk.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "platform/linux/fd.h"
#include "server/common/dir_stream.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace {

constexpr int kFolderFlags = O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC;
// O_NONBLOCK: a FIFO swapped in after the listing must not hold the open.
constexpr int kFileFlags = O_RDONLY | O_NOFOLLOW | O_NONBLOCK | O_NOCTTY | O_CLOEXEC;

const char* kindOf(mode_t mode) {
  if (S_ISLNK(mode)) return "symbolic link";
  if (S_ISFIFO(mode)) return "FIFO";
  if (S_ISSOCK(mode)) return "socket";
  if (S_ISCHR(mode) || S_ISBLK(mode)) return "device";
  return "not a regular file";
}

/// Why an entry listed a moment ago could not be opened as what it was, or
/// empty when the failure is a real one that fails the collection.
const char* raceReason(int err) {
  switch (err) {
    case ENOENT: return "removed during the collection";
    case ELOOP: return "symbolic link";
    case ENOTDIR: return "replaced during the collection";
    case ENXIO:
    case ENODEV: return "not a regular file";
    default: return nullptr;
  }
}

}  // namespace

bool SourceWalk::walkSource(int baseFd, const std::string& relPath, const std::string& into, std::string* error) {
  int fd = ::openat(baseFd, relPath.c_str(), kFolderFlags);
  if (fd < 0) {
    if (errno == ENOENT) return true;
    *error = (errno == ENOTDIR || errno == ELOOP) ? "cannot read " + relPath + ": not a folder"
                                                   : errnoText("cannot read " + relPath, errno);
    return false;
  }
  struct stat st {};
  if (::fstat(fd, &st) != 0) {
    *error = errnoText("cannot read " + relPath, errno);
    ::close(fd);
    return false;
  }
  return walkFolder(fd, into, st, 1, error);
}

bool SourceWalk::walkFolder(int fd, const std::string& name, const struct stat& st, int depth, std::string* error) {
  DirStream dir(fd);
  if (!dir.ok()) {
    *error = "cannot list " + pathOf(name) + ": " + dir.error();
    return false;
  }
  if (!sink_.enterFolder(name, st, error)) return false;
  path_.push_back(name);
  std::string entry;
  while (dir.next(&entry)) {
    if (cancel_.load()) {
      *error = "cancelled";
      return false;
    }
    if (!visit(dir.fd(), entry, depth, error)) return false;
  }
  if (!dir.error().empty()) {
    *error = "cannot list " + pathOf("") + ": " + dir.error();
    return false;
  }
  path_.pop_back();
  return sink_.leaveFolder(error);
}

bool SourceWalk::visit(int dirFd, const std::string& name, int depth, std::string* error) {
  struct stat st {};
  if (::fstatat(dirFd, name.c_str(), &st, AT_SYMLINK_NOFOLLOW) != 0) {
    if (errno == ENOENT) {
      manifest_.skipped(pathOf(name), raceReason(ENOENT));
      return true;
    }
    *error = errnoText("cannot read " + pathOf(name), errno);
    return false;
  }
  if (S_ISREG(st.st_mode)) return visitFile(dirFd, name, error);
  if (!S_ISDIR(st.st_mode)) {
    manifest_.skipped(pathOf(name), kindOf(st.st_mode));
    return true;
  }
  if (depth >= kMaxDepth) {
    manifest_.skipped(pathOf(name) + "/", "deeper than " + std::to_string(kMaxDepth) + " folders");
    return true;
  }
  if (beforeOpen) beforeOpen(dirFd, name);
  int fd = ::openat(dirFd, name.c_str(), kFolderFlags);
  if (fd < 0) {
    const int err = errno;
    if (const char* why = raceReason(err)) {
      manifest_.skipped(pathOf(name) + "/", why);
      return true;
    }
    *error = errnoText("cannot read " + pathOf(name), err);
    return false;
  }
  struct stat opened {};
  if (::fstat(fd, &opened) != 0) {
    *error = errnoText("cannot read " + pathOf(name), errno);
    ::close(fd);
    return false;
  }
  return walkFolder(fd, name, opened, depth + 1, error);
}

bool SourceWalk::visitFile(int dirFd, const std::string& name, std::string* error) {
  if (beforeOpen) beforeOpen(dirFd, name);
  Fd fd(::openat(dirFd, name.c_str(), kFileFlags));
  if (!fd) {
    const int err = errno;
    if (const char* why = raceReason(err)) {
      manifest_.skipped(pathOf(name), why);
      return true;
    }
    *error = errnoText("cannot open " + pathOf(name), err);
    return false;
  }
  SourceFile file;
  file.fd = fd.get();
  if (::fstat(fd.get(), &file.st) != 0) {
    *error = errnoText("cannot read " + pathOf(name), errno);
    return false;
  }
  // What was opened is what counts: the listing may be out of date.
  if (!S_ISREG(file.st.st_mode)) {
    manifest_.skipped(pathOf(name), kindOf(file.st.st_mode));
    return true;
  }
  file.part = fitToBudget(dataExtents(fd.get(), file.st.st_size), file.st.st_size, &budget_);
  if (file.part.cut) {
    manifest_.cut(pathOf(name), file.part.bytes, static_cast<std::uint64_t>(file.st.st_size));
    if (file.part.bytes == 0) return true;
  }
  if (!sink_.addFile(name, file, cancel_, error)) return false;
  if (!file.part.cut) manifest_.stored(pathOf(name));
  return true;
}

std::string SourceWalk::pathOf(const std::string& name) const {
  std::string out;
  for (const auto& p : path_) out += p + "/";
  out += name;
  if (!name.empty()) return out;
  if (!out.empty()) out.pop_back();
  return out;
}

}  // namespace vorn::server
