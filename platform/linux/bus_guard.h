// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include <exception>

#include "platform/protocol/protocol.h"

namespace vorn::bus {

/// Runs `fn` inside a C callback of sd-bus and turns anything it throws into
/// an error (an error reply where sd-bus sends one), so that no exception
/// unwinds through sd-bus's C frames.
template <typename Fn>
int guarded(sd_bus_error* error, Fn&& fn) noexcept {
  try {
    return fn();
  } catch (const std::exception& e) {
    return sd_bus_error_set(error, protocol::kInternalError, e.what());
  } catch (...) {
    return sd_bus_error_set(error, protocol::kInternalError, "unexpected failure");
  }
}

}  // namespace vorn::bus
