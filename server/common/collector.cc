// SPDX-License-Identifier: MIT
#include "server/common/collector.h"
#include "server/common/snapshot_scan.h"

#include <fcntl.h>
#include <unistd.h>

#include <cctype>
#include <cerrno>
#include <cstring>
#include <filesystem>
#include <memory>
#include <set>
#include <vector>

#include "platform/linux/fd.h"
#include "platform/protocol/protocol.h"
#include "server/common/archive_sink.h"
#include "server/common/device_facts.h"
#include "server/common/dir_stream.h"
#include "server/common/folder_sink.h"
#include "server/common/manifest.h"
#include "server/common/output_policy.h"
#include "server/common/source_walk.h"
#include "server/common/timestamp_naming.h"
#include "server/common/tree_removal.h"
#include "platform/linux/errno_text.h"

namespace vorn::server {

namespace {

struct Source {
  const char* from;  // a device path, resolved under the root
  const char* into;  // under the collection directory
};

std::vector<Source> sourcesFor(CollectAction action) {
  std::vector<Source> sources = {
      {protocol::kTelephonyLogFolder, "vorn"},
      {trace::kScratchFolder, "ZelmarBasebandManager"},
  };
  if (action == CollectAction::telephonyLogsWithCoredump) sources.push_back({protocol::kModemDumpFolder, "coredump"});
  return sources;
}

/// "/var/log/vorn/" -> "var/log/vorn": relative to the root's descriptor.
std::string relativeToRoot(const char* devicePath) {
  std::string rel = devicePath;
  while (!rel.empty() && rel.front() == '/') rel.erase(0, 1);
  while (!rel.empty() && rel.back() == '/') rel.pop_back();
  return rel;
}

std::string pickTimestamp(int folderFd, std::time_t when) {
  std::set<std::string> names;
  if (int fd = ::dup(folderFd); fd >= 0) {
    DirStream dir(fd);
    for (std::string name; dir.next(&name);) {
      if (name.rfind(trace::kLogDirPrefix, 0) == 0) names.insert(name);
    }
  }
  return uniqueTimestamp(formatTimestamp(when), [&](const std::string& ts) {
    for (const auto& name : names) {
      if (nameUsesTimestamp(name, ts)) return true;
    }
    return false;
  });
}

Fd openFolder(const std::string& path) {
  return Fd(::open(path.c_str(), O_RDONLY | O_DIRECTORY | O_CLOEXEC));
}

}  // namespace

std::string directorySuffix(CollectAction action, int vendor) {
  switch (action) {
    case CollectAction::telephonyLogs: return trace::kTelephonyDirSuffix;
    case CollectAction::telephonyLogsWithCoredump: return trace::coreDumpDirSuffix(vendor);
    case CollectAction::basebandLogs: return trace::basebandTraceDirSuffix(vendor);
  }
  return trace::kTelephonyDirSuffix;
}

bool nameUsesTimestamp(const std::string& name, const std::string& ts) {
  std::string stem = trace::kLogDirPrefix + ts;
  if (name.compare(0, stem.size(), stem) != 0) return false;
  if (name.size() == stem.size()) return true;
  char next = name[stem.size()];
  if (next == '.') return true;
  if (next != '-') return false;
  return name.size() == stem.size() + 1 || !std::isdigit(static_cast<unsigned char>(name[stem.size() + 1]));
}

void Collector::removeLeftovers() const {
  Fd folder = openFolder(snapshotFolder(root_));
  if (folder) removePartialLeftovers(folder.get());
}

CollectOutcome Collector::collect(const CollectRequest& request, const std::atomic<bool>& cancel) {
  CollectOutcome outcome;
  const std::string folderPath = snapshotFolder(root_);
  std::error_code ec;
  std::filesystem::create_directories(folderPath, ec);
  Fd folder = openFolder(folderPath);
  Fd root = openFolder(root_);
  if (!folder || !root) {
    outcome.error = "cannot open " + (folder ? root_ : folderPath) + ": " + errnoText(errno);
    return outcome;
  }
  removePartialLeftovers(folder.get());

  const DeviceFacts facts = loadDeviceFacts(root_);
  const std::time_t when = options_.clock();
  const std::string ts = pickTimestamp(folder.get(), when);
  const std::string dirName = trace::kLogDirPrefix + ts + directorySuffix(request.action, facts.vendor);
  const std::optional<gid_t> group = outputGroup();

  std::string finalName;
  std::unique_ptr<TreeSink> sink;
  std::string error;
  if (request.compression == Compression::none) {
    finalName = dirName;
    sink = FolderSink::create(folder.get(), "." + dirName + ".partial", group, &error);
  } else {
    const auto format = request.compression == Compression::tar ? ArchiveFormat::tar : ArchiveFormat::tarGz;
    finalName = trace::kLogDirPrefix + ts + (format == ArchiveFormat::tar ? ".tar" : ".tar.gz");
    // Built under a hidden name so that nothing incomplete ever carries a
    // collection's name.
    sink = ArchiveSink::create(folder.get(), "." + finalName + ".partial", dirName, format, group, &error);
  }
  if (!sink) {
    outcome.error = error;
    return outcome;
  }

  Manifest manifest;
  bool ok = manifest.open(folder.get(), "." + dirName + ".manifest.partial", &error);
  if (ok) manifest.header(request, ts, when, facts);
  SourceWalk walk(*sink, manifest, options_.maxBytes, cancel);
  walk.beforeOpen = options_.beforeOpen;
  for (const auto& source : sourcesFor(request.action)) {
    if (!ok) break;
    ok = walk.walkSource(root.get(), relativeToRoot(source.from), source.into, &error);
  }
  ok = ok && manifest.finish(&error) && sink->addManifest(manifest.fd(), manifest.size(), &error) &&
       sink->commit(finalName, &error);
  if (!ok) {
    sink->abandon();
    outcome.error = error;
    return outcome;
  }
  outcome.ok = true;
  outcome.timestamp = ts;
  return outcome;
}

}  // namespace vorn::server
