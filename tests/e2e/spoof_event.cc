// SPDX-License-Identifier: MIT
// What any local user can send on the system bus to lie about the server:
// a ServerStateChange event addressed to one client, and the same event to
// everybody. Exits once the bus has passed both on.
//
//   vorn_spoof_event CLIENT_UNIQUE_NAME STATE
#include <systemd/sd-bus.h>

#include <cstdio>

namespace {

bool sendEvent(sd_bus* bus, const char* destination, const char* state) {
  sd_bus_message* m = nullptr;
  bool ok = sd_bus_message_new_signal(bus, &m, "/org/vorn/Manager", "org.vorn.Manager1", "Event") >= 0 &&
            (!destination || sd_bus_message_set_destination(m, destination) >= 0) &&
            sd_bus_message_append(m, "sa{sv}", "ServerStateChange", 1, "ServerState", "s", state) >= 0 &&
            sd_bus_send(bus, m, nullptr) >= 0;
  sd_bus_message_unref(m);
  return ok;
}

}  // namespace

int main(int argc, char** argv) {
  if (argc != 3) {
    std::fprintf(stderr, "usage: %s CLIENT_UNIQUE_NAME STATE\n", argv[0]);
    return 2;
  }
  sd_bus* bus = nullptr;
  if (sd_bus_open_system(&bus) < 0) return 1;
  bool ok = sendEvent(bus, argv[1], argv[2]) && sendEvent(bus, nullptr, argv[2]);
  // The bus handles one connection's messages in order: once it has answered
  // this, both signals are on their way.
  ok = ok && sd_bus_call_method(bus, "org.freedesktop.DBus", "/org/freedesktop/DBus", "org.freedesktop.DBus",
                                "GetId", nullptr, nullptr, "") >= 0;
  sd_bus_flush_close_unref(bus);
  return ok ? 0 : 1;
}
