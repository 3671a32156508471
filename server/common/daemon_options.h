// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

/// Command lines of the two daemons, read with getopt_long: "--name value"
/// and "--name=value". The switches that make a daemon misbehave for tests
/// are read only by a build with VORN_TEST_SWITCHES (vornd-testing,
/// vorn-helper-testing); the shipped daemons reject them as unknown.
namespace vorn::server {

struct ManagerOptions {
  std::string root;
  std::uint64_t maxCollectionBytes = std::uint64_t{1} << 30;
  // Test switches.
  std::string state = "Started";
  long startDelayMs = 0;
  long replyDelayMs = 0;
  long collectDelayMs = 0;
  std::map<std::string, int> fail;  // command -> status
  std::set<std::string> noReply;
  std::set<std::string> exitOn;
};

struct HelperOptions {
  std::string root;
  // Test switches.
  std::optional<int> fail;
  long replyDelayMs = 0;
};

/// What a command line asks for. With `help` or `version` the text to print
/// on standard output is in `text`; with `error`, the message for stderr.
enum class OptionsVerdict { run, help, version, error };

/// `envRoot` is VORN_ROOT (null or empty: "/"); --root wins over it.
OptionsVerdict parseManagerOptions(const std::vector<std::string>& args, const char* envRoot, ManagerOptions* out,
                                   std::string* text);
OptionsVerdict parseHelperOptions(const std::vector<std::string>& args, const char* envRoot, HelperOptions* out,
                                  std::string* text);

}  // namespace vorn::server
