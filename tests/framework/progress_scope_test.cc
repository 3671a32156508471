// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "framework/progress.h"

namespace {

using Activity = Progress::Activity;
using testing::ElementsAre;

/// Records what a scope asks of the line.
struct RecordedProgress : Progress {
  void begin(Activity activity) override { calls.push_back(activity == Activity::exporting ? "export" : "wait"); }
  void setCount(std::uint64_t) override {}
  void end() override { calls.push_back("end"); }
  std::vector<std::string> calls;
};

TEST(AProgressScope, EndsItsActivityOnceAndNeverOneBegunAfterIt) {
  auto progress = std::make_shared<RecordedProgress>();
  {
    ProgressScope first(progress, Activity::waitingForServer);
    first.end();
    ProgressScope second(progress, Activity::exporting);
    first.end();
  }
  EXPECT_THAT(progress->calls, ElementsAre("wait", "end", "export", "end"));
}

}  // namespace
