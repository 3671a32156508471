// SPDX-License-Identifier: MIT
// Collections on a scratch platform root: what a log folder's owner can do to
// them, and what comes out, in each of the three forms.
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <random>
#include <sstream>

#include "server/common/collector.h"
#include "server/common/snapshot_scan.h"
#include "server/common/timestamp_naming.h"
#include "server/common/tree_removal.h"
#include "tests/server/collection_reader.h"
#include "tests/support/file_size_limit.h"

namespace fs = std::filesystem;
using vorn::server::CollectAction;
using vorn::server::Collector;
using vorn::server::CollectOutcome;
using vorn::server::Compression;
using vorn::test::CollectedItem;

namespace {

constexpr char kSecret[] = "TOP-SECRET-ROOT-ONLY";
constexpr off_t kGiB = off_t{1} << 30;

std::string slurp(const fs::path& path) {
  std::ifstream in(path, std::ios::binary);
  std::ostringstream text;
  text << in.rdbuf();
  return text.str();
}

std::string noise(size_t size, unsigned seed) {
  std::mt19937 random(seed);
  std::string out(size, '\0');
  // Log-like: compressible, but not to nothing.
  for (auto& c : out) c = static_cast<char>('a' + random() % 16);
  return out;
}

class CollectorTest : public ::testing::Test {
 protected:
  void SetUp() override {
    char pattern[] = "/tmp/vorn-collector.XXXXXX";
    ASSERT_NE(mkdtemp(pattern), nullptr);
    root_ = pattern;
  }
  void TearDown() override {
    // Trees deeper than PATH_MAX defeat std::filesystem.
    int fd = ::open("/tmp", O_RDONLY | O_DIRECTORY);
    vorn::server::removeEntryAt(fd, fs::path(root_).filename().string());
    ::close(fd);
  }

  fs::path logs() const { return fs::path(root_) / "var/log/vorn"; }
  fs::path snapshots() const { return vorn::server::snapshotFolder(root_); }

  void write(const fs::path& path, const std::string& data, mode_t mode = 0644) const {
    fs::create_directories(path.parent_path());
    std::ofstream(path, std::ios::binary) << data;
    ::chmod(path.c_str(), mode);
  }

  CollectOutcome collect(Compression compression, Collector::Options options = {}) {
    options.clock = [] { return std::time_t{1700000000}; };
    std::atomic<bool> cancel{false};
    Collector collector(root_, std::move(options));
    CollectOutcome outcome = collector.collect({CollectAction::telephonyLogs, compression, {}}, cancel);
    prefix_ = "log-bb-" + outcome.timestamp + "-tel";
    const char* extension = compression == Compression::tar ? ".tar" : ".tar.gz";
    output_ = snapshots() / (compression == Compression::none ? prefix_ : "log-bb-" + outcome.timestamp + extension);
    return outcome;
  }

  std::map<std::string, CollectedItem> items() const {
    std::string error;
    auto out = vorn::test::readCollection(output_, &error);
    EXPECT_EQ(error, "");
    return out;
  }

  std::string path(const std::string& rel) const { return prefix_ + "/" + rel; }

  std::set<std::string> snapshotNames() const {
    std::set<std::string> names;
    for (const auto& e : fs::directory_iterator(snapshots())) names.insert(e.path().filename().string());
    return names;
  }

  std::string root_;
  std::string prefix_;
  fs::path output_;
};

struct Form {
  const char* name;
  Compression compression;
};

void PrintTo(const Form& form, std::ostream* os) { *os << form.name; }

class CollectionForms : public CollectorTest, public ::testing::WithParamInterface<Form> {};

TEST_P(CollectionForms, AnEntrySwappedAfterTheListingIsSkippedNotFollowed) {
  write(root_ + "/secret.txt", kSecret, 0600);
  write(root_ + "/outside/secret.txt", kSecret, 0600);
  write(logs() / "a.log", "a");
  write(logs() / "swap.log", "innocent");
  write(logs() / "fifo.log", "innocent");
  write(logs() / "sub/b.log", "b");
  fs::create_symlink(root_ + "/secret.txt", logs() / "link.log");
  ASSERT_EQ(::mkfifo((logs() / "pipe").c_str(), 0600), 0);

  Collector::Options options;
  // Between the listing and the open, as the folder's owner would.
  options.beforeOpen = [&](int dirFd, const std::string& name) {
    if (name == "swap.log") {
      ::unlinkat(dirFd, name.c_str(), 0);
      ::symlinkat((root_ + "/secret.txt").c_str(), dirFd, name.c_str());
    } else if (name == "fifo.log") {
      ::unlinkat(dirFd, name.c_str(), 0);
      ::mkfifoat(dirFd, name.c_str(), 0600);
    } else if (name == "sub") {
      ::renameat(dirFd, "sub", dirFd, "sub.moved");
      ::symlinkat((root_ + "/outside").c_str(), dirFd, "sub");
    }
  };
  auto outcome = collect(GetParam().compression, options);
  ASSERT_TRUE(outcome.ok) << outcome.error;

  auto found = items();
  EXPECT_EQ(found[path("vorn/a.log")].content(), "a");
  for (const auto& [name, item] : found) {
    EXPECT_EQ(item.content().find(kSecret), std::string::npos) << name;
  }
  for (const char* gone : {"vorn/swap.log", "vorn/fifo.log", "vorn/link.log", "vorn/pipe", "vorn/sub/secret.txt"}) {
    EXPECT_EQ(found.count(path(gone)), 0u) << gone;
  }
  const std::string manifest = found[path("manifest.txt")].content();
  for (const char* line : {"  vorn/swap.log  [skipped: symbolic link]", "  vorn/fifo.log  [skipped: FIFO]",
                           "  vorn/link.log  [skipped: symbolic link]", "  vorn/pipe  [skipped: FIFO]",
                           "  vorn/sub/  [skipped: "}) {
    EXPECT_NE(manifest.find(line), std::string::npos) << line << "\n" << manifest;
  }
}

TEST_P(CollectionForms, OutputsAreNoMoreOpenThanTheirSources) {
  write(logs() / "private.log", "p", 0600);
  write(logs() / "shared.log", "s", 0644);
  write(logs() / "tool.sh", "t", 0755);
  ::chmod(logs().c_str(), 0700);
  auto outcome = collect(GetParam().compression);
  ASSERT_TRUE(outcome.ok) << outcome.error;

  struct stat st {};
  ASSERT_EQ(::stat(output_.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 07777, GetParam().compression == Compression::none ? 0750u : 0640u);
  auto found = items();
  const std::map<std::string, mode_t> expected = {{prefix_, 0750},
                                                  {path("vorn"), 0750},
                                                  {path("vorn/private.log"), 0600},
                                                  {path("vorn/shared.log"), 0640},
                                                  {path("vorn/tool.sh"), 0640},
                                                  {path("manifest.txt"), 0640}};
  for (const auto& [name, perms] : expected) {
    ASSERT_EQ(found.count(name), 1u) << name;
    EXPECT_EQ(found[name].perms, perms) << name;
  }
}

TEST_P(CollectionForms, NamesGoInAsTheirBytes) {
  // Whatever the locale: these tests run in "C".
  const std::vector<std::string> names = {"\xC3\xA9t\xC3\xA9.log", "bad\xFF.log", "e\xCC\x81.log"};
  for (const auto& name : names) write(logs() / name, "data of " + name);
  auto outcome = collect(GetParam().compression);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  auto found = items();
  for (const auto& name : names) {
    ASSERT_EQ(found.count(path("vorn/" + name)), 1u) << name;
    EXPECT_EQ(found[path("vorn/" + name)].content(), "data of " + name);
  }
}

TEST_P(CollectionForms, ATreeDeeperThanPathMaxIsCollectedDownToTheDepthLimit) {
  // 70 folders of 100 bytes: some 7,000 bytes of path, built relative to
  // each parent since no path call reaches that deep.
  const std::string level(100, 'd');
  ASSERT_TRUE(fs::create_directories(logs()));
  int fd = ::open(logs().c_str(), O_RDONLY | O_DIRECTORY);
  for (int i = 1; i <= 70; ++i) {
    ASSERT_EQ(::mkdirat(fd, level.c_str(), 0755), 0) << i;
    int next = ::openat(fd, level.c_str(), O_RDONLY | O_DIRECTORY);
    ::close(fd);
    fd = next;
    int file = ::openat(fd, "f.log", O_WRONLY | O_CREAT, 0644);
    const std::string text = std::to_string(i);
    ASSERT_EQ(::write(file, text.data(), text.size()), ssize_t(text.size()));
    ::close(file);
  }
  ::close(fd);

  auto outcome = collect(GetParam().compression);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  // "vorn" is the first of the 64 folders a walk enters: 63 levels below it.
  std::string deepest = "vorn", tooDeep;
  for (int i = 1; i <= 63; ++i) deepest += "/" + level;
  tooDeep = deepest + "/" + level;
  ASSERT_GT(path(deepest).size(), size_t(PATH_MAX));
  auto found = items();
  EXPECT_EQ(found[path(deepest + "/f.log")].content(), "63");
  EXPECT_EQ(found.count(path(tooDeep)), 0u);
  EXPECT_NE(found[path("manifest.txt")].content().find(tooDeep + "/  [skipped: deeper than 64 folders]"),
            std::string::npos);
}

TEST_P(CollectionForms, SparseFilesAreStoredByWhatTheyHold) {
  const fs::path sparse = logs() / "sparse.bin";
  write(sparse, "");
  {
    int fd = ::open(sparse.c_str(), O_WRONLY);
    ASSERT_EQ(::ftruncate(fd, 2 * kGiB), 0);
    ASSERT_EQ(::pwrite(fd, "hello", 5, kGiB), 5);
    ::close(fd);
  }
  write(logs() / "hole.bin", "");
  ASSERT_EQ(::truncate((logs() / "hole.bin").c_str(), kGiB), 0);
  auto outcome = collect(GetParam().compression);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  if (GetParam().compression != Compression::none) {
    EXPECT_LT(fs::file_size(output_), 1u << 20);
  }
  auto found = items();
  const CollectedItem& item = found[path("vorn/sparse.bin")];
  EXPECT_EQ(item.size, 2 * kGiB);
  EXPECT_LT(item.stored, 1 << 20);
  EXPECT_EQ(found[path("vorn/hole.bin")].size, kGiB);
  EXPECT_EQ(found[path("vorn/hole.bin")].stored, 0);
  std::string data;
  for (const auto& [offset, bytes] : item.blocks) {
    if (offset <= kGiB && kGiB < offset + off_t(bytes.size())) data = bytes.substr(size_t(kGiB - offset), 5);
  }
  EXPECT_EQ(data, "hello");
}

TEST_P(CollectionForms, AWriteThatFailsPartWayLeavesNothingBehind) {
  // Random bytes do not compress, so every form outgrows a limit of 1 MiB;
  // tar.gz, with two cores or more, when it writes its last blocks as it
  // finishes.
  std::mt19937 random(3);
  std::string data(3 << 20, '\0');
  for (auto& c : data) c = static_cast<char>(random());
  write(logs() / "big.log", data);
  fs::create_directories(snapshots());
  CollectOutcome outcome;
  {
    vorn::test::FileSizeLimit disk(1 << 20);
    outcome = collect(GetParam().compression);
  }
  EXPECT_FALSE(outcome.ok);
  EXPECT_NE(outcome.error.find("File too large"), std::string::npos) << outcome.error;
  EXPECT_EQ(snapshotNames(), std::set<std::string>{});
}

TEST_P(CollectionForms, ANameTakenBeforeTheRenameFailsTheCollectionAndIsLeftAlone) {
  write(logs() / "a.log", "a");
  const bool folder = GetParam().compression == Compression::none;
  std::string squatter;
  Collector::Options options;
  // While the output is written, somebody takes its final name with what a
  // plain rename would replace: a file, or an empty folder.
  options.beforeOpen = [&](int, const std::string&) {
    for (const auto& name : snapshotNames()) {
      if (!name.ends_with(".partial") || name.find(".manifest.") != std::string::npos) continue;
      squatter = name.substr(1, name.size() - 1 - std::string(".partial").size());
      folder ? (void)fs::create_directory(snapshots() / squatter) : write(snapshots() / squatter, "theirs");
    }
  };
  auto outcome = collect(GetParam().compression, options);
  EXPECT_FALSE(outcome.ok);
  EXPECT_NE(outcome.error.find("cannot rename"), std::string::npos) << outcome.error;
  EXPECT_EQ(snapshotNames(), std::set<std::string>{squatter});
  if (folder) EXPECT_TRUE(fs::is_empty(snapshots() / squatter));
  else EXPECT_EQ(slurp(snapshots() / squatter), "theirs");
}

INSTANTIATE_TEST_SUITE_P(Collector, CollectionForms,
                         ::testing::Values(Form{"TarGz", Compression::tarGz}, Form{"Tar", Compression::tar},
                                           Form{"Folder", Compression::none}),
                         [](const auto& paramInfo) { return std::string(paramInfo.param.name); });

TEST_F(CollectorTest, TheSizeLimitCutsWhatIsBeyondItAndTheManifestSaysSo) {
  for (const char* name : {"a.log", "b.log", "c.log"}) write(logs() / name, noise(6000, name[0]));
  Collector::Options options;
  options.maxBytes = 10000;
  auto outcome = collect(Compression::tarGz, options);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  auto found = items();
  // The walk's order is the file system's: whole, cut, then left out.
  std::vector<size_t> sizes;
  for (const char* name : {"a.log", "b.log", "c.log"}) {
    if (!found.count(path(std::string("vorn/") + name))) continue;
    const std::string content = found[path(std::string("vorn/") + name)].content();
    EXPECT_EQ(content, noise(6000, name[0]).substr(0, content.size())) << name;
    sizes.push_back(content.size());
  }
  std::sort(sizes.begin(), sizes.end());
  EXPECT_EQ(sizes, (std::vector<size_t>{4000, 6000}));
  const std::string manifest = found[path("manifest.txt")].content();
  EXPECT_NE(manifest.find("[cut: 4000 of 6000 bytes stored"), std::string::npos) << manifest;
  EXPECT_NE(manifest.find("[cut: 0 of 6000 bytes stored"), std::string::npos) << manifest;
}

TEST_F(CollectorTest, CollectionsInTheSameSecondAreNumberedAndNoneReplacesAnother) {
  write(logs() / "a.log", "a");
  const std::string ts = vorn::server::formatTimestamp(1700000000);  // the fixture's clock
  std::vector<std::string> timestamps;
  std::set<std::string> outputs;
  for (auto compression : {Compression::tarGz, Compression::tarGz, Compression::tar, Compression::none}) {
    auto outcome = collect(compression);
    ASSERT_TRUE(outcome.ok) << outcome.error;
    timestamps.push_back(outcome.timestamp);
    outputs.insert(output_.filename().string());
  }
  EXPECT_EQ(timestamps, (std::vector<std::string>{ts, ts + "-2", ts + "-3", ts + "-4"}));
  EXPECT_EQ(outputs.size(), 4u);
  EXPECT_EQ(snapshotNames(), outputs);
}

TEST_F(CollectorTest, LeftoversOfAKilledRunGoWithoutFollowingTheirLinks) {
  write(root_ + "/keep/keep.txt", "keep");
  auto leave = [&] {
    write(snapshots() / ".log-bb-2020-01-01-000000.tar.gz.partial", "half");
    write(snapshots() / ".log-bb-2020-01-01-000000-tel.partial/vorn/deep/x.log", "half");
    fs::create_symlink(root_ + "/keep", snapshots() / ".log-bb-2020-01-01-000000-tel.partial/vorn/escape");
    fs::create_symlink(root_ + "/keep", snapshots() / ".link.partial");
  };
  write(snapshots() / "log-bb-2020-01-01-000000.tar.gz", "a finished one");
  write(snapshots() / ".hidden", "not ours");
  const std::set<std::string> kept = {"log-bb-2020-01-01-000000.tar.gz", ".hidden"};

  leave();
  Collector(root_).removeLeftovers();  // what vornd does as it starts
  EXPECT_EQ(snapshotNames(), kept);
  leave();
  auto outcome = collect(Compression::tarGz);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  auto after = snapshotNames();
  after.erase(output_.filename().string());
  EXPECT_EQ(after, kept);
  EXPECT_EQ(slurp(root_ + "/keep/keep.txt"), "keep");
}

TEST_F(CollectorTest, ArchivesListAndUnpackWithTheSystemTar) {
  // Several megabytes: several gzip members.
  write(logs() / "big.log", noise(5 << 20, 1));
  write(logs() / "\xC3\xA9t\xC3\xA9.log", "accent");
  write(root_ + "/var/wireless/Library/Logs/ZelmarBasebandManager/bb.log", noise(70000, 2));
  {
    int fd = ::open((logs() / "holes.bin").c_str(), O_WRONLY | O_CREAT, 0644);
    ASSERT_EQ(::pwrite(fd, "middle", 6, 8 << 20), 6);
    ASSERT_EQ(::ftruncate(fd, 16 << 20), 0);
    ::close(fd);
  }
  for (auto compression : {Compression::tarGz, Compression::tar}) {
    auto outcome = collect(compression);
    ASSERT_TRUE(outcome.ok) << outcome.error;
    const fs::path into = fs::path(root_) / ("unpacked-" + std::to_string(int(compression)));
    fs::create_directories(into);
    const std::string z = compression == Compression::tarGz ? "z" : "";
    const std::string list = (into / "list").string(), warnings = (into / "warnings").string();
    ASSERT_EQ(std::system(("tar -t" + z + "f '" + output_.string() + "' >'" + list + "' 2>'" + warnings + "'").c_str()),
              0);
    // UTF-8 names travel as standard pax records: no reader has to guess.
    EXPECT_EQ(slurp(warnings), "");
    ASSERT_EQ(std::system(("tar -x" + z + "f '" + output_.string() + "' -C '" + into.string() + "'").c_str()), 0);
    const std::string listed = slurp(list);
    EXPECT_NE(listed.find(path("vorn/\xC3\xA9t\xC3\xA9.log") + "\n"), std::string::npos) << listed;
    const fs::path out = into / prefix_;
    EXPECT_EQ(slurp(out / "vorn/big.log"), noise(5 << 20, 1));
    EXPECT_EQ(slurp(out / "vorn/\xC3\xA9t\xC3\xA9.log"), "accent");
    EXPECT_EQ(slurp(out / "ZelmarBasebandManager/bb.log"), noise(70000, 2));
    std::string holes = slurp(out / "vorn/holes.bin");
    EXPECT_EQ(holes.size(), size_t(16 << 20));
    EXPECT_EQ(holes.substr(8 << 20, 6), "middle");
    EXPECT_NE(slurp(out / "manifest.txt").find("  vorn/big.log\n"), std::string::npos);
  }
}

TEST_F(CollectorTest, AMissingSourceIsNothingLoggedYetButAFileInItsPlaceFails) {
  auto outcome = collect(Compression::tarGz);
  ASSERT_TRUE(outcome.ok) << outcome.error;
  auto found = items();
  EXPECT_EQ(found.count(path("vorn")), 0u);
  EXPECT_EQ(found.count(path("manifest.txt")), 1u);

  write(logs(), "a file where the folder belongs");
  for (auto compression : {Compression::tarGz, Compression::none}) {
    outcome = collect(compression);
    EXPECT_FALSE(outcome.ok);
    EXPECT_NE(outcome.error.find("not a folder"), std::string::npos) << outcome.error;
    EXPECT_FALSE(fs::exists(output_));
  }
}

}  // namespace
