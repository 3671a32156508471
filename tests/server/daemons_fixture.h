// SPDX-License-Identifier: MIT
#pragma once

#include <gtest/gtest.h>

#include <filesystem>
#include <functional>
#include <list>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include "platform/linux/bus_handles.h"
#include "platform/xpc.h"
#include "tests/support/private_bus.h"

/// The built daemons on a private bus with the project's policy, and calls
/// to them as a client makes them, each on a connection of its own.
namespace vorn::test {

struct Reply {
  std::string error;  // D-Bus error name; empty on a method return
  int status = 0;
  xpc::object response;
};

xpc::object dict(std::vector<xpc::entry> entries);
std::string text(const xpc::object& response, const char* key);
/// A TraceDumpState request; no compression entry when `compression` is empty.
xpc::object collect(const char* action, std::optional<int> compression);
std::set<std::string> namesIn(const std::filesystem::path& dir);

/// A method call to org.vorn.Manager's PerformCommand, for `bus` to send.
bus::MessagePtr performCall(sd_bus* bus, const std::string& command, const xpc::object& request);
/// Reads a PerformCommand answer (or its D-Bus error) into a Reply.
Reply readReply(sd_bus_message* reply);

Reply hello();
Reply perform(const std::string& command, const xpc::object& request);
Reply diagsnapStatus(std::uint32_t task = 4, const char* command = "DiagsnapStatus");

class Daemons : public ::testing::Test {
 public:
  void SetUp() override;
  void write(const std::string& rel, const std::string& data) const;
  /// Runs `argv` with "--root <root>" appended until `ready` gets an answer.
  void start(std::vector<std::string> argv, Reply (*ready)() = hello);
  std::filesystem::path folder() const;

  std::optional<PrivateBus> bus;
  std::filesystem::path root;
  std::list<ChildProcess> daemons;  // ended before the bus goes
};

}  // namespace vorn::test
