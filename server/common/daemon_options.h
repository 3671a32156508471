// SPDX-License-Identifier: MIT
#pragma once

#include <map>
#include <optional>
#include <set>
#include <string>
#include <vector>

/// Command lines of the two daemons. Both accept "--name value" and
/// "--name=value".
namespace vorn::server {

struct ManagerOptions {
  std::string root;
  std::string state = "Started";
  long startDelayMs = 0;
  long replyDelayMs = 0;
  std::map<std::string, int> fail;  // command -> status
  std::set<std::string> noReply;
  std::set<std::string> exitOn;
};

struct HelperOptions {
  std::string root;
  std::optional<int> fail;
  long replyDelayMs = 0;
};

/// `envRoot` is VORN_ROOT (null or empty: "/"); --root wins over it.
bool parseManagerOptions(const std::vector<std::string>& args, const char* envRoot, ManagerOptions* out,
                         std::string* error);
bool parseHelperOptions(const std::vector<std::string>& args, const char* envRoot, HelperOptions* out,
                        std::string* error);

}  // namespace vorn::server
