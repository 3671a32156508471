// SPDX-License-Identifier: MIT
#include "fuzz/support.h"

#include <sys/socket.h>
#include <utf8proc.h>

#include <algorithm>
#include <bit>

#include "platform/linux/bus_message.h"

namespace fuzz {

std::vector<std::string> wordsOf(std::string_view text) {
  std::vector<std::string> words;
  while (!text.empty()) {
    const auto end = std::min(text.find('\0'), text.size());
    words.emplace_back(text.substr(0, end));
    text.remove_prefix(std::min(end + 1, text.size()));
  }
  return words;
}

bool validUtf8(std::string_view utf8, bool (*accept)(std::int32_t)) {
  const auto* p = reinterpret_cast<const utf8proc_uint8_t*>(utf8.data());
  for (std::size_t i = 0; i < utf8.size();) {
    utf8proc_int32_t cp = 0;
    const auto n = utf8proc_iterate(p + i, static_cast<utf8proc_ssize_t>(utf8.size() - i), &cp);
    if (n <= 0 || (accept && !accept(cp))) return false;
    i += static_cast<std::size_t>(n);
  }
  return true;
}

xpc::object objectFromBytes(FuzzedDataProvider& in, const std::vector<std::string_view>& words, int maxDepth) {
  constexpr std::size_t kMaxItems = 6;
  auto text = [&] {
    const auto pick = in.ConsumeIntegral<std::uint8_t>();
    return pick < words.size() ? std::string(words[pick]) : in.ConsumeRandomLengthString(64);
  };
  switch (in.ConsumeIntegralInRange(0, maxDepth > 0 ? 7 : 5)) {
    case 0: return {};
    case 1: return xpc::object::string(text());
    case 2: return xpc::object::int64(in.ConsumeIntegral<std::int64_t>());
    case 3: return xpc::object::uint64(in.ConsumeIntegral<std::uint64_t>());
    case 4: return xpc::object::boolean(in.ConsumeBool());
    case 5: return xpc::object::dbl(std::bit_cast<double>(in.ConsumeIntegral<std::uint64_t>()));
    case 6: {
      std::vector<xpc::object> items(in.ConsumeIntegralInRange<std::size_t>(0, kMaxItems));
      for (auto& item : items) item = objectFromBytes(in, words, maxDepth - 1);
      return xpc::object::array(std::move(items));
    }
    default: {
      std::vector<xpc::entry> entries(in.ConsumeIntegralInRange<std::size_t>(0, kMaxItems));
      for (auto& [key, value] : entries) key = text(), value = objectFromBytes(in, words, maxDepth - 1);
      return xpc::object::dictionary(std::move(entries));
    }
  }
}

bool identical(const xpc::object& a, const xpc::object& b) {
  if (a.kind() != b.kind()) return false;
  if (const auto* x = a.asDouble()) return std::bit_cast<std::uint64_t>(*x) == std::bit_cast<std::uint64_t>(*b.asDouble());
  if (const auto* items = a.asArray())
    return std::ranges::equal(*items, *b.asArray(), identical);
  if (const auto* entries = a.asEntries())
    return std::ranges::equal(*entries, *b.asEntries(), [](const xpc::entry& x, const xpc::entry& y) {
      return x.first == y.first && identical(x.second, y.second);
    });
  return a == b;
}

vorn::bus::MessagePtr newOfflineMessage() {
  // Never closed: closing flushes, and a flush would wait for the missing
  // peer to finish authentication. The bus owns fds[0]; fds[1] stays open so
  // that the connection never sees its peer leave.
  static sd_bus* const bus = [] {
    sd_bus* b = nullptr;
    int fds[2];
    if (sd_bus_new(&b) < 0 || socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, fds) < 0 ||
        sd_bus_set_fd(b, fds[0], fds[0]) < 0 || sd_bus_start(b) < 0)
      return static_cast<sd_bus*>(nullptr);
    return b;
  }();
  sd_bus_message* raw = nullptr;
  if (!bus || sd_bus_message_new_method_call(bus, &raw, "org.vorn.Fuzz", "/org/vorn/Fuzz", "org.vorn.Fuzz",
                                             "Message") < 0)
    return nullptr;
  return vorn::bus::MessagePtr(raw);
}

void checkReadsAs(sd_bus_message* m, const xpc::object& expected) {
  FUZZ_CHECK(sd_bus_message_seal(m, /* cookie= */ 1, /* timeout_usec= */ 0) >= 0 &&
             sd_bus_message_rewind(m, /* complete= */ 1) >= 0);
  xpc::object received;
  FUZZ_CHECK(vorn::bus::readDictionary(m, received));
  FUZZ_CHECK(identical(received, expected));
}

}  // namespace fuzz
