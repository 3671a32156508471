// SPDX-License-Identifier: MIT
#pragma once

#include <memory>
#include <optional>

#include "framework/progress.h"
#include "oslog/export_observer.h"

namespace logdump {

/// Shows an export on the tool's progress line, from the stream's start to
/// its end.
class ExportProgress final : public oslog::ExportObserver {
 public:
  explicit ExportProgress(std::shared_ptr<Progress> progress)
      : progress_(progress ? std::move(progress) : silentProgress()) {}

  void started() override { shown_.emplace(progress_, Progress::Activity::exporting); }
  void linesWritten(std::uint64_t lines) override { progress_->setCount(lines); }
  void finished() override { shown_.reset(); }

 private:
  std::shared_ptr<Progress> progress_;
  std::optional<ProgressScope> shown_;
};

}  // namespace logdump
