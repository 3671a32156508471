// SPDX-License-Identifier: MIT
#include "server/common/daemon_loop.h"
#include "platform/linux/errno_text.h"

#include <signal.h>

#include <cstring>
#include <memory>

namespace vorn::server {

namespace {

std::string sdError(const std::string& what, int r) { return what + ": " + errnoText(-r); }

int onTimer(sd_event_source* s, uint64_t, void* userdata) {
  auto* fn = static_cast<std::function<void()>*>(userdata);
  try {
    (*fn)();
  } catch (...) {
    // A timer callback has no one to report to; the loop must go on.
  }
  // Un-floating drops the loop's reference, the only one: sd-event frees the
  // source once this callback returns, and the destroy callback frees `fn`.
  sd_event_source_set_floating(s, 0);
  return 0;
}

void destroyTimerFn(void* userdata) { delete static_cast<std::function<void()>*>(userdata); }

}  // namespace

bool DaemonLoop::open(std::function<void()> onStop, std::string* error) {
  onStop_ = std::move(onStop);
  // A shell starts background jobs with SIGINT ignored, and an ignored
  // signal never reaches a signalfd; take both back before blocking them.
  signal(SIGTERM, SIG_DFL);
  signal(SIGINT, SIG_DFL);
  sigset_t mask;
  sigemptyset(&mask);
  sigaddset(&mask, SIGTERM);
  sigaddset(&mask, SIGINT);
  pthread_sigmask(SIG_BLOCK, &mask, nullptr);

  sd_event* e = nullptr;
  int r = sd_event_new(&e);
  if (r < 0) {
    *error = sdError("cannot create the event loop", r);
    return false;
  }
  event_.reset(e);
  sd_event_source* src = nullptr;
  if ((r = sd_event_add_signal(e, &src, SIGTERM, &DaemonLoop::onSignal, this)) < 0) {
    *error = sdError("cannot watch SIGTERM", r);
    return false;
  }
  sigterm_.reset(src);
  if ((r = sd_event_add_signal(e, &src, SIGINT, &DaemonLoop::onSignal, this)) < 0) {
    *error = sdError("cannot watch SIGINT", r);
    return false;
  }
  sigint_.reset(src);

  sd_bus* b = nullptr;
  // sd_bus_open_system honours DBUS_SYSTEM_BUS_ADDRESS.
  if ((r = sd_bus_open_system(&b)) < 0) {
    *error = sdError("cannot connect to the system bus", r);
    return false;
  }
  bus_.reset(b);
  if ((r = sd_bus_attach_event(b, e, SD_EVENT_PRIORITY_NORMAL)) < 0) {
    *error = sdError("cannot attach the bus", r);
    return false;
  }
  return true;
}

bool DaemonLoop::after(long delayMs, std::function<void()> fn) {
  auto* holder = new std::function<void()>(std::move(fn));
  sd_event_source* src = nullptr;
  int r = sd_event_add_time_relative(event_.get(), &src, CLOCK_MONOTONIC, static_cast<uint64_t>(delayMs) * 1000,
                                     /* accuracy= */ 1000, onTimer, holder);
  if (r < 0) {
    delete holder;
    return false;
  }
  sd_event_source_set_destroy_callback(src, destroyTimerFn);
  // Owned by the loop, so timers still pending at exit go with it.
  sd_event_source_set_floating(src, 1);
  sd_event_source_unref(src);
  return true;
}

void DaemonLoop::sendReply(bus::MessagePtr reply, long delayMs) {
  if (delayMs <= 0) {
    sd_bus_send(bus_.get(), reply.get(), nullptr);
    return;
  }
  auto shared = std::make_shared<bus::MessagePtr>(std::move(reply));
  sd_bus* b = bus_.get();
  if (!after(delayMs, [b, shared] { sd_bus_send(b, shared->get(), nullptr); })) {
    sd_bus_send(b, shared->get(), nullptr);
  }
}

bool DaemonLoop::requestName(const char* name, std::string* error) {
  int r = sd_bus_request_name(bus_.get(), name, 0);
  if (r < 0) {
    *error = sdError(std::string("cannot own ") + name, r);
    return false;
  }
  return true;
}

void DaemonLoop::releaseName(const char* name) {
  sd_bus_release_name(bus_.get(), name);
  sd_bus_flush(bus_.get());
}

int DaemonLoop::run() { return sd_event_loop(event_.get()); }

void DaemonLoop::exit(int code) { sd_event_exit(event_.get(), code); }

int DaemonLoop::onSignal(sd_event_source*, const struct signalfd_siginfo*, void* userdata) {
  auto* self = static_cast<DaemonLoop*>(userdata);
  if (self->stopping_) return 0;
  self->stopping_ = true;
  try {
    if (self->onStop_) self->onStop_();
  } catch (...) {
    // Stopping goes on regardless.
  }
  self->exit(0);
  return 0;
}

}  // namespace vorn::server
