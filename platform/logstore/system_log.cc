// SPDX-License-Identifier: MIT
#include "platform/logstore/system_log.h"

#include <syslog.h>
#include <systemd/sd-journal.h>

#include <mutex>
#include <optional>

namespace logstore {
namespace {

std::mutex captureMutex;
std::optional<std::vector<std::string>> captured;  // engaged while a capture exists

}  // namespace

bool systemLogErrorEnabled() { return true; }

void systemLogError(std::string_view message) {
  {
    std::lock_guard lock(captureMutex);
    if (captured) {
      captured->emplace_back(message);
      return;
    }
  }
  // sd_journal_print would name the executable; the messages belong to the tool.
  sd_journal_send("MESSAGE=%.*s", static_cast<int>(message.size()), message.data(),
                  "PRIORITY=%d", LOG_ERR, "SYSLOG_IDENTIFIER=vorntool", nullptr);
}

SystemLogCapture::SystemLogCapture() {
  std::lock_guard lock(captureMutex);
  captured.emplace();
}

SystemLogCapture::~SystemLogCapture() {
  std::lock_guard lock(captureMutex);
  captured.reset();
}

std::vector<std::string> SystemLogCapture::messages() const {
  std::lock_guard lock(captureMutex);
  return *captured;
}

}  // namespace logstore
