// SPDX-License-Identifier: MIT
#pragma once

#include <locale.h>

#include <memory>
#include <optional>
#include <string>
#include <vector>

#include "platform/linux/fd.h"
#include "server/common/byte_sink.h"
#include "server/common/tree_sink.h"

struct archive;

/// Streams the sources straight into a tar or tar.gz archive (restricted
/// pax, libarchive), each file read once from its descriptor. The archive
/// is written under a hidden temporary name in the snapshot folder and
/// renamed when complete, so no reader ever finds half an archive under a
/// collection's name. Names go in as bytes: a name that is not UTF-8 is
/// stored as it is, whatever the daemon's locale. Sparse files are stored
/// as sparse entries.
namespace vorn::server {

enum class ArchiveFormat { tar, tarGz };

class ArchiveSink : public TreeSink {
 public:
  /// Starts `partialName` in the folder `dirFd` (which must outlive the
  /// sink); entries are named "<entryPrefix>/...". Null, with `error` set,
  /// when it cannot.
  static std::unique_ptr<ArchiveSink> create(int dirFd, const std::string& partialName, const std::string& entryPrefix,
                                             ArchiveFormat format, std::optional<gid_t> group, std::string* error);
  ~ArchiveSink() override;

  bool enterFolder(const std::string& name, const struct stat& st, std::string* error) override;
  bool leaveFolder(std::string* error) override;
  bool addFile(const std::string& name, const SourceFile& file, const std::atomic<bool>& cancel,
               std::string* error) override;
  bool addManifest(int fd, off_t size, std::string* error) override;
  bool commit(const std::string& finalName, std::string* error) override;
  void abandon() override;

 private:
  ArchiveSink(int dirFd, std::string partialName, std::optional<gid_t> group);
  static ssize_t onWrite(struct archive* a, void* self, const void* buffer, size_t length);
  bool start(const std::string& entryPrefix, ArchiveFormat format, std::string* error);
  bool header(const std::string& name, mode_t type, mode_t perm, off_t size, const struct timespec& mtime,
              const std::vector<Extent>* sparse, std::string* error);
  bool data(const void* buffer, size_t length, std::string* error);
  bool zeros(off_t length, std::string* error);
  bool fileData(const SourceFile& file, const std::atomic<bool>& cancel, std::string* error);
  std::string entryName(const std::string& name) const;
  std::string archiveError(const std::string& what) const;

  int dirFd_;
  std::string partialName_;
  std::optional<gid_t> group_;
  Fd fd_;
  locale_t utf8_ = nullptr;
  locale_t previous_ = nullptr;
  struct archive* archive_ = nullptr;
  std::unique_ptr<ByteSink> file_;
  std::unique_ptr<ByteSink> gzip_;
  ByteSink* out_ = nullptr;
  std::vector<std::string> path_;
  std::vector<char> buffer_;
  bool done_ = false;
  bool discard_ = false;
};

}  // namespace vorn::server
