// SPDX-License-Identifier: MIT
#include "framework/progress.h"

#include <utility>

std::shared_ptr<Progress> silentProgress() {
  static const auto silent = std::make_shared<SilentProgress>();
  return silent;
}

ProgressScope::ProgressScope(std::shared_ptr<Progress> progress, Progress::Activity activity)
    : progress_(progress ? std::move(progress) : silentProgress()) {
  progress_->begin(activity);
}

void ProgressScope::end() {
  if (!ended_.exchange(true)) progress_->end();
}
