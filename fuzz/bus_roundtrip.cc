// SPDX-License-Identifier: MIT
// Message objects onto the wire and back: what can be sent arrives unchanged.
#include "fuzz/support.h"
#include "platform/linux/bus_message.h"

namespace {

using vorn::bus::kMaxContainerDepth;

/// What sd-bus accepts as a string: UTF-8 without NUL, surrogates or
/// noncharacters (U+FDD0..U+FDEF and the last two code points of each plane).
bool sendableText(const std::string& s) {
  return fuzz::validUtf8(s, [](std::int32_t cp) {
    return cp != 0 && !(cp >= 0xFDD0 && cp <= 0xFDEF) && (cp & 0xFFFE) != 0xFFFE;
  });
}

/// Whether appendDictionary can send `v`, found inside `depth` containers:
/// an item of an array lies in a variant in the array, an entry's value in a
/// variant in a dict entry in the dictionary. Null values are left out, so
/// what they would hold never counts.
bool sendable(const xpc::object& v, int depth) {
  if (v.isNull()) return true;
  if (depth > kMaxContainerDepth) return false;
  if (const auto* s = v.asString()) return sendableText(*s);
  if (const auto* items = v.asArray())
    return std::ranges::all_of(*items, [&](const auto& item) { return sendable(item, depth + 2); });
  if (const auto* entries = v.asEntries())
    return std::ranges::all_of(*entries, [&](const auto& e) {
      return e.second.isNull() || (sendableText(e.first) && sendable(e.second, depth + 3));
    });
  return true;
}

/// `v` as the other side sees it: without the null values D-Bus cannot carry.
xpc::object withoutNulls(const xpc::object& v) {
  if (const auto* items = v.asArray()) {
    std::vector<xpc::object> kept;
    for (const auto& item : *items)
      if (!item.isNull()) kept.push_back(withoutNulls(item));
    return xpc::object::array(std::move(kept));
  }
  if (const auto* entries = v.asEntries()) {
    std::vector<xpc::entry> kept;
    for (const auto& [key, value] : *entries)
      if (!value.isNull()) kept.emplace_back(key, withoutNulls(value));
    return xpc::object::dictionary(std::move(kept));
  }
  return v;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  const xpc::object sent = fuzz::objectFromBytes(in, {}, kMaxContainerDepth / 2 + 2);
  auto m = fuzz::newOfflineMessage();
  FUZZ_CHECK(m);
  // Anything but a dictionary goes as an empty one.
  const bool appended = vorn::bus::appendDictionary(m.get(), sent);
  FUZZ_CHECK(appended == (!sent.isDictionary() || sendable(sent, 0)));
  if (appended) fuzz::checkReadsAs(m.get(), sent.isDictionary() ? withoutNulls(sent) : xpc::object::dictionary({}));
  return 0;
}
