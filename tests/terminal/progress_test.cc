// SPDX-License-Identifier: MIT
#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <chrono>
#include <condition_variable>
#include <cstdlib>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "terminal/progress_text.h"
#include "terminal/terminal_facts.h"
#include "terminal/terminal_progress.h"

namespace {

using namespace std::chrono_literals;
using Activity = Progress::Activity;
using terminal::TerminalProgress;
using testing::ElementsAre;
using testing::IsEmpty;

const std::string kClear = "\r\x1b[K";

// The line tests below pin the first spinner frame and an export's start.
TEST(ProgressText, SaysWhatIsGoingOnAndForHowLong) {
  struct Case {
    Activity activity;
    std::chrono::nanoseconds elapsed;
    std::uint64_t count;
    unsigned frame;
    std::string text;
  };
  const Case cases[] = {
      {Activity::waitingForServer, 999ms, 0, 1, "/ waiting for the server\u2026 0 s"},
      {Activity::waitingForServer, 1s, 0, 2, "- waiting for the server\u2026 1 s"},
      {Activity::waitingForServer, 12900ms, 7, 7, "\\ waiting for the server\u2026 12 s"},
      {Activity::waitingForServer, 3s, 0, 8, "| waiting for the server\u2026 3 s"},
      {Activity::exporting, 100ms, 1, 0, "exporting\u2026 1 entry, 10/s, 0 s"},
      {Activity::exporting, 1s, 999, 0, "exporting\u2026 999 entries, 999/s, 1 s"},
      {Activity::exporting, 1s, 123456, 0, "exporting\u2026 123,456 entries, 123k/s, 1 s"},
      {Activity::exporting, 2017ms, 1234567, 3, "exporting\u2026 1,234,567 entries, 612k/s, 2 s"},
      {Activity::exporting, 1ns, UINT64_MAX, 0,
       "exporting\u2026 18,446,744,073,709,551,615 entries, 1000000000000.0M/s, 0 s"},
  };
  for (const auto& c : cases)
    EXPECT_EQ(terminal::progressText(c.activity, c.elapsed, c.count, c.frame), c.text);
}

TEST(ProgressText, RatesAreShortAndRoundedDown) {
  const std::pair<double, const char*> rates[] = {
      {-5, "0/s"}, {999.9, "999/s"}, {1000, "1k/s"}, {999999.9, "999k/s"}, {1e6, "1.0M/s"}, {2599999, "2.5M/s"}};
  for (const auto& [rate, text] : rates) EXPECT_EQ(terminal::rateText(rate), text) << rate;
}

TEST(ProgressText, IsCutToTheColumnsWithoutBreakingACharacter) {
  const std::string text = "| waiting for the server\u2026 12 s";
  EXPECT_EQ(terminal::fitColumns(text, 30), text);
  EXPECT_EQ(terminal::fitColumns(text, 29), "| waiting for the server\u2026 12 ");
  EXPECT_EQ(terminal::fitColumns(text, 25), "| waiting for the server\u2026");
  EXPECT_EQ(terminal::fitColumns(text, 24), "| waiting for the server");
  EXPECT_EQ(terminal::fitColumns(text, 0), "");
}

/// A progress line with a clock the test moves and a screen it reads.
class AProgressLine : public testing::Test {
 protected:
  /// Moves the clock, then lets the line draw if it is due.
  void tickAfter(std::chrono::nanoseconds by) {
    now_ += by;
    line_.tick();
  }
  std::vector<std::string> takeWrites() { return std::exchange(writes_, {}); }

  std::chrono::steady_clock::time_point now_{std::chrono::hours(1)};
  std::size_t width_ = 80;
  std::vector<std::string> writes_;
  TerminalProgress line_{[this] { return now_; },
                         [this](std::string_view bytes) { writes_.emplace_back(bytes); },
                         [this] { return width_; }, /* ticker= */ false};
};

TEST_F(AProgressLine, RedrawsInPlaceAtMostTenTimesASecond) {
  line_.begin(Activity::waitingForServer);
  tickAfter(100ms);
  tickAfter(50ms);
  tickAfter(49ms);
  tickAfter(1ms);
  tickAfter(0ms);
  EXPECT_THAT(takeWrites(), ElementsAre(kClear + "| waiting for the server\u2026 0 s",
                                        kClear + "/ waiting for the server\u2026 0 s"));
  // A late tick draws once, with the time as it is then.
  tickAfter(12s);
  tickAfter(10ms);
  EXPECT_THAT(takeWrites(), ElementsAre(kClear + "- waiting for the server\u2026 12 s"));
}

TEST_F(AProgressLine, DrawsNothingForAQuickAnswerAndClearsALineOnceAtItsEnd) {
  line_.begin(Activity::waitingForServer);
  tickAfter(99ms);
  line_.end();
  tickAfter(1s);
  EXPECT_THAT(takeWrites(), IsEmpty());
  line_.begin(Activity::waitingForServer);
  tickAfter(200ms);
  takeWrites();
  line_.end();
  line_.end();
  tickAfter(1s);
  line_.setCount(5);
  tickAfter(1s);
  EXPECT_THAT(takeWrites(), ElementsAre(kClear));
}

TEST_F(AProgressLine, ANewActivityStartsItsTimeAndCountAfresh) {
  line_.begin(Activity::exporting);
  line_.setCount(900);
  tickAfter(5s);
  line_.begin(Activity::waitingForServer);
  tickAfter(50ms);
  line_.begin(Activity::exporting);
  tickAfter(100ms);
  EXPECT_THAT(takeWrites(), ElementsAre(kClear + "exporting\u2026 900 entries, 180/s, 5 s",
                                        kClear + "exporting\u2026 0 entries, 0/s, 0 s"));
}

TEST_F(AProgressLine, KeepsTheLastColumnFreeAndSkipsATerminalTooNarrow) {
  width_ = 12;
  line_.begin(Activity::waitingForServer);
  tickAfter(100ms);
  width_ = 1;
  tickAfter(100ms);
  EXPECT_THAT(takeWrites(), ElementsAre(kClear + "| waiting f"));
}

TEST(AProgressLineOnItsOwnThread, DrawsWhileWaitingAndNeverAfterTheEnd) {
  std::mutex mutex;
  std::condition_variable drawn;
  std::vector<std::string> writes;
  TerminalProgress line(
      std::chrono::steady_clock::now,
      [&](std::string_view bytes) {
        std::lock_guard lock(mutex);
        writes.emplace_back(bytes);
        drawn.notify_all();
      },
      [] { return std::size_t{80}; }, /* ticker= */ true);
  line.begin(Activity::waitingForServer);
  {
    std::unique_lock lock(mutex);
    ASSERT_TRUE(drawn.wait_for(lock, 30s, [&] { return writes.size() >= 2; }));
  }
  line.end();
  std::lock_guard lock(mutex);
  ASSERT_GE(writes.size(), 3u);
  EXPECT_EQ(writes.back(), kClear);
  for (std::size_t i = 0; i + 1 < writes.size(); ++i)
    EXPECT_THAT(writes[i], testing::StartsWith(kClear + "|/-\\"[i % 4] + " waiting for the server"));
}

TEST(OpenProgress, DrawsOnlyOnATerminalAbleToMoveItsCursorAndNeverOverAPrompt) {
  struct Case {
    bool input, output, error, dumb, prompting;
    bool draws;
  };
  const Case cases[] = {
      {true, true, true, false, false, true},     // one command at a terminal
      {true, true, true, false, true, true},      // the editing prompt ends its line with the user's Enter
      {false, false, true, false, true, true},    // commands piped in, output piped on: only the line is shown
      {false, true, true, false, false, true},    // one command, nothing read
      {false, true, true, false, true, false},    // the plain prompt shares the terminal's line
      {true, true, false, false, false, false},   // standard error into a file or a pipe
      {true, true, true, true, false, false},     // TERM=dumb
  };
  for (const auto& c : cases) {
    auto progress = terminal::openProgress(
        {.inputIsTerminal = c.input, .outputIsTerminal = c.output, .errorIsTerminal = c.error, .dumb = c.dumb},
        c.prompting);
    EXPECT_EQ(dynamic_cast<TerminalProgress*>(progress.get()) != nullptr, c.draws) << &c - cases;
    EXPECT_EQ(progress == silentProgress(), !c.draws) << &c - cases;
  }
}

TEST(OpenProgress, ADumbTerminalIsToldByTerm) {
  const std::pair<const char*, bool> terms[] = {{"dumb", true}, {"xterm", false}, {"", false}, {nullptr, false}};
  std::optional<std::string> saved;
  if (const char* term = std::getenv("TERM")) saved = term;
  for (const auto& [term, dumb] : terms) {
    term ? ::setenv("TERM", term, 1) : ::unsetenv("TERM");
    EXPECT_EQ(terminal::probe().dumb, dumb) << (term ? term : "(unset)");
  }
  saved ? ::setenv("TERM", saved->c_str(), 1) : ::unsetenv("TERM");
}

}  // namespace
