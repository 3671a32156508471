// SPDX-License-Identifier: MIT
#include "platform/linux/bus_link.h"

#include <poll.h>
#include <sys/eventfd.h>
#include <time.h>
#include <unistd.h>

#include <cstdlib>

#include "platform/linux/bus_guard.h"
#include "platform/result.h"
#include "platform/protocol/protocol.h"

namespace vorn::bus {
namespace {

/// The caller's side of one call that sd-bus has accepted. It lives as the
/// userdata of a floating slot; the slot's destroy callback deletes it, and if
/// sd-bus dropped the slot without a reply (connection closed), reports the
/// call as unanswered, so the handler runs exactly once whatever happens.
struct PendingCall {
  OutcomeHandler handler;
  bool done = false;

  void finish(const CallOutcome& outcome) {
    if (done) return;
    done = true;
    auto h = std::move(handler);
    h(outcome);
  }

  static int onReply(sd_bus_message* reply, void* userdata, sd_bus_error* error) {
    return guarded(error, [&] {
      auto* self = static_cast<PendingCall*>(userdata);
      CallOutcome outcome;
      if (sd_bus_message_is_method_error(reply, nullptr)) {
        const sd_bus_error* e = sd_bus_message_get_error(reply);
        outcome.status = statusForError(e ? e->name : nullptr);
        outcome.description = e && e->message ? e->message : (e && e->name ? e->name : "");
      } else {
        outcome.message = reply;
      }
      self->finish(outcome);
      return 1;
    });
  }

  static void onDestroy(void* userdata) {
    auto* self = static_cast<PendingCall*>(userdata);
    self->finish({status::kNoReply, "connection closed before the reply", nullptr});
    delete self;
  }
};

/// Milliseconds until sd-bus's next deadline, for poll(); -1 when none.
int pollTimeout(sd_bus* bus) {
  std::uint64_t until = 0;
  if (!bus || sd_bus_get_timeout(bus, &until) <= 0 || until == UINT64_MAX) return -1;
  timespec now{};
  clock_gettime(CLOCK_MONOTONIC, &now);
  std::uint64_t nowUs = std::uint64_t(now.tv_sec) * 1000000u + std::uint64_t(now.tv_nsec) / 1000u;
  if (until <= nowUs) return 0;
  std::uint64_t ms = (until - nowUs + 999) / 1000;
  return ms > 60000 ? 60000 : int(ms);
}

}  // namespace

std::chrono::microseconds callTimeout(std::chrono::microseconds wanted) {
  const char* text = std::getenv("VORN_CALL_TIMEOUT_MS");
  if (!text || !*text) return wanted;
  char* end = nullptr;
  long long ms = std::strtoll(text, &end, 10);
  if (*end != '\0' || ms <= 0) return wanted;
  return std::min(wanted, std::chrono::microseconds(std::chrono::milliseconds(ms)));
}

BusLink::BusLink(ConnectHook onConnect) : onConnect_(std::move(onConnect)) {
  wakeFd_ = eventfd(0, EFD_CLOEXEC | EFD_NONBLOCK);
  thread_ = std::thread([this] { run(); });
}

BusLink::~BusLink() {
  {
    std::lock_guard lock(mutex_);
    stopping_ = true;
  }
  wake();
  if (thread_.joinable()) thread_.join();
  if (wakeFd_ >= 0) close(wakeFd_);
}

void BusLink::call(CallTarget target, ArgumentWriter args, std::chrono::microseconds timeout,
                   OutcomeHandler handler) {
  {
    std::lock_guard lock(mutex_);
    if (!stopping_) {
      requests_.push_back({target, std::move(args), timeout, std::move(handler)});
      handler = nullptr;
    }
  }
  if (handler) {
    handler({status::kNoReply, "client is closing", nullptr});
    return;
  }
  wake();
}

void BusLink::wake() {
  std::uint64_t one = 1;
  // A full counter still wakes the thread; nothing else can fail here.
  [[maybe_unused]] auto n = write(wakeFd_, &one, sizeof one);
}

sd_bus* BusLink::connection() {
  if (bus_ && sd_bus_is_open(bus_.get()) <= 0) bus_.reset();
  if (bus_) return bus_.get();
  sd_bus* raw = nullptr;
  if (sd_bus_open_system(&raw) < 0) return nullptr;
  bus_.reset(raw);
  if (onConnect_) onConnect_(raw);
  return raw;
}

void BusLink::send(Request& request) {
  sd_bus* bus = connection();
  if (!bus) {
    request.handler({kResultServerNotRunning, "no system bus", nullptr});
    return;
  }
  sd_bus_message* raw = nullptr;
  const auto& t = request.target;
  if (sd_bus_message_new_method_call(bus, &raw, t.destination, t.path, t.interface, t.member) < 0) {
    request.handler({status::kBusError, "cannot create the call", nullptr});
    return;
  }
  MessagePtr message(raw);
  if (request.args && !request.args(raw)) {
    request.handler({status::kBusError, "request cannot be encoded for D-Bus", nullptr});
    return;
  }
  auto* pending = new PendingCall{std::move(request.handler)};
  sd_bus_slot* slot = nullptr;
  int r = sd_bus_call_async(bus, &slot, raw, &PendingCall::onReply, pending,
                            std::uint64_t(request.timeout.count()));
  if (r < 0) {
    // A connection that broke under us counts as no bus; the next call
    // reconnects.
    bool broken = r == -ENOTCONN || r == -ECONNRESET || r == -EPIPE;
    if (broken) bus_.reset();
    pending->finish({broken ? kResultServerNotRunning : status::kBusError,
                     "cannot send the call", nullptr});
    delete pending;
    return;
  }
  sd_bus_slot_set_destroy_callback(slot, &PendingCall::onDestroy);
  sd_bus_slot_set_floating(slot, 1);
  sd_bus_slot_unref(slot);
}

void BusLink::run() {
  for (;;) {
    std::deque<Request> batch;
    bool stopping = false;
    {
      std::lock_guard lock(mutex_);
      batch.swap(requests_);
      stopping = stopping_;
    }
    if (stopping) {
      for (auto& request : batch) request.handler({status::kNoReply, "client is closing", nullptr});
      // Closing the connection drops every pending slot; their destroy
      // callbacks report the calls as unanswered.
      bus_.reset();
      return;
    }
    for (auto& request : batch) send(request);

    if (bus_) {
      int r = 0;
      // sd_bus_process returns 0 right after running a timeout callback even
      // when more is due; the poll below recomputes the deadline, so a second
      // expired call is handled at once rather than at the next message.
      while ((r = sd_bus_process(bus_.get(), nullptr)) > 0) {
      }
      if (r < 0) bus_.reset();
    }

    pollfd fds[2] = {{wakeFd_, POLLIN, 0}, {-1, 0, 0}};
    nfds_t count = 1;
    if (bus_) {
      int fd = sd_bus_get_fd(bus_.get());
      int events = sd_bus_get_events(bus_.get());
      if (fd >= 0 && events >= 0) {
        fds[1] = {fd, short(events), 0};
        count = 2;
      }
    }
    poll(fds, count, pollTimeout(bus_.get()));
    if (fds[0].revents & POLLIN) {
      std::uint64_t value = 0;
      [[maybe_unused]] auto n = read(wakeFd_, &value, sizeof value);
    }
  }
}

}  // namespace vorn::bus
