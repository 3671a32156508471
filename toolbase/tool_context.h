// SPDX-License-Identifier: MIT
#pragma once

#include <memory>

#include "framework/progress.h"
#include "platform/dispatch.h"
#include "platform/helper_client.h"
#include "platform/vorn_client.h"
#include "toolbase/device_profile.h"

/// What every command of the tool works with. The shell builds one, and every
/// command of the tree holds a copy; the copies share what they point to.
/// Tests build theirs from fakes. Every member has a default, so a new one
/// needs no change where it is not used.
struct ToolContext {
  /// The server connection.
  std::shared_ptr<vorn::client::Manager> manager{};
  /// The serial queue on which the server's callbacks arrive.
  dispatch::queue queue{};
  std::shared_ptr<DeviceProfile> device{};
  /// Makes the helper service's client when a command needs one; empty: none.
  vorn::HelperClient::Factory helpers{};
  /// Shows the user that a command is waiting or working; silent unless the
  /// tool runs at a terminal that can draw it.
  std::shared_ptr<Progress> progress = silentProgress();

  /// `manager` and `queue` with this machine's device and helper service.
  static ToolContext onThisDevice(std::shared_ptr<vorn::client::Manager> manager,
                                  dispatch::queue queue);
};
