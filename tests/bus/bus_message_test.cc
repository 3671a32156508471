// SPDX-License-Identifier: MIT
// The xpc::object <-> a{sv} mapping, on messages that never leave the process.
#include "platform/linux/bus_message.h"

#include <gtest/gtest.h>
#include <sys/socket.h>
#include <unistd.h>

#include <limits>

#include "platform/result.h"
#include "platform/vorn_constants.h"

namespace vorn::bus {
namespace {

using xpc::object;

/// A bus on one end of a socket pair: enough to build and seal messages.
class MessageMapping : public ::testing::Test {
 protected:
  void SetUp() override {
    int sv[2];
    ASSERT_EQ(socketpair(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0, sv), 0);
    other_ = sv[1];
    sd_bus* raw = nullptr;
    ASSERT_GE(sd_bus_new(&raw), 0);
    bus_.reset(raw);
    ASSERT_GE(sd_bus_set_fd(raw, sv[0], sv[0]), 0);
    ASSERT_GE(sd_bus_start(raw), 0);
  }
  void TearDown() override {
    // Nobody reads the other end: close it first, so that the flush in the
    // bus's deleter fails at once instead of waiting out its timeout.
    if (other_ >= 0) close(other_);
    if (bus_) sd_bus_close(bus_.get());
    bus_.reset();
  }

  MessagePtr newMessage() {
    sd_bus_message* m = nullptr;
    EXPECT_GE(sd_bus_message_new_method_call(bus_.get(), &m, "org.vorn.Manager",
                                             "/org/vorn/Manager", "org.vorn.Manager1", "M"),
              0);
    return MessagePtr(m);
  }
  /// Seals the message and moves the read position to its start, as on receipt.
  static void received(sd_bus_message* m) {
    ASSERT_GE(sd_bus_message_seal(m, 1, 0), 0);
    ASSERT_GE(sd_bus_message_rewind(m, 1), 0);
  }
  object roundTrip(const object& value) {
    auto m = newMessage();
    EXPECT_TRUE(appendDictionary(m.get(), value));
    received(m.get());
    object out;
    EXPECT_TRUE(readDictionary(m.get(), out));
    return out;
  }

  BusPtr bus_;
  int other_ = -1;
};

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }

object nested(int depth) {
  object value = object::string("bottom");
  for (int i = 0; i < depth; ++i) value = dict({{"in", value}});
  return value;
}

TEST_F(MessageMapping, RoundTripsEveryKind) {
  struct Case {
    const char* what;
    object value;
  } cases[] = {
      {"empty", dict({})},
      {"string", dict({{"s", object::string("Baseband")}})},
      {"utf-8 string and key", dict({{"Zélmar", object::string("日本語 ✓")}})},
      {"empty string", dict({{"s", object::string("")}})},
      {"int64 extremes", dict({{"min", object::int64(std::numeric_limits<std::int64_t>::min())},
                               {"max", object::int64(std::numeric_limits<std::int64_t>::max())}})},
      {"uint64 max", dict({{"u", object::uint64(std::numeric_limits<std::uint64_t>::max())}})},
      {"bools", dict({{"t", object::boolean(true)}, {"f", object::boolean(false)}})},
      {"double", dict({{"d", object::dbl(-2.5e300)}})},
      {"array of mixed", dict({{"a", object::array({object::int64(1), object::string("two"),
                                                     object::array({}), dict({})})}})},
      {"nested dictionaries", nested(10)},
      {"order kept", dict({{"z", object::int64(1)}, {"a", object::int64(2)}, {"m", object::int64(3)}})},
  };
  for (const auto& c : cases) EXPECT_EQ(roundTrip(c.value), c.value) << c.what;
}

TEST_F(MessageMapping, LeavesOutWhatDBusCannotCarry) {
  // Null has no D-Bus form: dropped from dictionaries and arrays alike.
  EXPECT_EQ(roundTrip(dict({{"gone", object()}, {"kept", object::int64(7)}})),
            dict({{"kept", object::int64(7)}}));
  EXPECT_EQ(roundTrip(dict({{"a", object::array({object(), object::boolean(true)})}})),
            dict({{"a", object::array({object::boolean(true)})}}));
  // A request that is not a dictionary goes out as an empty one.
  EXPECT_EQ(roundTrip(object()), dict({}));
  EXPECT_EQ(roundTrip(object::string("not a dictionary")), dict({}));
}

TEST_F(MessageMapping, RefusesWhatCannotBeEncoded) {
  struct Case {
    const char* what;
    object value;
  } cases[] = {
      {"invalid UTF-8 value", dict({{"s", object::string("\xff\xfe")}})},
      {"invalid UTF-8 key", dict({{"\xc3(", object::int64(1)}})},
      {"embedded NUL", dict({{"s", object::string(std::string("a\0b", 3))}})},
      {"invalid UTF-8 deep in an array", dict({{"a", object::array({dict({{"x", object::string("\x80")}})})}})},
      {"nesting past the limit", nested(kMaxNesting + 5)},
  };
  for (const auto& c : cases) {
    auto m = newMessage();
    EXPECT_FALSE(appendDictionary(m.get(), c.value)) << c.what;
  }
}

TEST_F(MessageMapping, ReadsForeignTypesAsNull) {
  auto m = newMessage();
  ASSERT_GE(sd_bus_message_append(m.get(), "a{sv}", 8,                         //
                                  "i", "i", -5,                                 //
                                  "u", "u", 5u,                                 //
                                  "y", "y", 1,                                  //
                                  "o", "o", "/org/vorn",                        //
                                  "as", "as", 2, "x", "y",                      //
                                  "map", "a{ss}", 1, "k", "v",                  //
                                  "pair", "(ii)", 1, 2,                         //
                                  "s", "s", "still read"),
            0);
  received(m.get());
  object out;
  ASSERT_TRUE(readDictionary(m.get(), out));
  for (const char* key : {"i", "u", "y", "o", "as", "map", "pair"}) {
    EXPECT_TRUE(out.get(key).isNull()) << key;
    EXPECT_EQ(xpc::dyn_cast_or_default(out.get(key), "default"), "default") << key;
  }
  EXPECT_EQ(out.get("s"), object::string("still read"));
}

TEST_F(MessageMapping, HostileNestingReadsAsNullBeyondTheLimit) {
  // Built by hand, as a hostile peer would, past what appendDictionary allows.
  auto m = newMessage();
  const int depth = kMaxNesting + 8;
  for (int i = 0; i < depth; ++i) {
    ASSERT_GE(sd_bus_message_open_container(m.get(), 'a', "{sv}"), 0);
    ASSERT_GE(sd_bus_message_open_container(m.get(), 'e', "sv"), 0);
    ASSERT_GE(sd_bus_message_append(m.get(), "s", "in"), 0);
    const char* sig = i + 1 < depth ? "a{sv}" : "s";
    ASSERT_GE(sd_bus_message_open_container(m.get(), 'v', sig), 0);
  }
  ASSERT_GE(sd_bus_message_append(m.get(), "s", "bottom"), 0);
  for (int i = 0; i < depth; ++i)
    for (int k = 0; k < 3; ++k) ASSERT_GE(sd_bus_message_close_container(m.get()), 0);
  received(m.get());
  object out;
  ASSERT_TRUE(readDictionary(m.get(), out));
  int levels = 0;
  for (object o = out; o.isDictionary(); o = o.get("in")) ++levels;
  EXPECT_EQ(levels, kMaxNesting + 1);
}

TEST_F(MessageMapping, RefusesAReplyThatIsNotADictionary) {
  auto m = newMessage();
  ASSERT_GE(sd_bus_message_append(m.get(), "a{ss}", 1, "k", "v"), 0);
  received(m.get());
  object out = object::string("untouched");
  EXPECT_FALSE(readDictionary(m.get(), out));
  EXPECT_EQ(out, object::string("untouched"));
}

TEST_F(MessageMapping, ReadsResultReplies) {
  struct Case {
    const char* what;
    const char* signature;
    bool accepted;
    std::int32_t status;
    bool hasResponse;
  } cases[] = {
      {"success", "isa{sv}", true, 0, true},
      {"server failure drops the response", "isa{sv}", true, status::kBadRequest, false},
      {"wrong signature", "s", false, 0, false},
      {"missing response", "is", false, 0, false},
  };
  for (const auto& c : cases) {
    auto m = newMessage();
    std::string sig = c.signature;
    if (sig == "s")
      ASSERT_GE(sd_bus_message_append(m.get(), "s", "x"), 0);
    else if (sig == "is")
      ASSERT_GE(sd_bus_message_append(m.get(), "is", c.status, "d"), 0);
    else
      ASSERT_GE(sd_bus_message_append(m.get(), "isa{sv}", c.status, "described", 1, "TimestampString",
                                      "s", "2024-01-01-000000"),
                0);
    received(m.get());
    std::int32_t status = 12345;
    std::string description;
    object response;
    EXPECT_EQ(readResultReply(m.get(), status, description, response), c.accepted) << c.what;
    if (!c.accepted) continue;
    EXPECT_EQ(status, c.status) << c.what;
    EXPECT_EQ(description, "described") << c.what;
    EXPECT_EQ(!response.isNull(), c.hasResponse) << c.what;
    if (c.hasResponse) {
      EXPECT_EQ(xpc::dyn_cast_or_default(response.get("TimestampString"), ""), "2024-01-01-000000");
    }
  }
}

TEST(BusErrorStatus, MapsByErrorName) {
  struct Case {
    const char* name;
    std::int32_t status;
  } cases[] = {
      {SD_BUS_ERROR_SERVICE_UNKNOWN, kResultServerNotRunning},
      {SD_BUS_ERROR_NAME_HAS_NO_OWNER, kResultServerNotRunning},
      {SD_BUS_ERROR_NO_REPLY, status::kNoReply},
      {SD_BUS_ERROR_TIMEOUT, status::kNoReply},
      {SD_BUS_ERROR_DISCONNECTED, status::kNoReply},
      {SD_BUS_ERROR_ACCESS_DENIED, status::kAccessDenied},
      {SD_BUS_ERROR_UNKNOWN_METHOD, status::kBusError},
      {SD_BUS_ERROR_INVALID_ARGS, status::kBusError},
      {"org.vorn.Error.Whatever", status::kBusError},
      {nullptr, status::kBusError},
  };
  for (const auto& c : cases) EXPECT_EQ(statusForError(c.name), c.status) << (c.name ? c.name : "null");
}

}  // namespace
}  // namespace vorn::bus
