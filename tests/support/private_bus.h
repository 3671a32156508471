// SPDX-License-Identifier: MIT
#pragma once

#include <sys/types.h>

#include <chrono>
#include <string>
#include <vector>

/// Test fixtures for the server link: a private system bus and child
/// processes with bounded waits.
namespace vorn::test {

/// A private dbus-daemon with the project's bus policy, started for one test
/// and exported as the system bus (DBUS_SYSTEM_BUS_ADDRESS). Killed, and the
/// previous address restored, on destruction.
class PrivateBus {
 public:
  PrivateBus();
  ~PrivateBus();
  PrivateBus(const PrivateBus&) = delete;
  PrivateBus& operator=(const PrivateBus&) = delete;

  /// False when the daemon could not be started; `error()` says why.
  bool ok() const { return pid_ > 0; }
  const std::string& error() const { return error_; }
  const std::string& address() const { return address_; }
  /// A scratch folder that lives as long as the bus.
  const std::string& directory() const { return directory_; }

 private:
  pid_t pid_ = -1;
  std::string directory_;
  std::string address_;
  std::string error_;
  std::string savedAddress_;
  bool hadAddress_ = false;
};

/// A child process killed (SIGTERM, then SIGKILL after a grace period) and
/// reaped on destruction.
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

  ChildProcess() = default;
  explicit ChildProcess(const Options& options);
  ~ChildProcess();
  ChildProcess(ChildProcess&& other) noexcept;
  ChildProcess& operator=(ChildProcess&& other) noexcept;

  pid_t pid() const { return pid_; }
  bool running() const { return pid_ > 0; }
  /// Waits at most `limit` for the child to exit; its exit code, or -1 when it
  /// did not exit in time or died of a signal.
  int wait(std::chrono::milliseconds limit);
  /// Sends SIGKILL and reaps the child.
  void kill();

 private:
  pid_t pid_ = -1;
  int status_ = -1;
};

/// Waits at most `limit` until `name` has an owner on the system bus; true
/// when it has one.
bool waitForBusName(const std::string& name, std::chrono::milliseconds limit);

/// True when the process runs as root (owning the project's names needs it).
bool isRoot();

}  // namespace vorn::test
