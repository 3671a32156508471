// SPDX-License-Identifier: MIT
// The client libraries, with their message mapping, against a scripted server
// on a private bus.
#include <gtest/gtest.h>
#include <stdlib.h>
#include <unistd.h>

#include <atomic>
#include <cstdint>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <condition_variable>
#include <optional>
#include <thread>

#include "platform/helper_client.h"
#include "platform/linux/bus_message.h"
#include "platform/vorn_client.h"
#include "tests/support/private_bus.h"

namespace {

using namespace std::chrono_literals;
using xpc::object;

// The statuses of the bus contract, spelled out so that a wrong constant shows.
constexpr auto kNotRunning = std::int32_t(0xE020E001);
constexpr auto kNoReply = std::int32_t(0xE020E002);
constexpr auto kAccessDenied = std::int32_t(0xE020E003);
constexpr auto kMalformedReply = std::int32_t(0xE020E004);
constexpr auto kBusError = std::int32_t(0xE020E005);
constexpr auto kBusy = std::int32_t(0xE0200003);
// Every call gives up after this long in these tests (VORN_CALL_TIMEOUT_MS);
// kPatience bounds any wait, with slack for sanitizers.
constexpr auto kCallTimeout = 1000ms;
constexpr auto kPatience = 10s;

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }

/// The server (or its helper) on its own connection and thread. Calls are
/// handled as `act` says. Answers carry `status`, "client/task/command" as
/// description and the request as response (for "Foreign": types the mapping
/// lacks). Hello answers "Started" and the caller's name, then a
/// ServerStateChange event says "Stopping"; the peer remembers who said Hello.
class Peer {
 public:
  enum class Act { answer, wrongSignature, noReply, exit };
  Peer(bool helper, Act act, std::int32_t status = 0) : act_(act), status_(status) {
    const char* path = helper ? "/org/vorn/Helper" : "/org/vorn/Manager";
    EXPECT_TRUE(sd_bus_open_system(&bus_) >= 0 && sd_bus_add_object(bus_, nullptr, path, &Peer::onCall, this) >= 0 &&
                sd_bus_request_name(bus_, helper ? "org.vorn.Helper" : "org.vorn.Manager", 0) >= 0);
    thread_ = std::thread([this] {
      for (int r = 0; r >= 0 && !stop_; sd_bus_wait(bus_, 10000))  // ticks see the stop flag
        while ((r = sd_bus_process(bus_, nullptr)) > 0) {
        }
    });
  }
  ~Peer() {
    stop_ = true;
    thread_.join();
    sd_bus_flush_close_unref(bus_);
  }
  /// The unique name of the last connection that said Hello.
  std::string caller() const {
    std::lock_guard lock(mutex_);
    return caller_;
  }
  /// Waits, within 10 s, until `count` calls other than Hello have come.
  bool waitForCalls(int count) const {
    for (auto deadline = std::chrono::steady_clock::now() + std::chrono::seconds(10); received_ < count;
         std::this_thread::sleep_for(std::chrono::milliseconds(5)))
      if (std::chrono::steady_clock::now() > deadline) return false;
    return true;
  }

 private:
  static int onCall(sd_bus_message* m, void* self, sd_bus_error*) {
    auto* p = static_cast<Peer*>(self);
    std::string member = sd_bus_message_get_member(m);
    const char *client = "", *command = "";
    std::uint32_t task = 0;
    object request;
    if (member == "Perform") sd_bus_message_read(m, "sus", &client, &task, &command);
    else sd_bus_message_read(m, member == "Hello" ? "s" : "ss", &client, &command);
    vorn::bus::readDictionary(m, request);
    std::string call = std::string(client) + "/" + std::to_string(task) + "/" + command;
    if (member != "Hello") ++p->received_;
    if (member == "Hello") {
      {
        std::lock_guard lock(p->mutex_);
        p->caller_ = sd_bus_message_get_sender(m);
      }
      sd_bus_reply_method_return(m, "a{sv}", 2, "ServerState", "s", "Started", "Client", "s", client);
      sd_bus_emit_signal(p->bus_, "/org/vorn/Manager", "org.vorn.Manager1", "Event", "sa{sv}",
                         "ServerStateChange", 1, "ServerState", "s", "Stopping");
    } else if (p->act_ == Act::noReply) {
      p->unanswered_.emplace_back(sd_bus_message_ref(m));
    } else if (p->act_ == Act::exit) {
      sd_bus_close(p->bus_);  // leaving with the call pending makes the daemon fail it
    } else if (p->act_ == Act::wrongSignature) {
      sd_bus_reply_method_return(m, "s", "not what you asked for");
    } else if (command == std::string("Foreign")) {
      sd_bus_reply_method_return(m, "isa{sv}", p->status_, call.c_str(), 7, "i", "i", -5, "u", "u", 5u, "o",
                                 "o", "/org/vorn", "as", "as", 1, "x", "map", "a{ss}", 1, "k", "v", "pair",
                                 "(ii)", 1, 2, "s", "s", "still read");
    } else {
      sd_bus_message* out = nullptr;
      sd_bus_message_new_method_return(m, &out);
      sd_bus_message_append(out, "is", p->status_, call.c_str());
      if (vorn::bus::appendDictionary(out, request)) sd_bus_send(p->bus_, out, nullptr);
      sd_bus_message_unref(out);
    }
    return 1;
  }

  Act act_;
  std::int32_t status_;
  sd_bus* bus_ = nullptr;
  std::atomic<bool> stop_ = false;
  std::atomic<int> received_ = 0;
  std::vector<vorn::bus::MessagePtr> unanswered_;  // peer thread only
  mutable std::mutex mutex_;
  std::string caller_;
  std::thread thread_;
};
using Act = Peer::Act;

const object kHelloAnswer =
    dict({{"ServerState", object::string("Started")}, {"Client", object::string("vorntool-test")}});
const object kStopping = dict({{"ServerState", object::string("Stopping")}});

/// Stands in for a payload or response delivered anywhere but on the manager's
/// queue.
const object kOffQueue = object::string("delivered off the queue");

/// The ServerStateChange payloads that a manager delivers, in order. The
/// manager's handler shares it, so a late delivery finds it alive.
struct StateLog {
  /// Waits, within kPatience, until at least `count` payloads came.
  bool waitFor(std::size_t count) {
    std::unique_lock lock(mutex);
    return changed.wait_for(lock, kPatience, [&] { return payloads.size() >= count; });
  }
  std::vector<object> all() {
    std::lock_guard lock(mutex);
    return payloads;
  }

  std::mutex mutex;
  std::condition_variable changed;
  std::vector<object> payloads;
};

/// From a connection of its own, which owns nothing: a ServerStateChange event
/// sent to `client` alone and one to everybody, and a NameOwnerChanged sent to
/// `client` that says the server's name has lost its owner. Returns once the
/// bus has passed them on, since it handles one connection's messages in order.
void spoofFrom(const std::string& client) {
  sd_bus* raw = nullptr;
  ASSERT_GE(sd_bus_open_system(&raw), 0);
  vorn::bus::BusPtr bus(raw);
  sd_bus_message* m = nullptr;
  ASSERT_GE(sd_bus_message_new_signal(raw, &m, "/org/vorn/Manager", "org.vorn.Manager1", "Event"), 0);
  vorn::bus::MessagePtr event(m);
  ASSERT_GE(sd_bus_message_set_destination(m, client.c_str()), 0);
  ASSERT_GE(sd_bus_message_append(m, "sa{sv}", "ServerStateChange", 1, "ServerState", "s", "Spoofed"), 0);
  ASSERT_GE(sd_bus_send(raw, m, nullptr), 0);
  ASSERT_GE(sd_bus_emit_signal(raw, "/org/vorn/Manager", "org.vorn.Manager1", "Event", "sa{sv}", "ServerStateChange", 1,
                               "ServerState", "s", "Spoofed"),
            0);
  ASSERT_GE(sd_bus_message_new_signal(raw, &m, "/org/freedesktop/DBus", "org.freedesktop.DBus", "NameOwnerChanged"), 0);
  vorn::bus::MessagePtr ownerChange(m);
  ASSERT_GE(sd_bus_message_set_destination(m, client.c_str()), 0);
  ASSERT_GE(sd_bus_message_append(m, "sss", "org.vorn.Manager", client.c_str(), ""), 0);
  ASSERT_GE(sd_bus_send(raw, m, nullptr), 0);
  ASSERT_GE(sd_bus_call_method(raw, "org.freedesktop.DBus", "/org/freedesktop/DBus", "org.freedesktop.DBus", "GetId",
                               nullptr, nullptr, ""),
            0);
}

/// What an asynchronous call completed with: its status and response.
using Completion = std::pair<std::int32_t, object>;

class ClientOverBus : public ::testing::Test {
 protected:
  void SetUp() override {
    if (geteuid() != 0) GTEST_SKIP() << "the bus policy lets only root own the names";
    bus_.emplace();
    ASSERT_TRUE(bus_->ok()) << bus_->error();
    setenv("VORN_CALL_TIMEOUT_MS", std::to_string(kCallTimeout.count()).c_str(), 1);
    setenv("VORN_ROOT", bus_->directory().c_str(), 1);
    properties_ = bus_->directory() + "/var/lib/vorn/trace.properties";
    std::filesystem::create_directories(bus_->directory() + "/var/lib/vorn");
  }
  void TearDown() override { unsetenv("VORN_CALL_TIMEOUT_MS"); }
  void dropTheBus() {
    setenv("DBUS_SYSTEM_BUS_ADDRESS", ("unix:path=" + bus_->directory() + "/none").c_str(), 1);
  }
  std::shared_ptr<vorn::client::Manager> manager() {
    return vorn::client::CreateManager("vorntool-test", queue_);
  }
  /// A manager with events on that `log` follows, once Hello's answer and the
  /// server's event have come.
  std::shared_ptr<vorn::client::Manager> greeted(const std::shared_ptr<StateLog>& log) {
    auto m = manager();
    vorn::client::RegisterEventHandler(m, "ServerStateChange", [log, queue = queue_](object payload, dispatch::group) {
      std::lock_guard lock(log->mutex);
      log->payloads.push_back(queue.isCurrent() ? payload : kOffQueue);
      log->changed.notify_all();
    });
    vorn::client::EventsOn(m);
    EXPECT_TRUE(log->waitFor(2));
    return m;
  }
  /// Releases `m` and waits until its queue has run whatever that completed.
  void release(std::shared_ptr<vorn::client::Manager>& m) {
    m.reset();
    dispatch::group drained;
    drained.enter();
    queue_.async([drained] { drained.leave(); });
    ASSERT_TRUE(drained.wait(kPatience));
  }
  /// Starts TraceDumpState on `m` without waiting: each completion lands in
  /// `got` (kOffQueue for a response not on the queue), and `first` empties at
  /// the first of them.
  void performAsync(const std::shared_ptr<vorn::client::Manager>& m, std::vector<Completion>& got,
                    dispatch::group& first) {
    first.enter();
    auto done = [&got, first, queue = queue_](TelephonyXPC::Result r, object response) {
      got.emplace_back(r.status, queue.isCurrent() ? response : kOffQueue);
      if (got.size() == 1) first.leave();
    };
    vorn::client::PerformCommand(m, "TraceDumpState", done, dict({}));
  }
  TelephonyXPC::Result perform(const char* command, object request, object& response) {
    return vorn::client::PerformCommand(manager(), command, std::move(request), response);
  }
  TelephonyXPC::Result performHelper(const xpc::dict& request, xpc::dict& response) {
    return vorn::HelperClient::create("logdump.helper", nullptr)
        ->perform(vorn::helper::TaskID(4), "DiagsnapStatus", request, response);
  }

  std::optional<vorn::test::PrivateBus> bus_;
  std::string properties_;
  dispatch::queue queue_{"vorn.test.queue"};
};

TEST_F(ClientOverBus, MapsMessagesBothWaysAndRefusesWhatCannotBeEncoded) {
  Peer server(false, Act::answer), helper(true, Act::answer);
  std::vector<xpc::entry> everyKind = {
      {"Zélmar", object::string("日本語 ✓")}, {"empty", object::string("")}, {"min", object::int64(INT64_MIN)},
      {"max", object::uint64(UINT64_MAX)}, {"b", object::boolean(false)}, {"d", object::dbl(-2.5e300)},
      {"a", object::array({object::int64(1), object::array({}), dict({{"in", dict({})}})})}};
  auto withNull = everyKind;
  withNull.insert(withNull.begin() + 1, {"null", object()});  // a null has no D-Bus form
  object response;
  auto result = perform("Echo", dict(withNull), response);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.description, "vorntool-test/0/Echo");
  EXPECT_EQ(response, dict(everyKind));
  ASSERT_EQ(perform("Foreign", dict({}), response).status, 0);
  for (const char* key : {"i", "u", "o", "as", "map", "pair"}) EXPECT_TRUE(response.get(key).isNull()) << key;
  EXPECT_EQ(response.get("s"), object::string("still read"));
  for (const object& bad : {dict({{"s", object::string("\xff\xfe")}}), dict({{"\xc3(", object::int64(1)}}),
                            dict({{"s", object::string(std::string("a\0b", 3))}}),
                            dict({{"a", object::array({dict({{"x", object::string("\x80")}})})}})}) {
    response = object::string("stale");
    EXPECT_EQ(perform("Bad", bad, response).status, kBusError);
    EXPECT_TRUE(response.isNull());
  }
  xpc::dict helperRequest(dict(everyKind)), helperResponse;
  result = performHelper(helperRequest, helperResponse);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(result.description, "logdump.helper/4/DiagsnapStatus");
  EXPECT_EQ(helperResponse.obj(), helperRequest.obj());
}

/// `levels` dictionaries, one inside the other, the innermost holding `leaf`;
/// each level is an array, a dict entry and a variant on the wire.
object nested(int levels, object leaf) {
  for (int i = 1; i < levels; ++i) leaf = dict({{"in", leaf}});
  return dict({{"in", leaf}});
}

TEST_F(ClientOverBus, RefusesBeforeSendingWhatTheBusWouldDisconnectFor) {
  // dbus-daemon drops a sender whose value lies inside more than 64
  // containers; an array of variants costs two per level.
  Peer server(false, Act::answer);
  auto log = std::make_shared<StateLog>();
  auto m = greeted(log);
  const std::string connection = server.caller();
  auto items = [](int levels) {
    object v = object::string("bottom");
    for (int i = 0; i < levels; ++i) v = object::array({v});
    return dict({{"a", v}});
  };
  const object bottom = object::string("bottom");
  struct Case {
    object request;
    object echoed;  // null: refused
  } const cases[] = {
      {nested(21, bottom), nested(21, bottom)},
      {nested(21, dict({})), nested(21, dict({}))},
      {nested(22, object()), nested(21, dict({}))},  // a null is left out
      {nested(22, bottom), object()},
      {nested(21, dict({{"x", object::int64(1)}})), object()},
      {items(30), items(30)},
      {items(31), object()},
  };
  for (std::size_t i = 0; i < std::size(cases); ++i) {
    object response = object::string("stale");
    const auto result = vorn::client::PerformCommand(m, "Echo", cases[i].request, response);
    EXPECT_EQ(result.status, cases[i].echoed.isNull() ? kBusError : 0) << "case " << i;
    EXPECT_EQ(response, cases[i].echoed) << "case " << i;
  }
  // Still the first connection: a new one would have said Hello again.
  EXPECT_EQ(server.caller(), connection);
  release(m);
  EXPECT_EQ(log->all(), (std::vector<object>{kHelloAnswer, kStopping}));
}

/// One way for a call to fail (no peer at all when `act` is unset), seen
/// through each way of calling.
struct Failure { const char* name; std::optional<Act> act; std::int32_t status; bool noBus = false; };
enum class Caller { sync, async, helper };
const char* const kCallers[] = {"Sync", "Async", "Helper"};

class CallFailure : public ClientOverBus,
                    public ::testing::WithParamInterface<std::tuple<Failure, Caller>> {};

TEST_P(CallFailure, YieldsItsStatusOnceWithinTheTimeout) {
  auto [failure, caller] = GetParam();
  std::optional<Peer> peer;
  if (failure.act) peer.emplace(caller == Caller::helper, *failure.act, kBusy);
  if (failure.noBus) dropTheBus();
  auto start = std::chrono::steady_clock::now();
  if (caller == Caller::helper) {
    xpc::dict response;
    EXPECT_EQ(performHelper(xpc::dict(), response).status, failure.status);
    EXPECT_FALSE(response.valid());
  } else if (caller == Caller::sync) {
    object response = object::string("stale");
    EXPECT_EQ(perform("TraceDumpState", dict({}), response).status, failure.status);
    EXPECT_TRUE(response.isNull());
  } else {
    std::vector<Completion> got;
    dispatch::group first;
    auto m = manager();
    performAsync(m, got, first);
    ASSERT_TRUE(first.wait(kPatience));
    release(m);  // would complete anything still pending
    EXPECT_EQ(got, (std::vector<Completion>{{failure.status, object()}}));
  }
  EXPECT_LT(std::chrono::steady_clock::now() - start, kCallTimeout + 3s);
}

const Failure kFailures[] = {
    {"NoOwner", std::nullopt, kNotRunning},
    {"NoBus", std::nullopt, kNotRunning, true},
    {"WrongSignature", Act::wrongSignature, kMalformedReply},
    {"NeverReplies", Act::noReply, kNoReply},
    {"KilledMidCall", Act::exit, kNoReply},
    {"ServerStatus", Act::answer, kBusy},
};

INSTANTIATE_TEST_SUITE_P(
    Calls, CallFailure,
    ::testing::Combine(::testing::ValuesIn(kFailures), ::testing::Values(Caller::sync, Caller::async, Caller::helper)),
    [](const auto& paramInfo) { return std::string(std::get<0>(paramInfo.param).name) + kCallers[int(std::get<1>(paramInfo.param))]; });

TEST_F(ClientOverBus, ACallPendingWhenTheManagerOrTheBusGoesCompletesOnceUnanswered) {
  // Longer than any wait here: no answer can come from the call's timeout.
  setenv("VORN_CALL_TIMEOUT_MS", "600000", 1);
  for (const std::string ending : {"manager released", "bus killed"}) {
    Peer server(false, Act::noReply);
    std::vector<Completion> got;
    dispatch::group first;
    auto m = manager();
    performAsync(m, got, first);
    ASSERT_TRUE(server.waitForCalls(1)) << ending;
    ending == "manager released" ? m.reset() : bus_.reset();
    ASSERT_TRUE(first.wait(kPatience)) << ending;
    release(m);
    EXPECT_EQ(got, (std::vector<Completion>{{kNoReply, object()}})) << ending;
  }
}

TEST_F(ClientOverBus, RefusesCallersThatThePolicyDeniesAndSaysSo) {
  Peer server(false, Act::answer), helper(true, Act::answer);
  for (const char* mode : {"manager", "helper"}) {
    std::string out = bus_->directory() + "/probe-" + mode;
    vorn::test::ChildProcess probe({{VORN_BUS_PROBE, mode}, {}, /* runAsId= */ 65534, out});
    ASSERT_EQ(probe.wait(kPatience), 0) << mode;
    std::int32_t status = 0;
    int deniedBefore = -1, deniedAfter = -1;
    std::ifstream(out) >> status >> deniedBefore >> deniedAfter;
    EXPECT_EQ(status, kAccessDenied) << mode;
    if (mode == std::string("manager")) {
      EXPECT_EQ(deniedBefore, 0);
      EXPECT_EQ(deniedAfter, 1);
    }
  }
  // Root is admitted: nothing to report.
  auto m = manager();
  object response;
  ASSERT_EQ(vorn::client::PerformCommand(m, "Echo", dict({}), response).status, 0);
  EXPECT_FALSE(m->accessDenied());
}

TEST_F(ClientOverBus, IgnoresEventsFromAnyoneButTheServer) {
  Peer server(false, Act::answer);
  auto log = std::make_shared<StateLog>();
  auto m = greeted(log);
  spoofFrom(server.caller());
  // Hello again: its answer and the server's event come after whatever the
  // spoofer's signals turned into.
  vorn::client::EventsOn(m);
  ASSERT_TRUE(log->waitFor(4));
  release(m);
  EXPECT_EQ(log->all(), (std::vector<object>{kHelloAnswer, kStopping, kHelloAnswer, kStopping}));
}

TEST_F(ClientOverBus, ReportsALostServerOnceAndGreetsTheNextOne) {
  std::optional<Peer> server;
  server.emplace(false, Act::answer);
  auto log = std::make_shared<StateLog>();
  auto m = greeted(log);
  server.reset();  // gone without a word, as after SIGKILL
  ASSERT_TRUE(log->waitFor(3));
  server.emplace(false, Act::answer);
  ASSERT_TRUE(log->waitFor(5));

  // With events off a lost server goes unreported. The call's answer comes
  // after the owner change on the same connection, so by then it was seen.
  vorn::client::EventsOff(m);
  server.reset();
  ASSERT_TRUE(vorn::test::waitForBusName("org.vorn.Manager", kPatience, /* owned= */ false));
  object response;
  EXPECT_EQ(vorn::client::PerformCommand(m, "Echo", dict({}), response).status, kNotRunning);
  release(m);
  EXPECT_EQ(log->all(), (std::vector<object>{kHelloAnswer, kStopping, dict({}), kHelloAnswer, kStopping}));
}

TEST_F(ClientOverBus, AnswersTracePropertiesFromTheFileWhileTheServerIsDown) {
  // No request entries when `trace` is null; no `value`: fails as server not running.
  struct Case { const char *command, *trace, *property, *value; } const cases[] = {
      {"GetTraceProperty", "SystemLogs", "Mode", "3"},  {"GetTraceProperty", "Baseband", "Path", "/a=b"},
      {"GetTraceProperty", "baseband", "Path", nullptr}, {"GetTraceProperty", "Baseband", "Mode", nullptr},
      {"GetTraceProperty", nullptr, nullptr, nullptr},   {"TraceDumpState", "SystemLogs", "Mode", nullptr},
  };
  std::ofstream(properties_) << "# by the server\nBaseband.Enabled=1\nSystemLogs.Mode = 3\njunk\nBaseband.Path=/a=b\n";
  for (std::string down : {"no owner", "no bus", "no file"}) {
    if (down == "no bus") dropTheBus();
    if (down == "no file") std::filesystem::remove(properties_);
    for (const auto& c : cases) {
      const char* value = down == "no file" ? nullptr : c.value;
      object response, request = c.trace ? dict({{"TraceName", object::string(c.trace)},
                                                  {"TracePropertyName", object::string(c.property)}})
                                          : dict({});
      EXPECT_EQ(perform(c.command, request, response).status, value ? 0 : kNotRunning) << down << " " << c.command;
      EXPECT_EQ(response, value ? dict({{"TracePropertyValue", object::string(value)}}) : object()) << down;
    }
  }
}

}  // namespace
