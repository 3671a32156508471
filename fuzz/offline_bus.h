// SPDX-License-Identifier: MIT
#pragma once

#include "platform/linux/bus_handles.h"

namespace fuzz {

/// A new method call on a bus connection that has no peer: sd-bus creates
/// messages only on a started connection, and a socket pair whose other end
/// nobody reads is enough for that. Empty when sd-bus refuses.
vorn::bus::MessagePtr newOfflineMessage();

/// Seals `m` as sending would and rewinds it for reading.
bool sealForReading(sd_bus_message* m);

}  // namespace fuzz
