// SPDX-License-Identifier: MIT
// The line of requests behind a running collection, through the test build
// of vornd (which can hold a collection before it starts), and what vornd
// finds and leaves in the snapshot folder as it starts.
#include <gtest/gtest.h>

#include <chrono>
#include <fstream>
#include <map>

#include "platform/protocol/protocol.h"
#include "tests/server/daemons_fixture.h"

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using namespace vorn::test;

namespace {

/// Asynchronous TraceDumpState calls on one connection, and their answers
/// in the order they arrive.
class Caller {
 public:
  Caller() {
    sd_bus* raw = nullptr;
    if (sd_bus_open_system(&raw) >= 0) bus_.reset(raw);
  }
  bool ok() const { return bus_ != nullptr; }

  void send(int id) {
    auto m = performCall(bus_.get(), "TraceDumpState", collect("CollectTelephonyLogs", 1));
    std::uint64_t cookie = 0;
    // A floating slot: it goes with the connection, so no answer runs after.
    if (!m || sd_bus_call_async(bus_.get(), nullptr, m.get(), &Caller::onReply, this, 60'000'000) < 0 ||
        sd_bus_message_get_cookie(m.get(), &cookie) < 0) {
      answers.emplace_back(id, Reply{"test.CannotSend", -1, {}});
    }
    ids_[cookie] = id;
  }

  /// Returns once vornd has read everything sent so far on this connection:
  /// it answers in order, so its answer to a Hello sent after them says so.
  bool sync() {
    sd_bus_message* reply = nullptr;
    int r = sd_bus_call_method(bus_.get(), "org.vorn.Manager", "/org/vorn/Manager", "org.vorn.Manager1", "Hello",
                               nullptr, &reply, "s", "t");
    sd_bus_message_unref(reply);
    return r >= 0;
  }

  /// Sends and leaves the bus at once, as a client that exits would.
  static void sendAndLeave() {
    Caller gone;
    auto m = performCall(gone.bus_.get(), "TraceDumpState", collect("CollectTelephonyLogs", 1));
    sd_bus_send(gone.bus_.get(), m.get(), nullptr);
  }

  /// Processes the connection until `count` answers came, or a deadline.
  bool waitFor(size_t count, std::chrono::seconds limit = 60s) {
    for (auto deadline = std::chrono::steady_clock::now() + limit; answers.size() < count;) {
      if (std::chrono::steady_clock::now() > deadline) return false;
      if (sd_bus_process(bus_.get(), nullptr) > 0) continue;
      sd_bus_wait(bus_.get(), 100'000);
    }
    return true;
  }

  std::vector<std::pair<int, Reply>> answers;

 private:
  static int onReply(sd_bus_message* m, void* self, sd_bus_error*) {
    auto* caller = static_cast<Caller*>(self);
    std::uint64_t cookie = 0;
    sd_bus_message_get_reply_cookie(m, &cookie);
    caller->answers.emplace_back(caller->ids_[cookie], readReply(m));
    return 0;
  }

  vorn::bus::BusPtr bus_;
  std::map<std::uint64_t, int> ids_;  // by the cookie of the call
};

TEST_F(Daemons, TheNinthWaitingRequestIsToldBusyAtOnce) {
  start({VORND_TESTING_PATH, "--collect-delay-ms", "20000"});
  Caller caller;
  ASSERT_TRUE(caller.ok());
  // The first runs (held for 20 s), eight wait, the tenth finds the line full.
  for (int id = 1; id <= 10; ++id) caller.send(id);
  ASSERT_TRUE(caller.waitFor(1));
  ASSERT_EQ(caller.answers.size(), 1u);
  EXPECT_EQ(caller.answers[0].first, 10);
  EXPECT_EQ(caller.answers[0].second.status, vorn::status::kBusy) << caller.answers[0].second.error;
  EXPECT_TRUE(caller.answers[0].second.response.isNull() || caller.answers[0].second.response.asEntries()->empty());
}

/// The parameter: whether the second caller leaves the bus before its turn.
class WaitingCaller : public Daemons, public ::testing::WithParamInterface<bool> {};

TEST_P(WaitingCaller, IsCollectedForOnlyWhileItStaysOnTheBus) {
  const bool leaves = GetParam();
  start({VORND_TESTING_PATH, "--collect-delay-ms", "1000"});
  Caller stays, other;
  ASSERT_TRUE(stays.ok() && other.ok());
  stays.send(1);  // runs, held a second: the next ones wait
  ASSERT_TRUE(stays.sync());
  if (leaves) {
    Caller::sendAndLeave();
  } else {
    other.send(2);
  }
  stays.send(3);
  ASSERT_TRUE(stays.waitFor(2));
  for (const auto& [id, reply] : stays.answers) EXPECT_EQ(reply.status, 0) << id << " " << reply.error;
  if (!leaves) {
    ASSERT_TRUE(other.waitFor(1));
  }
  EXPECT_EQ(namesIn(folder()).size(), leaves ? 2u : 3u);
}

INSTANTIATE_TEST_SUITE_P(Daemons, WaitingCaller, ::testing::Bool(),
                         [](const auto& paramInfo) { return paramInfo.param ? "Leaves" : "Stays"; });

TEST_F(Daemons, StartingRemovesWhatAKilledRunLeftHalfWritten) {
  write("var/wireless/Library/Logs/CrashReporter/Baseband/.log-bb-2020-01-01-000000.tar.gz.partial", "half");
  write("var/wireless/Library/Logs/CrashReporter/Baseband/.log-bb-2020-01-01-000000-tel.partial/vorn/a.log", "half");
  write("var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-2020-01-01-000000.tar", "whole");
  start({VORND_PATH});
  EXPECT_EQ(namesIn(folder()), std::set<std::string>{"log-bb-2020-01-01-000000.tar"});
}

TEST(ShippedDaemons, RefuseTheTestSwitchesAndTellTheirVersion) {
  struct Case {
    std::string command;
    int status;
    std::string out, err;
  } const cases[] = {
      {VORND_PATH " --version", 0, "vornd 0.2.0\n", ""},
      {VORN_HELPER_PATH " --version", 0, "vorn-helper 0.2.0\n", ""},
      {VORND_PATH " --state Busy", 2, "", "vornd: unknown option --state (see vornd --help)\n"},
      {VORN_HELPER_PATH " --fail 1", 2, "", "vorn-helper: unknown option --fail (see vorn-helper --help)\n"},
      {VORND_TESTING_PATH " --state", 2, "", "vornd: --state needs a value (see vornd --help)\n"},
  };
  char pattern[] = "/tmp/vorn-shipped.XXXXXX";
  const fs::path dir = mkdtemp(pattern);
  for (const auto& c : cases) {
    const int raw = std::system((c.command + " >" + (dir / "out").string() + " 2>" + (dir / "err").string()).c_str());
    EXPECT_EQ(WIFEXITED(raw) ? WEXITSTATUS(raw) : -1, c.status) << c.command;
    std::ifstream out(dir / "out"), err(dir / "err");
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(out), {}), c.out) << c.command;
    EXPECT_EQ(std::string(std::istreambuf_iterator<char>(err), {}), c.err) << c.command;
  }
  fs::remove_all(dir);
}

}  // namespace
