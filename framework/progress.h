// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <cstdint>
#include <memory>

/// A line that tells the person at the terminal that a slow step is under
/// way: the tool waiting for the server, or an export writing entries. The
/// commands never learn whether anything is drawn; through pipes, files and
/// dumb terminals the tool uses the silent one, so what it prints stays the
/// same byte for byte.
class Progress {
 public:
  enum class Activity { waitingForServer, exporting };

  virtual ~Progress() = default;

  /// Shows `activity` with its time counted from now, in place of whatever
  /// was shown.
  virtual void begin(Activity activity) = 0;
  /// How many entries the activity has done so far. Any thread; cheap enough
  /// to call every few hundred entries.
  virtual void setCount(std::uint64_t count) = 0;
  /// Removes the line. Once it returns, nothing is drawn until the next
  /// begin(), so output that follows has the screen to itself. Any thread.
  virtual void end() = 0;
};

/// Shows nothing, starts nothing.
class SilentProgress final : public Progress {
 public:
  void begin(Activity) override {}
  void setCount(std::uint64_t) override {}
  void end() override {}
};

/// One silent progress for the whole process: the default of whoever is
/// given no other.
std::shared_ptr<Progress> silentProgress();

/// Shows an activity from its making until end() or its destruction,
/// whichever comes first; later calls do nothing, so a late destruction never
/// ends an activity that someone else has begun since.
class ProgressScope {
 public:
  ProgressScope(std::shared_ptr<Progress> progress, Progress::Activity activity);
  ~ProgressScope() { end(); }
  ProgressScope(const ProgressScope&) = delete;
  ProgressScope& operator=(const ProgressScope&) = delete;

  void end();

 private:
  std::shared_ptr<Progress> progress_;
  std::atomic<bool> ended_{false};
};
