// SPDX-License-Identifier: MIT
#include "fuzz/offline_bus.h"

#include <sys/socket.h>

namespace fuzz {
namespace {

/// Lives as long as the process and is never closed: closing flushes, and a
/// flush would wait for the missing peer to finish authentication.
sd_bus* startOfflineBus() {
  sd_bus* bus = nullptr;
  int fds[2];
  if (sd_bus_new(&bus) < 0 || socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, fds) < 0) return nullptr;
  // The bus owns fds[0]; fds[1] stays open so that the connection never sees
  // its peer leave.
  if (sd_bus_set_fd(bus, fds[0], fds[0]) < 0 || sd_bus_start(bus) < 0) return nullptr;
  return bus;
}

}  // namespace

vorn::bus::MessagePtr newOfflineMessage() {
  static sd_bus* const bus = startOfflineBus();
  sd_bus_message* raw = nullptr;
  if (!bus || sd_bus_message_new_method_call(bus, &raw, "org.vorn.Fuzz", "/org/vorn/Fuzz", "org.vorn.Fuzz",
                                             "Message") < 0)
    return nullptr;
  return vorn::bus::MessagePtr(raw);
}

bool sealForReading(sd_bus_message* m) {
  return sd_bus_message_seal(m, /* cookie= */ 1, /* timeout_usec= */ 0) >= 0 &&
         sd_bus_message_rewind(m, /* complete= */ 1) >= 0;
}

}  // namespace fuzz
