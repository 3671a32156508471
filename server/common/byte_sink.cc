// SPDX-License-Identifier: MIT
#include "server/common/byte_sink.h"
#include "platform/linux/errno_text.h"

#include <unistd.h>

#include <cerrno>
#include <cstring>

namespace vorn::server {

bool FdByteSink::write(const void* data, size_t size) {
  const auto* p = static_cast<const char*>(data);
  while (error_.empty() && size > 0) {
    ssize_t n = ::write(fd_, p, size);
    if (n < 0 && errno == EINTR) continue;
    if (n <= 0) {
      error_ = n < 0 ? errnoText(errno) : "no room";
      break;
    }
    p += n;
    size -= static_cast<size_t>(n);
  }
  return error_.empty();
}

}  // namespace vorn::server
