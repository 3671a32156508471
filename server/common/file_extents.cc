// SPDX-License-Identifier: MIT
#include "server/common/file_extents.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>

namespace vorn::server {

std::vector<Extent> dataExtents(int fd, off_t size) {
  std::vector<Extent> extents;
  off_t pos = 0;
  while (pos < size) {
    off_t data = ::lseek(fd, pos, SEEK_DATA);
    if (data < 0) {
      // ENXIO: only a hole is left. Anything else: no extent support here,
      // so read the rest as data.
      if (errno != ENXIO) extents.push_back({pos, size - pos});
      break;
    }
    if (data >= size) break;
    off_t hole = ::lseek(fd, data, SEEK_HOLE);
    if (hole < 0 || hole > size) hole = size;
    if (hole <= data) hole = size;
    extents.push_back({data, hole - data});
    pos = hole;
  }
  return extents;
}

StoredPart fitToBudget(const std::vector<Extent>& extents, off_t size, std::uint64_t* budget) {
  StoredPart part;
  part.size = size;
  for (const auto& e : extents) {
    const auto take = std::min<std::uint64_t>(static_cast<std::uint64_t>(e.length), *budget);
    if (take > 0) part.extents.push_back({e.offset, static_cast<off_t>(take)});
    part.bytes += take;
    *budget -= take;
    if (take < static_cast<std::uint64_t>(e.length)) {
      part.cut = true;
      part.size = e.offset + static_cast<off_t>(take);
      break;
    }
  }
  return part;
}

}  // namespace vorn::server
