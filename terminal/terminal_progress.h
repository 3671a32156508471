// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <chrono>
#include <condition_variable>
#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <stop_token>
#include <string_view>
#include <thread>

#include "framework/progress.h"
#include "terminal/terminal_facts.h"

namespace terminal {

/// The progress line on a terminal: one line, redrawn in place (carriage
/// return, clear to the end of the line) at most once per kInterval and first
/// after kInterval, so that a quick answer draws nothing at all. While an
/// activity runs, a thread of its own redraws it, so the spinner and the time
/// move even when nothing else happens. end() takes the line away again and
/// stops the thread.
class TerminalProgress final : public Progress {
 public:
  using Clock = std::function<std::chrono::steady_clock::time_point()>;
  using Writer = std::function<void(std::string_view bytes)>;
  /// The terminal's width in columns.
  using Width = std::function<std::size_t()>;

  static constexpr std::chrono::milliseconds kInterval{100};

  /// Without `ticker` no thread is started and only tick() draws.
  TerminalProgress(Clock clock, Writer write, Width width, bool ticker);
  ~TerminalProgress() override;

  void begin(Activity activity) override;
  void setCount(std::uint64_t count) override;
  void end() override;

  /// Redraws the line if an activity runs and the last drawing (or the
  /// begin) is at least kInterval old.
  void tick();

 private:
  void drawIfDue();
  void tickUntilStopped(std::stop_token stop);

  const Clock clock_;
  const Writer write_;
  const Width width_;
  const bool ticker_;

  std::mutex mutex_;
  std::condition_variable_any wake_;
  // Guarded by mutex_:
  std::optional<Activity> activity_;
  std::chrono::steady_clock::time_point started_;
  std::chrono::steady_clock::time_point lastDrawn_;
  bool drawn_ = false;
  unsigned frame_ = 0;
  std::jthread thread_;

  // Written by whoever does the work, read when drawing.
  std::atomic<std::uint64_t> count_{0};
};

/// The terminal's line when standard error is a terminal that can move its
/// cursor (TERM is not "dumb"), drawing on standard error; the silent one
/// otherwise. Silent as well for a prompt session whose commands come from a
/// pipe or a file while standard output is a terminal: its plain prompt ends
/// mid-line, right where the line would be drawn and cleared.
std::shared_ptr<Progress> openProgress(const Facts& facts, bool prompting);

}  // namespace terminal
