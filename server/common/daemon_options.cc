// SPDX-License-Identifier: MIT
#include "server/common/daemon_options.h"

#include <functional>

#include "server/common/text_util.h"

namespace vorn::server {

namespace {

using Handler = std::function<bool(const std::string& value, std::string* error)>;

/// Walks `args`, giving each known option its value; every option here takes one.
bool walk(const std::vector<std::string>& args, const std::map<std::string, Handler>& handlers, std::string* error) {
  for (size_t i = 0; i < args.size(); ++i) {
    std::string name = args[i];
    std::string value;
    bool inlineValue = false;
    if (auto eq = name.find('='); name.rfind("--", 0) == 0 && eq != std::string::npos) {
      value = name.substr(eq + 1);
      name = name.substr(0, eq);
      inlineValue = true;
    }
    auto it = handlers.find(name);
    if (it == handlers.end()) {
      *error = "unknown option " + args[i];
      return false;
    }
    if (!inlineValue) {
      if (i + 1 >= args.size()) {
        *error = name + " needs a value";
        return false;
      }
      value = args[++i];
    }
    if (!it->second(value, error)) return false;
  }
  return true;
}

Handler delayInto(long* target, const std::string& name) {
  return [target, name](const std::string& value, std::string* error) {
    if (parseCount(value, target)) return true;
    *error = name + " wants a number of milliseconds, not \"" + value + "\"";
    return false;
  };
}

Handler rootInto(std::string* target) {
  return [target](const std::string& value, std::string* error) {
    if (value.empty()) {
      *error = "--root wants a folder";
      return false;
    }
    *target = value;
    return true;
  };
}

std::string defaultRoot(const char* envRoot) { return envRoot != nullptr && *envRoot != '\0' ? envRoot : "/"; }

}  // namespace

bool parseManagerOptions(const std::vector<std::string>& args, const char* envRoot, ManagerOptions* out,
                         std::string* error) {
  ManagerOptions opts;
  opts.root = defaultRoot(envRoot);
  std::map<std::string, Handler> handlers = {
      {"--root", rootInto(&opts.root)},
      {"--state", [&](const std::string& v, std::string*) { opts.state = v; return true; }},
      {"--start-delay-ms", delayInto(&opts.startDelayMs, "--start-delay-ms")},
      {"--reply-delay-ms", delayInto(&opts.replyDelayMs, "--reply-delay-ms")},
      {"--fail",
       [&](const std::string& v, std::string* e) {
         auto eq = v.rfind('=');
         int status = 0;
         if (eq == std::string::npos || eq == 0 || !parseStatus(v.substr(eq + 1), &status)) {
           *e = "--fail wants COMMAND=STATUS, not \"" + v + "\"";
           return false;
         }
         opts.fail[v.substr(0, eq)] = status;
         return true;
       }},
      {"--no-reply", [&](const std::string& v, std::string*) { opts.noReply.insert(v); return true; }},
      {"--exit-on", [&](const std::string& v, std::string*) { opts.exitOn.insert(v); return true; }},
  };
  if (!walk(args, handlers, error)) return false;
  *out = std::move(opts);
  return true;
}

bool parseHelperOptions(const std::vector<std::string>& args, const char* envRoot, HelperOptions* out,
                        std::string* error) {
  HelperOptions opts;
  opts.root = defaultRoot(envRoot);
  std::map<std::string, Handler> handlers = {
      {"--root", rootInto(&opts.root)},
      {"--reply-delay-ms", delayInto(&opts.replyDelayMs, "--reply-delay-ms")},
      {"--fail",
       [&](const std::string& v, std::string* e) {
         int status = 0;
         if (!parseStatus(v, &status)) {
           *e = "--fail wants a status, not \"" + v + "\"";
           return false;
         }
         opts.fail = status;
         return true;
       }},
  };
  if (!walk(args, handlers, error)) return false;
  *out = std::move(opts);
  return true;
}

}  // namespace vorn::server
