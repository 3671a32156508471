// SPDX-License-Identifier: MIT
// Received a{sv} content of any D-Bus type: read leniently, types outside the
// value model as null, and the read ends right after the dictionary.
//
// sd-bus checks every received message against its signature before anyone
// reads it, so a well-formed message with arbitrary content is exactly what
// readDictionary can meet; it is built here from the fuzz bytes.
#include <bit>

#include "fuzz/support.h"
#include "platform/linux/bus_message.h"

namespace {

using vorn::bus::kMaxContainerDepth;

class ContentFromBytes {
 public:
  ContentFromBytes(FuzzedDataProvider& in, sd_bus_message* m) : in_(in), m_(m) {}

  /// Appends an a{sv} inside `depth` containers and returns what
  /// readDictionary makes of it there.
  xpc::object dictionary(int depth) {
    std::vector<xpc::entry> entries;
    open('a', "{sv}");
    for (int n = in_.ConsumeIntegralInRange(0, 4); n > 0; --n) {
      open('e', "sv");
      std::string key = text();
      basic('s', key.c_str());
      xpc::object value = variant(depth + 2);
      entries.emplace_back(std::move(key), std::move(value));
      close();
    }
    close();
    return xpc::object::dictionary(std::move(entries));
  }

 private:
  /// Appends a variant inside `depth` containers, of a type in the value
  /// model, a basic type outside it, or a container holding variants; returns
  /// what reading it there gives: null when its contents lie deeper than the
  /// limit. Containers go a few levels past the limit, well inside sd-bus's
  /// own of 128.
  xpc::object variant(int depth) {
    static constexpr const char* kSignatures[] = {"s", "x", "t", "b", "d",     "y",  "n",    "q", "i",
                                                  "u", "o", "g", "ai", "v", "a{sv}", "av", "a(sv)"};
    const char* sig = kSignatures[in_.ConsumeIntegralInRange(0, depth <= kMaxContainerDepth + 6 ? 16 : 12)];
    open('v', sig);
    xpc::object value;
    // One value, read as each basic type reads it.
    const auto number = in_.ConsumeIntegral<std::uint64_t>();
    const int truth = number & 1;
    const double real = std::bit_cast<double>(number);
    switch (sig[0]) {
      case 's': value = xpc::object::string(text()), basic('s', value.asString()->c_str()); break;
      case 'x': value = xpc::object::int64(static_cast<std::int64_t>(number)), basic('x', &number); break;
      case 't': value = xpc::object::uint64(number), basic('t', &number); break;
      case 'b': value = xpc::object::boolean(truth != 0), basic('b', &truth); break;
      case 'd': value = xpc::object::dbl(real), basic('d', &real); break;
      case 'o': basic('o', number & 1 ? "/" : "/org/vorn/x"); break;
      case 'g': basic('g', "a{sv}(av)"); break;
      case 'v': variant(depth + 1); break;
      case 'a': {
        if (sig[1] == '{') {
          value = dictionary(depth + 1);
          break;
        }
        open('a', sig + 1);
        std::vector<xpc::object> items;
        for (auto n = in_.ConsumeIntegralInRange<int>(0, 4); n > 0; --n) {
          if (sig[1] == 'i') {
            basic('i', &number);
            continue;
          }
          if (sig[1] == '(') open('r', "sv"), basic('s', "field");
          items.push_back(variant(depth + (sig[1] == '(' ? 3 : 2)));
          if (sig[1] == '(') close();
        }
        close();
        if (sig[1] == 'v') value = xpc::object::array(std::move(items));
        break;
      }
      default: basic(sig[0], &number);  // y, n, q, i, u: any bytes make a value
    }
    close();
    return depth + 1 <= kMaxContainerDepth ? value : xpc::object();
  }

  /// Printable ASCII, so that sd-bus takes it as a string of any kind.
  std::string text() {
    std::string s = in_.ConsumeRandomLengthString(16);
    for (char& c : s) c = static_cast<char>(0x20 + static_cast<unsigned char>(c) % 0x5F);
    return s;
  }
  void basic(char type, const void* value) { FUZZ_CHECK(sd_bus_message_append_basic(m_, type, value) >= 0); }
  void open(char type, const char* contents) { FUZZ_CHECK(sd_bus_message_open_container(m_, type, contents) >= 0); }
  void close() { FUZZ_CHECK(sd_bus_message_close_container(m_) >= 0); }

  FuzzedDataProvider& in_;
  sd_bus_message* m_;
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  auto m = fuzz::newOfflineMessage();
  FUZZ_CHECK(m);
  const xpc::object expected = ContentFromBytes(in, m.get()).dictionary(/* depth= */ 0);
  constexpr const char* kAfter = "after the dictionary";
  FUZZ_CHECK(sd_bus_message_append_basic(m.get(), 's', kAfter) >= 0);
  fuzz::checkReadsAs(m.get(), expected);
  const char* after = nullptr;
  FUZZ_CHECK(sd_bus_message_read_basic(m.get(), 's', &after) > 0 && std::string_view(after) == kAfter);
  return 0;
}
