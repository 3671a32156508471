// SPDX-License-Identifier: MIT
// Archive writing and whole collections on a real temporary root.
#include <gtest/gtest.h>

#include <algorithm>
#include <atomic>
#include <set>
#include <filesystem>
#include <vector>

#include "archive_listing.h"
#include "server/common/archive_writer.h"
#include "server/common/collector.h"
#include "server/common/timestamp_naming.h"
#include "temp_dir.h"

using namespace vorn::server;
namespace fs = std::filesystem;

namespace {

std::vector<std::string> folderNames(const fs::path& dir) {
  std::vector<std::string> names;
  std::error_code ec;
  for (fs::directory_iterator it(dir, ec); !ec && it != fs::directory_iterator(); it.increment(ec)) {
    names.push_back(it->path().filename().string());
  }
  std::sort(names.begin(), names.end());
  return names;
}

std::vector<std::string> keys(const ArchiveListing& l) {
  std::vector<std::string> out;
  for (const auto& [k, v] : l.entries) out.push_back(k);
  return out;
}

}  // namespace

class ArchiveWriter : public ::testing::Test {
 protected:
  void SetUp() override {
    src.write("a.log", "alpha\n");
    src.write("sub/b.log", std::string(100000, 'b'));
    fs::create_symlink("/etc/passwd", src.path() / "link");
  }
  ArchiveJob job(ArchiveFormat format, const std::string& name) {
    ArchiveJob j;
    j.sourceDir = src.path();
    j.entryPrefix = "log-bb-T-tel";
    j.format = format;
    j.finalPath = (out.path() / name).string();
    return j;
  }
  TempDir src, out;
  std::atomic<bool> cancel{false};
};

TEST_F(ArchiveWriter, ListsFoldersAndRegularFilesOnly) {
  std::vector<std::string> entries;
  std::string error;
  ASSERT_TRUE(listTree(src.path(), &entries, &error)) << error;
  EXPECT_EQ(entries, (std::vector<std::string>{"a.log", "sub", "sub/b.log"}));
}

TEST_F(ArchiveWriter, PacksEntriesUnderThePrefixInBothFormats) {
  struct Case {
    ArchiveFormat format;
    const char* name;
    int filter;
  } cases[] = {{ArchiveFormat::tarGz, "x.tar.gz", ARCHIVE_FILTER_GZIP}, {ArchiveFormat::tar, "x.tar", ARCHIVE_FILTER_NONE}};
  for (const auto& c : cases) {
    auto j = job(c.format, c.name);
    std::string error;
    ASSERT_TRUE(listTree(src.path(), &j.entries, &error));
    ASSERT_TRUE(writeArchive(j, cancel, &error)) << error;
    auto listing = listArchive(j.finalPath);
    ASSERT_TRUE(listing.readable) << c.name;
    EXPECT_EQ(listing.filter, c.filter) << c.name;
    EXPECT_EQ(keys(listing), (std::vector<std::string>{"log-bb-T-tel/a.log", "log-bb-T-tel/sub/",
                                                       "log-bb-T-tel/sub/b.log"}));
    EXPECT_EQ(listing.entries["log-bb-T-tel/a.log"], "alpha\n");
    EXPECT_EQ(listing.entries["log-bb-T-tel/sub/b.log"].size(), 100000u);
  }
  EXPECT_EQ(folderNames(out.path()), (std::vector<std::string>{"x.tar", "x.tar.gz"}));
}

TEST_F(ArchiveWriter, FailureLeavesNothingUnderEitherName) {
  struct Case {
    const char* label;
    std::vector<std::string> entries;
    std::string finalPath;
    bool cancelled;
  } cases[] = {
      // The archive is half written when the vanished source is reached.
      {"source vanished", {"a.log", "sub", "sub/b.log", "gone.log"}, (out.path() / "x.tar.gz").string(), false},
      {"destination missing", {"a.log"}, (out.path() / "no/such/dir/x.tar.gz").string(), false},
      {"destination not writable", {"a.log"}, "/proc/x.tar.gz", false},
      {"cancelled", {"a.log", "sub/b.log"}, (out.path() / "x.tar.gz").string(), true},
  };
  for (const auto& c : cases) {
    auto j = job(ArchiveFormat::tarGz, "unused");
    j.entries = c.entries;
    j.finalPath = c.finalPath;
    cancel = c.cancelled;
    std::string error;
    EXPECT_FALSE(writeArchive(j, cancel, &error)) << c.label;
    EXPECT_FALSE(error.empty()) << c.label;
    EXPECT_FALSE(fs::exists(c.finalPath)) << c.label;
    EXPECT_FALSE(fs::exists(partialArchivePath(c.finalPath))) << c.label;
  }
  EXPECT_TRUE(folderNames(out.path()).empty());
}

class CollectorOnRoot : public ::testing::Test {
 protected:
  void SetUp() override {
    root.write("etc/vorn/device.conf", "radio=1\nvendor=2\nbuild=internal\n");
    root.write("var/log/vorn/telhub.log", "tel\n");
    root.write("var/wireless/Library/Logs/ZelmarBasebandManager/bb/trace.log", "bb\n");
    root.write("var/lib/vorn/modem/ram.bin", "core");
  }
  CollectOutcome collect(CollectAction action, Compression compression, const std::string& reason = "r") {
    Collector collector(root.path(), [] { return std::time_t{1700000000}; });
    CollectRequest request{action, compression, reason};
    return collector.collect(request, cancel);
  }
  fs::path folder() const { return snapshotFolder(root.path()); }
  TempDir root;
  std::atomic<bool> cancel{false};
};

TEST_F(CollectorOnRoot, TelephonyArchiveHoldsManifestAndBothLogFolders) {
  auto outcome = collect(CollectAction::telephonyLogs, Compression::tarGz, "line one\nline two");
  ASSERT_TRUE(outcome.ok) << outcome.error;
  const std::string ts = outcome.timestamp;
  ASSERT_TRUE(parseTimestamp(ts).has_value()) << ts;
  EXPECT_EQ(folderNames(folder()), std::vector<std::string>{"log-bb-" + ts + ".tar.gz"});
  auto listing = listArchive(folder() / ("log-bb-" + ts + ".tar.gz"));
  ASSERT_TRUE(listing.readable);
  const std::string dir = "log-bb-" + ts + "-tel/";
  EXPECT_EQ(keys(listing),
            (std::vector<std::string>{dir + "ZelmarBasebandManager/", dir + "ZelmarBasebandManager/bb/",
                                      dir + "ZelmarBasebandManager/bb/trace.log", dir + "manifest.txt",
                                      dir + "vorn/", dir + "vorn/telhub.log"}));
  const std::string manifest = listing.entries[dir + "manifest.txt"];
  EXPECT_NE(manifest.find("action: CollectTelephonyLogs\n"), std::string::npos) << manifest;
  // The reason cannot break the manifest's line structure.
  EXPECT_NE(manifest.find("reason: line one?line two\n"), std::string::npos) << manifest;
  EXPECT_NE(manifest.find("device.vendor: 2\n"), std::string::npos) << manifest;
  EXPECT_NE(manifest.find("  vorn/telhub.log\n"), std::string::npos) << manifest;
}

TEST_F(CollectorOnRoot, NamesFollowActionVendorAndCompression) {
  struct Case {
    const char* vendor;
    CollectAction action;
    Compression compression;
    std::string ending;
    const char* mustHold;
  } cases[] = {
      {"2", CollectAction::basebandLogs, Compression::none, "-bb-trace", "ZelmarBasebandManager/bb/trace.log"},
      {"1", CollectAction::basebandLogs, Compression::none, "-diag", "manifest.txt"},
      {"2", CollectAction::telephonyLogsWithCoredump, Compression::none, "-coredump", "coredump/ram.bin"},
      {"0", CollectAction::telephonyLogsWithCoredump, Compression::none, "-cd", "coredump/ram.bin"},
      {"2", CollectAction::telephonyLogsWithCoredump, Compression::tar, ".tar", nullptr},
  };
  for (const auto& c : cases) {
    root.write("etc/vorn/device.conf", std::string("vendor=") + c.vendor + "\n");
    auto outcome = collect(c.action, c.compression);
    ASSERT_TRUE(outcome.ok) << outcome.error;
    fs::path made = folder() / ("log-bb-" + outcome.timestamp + c.ending);
    EXPECT_TRUE(fs::exists(made)) << made;
    if (c.mustHold) {
      EXPECT_TRUE(fs::is_regular_file(made / c.mustHold)) << made / c.mustHold;
    }
  }
  // The same clock second five times: every collection got its own name.
  std::set<std::string> names;
  for (const auto& n : folderNames(folder())) names.insert(n);
  EXPECT_EQ(names.size(), 5u);
}

TEST_F(CollectorOnRoot, SameSecondCollectionsGetCounters) {
  std::vector<std::string> got;
  for (int i = 0; i < 3; ++i) {
    auto outcome = collect(i == 1 ? CollectAction::basebandLogs : CollectAction::telephonyLogs,
                           i == 2 ? Compression::tar : Compression::tarGz);
    ASSERT_TRUE(outcome.ok) << outcome.error;
    got.push_back(outcome.timestamp);
  }
  const std::string base = got[0];
  EXPECT_EQ(got, (std::vector<std::string>{base, base + "-2", base + "-3"}));
}

TEST_F(CollectorOnRoot, UnreadableSourceFailsAndLeavesNothing) {
  fs::remove_all(root.path() / "var/log/vorn");
  root.write("var/log/vorn", "a file where a folder belongs");
  for (auto compression : {Compression::none, Compression::tarGz}) {
    auto outcome = collect(CollectAction::telephonyLogs, compression);
    EXPECT_FALSE(outcome.ok);
    EXPECT_NE(outcome.error.find("var/log/vorn"), std::string::npos) << outcome.error;
    EXPECT_TRUE(folderNames(folder()).empty());
  }
}

TEST_F(CollectorOnRoot, MissingSourcesAreEmptyAndCancelStops) {
  fs::remove_all(root.path() / "var/log/vorn");
  auto outcome = collect(CollectAction::telephonyLogs, Compression::none);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  fs::path made = folder() / ("log-bb-" + outcome.timestamp + "-tel");
  EXPECT_FALSE(fs::exists(made / "vorn"));
  EXPECT_TRUE(fs::exists(made / "ZelmarBasebandManager"));

  cancel = true;
  outcome = collect(CollectAction::basebandLogs, Compression::tarGz);
  EXPECT_FALSE(outcome.ok);
  EXPECT_EQ(folderNames(folder()).size(), 1u);  // only the first collection
}
