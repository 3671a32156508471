// SPDX-License-Identifier: MIT
// vornd and vorn-helper, built, on a private bus with the project's policy.
#include <gtest/gtest.h>
#include <unistd.h>

#include <random>

#include "platform/protocol/protocol.h"
#include "tests/server/daemons_fixture.h"

namespace fs = std::filesystem;
using namespace vorn::test;
using vorn::status::kBadRequest;
using vorn::status::kCollectionFailed;

namespace {

std::string noise(size_t size) {
  std::mt19937 random(7);
  std::string out(size, '\0');
  for (auto& c : out) c = static_cast<char>(random());
  return out;
}

std::string serverState() { return text(hello().response, "ServerState"); }

}  // namespace

TEST_F(Daemons, NocompressLeavesDirectoriesTheHelperReportsTheNewestOf) {
  start({VORND_PATH});
  start({VORN_HELPER_PATH}, [] { return diagsnapStatus(); });
  EXPECT_EQ(diagsnapStatus().status, kCollectionFailed);

  std::string newest;
  for (int i = 0; i < 2; ++i) {
    auto reply = perform("TraceDumpState", collect("CollectBasebandLogs", 0));
    ASSERT_EQ(reply.status, 0) << reply.error;
    newest = text(reply.response, "TimestampString");
    EXPECT_TRUE(fs::is_regular_file(folder() / ("log-bb-" + newest + "-bb-trace") / "manifest.txt")) << newest;
  }
  auto core = perform("TraceDumpState", collect("CollectTelephonyLogsWithCoredump", 0));
  ASSERT_EQ(core.status, 0) << core.error;
  EXPECT_EQ(fs::file_size(folder() / ("log-bb-" + text(core.response, "TimestampString") + "-coredump") /
                          "coredump/ram.bin"), 4u);
  // The core dump afterwards is not a baseband snapshot.
  auto found = diagsnapStatus();
  EXPECT_EQ(found.status, 0);
  EXPECT_EQ(text(found.response, "TimestampString"), newest);
  EXPECT_EQ(diagsnapStatus(3).status, kBadRequest);
  EXPECT_EQ(diagsnapStatus(4, "Other").status, kBadRequest);
}

// A collection that fails answers 0xE0200002 and leaves nothing behind.
struct Failure {
  const char* label;
  const char* file;  // written once the telephony logs are gone
  std::string data;
  std::vector<std::string> argv;
};

void PrintTo(const Failure& failure, std::ostream* os) { *os << failure.label; }

class FailedCollection : public Daemons, public ::testing::WithParamInterface<Failure> {};

TEST_P(FailedCollection, LeavesNoArchiveAndTheServerGoesOn) {
  fs::remove_all(root / "var/log/vorn");
  write(GetParam().file, GetParam().data);
  start(GetParam().argv);
  auto reply = perform("TraceDumpState", collect("CollectTelephonyLogsWithCoredump", 1));
  EXPECT_EQ(reply.status, kCollectionFailed) << reply.error;
  EXPECT_TRUE(reply.response.asEntries() == nullptr || reply.response.asEntries()->empty());
  EXPECT_EQ(namesIn(folder()), std::set<std::string>{});
  EXPECT_EQ(serverState(), "Started");
}

INSTANTIATE_TEST_SUITE_P(
    Daemons, FailedCollection,
    ::testing::Values(
        Failure{"UnreadableSource", "var/log/vorn", "a file where a folder belongs", {VORND_PATH}},
        // A file-size limit fails writes the way a full disk does; the data
        // must not compress below it.
        Failure{"NoRoom", "var/lib/vorn/modem/ram.bin", noise(1 << 20),
                {"/bin/sh", "-c", "ulimit -f 256 && exec \"$0\" \"$@\"", VORND_PATH}}),
    [](const auto& paramInfo) { return std::string(paramInfo.param.label); });
