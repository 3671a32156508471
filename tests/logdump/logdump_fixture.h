// SPDX-License-Identifier: MIT
#pragma once

#include <gtest/gtest.h>

#include <memory>

#include "../fakes/fake_device.h"
#include "../fakes/fake_helper.h"
#include "../fakes/fake_manager.h"
#include "../framework/stdio_capture.h"
#include "logdump/logdump_command.h"
#include "logdump/trace_names.h"
#include "toolbase/server_state.h"
#include "toolbase/tool_context.h"

/// A logdump command wired to a scripted server, device and helper service.
class LogdumpTest : public testing::Test {
 protected:
  /// The fixture's device and helper service, with `server` as the manager.
  ToolContext contextWith(std::shared_ptr<FakeManager> server) {
    auto helpers = [this](const char* client, std::shared_ptr<rilx::LogServer>)
        -> std::shared_ptr<vorn::HelperClient> {
      if (!helperAvailable) return nullptr;
      helper->client = client;
      return helper;
    };
    return {.manager = std::move(server), .queue = queue, .device = profile, .helpers = helpers};
  }

  struct Run {
    bool result;
    std::string out;
    std::string err;
  };
  Run run(const std::string& handler, std::list<std::string> typed) {
    std::list<std::string> words(typed.rbegin(), typed.rend());
    StdioCapture io;
    bool result = command->execCommand(handler, words);
    return {result, io.out(), io.err()};
  }

  /// The answer of a successful GetTraceProperty with `value`.
  static FakeManager::Answer property(const std::string& value) {
    return {0, xpc::object::dictionary({{vorn::kKeyTracePropertyValue, xpc::object::string(value)}})};
  }
  static FakeManager::Answer timestamp(const std::string& ts) {
    return {0, xpc::object::dictionary({{vorn::kKeyTimestampString, xpc::object::string(ts)}})};
  }

  std::shared_ptr<FakeDevice> device = std::make_shared<FakeDevice>();
  std::shared_ptr<DeviceProfile> profile = std::make_shared<DeviceProfile>(device);
  std::shared_ptr<FakeHelper> helper = std::make_shared<FakeHelper>();
  bool helperAvailable = true;
  dispatch::queue queue{"vorntool.queue"};
  std::shared_ptr<FakeManager> manager = std::make_shared<FakeManager>(queue);
  std::shared_ptr<LogdumpCommand> command = LogdumpCommand::create("logdump", {}, contextWith(manager));
};

inline const std::string kSnapshot = vorn::trace::kSnapshotFolder;
