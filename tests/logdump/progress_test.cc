// SPDX-License-Identifier: MIT
// The progress line as the handlers use it: begun before the first request,
// ended before the first line of the result.
#include <gmock/gmock.h>

#include "logdump/export_progress.h"
#include "logdump_fixture.h"
#include "oslog/os_log_stream.h"
#include "tests/oslog/oslog_test_support.h"

namespace {

using xpc::object;

/// Writes where the line would begin and end into standard output, so that
/// the test sees them among the result lines.
struct MarkedProgress : Progress {
  void begin(Activity activity) override {
    std::cout << (activity == Activity::waitingForServer ? "[waiting]" : "[exporting]") << std::flush;
  }
  void setCount(std::uint64_t count) override { counts.push_back(count); }
  void end() override { std::cout << "[end]" << std::flush; }
  std::vector<std::uint64_t> counts;
};

using AHandlersProgress = LogdumpTest;

TEST_F(AHandlersProgress, EndsBeforeTheResultIsPrinted) {
  struct Case {
    std::string handler;
    FakeManager::Answer enabled;
    FakeManager::Answer dump;
    std::string firstLine;
  };
  const std::vector<Case> cases = {
      {"tel", property("1"), timestamp("T"), "Telephony log collection: Success"},
      {"bb", property("1"), timestamp("T"), "Baseband log collection: Success (Vorn running)"},
      {"bb", {vorn::status::kNoReply, object()}, {}, "Baseband log collection: Failed"},
      {"bb", property("0"), {}, "Baseband logs are not enabled"},
      {"bb", property("1"), {vorn::status::kCollectionFailed, object()}, "Baseband log collection: Failed"},
      {"bb", property("1"), {kResultServerNotRunning, object()}, "Baseband log collection: Success (Vorn not running)"},
  };
  // The helper is asked too when the server is down.
  device->buildKind = platform::BuildKind::internal;
  for (const auto& c : cases) {
    restart(std::make_shared<MarkedProgress>());
    manager->answer("GetTraceProperty", c.enabled);
    manager->answer("TraceDumpState", c.dump);
    const auto r = run(c.handler, {"x"});
    EXPECT_THAT(r.out, testing::StartsWith("[waiting][end]" + c.firstLine + "\n")) << c.handler;
    EXPECT_EQ(r.out.find('[', 1), r.out.find("[end]")) << c.firstLine << ": one line, ended once";
  }
}

TEST(AnExportsProgress, CountsFromTheStreamsStartToItsEnd) {
  std::vector<logstore::Event> events;
  for (int i = 0; i < 700; ++i) events.push_back(oslog_test::messageEvent(::time(nullptr) - 5, "Telhub", "m"));
  oslog_test::FakeStore store(oslog_test::FakeScript{events});
  oslog_test::TempDir dir;
  auto progress = std::make_shared<MarkedProgress>();
  logdump::ExportProgress observer(progress);
  testing::internal::CaptureStdout();
  EXPECT_TRUE(OsLogStream::putOsLogStreamToFile(store, dir.path + "/out.txt", {}, {}, 60,
                                                OsLogStream::kStreamTimeout, &observer));
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "[exporting][end]");
  EXPECT_THAT(progress->counts, testing::ElementsAre(256, 512, 700));
}

}  // namespace
