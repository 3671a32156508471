// SPDX-License-Identifier: MIT
#include "server/common/bus_values.h"

#include <cstring>
#include <string>
#include <vector>

namespace vorn::server {
namespace {

bool readVariantBody(sd_bus_message* m, const char* contents, xpc::object* out, bool* known);

bool readArrayOfVariants(sd_bus_message* m, xpc::object* out) {
  if (sd_bus_message_enter_container(m, SD_BUS_TYPE_ARRAY, "v") < 0) return false;
  std::vector<xpc::object> items;
  for (;;) {
    int r = sd_bus_message_at_end(m, /* complete= */ false);
    if (r < 0) return false;
    if (r > 0) break;
    const char* contents = nullptr;
    if (sd_bus_message_peek_type(m, nullptr, &contents) < 0 || contents == nullptr) return false;
    if (sd_bus_message_enter_container(m, SD_BUS_TYPE_VARIANT, contents) < 0) return false;
    xpc::object item;
    bool known = false;
    if (!readVariantBody(m, contents, &item, &known)) return false;
    if (sd_bus_message_exit_container(m) < 0) return false;
    // An unknown item still takes its place, so indices keep their meaning.
    items.push_back(item);
  }
  if (sd_bus_message_exit_container(m) < 0) return false;
  *out = xpc::object::array(std::move(items));
  return true;
}

bool readVariantBody(sd_bus_message* m, const char* contents, xpc::object* out, bool* known) {
  *known = true;
  if (std::strcmp(contents, "s") == 0) {
    const char* s = nullptr;
    if (sd_bus_message_read_basic(m, 's', &s) < 0) return false;
    *out = xpc::object::string(s);
  } else if (std::strcmp(contents, "x") == 0) {
    int64_t v = 0;
    if (sd_bus_message_read_basic(m, 'x', &v) < 0) return false;
    *out = xpc::object::int64(v);
  } else if (std::strcmp(contents, "t") == 0) {
    uint64_t v = 0;
    if (sd_bus_message_read_basic(m, 't', &v) < 0) return false;
    *out = xpc::object::uint64(v);
  } else if (std::strcmp(contents, "b") == 0) {
    int v = 0;
    if (sd_bus_message_read_basic(m, 'b', &v) < 0) return false;
    *out = xpc::object::boolean(v != 0);
  } else if (std::strcmp(contents, "d") == 0) {
    double v = 0;
    if (sd_bus_message_read_basic(m, 'd', &v) < 0) return false;
    *out = xpc::object::dbl(v);
  } else if (std::strcmp(contents, "a{sv}") == 0) {
    return readDictionary(m, out);
  } else if (std::strcmp(contents, "av") == 0) {
    return readArrayOfVariants(m, out);
  } else {
    *known = false;
    *out = xpc::object();
    return sd_bus_message_skip(m, contents) >= 0;
  }
  return true;
}

}  // namespace

bool readDictionary(sd_bus_message* m, xpc::object* out) {
  if (sd_bus_message_enter_container(m, SD_BUS_TYPE_ARRAY, "{sv}") < 0) return false;
  std::vector<xpc::entry> entries;
  for (;;) {
    int r = sd_bus_message_enter_container(m, SD_BUS_TYPE_DICT_ENTRY, "sv");
    if (r < 0) return false;
    if (r == 0) break;
    const char* key = nullptr;
    const char* contents = nullptr;
    if (sd_bus_message_read_basic(m, 's', &key) < 0) return false;
    if (sd_bus_message_peek_type(m, nullptr, &contents) < 0 || contents == nullptr) return false;
    std::string name = key;
    if (sd_bus_message_enter_container(m, SD_BUS_TYPE_VARIANT, contents) < 0) return false;
    xpc::object value;
    bool known = false;
    if (!readVariantBody(m, contents, &value, &known)) return false;
    if (sd_bus_message_exit_container(m) < 0) return false;  // variant
    if (sd_bus_message_exit_container(m) < 0) return false;  // dict entry
    if (known) entries.emplace_back(std::move(name), std::move(value));
  }
  if (sd_bus_message_exit_container(m) < 0) return false;
  *out = xpc::object::dictionary(std::move(entries));
  return true;
}

namespace {

bool appendVariant(sd_bus_message* m, const xpc::object& value) {
  switch (value.kind()) {
    case xpc::type::string:
      return sd_bus_message_append(m, "v", "s", value.asString()->c_str()) >= 0;
    case xpc::type::int64:
      return sd_bus_message_append(m, "v", "x", *value.asInt64()) >= 0;
    case xpc::type::uint64:
      return sd_bus_message_append(m, "v", "t", *value.asUint64()) >= 0;
    case xpc::type::boolean:
      return sd_bus_message_append(m, "v", "b", static_cast<int>(*value.asBool())) >= 0;
    case xpc::type::double_:
      return sd_bus_message_append(m, "v", "d", *value.asDouble()) >= 0;
    case xpc::type::dictionary:
      if (sd_bus_message_open_container(m, SD_BUS_TYPE_VARIANT, "a{sv}") < 0) return false;
      if (!appendDictionary(m, value)) return false;
      return sd_bus_message_close_container(m) >= 0;
    case xpc::type::array:
      if (sd_bus_message_open_container(m, SD_BUS_TYPE_VARIANT, "av") < 0) return false;
      if (sd_bus_message_open_container(m, SD_BUS_TYPE_ARRAY, "v") < 0) return false;
      for (const auto& item : *value.asArray()) {
        if (!appendVariant(m, item)) return false;
      }
      if (sd_bus_message_close_container(m) < 0) return false;
      return sd_bus_message_close_container(m) >= 0;
    case xpc::type::null:
      break;
  }
  return false;
}

}  // namespace

bool appendDictionary(sd_bus_message* m, const xpc::object& dict) {
  if (sd_bus_message_open_container(m, SD_BUS_TYPE_ARRAY, "{sv}") < 0) return false;
  if (const auto* entries = dict.asEntries()) {
    for (const auto& [key, value] : *entries) {
      // Null cannot travel: the protocol spells it as a missing entry.
      if (value.isNull()) continue;
      if (sd_bus_message_open_container(m, SD_BUS_TYPE_DICT_ENTRY, "sv") < 0) return false;
      if (sd_bus_message_append_basic(m, 's', key.c_str()) < 0) return false;
      if (!appendVariant(m, value)) return false;
      if (sd_bus_message_close_container(m) < 0) return false;
    }
  }
  return sd_bus_message_close_container(m) >= 0;
}

}  // namespace vorn::server
