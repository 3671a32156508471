// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <chrono>
#include <optional>
#include <string>
#include <vector>

/// Test fixtures for the server link: a private system bus and child
/// processes with bounded waits.
namespace vorn::test {

/// A child process killed (SIGKILL) and reaped on destruction.
class ChildProcess {
 public:
  struct Options {
    std::vector<std::string> argv;
    /// Extra "NAME=value" settings on top of the current environment.
    std::vector<std::string> env;
    /// When set, the child drops to this uid and gid (and no supplementary
    /// groups) before exec; needs root.
    int runAsId = -1;
    /// Where the child's standard output goes; empty inherits it.
    std::string stdoutPath;
  };

  explicit ChildProcess(const Options& options);
  ~ChildProcess() { kill(); }
  ChildProcess(const ChildProcess&) = delete;
  ChildProcess& operator=(const ChildProcess&) = delete;

  bool running() const { return pid_ > 0; }
  /// Waits at most `limit` for the child to exit; its exit code, or -1 when it
  /// did not exit in time or died of a signal.
  int wait(std::chrono::milliseconds limit);
  /// Sends SIGKILL and reaps the child.
  void kill();

 private:
  pid_t pid_ = -1;
};

/// A private dbus-daemon with the project's bus policy, started for one test
/// and exported as the system bus (DBUS_SYSTEM_BUS_ADDRESS). Killed, and the
/// variable unset, on destruction.
class PrivateBus {
 public:
  PrivateBus();  // not copyable: it owns the daemon
  ~PrivateBus();

  /// False when the daemon could not be started; `error()` says why.
  bool ok() const { return daemon_.has_value(); }
  const std::string& error() const { return error_; }
  /// A scratch folder that lives as long as the bus.
  const std::string& directory() const { return directory_; }

 private:
  std::string directory_;
  std::optional<ChildProcess> daemon_;
  std::string error_;
};

/// Waits at most `limit` until `name` has an owner on the system bus (or, when
/// not `owned`, has none); true when it came to that.
bool waitForBusName(const std::string& name, std::chrono::milliseconds limit, bool owned = true);

}  // namespace vorn::test
