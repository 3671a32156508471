// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <string>
#include <vector>

/// Packs a collection directory into a tar or tar.gz archive. The archive is
/// written under a temporary name beside the final one and renamed only when
/// complete, so a reader never finds a half-written archive under the final
/// name, whatever happens to the writer.
namespace vorn::server {

enum class ArchiveFormat { tar, tarGz };

struct ArchiveJob {
  std::string sourceDir;
  /// Name that the entries are stored under: "<prefix>/<relative path>".
  std::string entryPrefix;
  /// Paths relative to `sourceDir`, folders before their contents.
  std::vector<std::string> entries;
  ArchiveFormat format = ArchiveFormat::tarGz;
  std::string finalPath;
};

/// Writes the archive. False, with `error` set and no file left under either
/// name, when a source cannot be read, the destination cannot be written, or
/// `cancel` becomes true.
bool writeArchive(const ArchiveJob& job, const std::atomic<bool>& cancel, std::string* error);

/// The temporary name `writeArchive` uses for `finalPath`.
std::string partialArchivePath(const std::string& finalPath);

/// Every folder and regular file under `dir`, relative and sorted, folders
/// before their contents. Symbolic links and special files are left out:
/// reading a FIFO would block, and a link may point outside the root.
bool listTree(const std::string& dir, std::vector<std::string>* out, std::string* error);

}  // namespace vorn::server
