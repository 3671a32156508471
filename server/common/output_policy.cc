// SPDX-License-Identifier: MIT
#include "server/common/output_policy.h"
#include "platform/linux/errno_text.h"

#include <fcntl.h>
#include <grp.h>
#include <stdio.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <vector>

namespace vorn::server {

std::optional<gid_t> outputGroup() {
  struct group entry {};
  struct group* found = nullptr;
  std::vector<char> buffer(16 * 1024);
  // getgrnam is not thread-safe, and collections run on a thread of their own.
  if (getgrnam_r("vorn", &entry, buffer.data(), buffer.size(), &found) != 0 || found == nullptr) return std::nullopt;
  return found->gr_gid;
}

bool applyOutputPolicy(int fd, mode_t mode, std::optional<gid_t> group, const std::string& what,
                       std::string* error) {
  if (group && ::fchown(fd, static_cast<uid_t>(-1), *group) != 0) {
    *error = "cannot give " + what + " to the group vorn: " + errnoText(errno);
    return false;
  }
  // After the chown, which may clear set-id bits but never adds any.
  if (::fchmod(fd, mode) != 0) {
    *error = "cannot set the mode of " + what + ": " + errnoText(errno);
    return false;
  }
  return true;
}

bool publishAt(int dirFd, const std::string& partialName, const std::string& finalName, std::string* error) {
  int failed = ::renameat2(dirFd, partialName.c_str(), dirFd, finalName.c_str(), RENAME_NOREPLACE);
  // A file system without the flag: the name was free when it was chosen,
  // and only this daemon writes in its folder.
  if (failed != 0 && errno == EINVAL)
    failed = ::renameat(dirFd, partialName.c_str(), dirFd, finalName.c_str());
  if (failed == 0) return true;
  *error = errnoText("cannot rename " + partialName, errno);
  return false;
}

}  // namespace vorn::server
