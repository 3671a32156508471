// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>

#include "platform/xpc.h"

/// Conversion between message objects and their D-Bus form (a{sv} and the
/// variant types of the protocol).
namespace vorn::server {

/// Reads one a{sv} at the read position of `m` into a dictionary. Entries
/// whose variant holds a type outside the protocol are dropped, so a request
/// reads them as missing. False when the message is malformed.
bool readDictionary(sd_bus_message* m, xpc::object* out);

/// Appends `dict` as a{sv}; a null or non-dictionary object is written as an
/// empty dictionary. False when sd-bus refused a value.
bool appendDictionary(sd_bus_message* m, const xpc::object& dict);

}  // namespace vorn::server
