// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <cstdint>
#include <vector>

/// The parts of a file that hold data, so that a sparse file is read and
/// stored by what it holds rather than by its apparent size.
namespace vorn::server {

struct Extent {
  off_t offset = 0;
  off_t length = 0;
  friend bool operator==(const Extent&, const Extent&) = default;
};

/// The data extents of the open file `fd` within [0, size), in order, found
/// with SEEK_DATA/SEEK_HOLE. A file system without them gives one extent
/// over the whole file.
std::vector<Extent> dataExtents(int fd, off_t size);

/// What of a file a collection stores once its byte budget is applied.
struct StoredPart {
  std::vector<Extent> extents;
  /// The logical size to store: the file's, or where the budget ran out.
  off_t size = 0;
  /// Data bytes stored, and whether some were left out.
  std::uint64_t bytes = 0;
  bool cut = false;
};

/// Takes the data of `extents` (a file of `size` bytes) in order until
/// `*budget` bytes are used, and lowers `*budget` by what it took. A file
/// that fits keeps its size, trailing hole included; one that does not is
/// cut where the budget ran out.
StoredPart fitToBudget(const std::vector<Extent>& extents, off_t size, std::uint64_t* budget);

}  // namespace vorn::server
