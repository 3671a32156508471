// SPDX-License-Identifier: MIT
#include "platform/linux/name_watch.h"

#include <cstring>

#include "platform/linux/bus_guard.h"

namespace vorn::bus {
namespace {

constexpr const char* kBusService = "org.freedesktop.DBus";
constexpr const char* kBusPath = "/org/freedesktop/DBus";
constexpr const char* kBusInterface = "org.freedesktop.DBus";

}  // namespace

NameWatch::NameWatch(std::string name, Handlers handlers)
    : name_(std::move(name)), handlers_(std::move(handlers)) {}

void NameWatch::attach(sd_bus* bus) {
  // A new connection may be to a new bus, where unique names start over:
  // nobody is trusted until this bus says who owns the name.
  update("", /* announce= */ settled_);
  const std::string rule = std::string("type='signal',sender='") + kBusService + "',path='" +
                           kBusPath + "',interface='" + kBusInterface +
                           "',member='NameOwnerChanged',arg0='" + name_ + "'";
  sd_bus_add_match_async(bus, nullptr, rule.c_str(), &NameWatch::onOwnerChanged,
                         /* install_callback= */ nullptr, this);
  sd_bus_call_method_async(bus, nullptr, kBusService, kBusPath, kBusInterface, "GetNameOwner",
                           &NameWatch::onOwnerAnswer, this, "s", name_.c_str());
}

bool NameWatch::isOwner(const char* sender) const {
  return sender && !owner_.empty() && owner_ == sender;
}

int NameWatch::onOwnerChanged(sd_bus_message* m, void* userdata, sd_bus_error* error) {
  return guarded(error, [&] {
    auto* self = static_cast<NameWatch*>(userdata);
    // Anyone may address a signal of this name to us; only the bus's own counts.
    const char* sender = sd_bus_message_get_sender(m);
    if (!sender || std::strcmp(sender, kBusService) != 0) return 0;
    const char *name = nullptr, *oldOwner = nullptr, *newOwner = nullptr;
    if (sd_bus_message_read(m, "sss", &name, &oldOwner, &newOwner) < 0 || self->name_ != name)
      return 0;
    self->settled_ = true;
    self->update(newOwner, /* announce= */ true);
    return 0;
  });
}

int NameWatch::onOwnerAnswer(sd_bus_message* m, void* userdata, sd_bus_error* error) {
  return guarded(error, [&] {
    auto* self = static_cast<NameWatch*>(userdata);
    // An error answer (NameHasNoOwner) means nobody owns the name.
    const char* owner = nullptr;
    if (sd_bus_message_is_method_error(m, nullptr) || sd_bus_message_read(m, "s", &owner) < 0)
      owner = "";
    self->update(owner, /* announce= */ self->settled_);
    self->settled_ = true;
    return 0;
  });
}

void NameWatch::update(const std::string& owner, bool announce) {
  if (owner == owner_) return;
  owner_ = owner;
  if (!announce) return;
  if (owner_.empty()) {
    if (handlers_.lost) handlers_.lost();
  } else if (handlers_.gained) {
    handlers_.gained();
  }
}

}  // namespace vorn::bus
