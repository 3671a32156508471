// SPDX-License-Identifier: MIT
#include "server/common/folder_sink.h"

#include <fcntl.h>
#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstring>

#include "server/common/output_policy.h"
#include "server/common/tree_removal.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace {

constexpr size_t kCopyBytes = 256 * 1024;

}  // namespace

std::unique_ptr<FolderSink> FolderSink::create(int dirFd, const std::string& partialName, std::optional<gid_t> group,
                                               std::string* error) {
  std::unique_ptr<FolderSink> sink(new FolderSink(dirFd, partialName, group));
  if (!sink->makeFolder(dirFd, partialName, error)) {
    sink->abandon();
    return nullptr;
  }
  return sink;
}

FolderSink::~FolderSink() {
  if (!done_) abandon();
}

bool FolderSink::makeFolder(int parentFd, const std::string& name, std::string* error) {
  // Closed to everyone but us until it is complete.
  if (::mkdirat(parentFd, name.c_str(), 0700) != 0) {
    *error = errnoText("cannot create " + name, errno);
    return false;
  }
  Fd fd(::openat(parentFd, name.c_str(), O_RDONLY | O_DIRECTORY | O_NOFOLLOW | O_CLOEXEC));
  if (!fd) {
    *error = errnoText("cannot open " + name, errno);
    return false;
  }
  folders_.push_back(std::move(fd));
  return true;
}

bool FolderSink::enterFolder(const std::string& name, const struct stat&, std::string* error) {
  return makeFolder(folders_.back().get(), name, error);
}

bool FolderSink::leaveFolder(std::string* error) {
  if (!applyOutputPolicy(folders_.back().get(), kFolderMode, group_, "a folder", error)) return false;
  folders_.pop_back();
  return true;
}

bool FolderSink::copyExtent(int in, int out, const Extent& extent, std::string* error) {
  off_t pos = extent.offset;
  const off_t end = extent.offset + extent.length;
  while (pos < end) {
    loff_t from = pos, to = pos;
    ssize_t n = ::copy_file_range(in, &from, out, &to, static_cast<size_t>(end - pos), 0);
    if (n < 0 && errno == EINTR) continue;
    if (n < 0 && (errno == EXDEV || errno == EINVAL || errno == ENOSYS || errno == EOPNOTSUPP)) {
      // No in-kernel copy between these two: read and write.
      if (buffer_.empty()) buffer_.resize(kCopyBytes);
      n = ::pread(in, buffer_.data(), static_cast<size_t>(std::min<off_t>(end - pos, kCopyBytes)), pos);
      if (n > 0 && ::pwrite(out, buffer_.data(), static_cast<size_t>(n), pos) != n) {
        *error = errnoText("cannot write a copy", errno);
        return false;
      }
    }
    if (n < 0) {
      *error = errnoText("cannot copy a log file", errno);
      return false;
    }
    if (n == 0) break;  // the log shrank meanwhile
    pos += n;
  }
  return true;
}

bool FolderSink::addFile(const std::string& name, const SourceFile& file, const std::atomic<bool>& cancel,
                         std::string* error) {
  Fd out(::openat(folders_.back().get(), name.c_str(), O_WRONLY | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
  if (!out) {
    *error = errnoText("cannot create a copy of " + name, errno);
    return false;
  }
  for (const auto& extent : file.part.extents) {
    if (cancel.load()) {
      *error = "cancelled";
      return false;
    }
    if (!copyExtent(file.fd, out.get(), extent, error)) return false;
  }
  // The size puts back the holes that the extents skipped, the last one too.
  if (::ftruncate(out.get(), file.part.size) != 0) {
    *error = errnoText("cannot write a copy of " + name, errno);
    return false;
  }
  const struct timespec times[2] = {file.st.st_atim, file.st.st_mtim};
  ::futimens(out.get(), times);
  return applyOutputPolicy(out.get(), copiedFileMode(file.st.st_mode), group_, name, error);
}

bool FolderSink::addManifest(int fd, off_t size, std::string* error) {
  SourceFile manifest;
  manifest.fd = fd;
  manifest.st.st_mode = S_IFREG | 0640;
  ::clock_gettime(CLOCK_REALTIME, &manifest.st.st_mtim);
  manifest.st.st_atim = manifest.st.st_mtim;
  manifest.part.size = size;
  if (size > 0) manifest.part.extents.push_back({0, size});
  folders_.resize(1);
  static const std::atomic<bool> kNever{false};
  return addFile("manifest.txt", manifest, kNever, error);
}

bool FolderSink::commit(const std::string& finalName, std::string* error) {
  if (!leaveFolder(error)) return false;
  if (!publishAt(dirFd_, partialName_, finalName, error)) return false;
  done_ = true;
  return true;
}

void FolderSink::abandon() {
  if (done_) return;
  done_ = true;
  folders_.clear();
  removeEntryAt(dirFd_, partialName_);
}

}  // namespace vorn::server
