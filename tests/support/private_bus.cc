// SPDX-License-Identifier: MIT
#include "tests/support/private_bus.h"

#include <fcntl.h>
#include <grp.h>
#include <poll.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <systemd/sd-bus.h>
#include <unistd.h>

#include <cerrno>
#include <cstring>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <memory>
#include <thread>
#include <utility>

namespace vorn::test {
namespace {

using Clock = std::chrono::steady_clock;

struct BusUnref {
  void operator()(sd_bus* b) const { sd_bus_flush_close_unref(b); }
};

std::vector<char*> pointers(std::vector<std::string>& strings) {
  std::vector<char*> out;
  for (auto& s : strings) out.push_back(s.data());
  out.push_back(nullptr);
  return out;
}

/// Reads one line from `fd` before `deadline`; empty on timeout or EOF.
std::string readLine(int fd, Clock::time_point deadline) {
  std::string line;
  while (line.empty() || line.back() != '\n') {
    auto left = std::chrono::duration_cast<std::chrono::milliseconds>(deadline - Clock::now());
    if (left.count() <= 0) return {};
    pollfd p{fd, POLLIN, 0};
    if (poll(&p, 1, int(left.count())) <= 0) continue;
    char c;
    ssize_t n = read(fd, &c, 1);
    if (n <= 0) return {};
    line.push_back(c);
  }
  line.pop_back();
  return line;
}

bool reap(pid_t pid, int& status, std::chrono::milliseconds limit) {
  auto deadline = Clock::now() + limit;
  for (;;) {
    pid_t r = waitpid(pid, &status, WNOHANG);
    if (r == pid || (r < 0 && errno != EINTR)) return true;
    if (Clock::now() >= deadline) return false;
    // waitpid cannot wait with a deadline; a short pause bounds the latency.
    std::this_thread::sleep_for(std::chrono::milliseconds(2));
  }
}

}  // namespace

PrivateBus::PrivateBus() {
  char pattern[] = "/tmp/vorn-bus-XXXXXX";
  if (!mkdtemp(pattern)) {
    error_ = std::string("mkdtemp: ") + std::strerror(errno);
    return;
  }
  directory_ = pattern;
  // Callers that tests run as another user must reach the socket in here.
  chmod(pattern, 0755);
  std::string config = std::string(VORN_SOURCE_DIR) + "/server/dbus/private-bus.conf";
  std::vector<std::string> args = {"dbus-daemon", "--nofork", "--print-address",
                                   "--config-file=" + config,
                                   "--address=unix:path=" + directory_ + "/bus"};
  int out[2];
  if (pipe2(out, O_CLOEXEC) != 0) {
    error_ = "pipe failed";
    return;
  }
  auto argv = pointers(args);
  // The daemon's complaints (an unknown group "vorn", fd limits) go to a log
  // beside the socket rather than into the test output.
  std::string log = directory_ + "/dbus-daemon.log";
  int logFd = open(log.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0644);
  pid_t pid = fork();
  if (pid == 0) {
    dup2(out[1], STDOUT_FILENO);
    if (logFd >= 0) dup2(logFd, STDERR_FILENO);
    execvp(argv[0], argv.data());
    _exit(127);
  }
  close(out[1]);
  if (logFd >= 0) close(logFd);
  if (pid < 0) {
    close(out[0]);
    error_ = "fork failed";
    return;
  }
  pid_ = pid;
  // The daemon prints its address once it listens.
  address_ = readLine(out[0], Clock::now() + std::chrono::seconds(10));
  close(out[0]);
  if (address_.empty()) {
    std::ifstream in(log);
    std::string why((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    error_ = "dbus-daemon did not start (is it installed?): " + why;
    ::kill(pid_, SIGKILL);
    int status;
    reap(pid_, status, std::chrono::seconds(5));
    pid_ = -1;
    return;
  }
  if (const char* old = getenv("DBUS_SYSTEM_BUS_ADDRESS")) {
    hadAddress_ = true;
    savedAddress_ = old;
  }
  setenv("DBUS_SYSTEM_BUS_ADDRESS", address_.c_str(), 1);
}

PrivateBus::~PrivateBus() {
  if (pid_ > 0) {
    ::kill(pid_, SIGTERM);
    int status;
    if (!reap(pid_, status, std::chrono::seconds(5))) {
      ::kill(pid_, SIGKILL);
      reap(pid_, status, std::chrono::seconds(5));
    }
    if (hadAddress_)
      setenv("DBUS_SYSTEM_BUS_ADDRESS", savedAddress_.c_str(), 1);
    else
      unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
  }
  if (!directory_.empty()) {
    std::error_code ignored;
    std::filesystem::remove_all(directory_, ignored);
  }
}

ChildProcess::ChildProcess(const Options& options) {
  std::vector<std::string> args = options.argv;
  std::vector<std::string> env;
  for (char** e = environ; *e; ++e) env.emplace_back(*e);
  for (const auto& setting : options.env) {
    auto name = setting.substr(0, setting.find('=') + 1);
    std::erase_if(env, [&](const std::string& e) { return e.rfind(name, 0) == 0; });
    env.push_back(setting);
  }
  auto argv = pointers(args);
  auto envp = pointers(env);
  int outFd = -1;
  if (!options.stdoutPath.empty())
    outFd = open(options.stdoutPath.c_str(), O_WRONLY | O_CREAT | O_TRUNC | O_CLOEXEC, 0666);
  pid_t pid = fork();
  if (pid == 0) {
    // Only async-signal-safe calls between fork and exec.
    if (outFd >= 0) dup2(outFd, STDOUT_FILENO);
    if (options.runAsId >= 0) {
      gid_t id = gid_t(options.runAsId);
      if (setgroups(0, nullptr) != 0 || setresgid(id, id, id) != 0 || setresuid(id, id, id) != 0)
        _exit(126);
    }
    execve(argv[0], argv.data(), envp.data());
    _exit(127);
  }
  if (outFd >= 0) close(outFd);
  pid_ = pid > 0 ? pid : -1;
}

ChildProcess::~ChildProcess() {
  if (pid_ <= 0) return;
  ::kill(pid_, SIGTERM);
  if (!reap(pid_, status_, std::chrono::seconds(5))) kill();
  pid_ = -1;
}

ChildProcess::ChildProcess(ChildProcess&& other) noexcept
    : pid_(std::exchange(other.pid_, -1)), status_(other.status_) {}

ChildProcess& ChildProcess::operator=(ChildProcess&& other) noexcept {
  std::swap(pid_, other.pid_);
  std::swap(status_, other.status_);
  return *this;
}

int ChildProcess::wait(std::chrono::milliseconds limit) {
  if (pid_ <= 0) return WIFEXITED(status_) ? WEXITSTATUS(status_) : -1;
  if (!reap(pid_, status_, limit)) return -1;
  pid_ = -1;
  return WIFEXITED(status_) ? WEXITSTATUS(status_) : -1;
}

void ChildProcess::kill() {
  if (pid_ <= 0) return;
  ::kill(pid_, SIGKILL);
  reap(pid_, status_, std::chrono::seconds(5));
  pid_ = -1;
}

bool waitForBusName(const std::string& name, std::chrono::milliseconds limit) {
  auto deadline = Clock::now() + limit;
  sd_bus* raw = nullptr;
  if (sd_bus_open_system(&raw) < 0) return false;
  std::unique_ptr<sd_bus, BusUnref> bus(raw);
  // Subscribe first, then ask: an owner that appears in between still shows
  // up as a NameOwnerChanged signal.
  bool owned = false;
  auto onChange = [](sd_bus_message* m, void* userdata, sd_bus_error*) -> int {
    const char *n = nullptr, *oldOwner = nullptr, *newOwner = nullptr;
    if (sd_bus_message_read(m, "sss", &n, &oldOwner, &newOwner) >= 0 && newOwner && *newOwner)
      *static_cast<bool*>(userdata) = true;
    return 0;
  };
  std::string rule = "type='signal',sender='org.freedesktop.DBus',member='NameOwnerChanged',arg0='" +
                     name + "'";
  if (sd_bus_add_match(bus.get(), nullptr, rule.c_str(), onChange, &owned) < 0) return false;
  sd_bus_message* reply = nullptr;
  auto left = std::chrono::duration_cast<std::chrono::microseconds>(deadline - Clock::now());
  sd_bus_set_method_call_timeout(bus.get(), std::max<std::int64_t>(left.count(), 1000));
  if (sd_bus_call_method(bus.get(), "org.freedesktop.DBus", "/org/freedesktop/DBus",
                         "org.freedesktop.DBus", "NameHasOwner", nullptr, &reply, "s",
                         name.c_str()) >= 0) {
    int has = 0;
    if (sd_bus_message_read(reply, "b", &has) >= 0 && has) owned = true;
    sd_bus_message_unref(reply);
  }
  while (!owned) {
    int r = sd_bus_process(bus.get(), nullptr);
    if (r < 0) return false;
    if (r > 0 || owned) continue;
    left = std::chrono::duration_cast<std::chrono::microseconds>(deadline - Clock::now());
    if (left.count() <= 0) return false;
    sd_bus_wait(bus.get(), std::uint64_t(left.count()));
  }
  return true;
}

bool isRoot() { return geteuid() == 0; }

}  // namespace vorn::test
