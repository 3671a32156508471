// SPDX-License-Identifier: MIT
#include "tool/vorn_shell.h"

#include <chrono>

#include "platform/device.h"
#include "platform/vorn_client.h"
#include "toolbase/server_state.h"
#include "tool/vorn_command.h"

namespace {
constexpr auto kServerStateWait = std::chrono::milliseconds(500);
}

std::shared_ptr<CommandBase> VornShell::createRootCommand() {
  dispatch::queue queue("vorntool.queue");
  auto manager = vorn::client::CreateManager("vorntool", queue);

  dispatch::group group;
  {
    GroupMembership membership(group);
    // The library keeps its own copy of the handler, and with it a membership
    // of the group: the wait below normally runs its full length, giving the
    // server's state time to arrive.
    vorn::client::EventHandler handler = [manager, membership](xpc::object payload, dispatch::group) {
      const std::string state =
          xpc::dyn_cast_or_default(xpc::dict(payload).get(vorn::kKeyServerState), "");
      gServerRunning = state == vorn::kServerStateStarted;
    };
    vorn::client::RegisterEventHandler(manager, vorn::kEventServerStateChange, handler);
    vorn::client::EventsOff(manager);
    vorn::client::EventsOn(manager);
  }
  group.wait(kServerStateWait);

  return VornCommand::create(getprogname(), {}, manager, queue);
}
