// SPDX-License-Identifier: MIT
#include "fuzz/xpc_from_bytes.h"

#include <algorithm>
#include <bit>
#include <cstdint>

namespace fuzz {

std::string XpcFromBytes::text() {
  const auto pick = in_.ConsumeIntegral<std::uint8_t>();
  if (pick < words_.size()) return std::string(words_[pick]);
  return in_.ConsumeRandomLengthString(64);
}

xpc::object XpcFromBytes::object(int depth) {
  constexpr std::size_t kMaxItems = 6;
  switch (in_.ConsumeIntegralInRange(0, depth < maxDepth_ ? 7 : 5)) {
    case 0: return {};
    case 1: return xpc::object::string(text());
    case 2: return xpc::object::int64(in_.ConsumeIntegral<std::int64_t>());
    case 3: return xpc::object::uint64(in_.ConsumeIntegral<std::uint64_t>());
    case 4: return xpc::object::boolean(in_.ConsumeBool());
    case 5: return xpc::object::dbl(std::bit_cast<double>(in_.ConsumeIntegral<std::uint64_t>()));
    case 6: {
      std::vector<xpc::object> items(in_.ConsumeIntegralInRange<std::size_t>(0, kMaxItems));
      for (auto& item : items) item = object(depth + 1);
      return xpc::object::array(std::move(items));
    }
    default: {
      std::vector<xpc::entry> entries(in_.ConsumeIntegralInRange<std::size_t>(0, kMaxItems));
      for (auto& [key, value] : entries) key = text(), value = object(depth + 1);
      return xpc::object::dictionary(std::move(entries));
    }
  }
}

bool identical(const xpc::object& a, const xpc::object& b) {
  if (a.kind() != b.kind()) return false;
  if (const auto* x = a.asDouble()) return std::bit_cast<std::uint64_t>(*x) == std::bit_cast<std::uint64_t>(*b.asDouble());
  if (const auto* items = a.asArray()) {
    const auto& other = *b.asArray();
    return std::equal(items->begin(), items->end(), other.begin(), other.end(), identical);
  }
  if (const auto* entries = a.asEntries()) {
    const auto& other = *b.asEntries();
    return std::equal(entries->begin(), entries->end(), other.begin(), other.end(),
                      [](const xpc::entry& x, const xpc::entry& y) {
                        return x.first == y.first && identical(x.second, y.second);
                      });
  }
  return a == b;
}

}  // namespace fuzz
