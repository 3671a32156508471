// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <map>
#include <string>

/// Reads a collection back, whatever its form, for tests: an archive or a
/// folder, both through libarchive (never following links).
namespace vorn::test {

struct CollectedItem {
  bool folder = false;
  mode_t perms = 0;
  off_t size = 0;
  /// The non-hole data: offset -> bytes. A plain file has one block at 0.
  std::map<off_t, std::string> blocks;
  /// Data bytes, holes left out.
  off_t stored = 0;

  /// The content with holes as zeros; only for small files.
  std::string content() const;
};

/// Entry name (or path relative to the folder's parent) -> item; names are
/// bytes. An empty map, with `error` set, when the collection cannot be read.
std::map<std::string, CollectedItem> readCollection(const std::string& path, std::string* error);

}  // namespace vorn::test
