// SPDX-License-Identifier: MIT
#include "bus_harness.h"

#include <fcntl.h>
#include <poll.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/wait.h>
#include <unistd.h>

#include <cstring>
#include <thread>

#include "server/common/bus_values.h"

extern char** environ;

namespace harness {

bool Process::start(const std::vector<std::string>& argv, const std::vector<std::string>& extraEnv, int stdoutFd,
                    std::optional<unsigned long> fileSizeLimit) {
  // Everything the child needs is built before fork: only async-signal-safe
  // calls happen after it.
  std::vector<std::string> env;
  for (char** e = environ; *e != nullptr; ++e) env.emplace_back(*e);
  for (const auto& extra : extraEnv) env.push_back(extra);
  std::vector<char*> envp;
  for (auto& e : env) envp.push_back(e.data());
  envp.push_back(nullptr);
  std::vector<std::string> args = argv;
  std::vector<char*> argp;
  for (auto& a : args) argp.push_back(a.data());
  argp.push_back(nullptr);

  pid_ = fork();
  if (pid_ < 0) return false;
  if (pid_ == 0) {
    if (stdoutFd >= 0) dup2(stdoutFd, STDOUT_FILENO);
    if (fileSizeLimit) {
      struct rlimit lim = {*fileSizeLimit, *fileSizeLimit};
      setrlimit(RLIMIT_FSIZE, &lim);
    }
    execve(argp[0], argp.data(), envp.data());
    _exit(127);
  }
  return true;
}

std::optional<int> Process::waitExit(std::chrono::milliseconds limit) {
  if (pid_ <= 0) return std::nullopt;
  auto deadline = Clock::now() + limit;
  for (;;) {
    int status = 0;
    pid_t r = waitpid(pid_, &status, WNOHANG);
    if (r == pid_) {
      pid_ = -1;
      return WIFEXITED(status) ? WEXITSTATUS(status) : 128 + WTERMSIG(status);
    }
    if (Clock::now() >= deadline) return std::nullopt;
    std::this_thread::sleep_for(5ms);
  }
}

void Process::signal(int sig) const {
  if (pid_ > 0) kill(pid_, sig);
}

void Process::terminate() {
  if (pid_ <= 0) return;
  kill(pid_, SIGTERM);
  if (!waitExit(5s)) {
    kill(pid_, SIGKILL);
    waitExit(5s);
  }
}

PrivateBus::PrivateBus(const std::string& dir, const std::string& config) {
  int fds[2];
  if (pipe2(fds, O_CLOEXEC) != 0) return;
  std::string socket = "unix:path=" + dir + "/bus";
  bool started = daemon_.start({"/usr/bin/dbus-daemon", "--nofork", "--print-address", "--config-file=" + config,
                                "--address=" + socket},
                               {}, fds[1]);
  close(fds[1]);
  // The daemon prints its address once it listens.
  std::string line;
  auto deadline = Clock::now() + 10s;
  while (started && line.find('\n') == std::string::npos && Clock::now() < deadline) {
    struct pollfd p = {fds[0], POLLIN, 0};
    if (poll(&p, 1, 100) <= 0) continue;
    char buf[256];
    ssize_t n = read(fds[0], buf, sizeof buf);
    if (n <= 0) break;
    line.append(buf, static_cast<size_t>(n));
  }
  close(fds[0]);
  if (line.find('\n') != std::string::npos) address_ = socket;
}

Reply decodeReply(sd_bus_message* m, const sd_bus_error* error) {
  Reply out;
  if (error != nullptr && sd_bus_error_is_set(error)) {
    out.error = error->name;
    return out;
  }
  if (sd_bus_message_is_method_error(m, nullptr)) {
    out.error = sd_bus_message_get_error(m)->name;
    return out;
  }
  const char* sig = sd_bus_message_get_signature(m, 1);
  if (std::strcmp(sig, "isa{sv}") == 0) {
    const char* desc = nullptr;
    if (sd_bus_message_read(m, "is", &out.status, &desc) < 0) out.error = "harness.BadReply";
    out.description = desc != nullptr ? desc : "";
  } else if (std::strcmp(sig, "a{sv}") != 0) {
    out.error = std::string("harness.UnexpectedSignature.") + sig;
    return out;
  }
  if (out.error.empty() && !vorn::server::readDictionary(m, &out.response)) out.error = "harness.BadReply";
  return out;
}

bool Client::connect(const std::string& address) {
  sd_bus* b = nullptr;
  if (sd_bus_new(&b) < 0) return false;
  bus_.reset(b);
  if (sd_bus_set_address(b, address.c_str()) < 0 || sd_bus_set_bus_client(b, 1) < 0 || sd_bus_start(b) < 0) {
    return false;
  }
  sd_bus_slot* slot = nullptr;
  if (sd_bus_match_signal(b, &slot, nullptr, "/org/vorn/Manager", "org.vorn.Manager1", "Event", &Client::onEvent,
                          this) < 0) {
    return false;
  }
  match_.reset(slot);
  return true;
}

int Client::onEvent(sd_bus_message* m, void* userdata, sd_bus_error*) {
  auto* self = static_cast<Client*>(userdata);
  const char* name = nullptr;
  xpc::object payload;
  if (sd_bus_message_read_basic(m, 's', &name) >= 0 && vorn::server::readDictionary(m, &payload)) {
    self->events_.push_back({name, xpc::dyn_cast_or_default(payload.get("ServerState"), "")});
  }
  return 0;
}

Reply Client::raw(const char* destination, const char* path, const char* interface, const char* member,
                  const std::function<int(sd_bus_message*)>& append, std::chrono::milliseconds timeout) {
  sd_bus_message* call = nullptr;
  Reply failed;
  failed.error = "harness.CannotBuild";
  if (sd_bus_message_new_method_call(bus_.get(), &call, destination, path, interface, member) < 0) return failed;
  vorn::server::MessagePtr owned(call);
  if (append(call) < 0) return failed;
  sd_bus_error error = SD_BUS_ERROR_NULL;
  sd_bus_message* reply = nullptr;
  sd_bus_call(bus_.get(), call, static_cast<uint64_t>(timeout.count()) * 1000, &error, &reply);
  vorn::server::MessagePtr ownedReply(reply);
  Reply out = decodeReply(reply, &error);
  sd_bus_error_free(&error);
  return out;
}

Reply Client::hello(std::chrono::milliseconds timeout) {
  return raw("org.vorn.Manager", "/org/vorn/Manager", "org.vorn.Manager1", "Hello",
             [](sd_bus_message* m) { return sd_bus_message_append(m, "s", "harness"); }, timeout);
}

Reply Client::perform(const std::string& command, const xpc::object& request, std::chrono::milliseconds timeout) {
  return raw("org.vorn.Manager", "/org/vorn/Manager", "org.vorn.Manager1", "PerformCommand",
             [&](sd_bus_message* m) {
               int r = sd_bus_message_append(m, "ss", "harness", command.c_str());
               if (r < 0) return r;
               return vorn::server::appendDictionary(m, request) ? 0 : -EINVAL;
             },
             timeout);
}

Reply Client::helper(std::uint32_t task, const std::string& command, const xpc::object& request,
                     std::chrono::milliseconds timeout) {
  return raw("org.vorn.Helper", "/org/vorn/Helper", "org.vorn.Helper1", "Perform",
             [&](sd_bus_message* m) {
               int r = sd_bus_message_append(m, "sus", "harness", task, command.c_str());
               if (r < 0) return r;
               return vorn::server::appendDictionary(m, request) ? 0 : -EINVAL;
             },
             timeout);
}

namespace {
struct AsyncTarget {
  Reply* out;
  bool* done;
};
int onAsyncReply(sd_bus_message* m, void* userdata, sd_bus_error* error) {
  auto* target = static_cast<AsyncTarget*>(userdata);
  *target->out = decodeReply(m, error);
  *target->done = true;
  delete target;
  return 0;
}
}  // namespace

bool Client::performAsync(const std::string& command, const xpc::object& request, Reply* out, bool* done) {
  sd_bus_message* call = nullptr;
  if (sd_bus_message_new_method_call(bus_.get(), &call, "org.vorn.Manager", "/org/vorn/Manager",
                                     "org.vorn.Manager1", "PerformCommand") < 0) {
    return false;
  }
  vorn::server::MessagePtr owned(call);
  if (sd_bus_message_append(call, "ss", "harness", command.c_str()) < 0) return false;
  if (!vorn::server::appendDictionary(call, request)) return false;
  auto* target = new AsyncTarget{out, done};
  if (sd_bus_call_async(bus_.get(), nullptr, call, onAsyncReply, target, 20'000'000) < 0) {
    delete target;
    return false;
  }
  return true;
}

bool Client::hasOwner(const std::string& name) {
  sd_bus_error error = SD_BUS_ERROR_NULL;
  sd_bus_message* reply = nullptr;
  int owned = 0;
  int r = sd_bus_call_method(bus_.get(), "org.freedesktop.DBus", "/org/freedesktop/DBus", "org.freedesktop.DBus",
                             "NameHasOwner", &error, &reply, "s", name.c_str());
  if (r >= 0) sd_bus_message_read(reply, "b", &owned);
  sd_bus_message_unref(reply);
  sd_bus_error_free(&error);
  return owned != 0;
}

bool Client::waitFor(const std::function<bool()>& done, std::chrono::milliseconds limit) {
  auto deadline = Clock::now() + limit;
  for (;;) {
    // Drain everything queued before looking at the condition again.
    while (sd_bus_process(bus_.get(), nullptr) > 0) {
    }
    if (done()) return true;
    auto left = std::chrono::duration_cast<std::chrono::microseconds>(deadline - Clock::now());
    if (left.count() <= 0) return false;
    // Bounded: name owners appear without a message to this connection.
    sd_bus_wait(bus_.get(), static_cast<uint64_t>(std::min<long>(left.count(), 20'000)));
  }
}

}  // namespace harness
