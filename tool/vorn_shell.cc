// SPDX-License-Identifier: MIT
#include "tool/vorn_shell.h"

#include <chrono>

#include "platform/device.h"
#include "toolbase/server_state.h"
#include "tool/vorn_command.h"

namespace {
constexpr auto kServerStateWait = std::chrono::milliseconds(500);
}

VornShell::VornShell() : VornShell(vorn::client::CreateManager, ToolContext::onThisDevice({}, {})) {}

VornShell::VornShell(vorn::client::ManagerFactory connect, ToolContext base)
    : connectServer(std::move(connect)), baseContext(std::move(base)) {}

std::shared_ptr<CommandBase> VornShell::createRootCommand() {
  dispatch::queue queue("vorntool.queue");
  auto manager = connectServer("vorntool", queue);

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

  ToolContext context = baseContext;
  context.manager = manager;
  context.queue = queue;
  return VornCommand::create(getprogname(), {}, std::move(context));
}
