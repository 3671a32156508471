// SPDX-License-Identifier: MIT
#include "tests/support/private_bus.h"

#include <fcntl.h>
#include <grp.h>
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
#include <thread>

namespace vorn::test {
namespace {

using Clock = std::chrono::steady_clock;

std::vector<char*> pointers(std::vector<std::string>& strings) {
  std::vector<char*> out;
  for (auto& s : strings) out.push_back(s.data());
  out.push_back(nullptr);
  return out;
}

}  // namespace

PrivateBus::PrivateBus() {
  char pattern[] = "/tmp/vorn-bus-XXXXXX";
  if (!mkdtemp(pattern)) {
    error_ = std::string("mkdtemp: ") + std::strerror(errno);
    return;
  }
  directory_ = pattern;
  chmod(pattern, 0755);  // callers that tests run as another user reach the socket
  // The daemon's complaints (an unknown group "vorn", fd limits) go to a log
  // beside the socket, followed by its address once it listens.
  std::string address = "unix:path=" + directory_ + "/bus", log = directory_ + "/dbus-daemon.log";
  daemon_.emplace(ChildProcess::Options{
      {"/bin/sh", "-c",
       "exec dbus-daemon --nofork --print-address --address=" + address +
           " --config-file='" VORN_SOURCE_DIR "/server/dbus/private-bus.conf' 2>&1"},
      {}, -1, log});
  std::string text;
  for (auto deadline = Clock::now() + std::chrono::seconds(10); text.find(address) == std::string::npos;) {
    if (Clock::now() > deadline || daemon_->wait(std::chrono::milliseconds(10)) != -1 || !daemon_->running()) {
      error_ = "dbus-daemon did not start (is it installed?): " + text;
      daemon_.reset();
      return;
    }
    std::ifstream in(log);
    text.assign(std::istreambuf_iterator<char>(in), std::istreambuf_iterator<char>());
  }
  setenv("DBUS_SYSTEM_BUS_ADDRESS", address.c_str(), 1);
}

PrivateBus::~PrivateBus() {
  daemon_.reset();
  unsetenv("DBUS_SYSTEM_BUS_ADDRESS");
  std::error_code ignored;
  if (!directory_.empty()) std::filesystem::remove_all(directory_, ignored);
}

ChildProcess::ChildProcess(const Options& options) {
  std::vector<std::string> args = options.argv;  // exec wants them writable
  // The extra settings come first: getenv finds the first of equal names.
  std::vector<std::string> env = options.env;
  for (char** e = environ; *e; ++e) env.emplace_back(*e);
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

int ChildProcess::wait(std::chrono::milliseconds limit) {
  int status = 0;
  pid_t r = -1;
  for (auto deadline = Clock::now() + limit; pid_ > 0 && (r = waitpid(pid_, &status, WNOHANG)) == 0;) {
    if (Clock::now() >= deadline) return -1;
    std::this_thread::sleep_for(std::chrono::milliseconds(2));  // waitpid cannot wait with a deadline
  }
  pid_ = -1;
  return r > 0 && WIFEXITED(status) ? WEXITSTATUS(status) : -1;
}

void ChildProcess::kill() {
  if (pid_ > 0 && ::kill(pid_, SIGKILL) == 0) waitpid(pid_, nullptr, 0);
  pid_ = -1;
}

bool waitForBusName(const std::string& name, std::chrono::milliseconds limit, bool owned) {
  sd_bus* bus = nullptr;
  if (sd_bus_open_system(&bus) < 0) return false;
  bool found;  // the lookup fails while the name has no owner
  for (auto deadline = Clock::now() + limit;
       (found = sd_bus_get_name_creds(bus, name.c_str(), 0, nullptr) >= 0) != owned && Clock::now() < deadline;)
    std::this_thread::sleep_for(std::chrono::milliseconds(10));
  sd_bus_flush_close_unref(bus);
  return found == owned;
}

}  // namespace vorn::test
