// SPDX-License-Identifier: MIT
// The client libraries against a scripted server on a private bus.
#include <gtest/gtest.h>
#include <stdlib.h>

#include <chrono>
#include <condition_variable>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <optional>

#include "platform/helper_client.h"
#include "platform/vorn_client.h"
#include "tests/bus/scripted_peer.h"
#include "tests/support/private_bus.h"

namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using vorn::test::ScriptedPeer;
using Act = ScriptedPeer::Act;
using xpc::object;
using Clock = std::chrono::steady_clock;

constexpr std::int32_t kNotRunning = kResultServerNotRunning;
namespace st = vorn::status;
// Every call gives up after this long in these tests (VORN_CALL_TIMEOUT_MS).
constexpr auto kCallTimeout = 1000ms;
// Bound on any single wait: the call timeout plus generous slack for sanitizers.
constexpr auto kPatience = 10s;

object dict(std::vector<xpc::entry> entries) { return object::dictionary(std::move(entries)); }

/// Records what completions and event handlers receive, and on which thread.
struct Recorder {
  struct Call {
    TelephonyXPC::Result result;
    object response;
    bool onQueue;
  };
  std::mutex mutex;
  std::condition_variable cv;
  std::vector<Call> calls;

  void add(TelephonyXPC::Result r, object o, bool onQueue) {
    std::lock_guard lock(mutex);
    calls.push_back({std::move(r), std::move(o), onQueue});
    cv.notify_all();
  }
  vorn::client::Completion completion(dispatch::queue q) {
    return [this, q](TelephonyXPC::Result r, object o) { add(std::move(r), std::move(o), q.isCurrent()); };
  }
  vorn::client::EventHandler handler(dispatch::queue q) {
    return [this, q](object payload, dispatch::group) { add({}, std::move(payload), q.isCurrent()); };
  }
  bool waitFor(std::size_t n, std::chrono::milliseconds limit = kPatience) {
    std::unique_lock lock(mutex);
    return cv.wait_for(lock, limit, [&] { return calls.size() >= n; });
  }
  std::vector<Call> snapshot() {
    std::lock_guard lock(mutex);
    return calls;
  }
};

/// Waits until everything queued on `q` so far has run.
bool drain(const dispatch::queue& q) {
  auto done = std::make_shared<dispatch::group>();
  done->enter();
  q.async([done] { done->leave(); });
  return done->wait(kPatience);
}

class ClientOverBus : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!vorn::test::isRoot()) GTEST_SKIP() << "the bus policy lets only root own the names";
    bus_.emplace();
    ASSERT_TRUE(bus_->ok()) << bus_->error();
    setenv("VORN_CALL_TIMEOUT_MS", std::to_string(kCallTimeout.count()).c_str(), 1);
    root_ = bus_->directory() + "/root";
    fs::create_directories(root_ + "/var/lib/vorn");
    setenv("VORN_ROOT", root_.c_str(), 1);
  }
  void TearDown() override {
    unsetenv("VORN_CALL_TIMEOUT_MS");
    unsetenv("VORN_ROOT");
  }

  std::unique_ptr<ScriptedPeer> startPeer(ScriptedPeer::Service service) {
    auto peer = std::make_unique<ScriptedPeer>(service);
    EXPECT_TRUE(peer->ok());
    return peer;
  }
  std::shared_ptr<vorn::client::Manager> manager() {
    return vorn::client::CreateManager("vorntool-test", queue_);
  }

  std::optional<vorn::test::PrivateBus> bus_;
  std::string root_;
  dispatch::queue queue_{"vorn.test.queue"};
};

object everyKind() {
  return dict({{"s", object::string("Zélmar")},
               {"x", object::int64(-3)},
               {"t", object::uint64(1ull << 63)},
               {"b", object::boolean(true)},
               {"d", object::dbl(0.25)},
               {"a", object::array({object::string("one"), dict({{"k", object::int64(2)}})})}});
}

TEST_F(ClientOverBus, CarriesRequestsAndResponsesBothWays) {
  auto peer = startPeer(ScriptedPeer::Service::manager);
  Recorder done;
  auto m = manager();
  object response;
  auto result = vorn::client::PerformCommand(m, "Echo", everyKind(), response);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(response, everyKind());

  vorn::client::PerformCommand(m, "Echo", done.completion(queue_), everyKind());
  ASSERT_TRUE(done.waitFor(1));
  auto calls = done.snapshot();
  EXPECT_EQ(calls[0].result.status, 0);
  EXPECT_EQ(calls[0].response, everyKind());
  EXPECT_TRUE(calls[0].onQueue);

  auto received = peer->waitForCalls(2, kPatience);
  ASSERT_EQ(received.size(), 2u);
  EXPECT_EQ(received[0].client, "vorntool-test");
  EXPECT_EQ(received[0].command, "Echo");
  EXPECT_EQ(received[1].request, everyKind());
}

TEST_F(ClientOverBus, PassesTheServersStatusAndDropsItsResponseOnFailure) {
  auto peer = startPeer(ScriptedPeer::Service::manager);
  peer->script(vorn::kCommandTraceDumpState,
               {Act::answer, st::kBusy, dict({{"ignored", object::int64(1)}})});
  peer->script(vorn::kCommandGetTraceProperty,
               {Act::answer, 0, dict({{vorn::kKeyTracePropertyValue, object::string("3")}})});
  auto m = manager();
  object response = object::string("stale");
  EXPECT_EQ(vorn::client::PerformCommand(m, vorn::kCommandTraceDumpState, dict({}), response).status,
            st::kBusy);
  EXPECT_TRUE(response.isNull());
  // With the server up, trace properties come from the server, not the file.
  std::ofstream(root_ + "/var/lib/vorn/trace.properties") << "SystemLogs.Mode=1\n";
  EXPECT_EQ(vorn::client::PerformCommand(m, vorn::kCommandGetTraceProperty, dict({}), response).status, 0);
  EXPECT_EQ(xpc::dyn_cast_or_default(response.get(vorn::kKeyTracePropertyValue), ""), "3");
}

TEST_F(ClientOverBus, RefusesARequestThatCannotBeEncoded) {
  auto peer = startPeer(ScriptedPeer::Service::manager);
  Recorder done;
  auto m = manager();
  object bad = dict({{"reason", object::string("\xff not UTF-8")}});
  object response;
  EXPECT_EQ(vorn::client::PerformCommand(m, "Echo", bad, response).status, st::kBusError);
  EXPECT_TRUE(response.isNull());
  vorn::client::PerformCommand(m, "Echo", done.completion(queue_), bad);
  ASSERT_TRUE(done.waitFor(1));
  EXPECT_EQ(done.snapshot()[0].result.status, st::kBusError);
  // The connection is still good, and nothing malformed reached the server.
  EXPECT_EQ(vorn::client::PerformCommand(m, "Good", dict({}), response).status, 0);
  auto received = peer->waitForCalls(1, kPatience);
  ASSERT_EQ(received.size(), 1u);
  EXPECT_EQ(received[0].command, "Good");
}

/// One way for a call to fail, seen through each way of calling.
struct Failure {
  const char* name;
  std::optional<Act> act;  // no peer at all when unset
  std::int32_t status;
};
enum class Caller { managerSync, managerAsync, helper };

class CallFailure : public ClientOverBus,
                    public ::testing::WithParamInterface<std::tuple<Failure, Caller>> {};

TEST_P(CallFailure, YieldsItsStatusOnceWithinTheTimeout) {
  auto [failure, caller] = GetParam();
  auto service = caller == Caller::helper ? ScriptedPeer::Service::helper : ScriptedPeer::Service::manager;
  std::unique_ptr<ScriptedPeer> peer;
  if (failure.act) {
    peer = startPeer(service);
    peer->script(vorn::kCommandTraceDumpState, {*failure.act, st::kBusy, dict({})});
    peer->script(vorn::helper::kCommandDiagsnapStatus, {*failure.act, st::kBusy, dict({})});
  }
  auto start = Clock::now();
  if (caller == Caller::helper) {
    auto helper = vorn::HelperClient::create("logdump.helper", nullptr);
    ASSERT_TRUE(helper);
    xpc::dict response;
    auto result = helper->perform(vorn::helper::kTaskDiagsnapStatus,
                                  vorn::helper::kCommandDiagsnapStatus, xpc::dict(), response);
    EXPECT_EQ(result.status, failure.status);
    EXPECT_FALSE(response.valid());
  } else if (caller == Caller::managerSync) {
    auto m = manager();
    object response = object::string("stale");
    EXPECT_EQ(vorn::client::PerformCommand(m, vorn::kCommandTraceDumpState, dict({}), response).status,
              failure.status);
    EXPECT_TRUE(response.isNull());
  } else {
    auto m = manager();
    Recorder done;
    vorn::client::PerformCommand(m, vorn::kCommandTraceDumpState, done.completion(queue_), dict({}));
    ASSERT_TRUE(done.waitFor(1));
    m.reset();  // would complete anything still pending
    ASSERT_TRUE(drain(queue_));
    auto calls = done.snapshot();
    ASSERT_EQ(calls.size(), 1u);
    EXPECT_EQ(calls[0].result.status, failure.status);
    EXPECT_TRUE(calls[0].response.isNull());
    EXPECT_TRUE(calls[0].onQueue);
  }
  EXPECT_LT(Clock::now() - start, kCallTimeout + 3s);
}

const Failure kFailures[] = {
    {"NoOwner", std::nullopt, kNotRunning},
    {"WrongSignature", Act::wrongSignature, st::kMalformedReply},
    {"NeverReplies", Act::noReply, st::kNoReply},
    {"ExitsMidCall", Act::exit, st::kNoReply},
    {"ServerStatus", Act::answer, st::kBusy},
};

std::string failureName(const ::testing::TestParamInfo<std::tuple<Failure, Caller>>& info) {
  const char* callers[] = {"Sync", "Async", "Helper"};
  return std::string(std::get<0>(info.param).name) + callers[int(std::get<1>(info.param))];
}

INSTANTIATE_TEST_SUITE_P(
    Calls, CallFailure,
    ::testing::Combine(::testing::ValuesIn(kFailures),
                       ::testing::Values(Caller::managerSync, Caller::managerAsync, Caller::helper)),
    failureName);

TEST_F(ClientOverBus, DestroyingTheManagerCompletesPendingCallsOnTheQueue) {
  setenv("VORN_CALL_TIMEOUT_MS", "60000", 1);
  auto peer = startPeer(ScriptedPeer::Service::manager);
  peer->script(vorn::kCommandTraceDumpState, {Act::noReply, 0, {}});
  Recorder done;
  auto m = manager();
  // Records where the completion's captures are released.
  struct Witness {
    dispatch::queue q;
    std::shared_ptr<std::atomic<int>> releasedOnQueue;
    ~Witness() {
      if (releasedOnQueue) *releasedOnQueue = q.isCurrent() ? 1 : 2;
    }
  };
  auto released = std::make_shared<std::atomic<int>>(0);
  auto witness = std::make_shared<Witness>(Witness{queue_, released});
  auto completion = done.completion(queue_);
  vorn::client::PerformCommand(
      m, vorn::kCommandTraceDumpState,
      [completion, witness](TelephonyXPC::Result r, object o) { completion(r, o); }, dict({}));
  witness.reset();
  ASSERT_EQ(peer->waitForCalls(1, kPatience).size(), 1u);
  auto start = Clock::now();
  m.reset();
  ASSERT_TRUE(done.waitFor(1));
  EXPECT_LT(Clock::now() - start, 5s);
  ASSERT_TRUE(drain(queue_));
  auto calls = done.snapshot();
  ASSERT_EQ(calls.size(), 1u);
  EXPECT_EQ(calls[0].result.status, st::kNoReply);
  EXPECT_EQ(released->load(), 1);
}

TEST_F(ClientOverBus, DeliversServerStateOnEventsOnAndLaterEvents) {
  auto peer = startPeer(ScriptedPeer::Service::manager);
  peer->setState(dict({{vorn::kKeyServerState, object::string("Started")}}));
  Recorder events, others;  // outlive the manager that calls them
  auto m = manager();
  vorn::client::RegisterEventHandler(m, vorn::kEventServerStateChange, events.handler(queue_));
  vorn::client::RegisterEventHandler(m, "Unrelated", others.handler(queue_));
  auto start = Clock::now();
  vorn::client::EventsOn(m);
  EXPECT_LT(Clock::now() - start, 100ms) << "EventsOn must not wait for the server";
  ASSERT_TRUE(events.waitFor(1, 500ms));
  EXPECT_EQ(peer->waitForCalls(1, kPatience)[0].client, "vorntool-test");

  peer->emit("NotRegistered", dict({{vorn::kKeyServerState, object::string("Bogus")}}));
  peer->emit(vorn::kEventServerStateChange, dict({{vorn::kKeyServerState, object::string("Stopping")}}));
  ASSERT_TRUE(events.waitFor(2));

  vorn::client::EventsOff(m);
  peer->emit(vorn::kEventServerStateChange, dict({{vorn::kKeyServerState, object::string("Off")}}));
  // The reply to this call comes after the signal: once it is in and the
  // queue drained, a delivered event would be visible.
  object response;
  ASSERT_EQ(vorn::client::PerformCommand(m, "Sync", dict({}), response).status, 0);
  ASSERT_TRUE(drain(queue_));

  auto seen = events.snapshot();
  ASSERT_EQ(seen.size(), 2u);
  EXPECT_EQ(xpc::dyn_cast_or_default(seen[0].response.get(vorn::kKeyServerState), ""), "Started");
  EXPECT_EQ(xpc::dyn_cast_or_default(seen[1].response.get(vorn::kKeyServerState), ""), "Stopping");
  EXPECT_TRUE(seen[0].onQueue && seen[1].onQueue);
  EXPECT_TRUE(others.snapshot().empty());
}

TEST_F(ClientOverBus, DeliversNothingWhenHelloFails) {
  struct Case {
    const char* what;
    std::optional<Act> hello;
  } cases[] = {{"no server", std::nullopt}, {"wrong signature", Act::wrongSignature}};
  for (const auto& c : cases) {
    std::unique_ptr<ScriptedPeer> peer;
    if (c.hello) {
      peer = startPeer(ScriptedPeer::Service::manager);
      peer->script("Hello", {*c.hello, 0, {}});
    }
    Recorder events;
    auto m = manager();
    vorn::client::RegisterEventHandler(m, vorn::kEventServerStateChange, events.handler(queue_));
    vorn::client::EventsOn(m);
    // Answered after Hello on the same connection.
    object response;
    vorn::client::PerformCommand(m, "After", dict({}), response);
    ASSERT_TRUE(drain(queue_));
    EXPECT_TRUE(events.snapshot().empty()) << c.what;
  }
}

TEST_F(ClientOverBus, AnswersTracePropertiesFromTheFileWhileTheServerIsDown) {
  std::ofstream(root_ + "/var/lib/vorn/trace.properties") << "Baseband.Enabled=1\nSystemLogs.Mode=3\n";
  auto query = [](const char* trace, const char* property) {
    return dict({{vorn::kKeyTraceName, object::string(trace)},
                 {vorn::kKeyTracePropertyName, object::string(property)}});
  };
  struct Case {
    const char* command;
    object request;
    std::int32_t status;
    const char* value;
  } cases[] = {
      {vorn::kCommandGetTraceProperty, query("SystemLogs", "Mode"), 0, "3"},
      {vorn::kCommandGetTraceProperty, query("Baseband", "Enabled"), 0, "1"},
      {vorn::kCommandGetTraceProperty, query("Baseband", "Mode"), kNotRunning, nullptr},
      {vorn::kCommandGetTraceProperty, dict({}), kNotRunning, nullptr},
      {vorn::kCommandTraceDumpState, query("SystemLogs", "Mode"), kNotRunning, nullptr},
  };
  auto m = manager();
  for (const auto& c : cases) {
    object response;
    EXPECT_EQ(vorn::client::PerformCommand(m, c.command, c.request, response).status, c.status);
    if (c.value)
      EXPECT_EQ(response, dict({{vorn::kKeyTracePropertyValue, object::string(c.value)}}));
    else
      EXPECT_TRUE(response.isNull());
  }
  fs::remove(root_ + "/var/lib/vorn/trace.properties");
  object response;
  EXPECT_EQ(vorn::client::PerformCommand(m, vorn::kCommandGetTraceProperty, query("SystemLogs", "Mode"),
                                         response)
                .status,
            kNotRunning);
}

TEST_F(ClientOverBus, FailsWithoutABusAndConnectsOnceOneAppears) {
  std::string address = bus_->address();
  setenv("DBUS_SYSTEM_BUS_ADDRESS", ("unix:path=" + bus_->directory() + "/missing").c_str(), 1);
  std::ofstream(root_ + "/var/lib/vorn/trace.properties") << "SystemLogs.Mode=2\n";
  Recorder done;
  auto m = manager();
  auto helper = vorn::HelperClient::create("logdump.helper", nullptr);
  ASSERT_TRUE(m);
  ASSERT_TRUE(helper);

  object response;
  EXPECT_EQ(vorn::client::PerformCommand(m, vorn::kCommandTraceDumpState, dict({}), response).status,
            kNotRunning);
  EXPECT_EQ(vorn::client::PerformCommand(
                m, vorn::kCommandGetTraceProperty,
                dict({{vorn::kKeyTraceName, object::string("SystemLogs")},
                      {vorn::kKeyTracePropertyName, object::string("Mode")}}),
                response)
                .status,
            0);
  EXPECT_EQ(xpc::dyn_cast_or_default(response.get(vorn::kKeyTracePropertyValue), ""), "2");
  vorn::client::PerformCommand(m, "Any", done.completion(queue_), dict({}));
  ASSERT_TRUE(done.waitFor(1));
  EXPECT_EQ(done.snapshot()[0].result.status, kNotRunning);
  xpc::dict helperResponse;
  EXPECT_EQ(helper->perform(vorn::helper::kTaskDiagsnapStatus, "DiagsnapStatus", xpc::dict(),
                            helperResponse)
                .status,
            kNotRunning);

  setenv("DBUS_SYSTEM_BUS_ADDRESS", address.c_str(), 1);
  auto peer = startPeer(ScriptedPeer::Service::manager);
  EXPECT_EQ(vorn::client::PerformCommand(m, "Echo", everyKind(), response).status, 0);
  EXPECT_EQ(response, everyKind());
}

TEST_F(ClientOverBus, HelperCarriesTaskCommandAndRequest) {
  auto peer = startPeer(ScriptedPeer::Service::helper);
  peer->script(vorn::helper::kCommandDiagsnapStatus,
               {Act::answer, 0, dict({{vorn::helper::kKeyTimestampString, object::string("2024-05-06-070809")}})});
  auto helper = vorn::HelperClient::create("logdump.helper", nullptr);
  xpc::dict request;
  request.set(vorn::helper::kKeyTimeout, object::int64(1500));
  xpc::dict response;
  auto result = helper->perform(vorn::helper::kTaskDiagsnapStatus, vorn::helper::kCommandDiagsnapStatus,
                                request, response);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(xpc::dyn_cast_or_default(response.get(vorn::helper::kKeyTimestampString), ""),
            "2024-05-06-070809");
  auto received = peer->waitForCalls(1, kPatience);
  ASSERT_EQ(received.size(), 1u);
  EXPECT_EQ(received[0].client, "logdump.helper");
  EXPECT_EQ(received[0].task, 4u);
  EXPECT_EQ(received[0].request, request.obj());
}

TEST_F(ClientOverBus, RefusesCallersThatThePolicyDenies) {
  auto managerPeer = startPeer(ScriptedPeer::Service::manager);
  auto helperPeer = startPeer(ScriptedPeer::Service::helper);
  for (const char* mode : {"manager", "helper"}) {
    std::string out = bus_->directory() + "/probe-" + mode;
    vorn::test::ChildProcess probe({{VORN_BUS_PROBE, mode}, {}, /* runAsId= */ 65534, out});
    ASSERT_EQ(probe.wait(kPatience), 0) << mode;
    std::ifstream in(out);
    std::int32_t status = 0;
    in >> status;
    EXPECT_EQ(status, st::kAccessDenied) << mode;
  }
  EXPECT_TRUE(managerPeer->waitForCalls(1, 0ms).empty());
}

TEST(ClientWithoutManager, FailsAsServerNotRunning) {
  object response = object::string("stale");
  EXPECT_EQ(vorn::client::PerformCommand(nullptr, "Any", dict({}), response).status, kNotRunning);
  EXPECT_TRUE(response.isNull());
  int calls = 0;
  std::int32_t status = 0;
  vorn::client::PerformCommand(
      nullptr, "Any",
      [&](TelephonyXPC::Result r, object) {
        ++calls;
        status = r.status;
      },
      dict({}));
  EXPECT_EQ(calls, 1);
  EXPECT_EQ(status, kNotRunning);
  vorn::client::EventsOn(nullptr);
  vorn::client::EventsOff(nullptr);
  vorn::client::RegisterEventHandler(nullptr, "x", {});
}

TEST(ClientFactories, InstalledFactoriesReplaceTheBusUntilCleared) {
  vorn::client::SetManagerFactory([](const std::string&, dispatch::queue) { return nullptr; });
  EXPECT_EQ(vorn::client::CreateManager("x", dispatch::queue("q")), nullptr);
  vorn::client::SetManagerFactory(nullptr);
  EXPECT_NE(vorn::client::CreateManager("x", dispatch::queue("q")), nullptr);

  vorn::HelperClient::setFactory([](const char*) { return nullptr; });
  EXPECT_EQ(vorn::HelperClient::create("x", nullptr), nullptr);
  vorn::HelperClient::setFactory(nullptr);
  EXPECT_NE(vorn::HelperClient::create("x", nullptr), nullptr);
}

}  // namespace
