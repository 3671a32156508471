// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include <cstdint>
#include <memory>
#include <string>

#include "platform/linux/bus_handles.h"
#include "platform/xpc.h"

/// Message objects on the wire: xpc::object <-> D-Bus `a{sv}`, and the status
/// a D-Bus error stands for. No connection is needed beyond the message.
namespace vorn::bus {

/// dbus-daemon disconnects a sender whose message holds a value inside more
/// than this many containers: arrays, dict entries and variants, so that each
/// level of `a{sv}` costs three and each level of `av` two. A value deeper
/// than this is refused when sending and read as null when received.
inline constexpr int kMaxContainerDepth = 64;

/// Appends `value` as `a{sv}`; anything but a dictionary is sent as an empty
/// one. Null entries are left out (D-Bus cannot carry them). False when the
/// value cannot be encoded (invalid UTF-8, an embedded NUL, too deep); the
/// message is then unusable and must not be sent.
bool appendDictionary(sd_bus_message* m, const xpc::object& value);

/// Reads the `a{sv}` at the message's read position. Entries of a type the
/// value model lacks read as null. False only when the next item is not `a{sv}`
/// or the message is damaged.
bool readDictionary(sd_bus_message* m, xpc::object& out);

/// The protocol status for a D-Bus error name (never 0).
std::int32_t statusForError(const char* errorName);

}  // namespace vorn::bus

namespace vorn::bus {

/// Reads a `(i status, s description, a{sv} response)` reply. False when the
/// reply has another signature. The response is null unless status is 0.
bool readResultReply(sd_bus_message* reply, std::int32_t& status, std::string& description,
                     xpc::object& response);

}  // namespace vorn::bus
