// SPDX-License-Identifier: MIT
#pragma once

#include <string>
#include <vector>

#include "platform/helper_client.h"

/// A helper service scripted by the test, remembering what it was asked.
class FakeHelper : public vorn::HelperClient {
 public:
  struct Call {
    unsigned task;
    std::string command;
    xpc::object request;
  };
  std::int32_t status = 0;
  xpc::object response;  // replaces the caller's dictionary when not null
  std::vector<Call> calls;
  std::string client;  // the name the last client was made with

  TelephonyXPC::Result perform(vorn::helper::TaskID task, const char* command, xpc::dict request,
                               xpc::dict& reply) override {
    calls.push_back({static_cast<unsigned>(task), command, request.obj()});
    if (!response.isNull()) reply = xpc::dict(response);
    return {status, ""};
  }
};
