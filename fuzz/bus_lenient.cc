// SPDX-License-Identifier: MIT
// Received a{sv} content of any D-Bus type: read leniently, types outside the
// value model as null, and the read ends right after the dictionary.
//
// sd-bus checks every received message against its signature before anyone
// reads it, so a well-formed message with arbitrary content is exactly what
// readDictionary can meet; it is built here from the fuzz bytes.
#include <fuzzer/FuzzedDataProvider.h>

#include <bit>
#include <cstddef>
#include <cstdint>
#include <string>
#include <vector>

#include "fuzz/fuzz_check.h"
#include "fuzz/offline_bus.h"
#include "fuzz/xpc_from_bytes.h"
#include "platform/linux/bus_message.h"

namespace {

/// A D-Bus type: a basic type code, or 'a' (one child), 'e' (dictionary
/// entry: a basic key and a value), 'r' (struct) or 'v' (variant).
struct Type {
  char code;
  std::vector<Type> children;
};

constexpr std::string_view kBasic = "ybnqiuxtdsog";  // no 'h': fds need a connection that passes them
using vorn::bus::kMaxNesting;

std::string signature(const Type& t) {
  switch (t.code) {
    case 'a': return "a" + signature(t.children[0]);
    case 'e': return "{" + signature(t.children[0]) + signature(t.children[1]) + "}";
    case 'r': {
      std::string s = "(";
      for (const auto& c : t.children) s += signature(c);
      return s + ")";
    }
    default: return std::string(1, t.code);
  }
}

class ContentFromBytes {
 public:
  ContentFromBytes(FuzzedDataProvider& in, sd_bus_message* m) : in_(in), m_(m) {}

  /// Appends an a{sv} whose variants lie at depth `depth` and returns what
  /// readDictionary should make of it there: the dictionary, or null when
  /// nested too deep.
  xpc::object appendDictionary(int depth) {
    FUZZ_CHECK(sd_bus_message_open_container(m_, 'a', "{sv}") >= 0);
    std::vector<xpc::entry> entries;
    for (auto n = in_.ConsumeIntegralInRange<int>(0, 4); n > 0; --n) {
      FUZZ_CHECK(sd_bus_message_open_container(m_, 'e', "sv") >= 0);
      std::string key = text();
      FUZZ_CHECK(sd_bus_message_append_basic(m_, 's', key.c_str()) >= 0);
      xpc::object value = appendVariant(depth);
      FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
      entries.emplace_back(std::move(key), std::move(value));
    }
    FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
    return depth <= kMaxNesting ? xpc::object::dictionary(std::move(entries)) : xpc::object();
  }

 private:
  /// Types nest at most kMaxTypeDepth deep inside one signature, variants
  /// two levels past the depth the reader still reads: some three containers
  /// per variant level, well inside sd-bus's limit of 128.
  static constexpr int kMaxTypeDepth = 2;
  static constexpr int kMaxVariantDepth = kMaxNesting + 2;

  Type type(int level, int depth) {
    const bool deeper = level < kMaxTypeDepth && depth < kMaxVariantDepth;
    const int pick = in_.ConsumeIntegralInRange<int>(0, deeper ? 17 : 11);
    if (pick < 12) return {kBasic[static_cast<std::size_t>(pick)], {}};
    switch (pick) {
      case 12: return {'v', {}};
      case 13: return {'a', {type(level + 1, depth)}};
      case 14: return {'a', {{'e', {basicType(), type(level + 1, depth)}}}};
      case 15: return {'a', {{'v', {}}}};
      case 16: return {'a', {{'e', {{'s', {}}, {'v', {}}}}}};
      default: {
        std::vector<Type> fields(in_.ConsumeIntegralInRange<std::size_t>(1, 3));
        for (auto& f : fields) f = type(level + 1, depth);
        return {'r', std::move(fields)};
      }
    }
  }

  Type basicType() { return {kBasic[in_.ConsumeIntegralInRange<std::size_t>(0, kBasic.size() - 1)], {}}; }

  /// A variant at depth `depth`, and what reading it there should give.
  xpc::object appendVariant(int depth) {
    const Type inner = type(0, depth);
    const std::string sig = signature(inner);
    FUZZ_CHECK(sd_bus_message_open_container(m_, 'v', sig.c_str()) >= 0);
    xpc::object value;
    if (sig == "a{sv}") {
      value = appendDictionary(depth + 1);
    } else if (sig == "av") {
      FUZZ_CHECK(sd_bus_message_open_container(m_, 'a', "v") >= 0);
      std::vector<xpc::object> items;
      for (auto n = in_.ConsumeIntegralInRange<int>(0, 4); n > 0; --n) items.push_back(appendVariant(depth + 1));
      FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
      if (depth + 1 <= kMaxNesting) value = xpc::object::array(std::move(items));
    } else {
      value = append(inner, depth);
    }
    FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
    return value;
  }

  /// Appends a value of type `t` inside a variant at depth `depth`; returns
  /// the object it reads as when it is the variant's whole content.
  xpc::object append(const Type& t, int depth) {
    switch (t.code) {
      case 'v': appendVariant(depth + 1); return {};
      case 'a': {
        FUZZ_CHECK(sd_bus_message_open_container(m_, 'a', signature(t.children[0]).c_str()) >= 0);
        for (auto n = in_.ConsumeIntegralInRange<int>(0, 3); n > 0; --n) append(t.children[0], depth);
        FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
        return {};
      }
      case 'e':
      case 'r': {
        std::string fields;
        for (const auto& c : t.children) fields += signature(c);
        FUZZ_CHECK(sd_bus_message_open_container(m_, t.code, fields.c_str()) >= 0);
        for (const auto& c : t.children) append(c, depth);
        FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0);
        return {};
      }
      default: return appendBasic(t.code);
    }
  }

  /// Printable ASCII, so that sd-bus takes it as a string of any kind.
  std::string text() {
    std::string s = in_.ConsumeRandomLengthString(16);
    for (char& c : s) c = static_cast<char>(0x20 + static_cast<unsigned char>(c) % 0x5F);
    return s;
  }

  template <class T>
  void appendNumber(char code) {
    const T v = in_.ConsumeIntegral<T>();
    FUZZ_CHECK(sd_bus_message_append_basic(m_, code, &v) >= 0);
  }

  xpc::object appendBasic(char code) {
    switch (code) {
      case 'y': appendNumber<std::uint8_t>(code); return {};
      case 'n': appendNumber<std::int16_t>(code); return {};
      case 'q': appendNumber<std::uint16_t>(code); return {};
      case 'i': appendNumber<std::int32_t>(code); return {};
      case 'u': appendNumber<std::uint32_t>(code); return {};
      case 'b': {
        const int v = in_.ConsumeBool();
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, &v) >= 0);
        return xpc::object::boolean(v != 0);
      }
      case 'x': {
        const auto v = in_.ConsumeIntegral<std::int64_t>();
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, &v) >= 0);
        return xpc::object::int64(v);
      }
      case 't': {
        const auto v = in_.ConsumeIntegral<std::uint64_t>();
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, &v) >= 0);
        return xpc::object::uint64(v);
      }
      case 'd': {
        const auto v = std::bit_cast<double>(in_.ConsumeIntegral<std::uint64_t>());
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, &v) >= 0);
        return xpc::object::dbl(v);
      }
      case 's': {
        const std::string v = text();
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, v.c_str()) >= 0);
        return xpc::object::string(v);
      }
      case 'o':
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, in_.ConsumeBool() ? "/" : "/org/vorn/x") >= 0);
        return {};
      default:  // 'g'
        FUZZ_CHECK(sd_bus_message_append_basic(m_, code, signature(type(0, kMaxVariantDepth)).c_str()) >= 0);
        return {};
    }
  }

  FuzzedDataProvider& in_;
  sd_bus_message* m_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  auto m = fuzz::newOfflineMessage();
  FUZZ_CHECK(m);
  const xpc::object expected = ContentFromBytes(in, m.get()).appendDictionary(/* depth= */ 0);
  constexpr const char* kAfter = "after the dictionary";
  FUZZ_CHECK(sd_bus_message_append_basic(m.get(), 's', kAfter) >= 0);
  FUZZ_CHECK(fuzz::sealForReading(m.get()));

  xpc::object received;
  FUZZ_CHECK(vorn::bus::readDictionary(m.get(), received));
  FUZZ_CHECK(fuzz::identical(received, expected));
  const char* after = nullptr;
  FUZZ_CHECK(sd_bus_message_read_basic(m.get(), 's', &after) > 0 && std::string_view(after) == kAfter);
  return 0;
}
