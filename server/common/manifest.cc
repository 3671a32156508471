// SPDX-License-Identifier: MIT
#include "server/common/manifest.h"

#include <fcntl.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>

#include "server/common/text_util.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace {

constexpr size_t kFlushAt = 64 * 1024;
// A path holds at most 64 folders of 255 bytes each, and a little more.
constexpr size_t kPathLimit = 64 * 256 + 512;

}  // namespace

bool Manifest::open(int dirFd, const std::string& fallbackName, std::string* error) {
  fd_.reset(::openat(dirFd, ".", O_TMPFILE | O_RDWR | O_CLOEXEC, 0600));
  if (!fd_) {
    fd_.reset(::openat(dirFd, fallbackName.c_str(), O_RDWR | O_CREAT | O_EXCL | O_NOFOLLOW | O_CLOEXEC, 0600));
    if (!fd_) {
      *error = "cannot create the manifest: " + errnoText(errno);
      return false;
    }
    ::unlinkat(dirFd, fallbackName.c_str(), 0);
  }
  return true;
}

void Manifest::header(const CollectRequest& request, const std::string& timestamp, std::time_t when,
                      const DeviceFacts& facts) {
  char iso[64];
  std::tm local{};
  localtime_r(&when, &local);
  std::strftime(iso, sizeof iso, "%Y-%m-%dT%H:%M:%S%z", &local);
  line("action: " + std::string(actionName(request.action)));
  line("reason: " + oneLine(request.reason, kReasonLimit));
  line("timestamp: " + timestamp);
  line("time: " + std::string(iso));
  for (const auto& [key, value] : facts.entries) line("device." + oneLine(key, 256) + ": " + oneLine(value, 256));
  line("files:");
}

void Manifest::stored(const std::string& path) { line("  " + oneLine(path, kPathLimit)); }

void Manifest::skipped(const std::string& path, const std::string& why) {
  line("  " + oneLine(path, kPathLimit) + "  [skipped: " + why + "]");
}

void Manifest::cut(const std::string& path, std::uint64_t storedBytes, std::uint64_t totalBytes) {
  line("  " + oneLine(path, kPathLimit) + "  [cut: " + std::to_string(storedBytes) + " of " +
       std::to_string(totalBytes) + " bytes stored, the collection's size limit reached]");
}

void Manifest::line(const std::string& text) {
  buffer_ += text;
  buffer_ += '\n';
  if (buffer_.size() >= kFlushAt) flush();
}

bool Manifest::flush() {
  size_t done = 0;
  while (error_.empty() && done < buffer_.size()) {
    ssize_t n = ::write(fd_.get(), buffer_.data() + done, buffer_.size() - done);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) {
      error_ = "cannot write the manifest: " + std::string(n < 0 ? errnoText(errno) : "no room");
      break;
    }
    done += static_cast<size_t>(n);
  }
  size_ += static_cast<off_t>(done);
  buffer_.clear();
  return error_.empty();
}

bool Manifest::finish(std::string* error) {
  if (!flush()) {
    *error = error_;
    return false;
  }
  return true;
}

}  // namespace vorn::server
