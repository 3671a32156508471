// SPDX-License-Identifier: MIT
// An export's progress on the tool's line (a collection's is checked with
// its result).
#include <gmock/gmock.h>

#include "logdump/export_progress.h"
#include "logdump_fixture.h"
#include "oslog/os_log_stream.h"
#include "tests/oslog/oslog_test_support.h"

namespace {

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
