// SPDX-License-Identifier: MIT
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <cstdio>
#include <cstdlib>
#include <string>
#include <string_view>
#include <vector>

#include "platform/linux/bus_handles.h"
#include "platform/xpc.h"

/// Ends the run when a property does not hold; libFuzzer then keeps the input
/// as a crash artifact. (A macro for the text and line.)
#define FUZZ_CHECK(condition)                                                                    \
  do {                                                                                           \
    if (!(condition)) {                                                                          \
      std::fprintf(stderr, "%s:%d: property does not hold: %s\n", __FILE__, __LINE__, #condition); \
      std::abort();                                                                              \
    }                                                                                            \
  } while (0)

namespace fuzz {

inline std::string textOf(const std::uint8_t* data, std::size_t size) {
  return {reinterpret_cast<const char*>(data), size};
}

/// The words of `text`, each ended by a NUL (the last one's may be missing).
std::vector<std::string> wordsOf(std::string_view text);

/// Whether `utf8` is well-formed UTF-8 (as utf8proc, not the code under test,
/// reads it) and `accept`, when given, takes each of its code points.
bool validUtf8(std::string_view utf8, bool (*accept)(std::int32_t codePoint) = nullptr);

/// A message object of any kind, nested up to `maxDepth` containers. Texts
/// are sometimes taken from `words` (keys and values a parser looks for),
/// which random bytes would rarely spell.
xpc::object objectFromBytes(FuzzedDataProvider& in, const std::vector<std::string_view>& words, int maxDepth);

/// Equal, with doubles compared bit for bit: a NaN must arrive as the same
/// NaN, though it equals nothing.
bool identical(const xpc::object& a, const xpc::object& b);

/// A new method call on a bus connection that has no peer: sd-bus creates
/// messages only on a started connection. Empty when sd-bus refuses.
vorn::bus::MessagePtr newOfflineMessage();

/// Seals `m` as sending would, rewinds it, and reads its first argument with
/// readDictionary, which must succeed and give `expected`.
void checkReadsAs(sd_bus_message* m, const xpc::object& expected);

}  // namespace fuzz
