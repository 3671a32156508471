// SPDX-License-Identifier: MIT
#include <gtest/gtest.h>

#include <chrono>
#include <thread>

#include "../fakes/fake_device.h"
#include "../fakes/fake_manager.h"
#include "toolbase/server_state.h"
#include "toolbase/vorn_command_base.h"
#include "tool/vorn_shell.h"

namespace {

using namespace std::chrono_literals;
using xpc::object;

class ToolShell : public testing::Test {
 protected:
  void SetUp() override { gServerRunning = false; }
  void TearDown() override {
    if (manager) manager->releaseHandlers();
  }

  /// A shell whose server is a FakeManager that reports `state` when asked.
  VornShell shell() {
    auto connect = [this](const std::string& client, dispatch::queue queue) {
      clientName = client;
      queueLabel = queue.label();
      manager = std::make_shared<FakeManager>(queue);
      manager->setState(state);
      return manager;
    };
    return VornShell(connect, {.device = device});
  }

  /// Waits, with a deadline, until the flag reads `expected`.
  static bool flagBecomes(bool expected) {
    for (auto end = std::chrono::steady_clock::now() + 5s; std::chrono::steady_clock::now() < end;
         std::this_thread::sleep_for(1ms))
      if (IsServerRunning() == expected) return true;
    return false;
  }

  std::optional<object> state;
  std::shared_ptr<DeviceProfile> device = std::make_shared<DeviceProfile>(std::make_shared<FakeDevice>());
  std::shared_ptr<FakeManager> manager;
  std::string clientName;
  std::string queueLabel;
};

object stateIs(object value) { return object::dictionary({{"ServerState", value}}); }

TEST_F(ToolShell, BuildsTheTreeOnOneConnectionAndQueue) {
  auto root = shell().createRootCommand();
  ASSERT_TRUE(root);
  EXPECT_EQ(clientName, "vorntool");
  EXPECT_EQ(queueLabel, "vorntool.queue");
  EXPECT_EQ(root->getHierarchy(), std::string("/") + getprogname());
  EXPECT_EQ(dynamic_cast<VornCommandBase&>(*root).getManager(), manager);
  ASSERT_TRUE(root->isValidSubCommand("logdump"));
  auto& logdump = dynamic_cast<VornCommandBase&>(*root->getSubCommandObj("logdump"));
  EXPECT_EQ(logdump.getManager(), manager);
  EXPECT_EQ(logdump.getContext().device, device);
  EXPECT_EQ(logdump.getQueue().label(), "vorntool.queue");
}

TEST_F(ToolShell, TheFlagFollowsServerStateAndOnlyTheExactStartedStringSetsIt) {
  const object started = stateIs(object::string("Started"));
  struct Case {
    std::optional<object> hello;  // what the server says within the wait; none: not running yet
    object event;
  } const cases[] = {
      {started, stateIs(object::string("Starting"))}, {started, stateIs(object::string("started"))},
      {started, stateIs(object::int64(1))},           {started, object::dictionary({})},
      {started, object::string("Started")},           {std::nullopt, started},
  };
  for (const auto& c : cases) {
    gServerRunning = false;
    state = c.hello;
    shell().createRootCommand();
    ASSERT_EQ(IsServerRunning(), c.hello.has_value());
    manager->emit(c.event);
    EXPECT_TRUE(flagBecomes(c.event == started));
    manager->releaseHandlers();
  }
}

}  // namespace
