// SPDX-License-Identifier: MIT
#pragma once

#include <atomic>
#include <map>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "platform/vorn_client.h"

/// A scripted server: answers each command from a table, records every
/// request, and delivers events and completions on the client's queue.
class FakeManager : public vorn::client::Manager {
 public:
  struct Answer {
    Answer() = default;
    Answer(std::int32_t s, xpc::object r) : status(s), response(std::move(r)) {}
    std::int32_t status = 0;
    xpc::object response;
  };
  struct Request {
    std::string command;
    xpc::object request;
    bool async;
  };

  explicit FakeManager(dispatch::queue queue) : queue_(std::move(queue)) {}

  /// What accessDenied() reports.
  std::atomic<bool> denied = false;

  /// Answers `command`, or only GetTraceProperty for trace `traceName`.
  void answer(const std::string& command, Answer a, const std::string& traceName = {}) {
    std::lock_guard lock(mutex_);
    answers_[command + "/" + traceName] = std::move(a);
  }
  /// The state Hello reports when events are switched on; none: no answer.
  void setState(std::optional<xpc::object> payload) {
    std::lock_guard lock(mutex_);
    state_ = std::move(payload);
  }
  /// Sends a server-state event, as a running server would.
  void emit(xpc::object payload) {
    std::lock_guard lock(mutex_);
    if (!eventsOn_ || !handler_) return;
    queue_.async([h = handler_, payload] { h(payload, dispatch::group()); });
  }
  std::vector<Request> requests() const {
    std::lock_guard lock(mutex_);
    return requests_;
  }
  /// Drops the stored handler, which may hold a reference to this manager.
  void releaseHandlers() {
    std::lock_guard lock(mutex_);
    handler_ = nullptr;
  }

  void registerEventHandler(const std::string& eventName, vorn::client::EventHandler handler) override {
    std::lock_guard lock(mutex_);
    if (eventName == vorn::kEventServerStateChange) handler_ = std::move(handler);
  }
  void eventsOff() override {
    std::lock_guard lock(mutex_);
    eventsOn_ = false;
  }
  void eventsOn() override {
    std::lock_guard lock(mutex_);
    eventsOn_ = true;
    if (state_ && handler_) queue_.async([h = handler_, p = *state_] { h(p, dispatch::group()); });
  }
  TelephonyXPC::Result performCommand(const std::string& command, const xpc::object& request,
                                      xpc::object& response) override {
    Answer a = record(command, request, /* async= */ false);
    response = a.response;
    return {a.status, ""};
  }
  void performCommand(const std::string& command, vorn::client::Completion completion,
                      const xpc::object& request) override {
    Answer a = record(command, request, /* async= */ true);
    queue_.async([completion, a] { completion({a.status, ""}, a.response); });
  }
  bool accessDenied() const override { return denied; }

 private:
  Answer record(const std::string& command, const xpc::object& request, bool async) {
    std::lock_guard lock(mutex_);
    requests_.push_back({command, request, async});
    const std::string trace = xpc::dyn_cast_or_default(request.get(vorn::kKeyTraceName), "");
    if (auto it = answers_.find(command + "/" + trace); it != answers_.end()) return it->second;
    if (auto it = answers_.find(command + "/"); it != answers_.end()) return it->second;
    return {};
  }

  dispatch::queue queue_;
  mutable std::mutex mutex_;
  std::map<std::string, Answer> answers_;
  std::vector<Request> requests_;
  std::optional<xpc::object> state_;
  vorn::client::EventHandler handler_;
  bool eventsOn_ = false;
};
