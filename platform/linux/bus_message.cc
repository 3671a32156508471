// SPDX-License-Identifier: MIT
#include "platform/linux/bus_message.h"

#include <cstring>
#include <string_view>

#include "platform/protocol/protocol.h"
#include "platform/result.h"

namespace vorn::bus {
namespace {

/// The D-Bus signature of a value, or nullptr for null (not representable).
const char* signatureOf(const xpc::object& v) {
  switch (v.kind()) {
    case xpc::type::null: return nullptr;
    case xpc::type::dictionary: return "a{sv}";
    case xpc::type::string: return "s";
    case xpc::type::int64: return "x";
    case xpc::type::uint64: return "t";
    case xpc::type::boolean: return "b";
    case xpc::type::double_: return "d";
    case xpc::type::array: return "av";
  }
  return nullptr;
}

bool appendText(sd_bus_message* m, const std::string& text) {
  // sd-bus takes C strings: an embedded NUL would silently cut the text.
  if (text.find('\0') != std::string::npos) return false;
  return sd_bus_message_append_basic(m, 's', text.c_str()) >= 0;
}

// `depth` is the number of containers around the value being appended.
bool appendEntries(sd_bus_message* m, const xpc::object& value, int depth);
bool appendItems(sd_bus_message* m, const xpc::object& value, int depth);

/// Appends the contents of a variant whose signature is signatureOf(v).
bool appendBare(sd_bus_message* m, const xpc::object& v, int depth) {
  switch (v.kind()) {
    case xpc::type::dictionary: return appendEntries(m, v, depth);
    case xpc::type::array: return appendItems(m, v, depth);
    case xpc::type::string: return appendText(m, *v.asString());
    case xpc::type::int64: {
      std::int64_t x = *v.asInt64();
      return sd_bus_message_append_basic(m, 'x', &x) >= 0;
    }
    case xpc::type::uint64: {
      std::uint64_t t = *v.asUint64();
      return sd_bus_message_append_basic(m, 't', &t) >= 0;
    }
    case xpc::type::boolean: {
      int b = *v.asBool() ? 1 : 0;
      return sd_bus_message_append_basic(m, 'b', &b) >= 0;
    }
    case xpc::type::double_: {
      double d = *v.asDouble();
      return sd_bus_message_append_basic(m, 'd', &d) >= 0;
    }
    case xpc::type::null: break;
  }
  return false;
}

bool appendVariant(sd_bus_message* m, const xpc::object& v, int depth) {
  const char* sig = signatureOf(v);
  if (!sig) return true;
  // The variant's contents are the deepest value it adds; a dict entry and
  // its key sit no deeper than the variant beside them.
  if (depth + 1 > kMaxContainerDepth) return false;
  return sd_bus_message_open_container(m, 'v', sig) >= 0 && appendBare(m, v, depth + 1) &&
         sd_bus_message_close_container(m) >= 0;
}

bool appendEntries(sd_bus_message* m, const xpc::object& value, int depth) {
  if (sd_bus_message_open_container(m, 'a', "{sv}") < 0) return false;
  if (auto* entries = value.asEntries()) {
    for (const auto& [key, item] : *entries) {
      if (item.isNull()) continue;
      if (sd_bus_message_open_container(m, 'e', "sv") < 0 || !appendText(m, key) ||
          !appendVariant(m, item, depth + 2) || sd_bus_message_close_container(m) < 0)
        return false;
    }
  }
  return sd_bus_message_close_container(m) >= 0;
}

bool appendItems(sd_bus_message* m, const xpc::object& value, int depth) {
  if (sd_bus_message_open_container(m, 'a', "v") < 0) return false;
  for (const auto& item : *value.asArray())
    if (!appendVariant(m, item, depth + 1)) return false;
  return sd_bus_message_close_container(m) >= 0;
}

bool readEntries(sd_bus_message* m, xpc::object& out, int depth);
bool readItems(sd_bus_message* m, xpc::object& out, int depth);

/// Reads one variant found inside `depth` containers; a type outside the
/// value model, or contents nested too deep, is skipped and reads as null.
bool readVariant(sd_bus_message* m, xpc::object& out, int depth) {
  char type = 0;
  const char* contents = nullptr;
  if (sd_bus_message_peek_type(m, &type, &contents) <= 0 || type != 'v' || !contents) return false;
  std::string_view sig(contents);
  if (sd_bus_message_enter_container(m, 'v', contents) < 0) return false;
  bool ok = true;
  out = {};
  if (depth + 1 > kMaxContainerDepth) {
    ok = sd_bus_message_skip(m, contents) >= 0;
  } else if (sig == "s") {
    const char* s = nullptr;
    ok = sd_bus_message_read_basic(m, 's', &s) >= 0;
    if (ok) out = xpc::object::string(s);
  } else if (sig == "x") {
    std::int64_t x = 0;
    ok = sd_bus_message_read_basic(m, 'x', &x) >= 0;
    if (ok) out = xpc::object::int64(x);
  } else if (sig == "t") {
    std::uint64_t t = 0;
    ok = sd_bus_message_read_basic(m, 't', &t) >= 0;
    if (ok) out = xpc::object::uint64(t);
  } else if (sig == "b") {
    int b = 0;
    ok = sd_bus_message_read_basic(m, 'b', &b) >= 0;
    if (ok) out = xpc::object::boolean(b != 0);
  } else if (sig == "d") {
    double d = 0;
    ok = sd_bus_message_read_basic(m, 'd', &d) >= 0;
    if (ok) out = xpc::object::dbl(d);
  } else if (sig == "a{sv}") {
    ok = readEntries(m, out, depth + 1);
  } else if (sig == "av") {
    ok = readItems(m, out, depth + 1);
  } else {
    ok = sd_bus_message_skip(m, contents) >= 0;
  }
  return ok && sd_bus_message_exit_container(m) >= 0;
}

bool readEntries(sd_bus_message* m, xpc::object& out, int depth) {
  if (sd_bus_message_enter_container(m, 'a', "{sv}") <= 0) return false;
  std::vector<xpc::entry> entries;
  for (;;) {
    int r = sd_bus_message_enter_container(m, 'e', "sv");
    if (r < 0) return false;
    if (r == 0) break;
    const char* key = nullptr;
    xpc::object value;
    if (sd_bus_message_read_basic(m, 's', &key) < 0 || !readVariant(m, value, depth + 2) ||
        sd_bus_message_exit_container(m) < 0)
      return false;
    entries.emplace_back(key, std::move(value));
  }
  if (sd_bus_message_exit_container(m) < 0) return false;
  out = xpc::object::dictionary(std::move(entries));
  return true;
}

bool readItems(sd_bus_message* m, xpc::object& out, int depth) {
  if (sd_bus_message_enter_container(m, 'a', "v") <= 0) return false;
  std::vector<xpc::object> items;
  for (;;) {
    int r = sd_bus_message_at_end(m, /* complete= */ false);
    if (r < 0) return false;
    if (r > 0) break;
    xpc::object item;
    if (!readVariant(m, item, depth + 1)) return false;
    items.push_back(std::move(item));
  }
  if (sd_bus_message_exit_container(m) < 0) return false;
  out = xpc::object::array(std::move(items));
  return true;
}

}  // namespace

bool appendDictionary(sd_bus_message* m, const xpc::object& value) {
  return appendEntries(m, value, 0);
}

bool readDictionary(sd_bus_message* m, xpc::object& out) {
  char type = 0;
  const char* contents = nullptr;
  if (sd_bus_message_peek_type(m, &type, &contents) <= 0 || type != 'a' || !contents ||
      std::string_view(contents) != "{sv}")
    return false;
  return readEntries(m, out, 0);
}

std::int32_t statusForError(const char* errorName) {
  std::string_view name = errorName ? errorName : "";
  if (name == SD_BUS_ERROR_SERVICE_UNKNOWN || name == SD_BUS_ERROR_NAME_HAS_NO_OWNER)
    return kResultServerNotRunning;
  if (name == SD_BUS_ERROR_NO_REPLY || name == SD_BUS_ERROR_TIMEOUT ||
      name == SD_BUS_ERROR_DISCONNECTED)
    return status::kNoReply;
  if (name == SD_BUS_ERROR_ACCESS_DENIED) return status::kAccessDenied;
  return status::kBusError;
}

}  // namespace vorn::bus

namespace vorn::bus {

bool readResultReply(sd_bus_message* reply, std::int32_t& status, std::string& description,
                     xpc::object& response) {
  if (sd_bus_message_has_signature(reply, "isa{sv}") <= 0) return false;
  std::int32_t code = 0;
  const char* text = nullptr;
  xpc::object payload;
  if (sd_bus_message_read(reply, "is", &code, &text) < 0 || !readDictionary(reply, payload))
    return false;
  status = code;
  description = text ? text : "";
  response = code == 0 ? std::move(payload) : xpc::object();
  return true;
}

}  // namespace vorn::bus
