// SPDX-License-Identifier: MIT
#pragma once

#include <systemd/sd-bus.h>
#include <systemd/sd-event.h>

#include <memory>

/// Owning handles of the sd-bus and sd-event objects that the client
/// library and the daemons hold.
namespace vorn::bus {

struct BusUnref {
  void operator()(sd_bus* bus) const { sd_bus_flush_close_unref(bus); }
};
struct MessageUnref {
  void operator()(sd_bus_message* m) const { sd_bus_message_unref(m); }
};
struct SlotUnref {
  void operator()(sd_bus_slot* s) const { sd_bus_slot_unref(s); }
};
struct EventUnref {
  void operator()(sd_event* e) const { sd_event_unref(e); }
};
struct EventSourceUnref {
  void operator()(sd_event_source* s) const { sd_event_source_disable_unref(s); }
};

using BusPtr = std::unique_ptr<sd_bus, BusUnref>;
using MessagePtr = std::unique_ptr<sd_bus_message, MessageUnref>;
using SlotPtr = std::unique_ptr<sd_bus_slot, SlotUnref>;
using EventPtr = std::unique_ptr<sd_event, EventUnref>;
using EventSourcePtr = std::unique_ptr<sd_event_source, EventSourceUnref>;

/// Takes a new reference to `m` (method calls answered later).
inline MessagePtr retain(sd_bus_message* m) { return MessagePtr(sd_bus_message_ref(m)); }

}  // namespace vorn::bus
