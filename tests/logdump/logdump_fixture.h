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

/// Writes where the progress line would begin and end into standard output,
/// so that a test sees them among the result lines.
struct MarkedProgress : Progress {
  void begin(Activity activity) override {
    std::cout << (activity == Activity::waitingForServer ? "[waiting]" : "[exporting]") << std::flush;
  }
  void setCount(std::uint64_t) override {}
  void end() override { std::cout << "[end]" << std::flush; }
};

/// What a collection prints first: its line, begun before the first request
/// and ended once, before the result.
inline const std::string kWaited = "[waiting][end]";

/// A logdump command wired to a scripted server, device and helper service,
/// its progress line marked in standard output.
class LogdumpTest : public testing::Test {
 protected:
  void SetUp() override { restart(); }

  /// Starts over with a new scripted server.
  void restart() {
    manager = std::make_shared<FakeManager>(queue);
    auto helpers = [this](const char* client, std::shared_ptr<rilx::LogServer>) {
      helper->client = client;
      return helperAvailable ? std::shared_ptr<vorn::HelperClient>(helper) : nullptr;
    };
    command = LogdumpCommand::create("logdump", {},
                                     {.manager = manager, .queue = queue, .device = profile, .helpers = helpers,
                                      .progress = std::make_shared<MarkedProgress>()});
  }

  struct Run {
    bool result;
    std::string out;
    std::string err;
  };
  Run run(const std::string& handler, std::list<std::string> typed) {
    StdioCapture io;
    const bool result = command->execCommand(handler, {typed.rbegin(), typed.rend()});
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
  std::shared_ptr<FakeManager> manager;
  std::shared_ptr<LogdumpCommand> command;
};

inline const std::string kSnapshot = vorn::trace::kSnapshotFolder;
