// SPDX-License-Identifier: MIT
// The client libraries against the real reference daemons on a private bus.
#include <gtest/gtest.h>
#include <stdlib.h>

#include <condition_variable>
#include <filesystem>
#include <fstream>
#include <mutex>
#include <optional>

#include "platform/helper_client.h"
#include "platform/vorn_client.h"
#include "tests/support/private_bus.h"

namespace {

namespace fs = std::filesystem;
using namespace std::chrono_literals;
using xpc::object;

const std::string kServerDir = VORN_SERVER_DIR;

class ClientAgainstVornd : public ::testing::Test {
 protected:
  void SetUp() override {
    if (!fs::exists(kServerDir + "/vornd") || !fs::exists(kServerDir + "/vorn-helper"))
      GTEST_SKIP() << "vornd or vorn-helper is not built in " << kServerDir;
    if (!vorn::test::isRoot()) GTEST_SKIP() << "the bus policy lets only root own the names";
    bus_.emplace();
    ASSERT_TRUE(bus_->ok()) << bus_->error();
    root_ = bus_->directory() + "/root";
    for (const char* dir : {"/etc/vorn", "/var/log/vorn", "/var/lib/vorn"})
      fs::create_directories(root_ + dir);
    std::ofstream(root_ + "/etc/vorn/device.conf") << "radio=1\nvendor=1\n";
    std::ofstream(root_ + "/var/log/vorn/telephony.log") << "a line\n";
  }

  bool startDaemon(const std::string& name, const std::string& busName,
                   std::vector<std::string> args) {
    args.insert(args.begin(), {kServerDir + "/" + name, "--root", root_});
    daemons_.emplace_back(vorn::test::ChildProcess::Options{args, {}, -1, ""});
    return vorn::test::waitForBusName(busName, 10s);
  }

  std::optional<vorn::test::PrivateBus> bus_;
  std::string root_;
  std::vector<vorn::test::ChildProcess> daemons_;
  dispatch::queue queue_{"vorn.e2e.queue"};
};

std::string stateOf(const object& payload) {
  return xpc::dyn_cast_or_default(payload.get(vorn::kKeyServerState), "");
}

TEST_F(ClientAgainstVornd, ReportsStateAtOnceAndLaterChanges) {
  ASSERT_TRUE(startDaemon("vornd", "org.vorn.Manager", {"--start-delay-ms", "1500"}));
  // Declared before the manager, so they outlive every call of the handler.
  std::mutex mutex;
  std::condition_variable cv;
  std::vector<std::string> states;
  bool offQueue = false;
  auto manager = vorn::client::CreateManager("vorntool", queue_);
  vorn::client::RegisterEventHandler(manager, vorn::kEventServerStateChange,
                                     [&](object payload, dispatch::group) {
                                       std::lock_guard lock(mutex);
                                       offQueue |= !queue_.isCurrent();
                                       states.push_back(stateOf(payload));
                                       cv.notify_all();
                                     });
  vorn::client::EventsOn(manager);
  std::unique_lock lock(mutex);
  ASSERT_TRUE(cv.wait_for(lock, 500ms, [&] { return !states.empty(); }));
  EXPECT_EQ(states[0], "Starting");
  ASSERT_TRUE(cv.wait_for(lock, 10s, [&] { return states.size() >= 2; }));
  EXPECT_EQ(states[1], vorn::kServerStateStarted);
  EXPECT_FALSE(offQueue);
  lock.unlock();
  manager.reset();
  dispatch::group drained;
  drained.enter();
  queue_.async([drained] { drained.leave(); });
  ASSERT_TRUE(drained.wait(10s));
}

TEST_F(ClientAgainstVornd, AnswersSyncAndAsyncRequests) {
  ASSERT_TRUE(startDaemon("vornd", "org.vorn.Manager", {}));
  auto manager = vorn::client::CreateManager("vorntool", queue_);

  object response;
  auto result = vorn::client::PerformCommand(
      manager, vorn::kCommandGetTraceProperty,
      object::dictionary({{vorn::kKeyTraceName, object::string(vorn::kTraceBaseband)},
                          {vorn::kKeyTracePropertyName, object::string(vorn::kKeyTraceEnabled)}}),
      response);
  EXPECT_EQ(result.status, 0);
  EXPECT_EQ(xpc::dyn_cast_or_default(response.get(vorn::kKeyTracePropertyValue), ""), "1");

  EXPECT_EQ(vorn::client::PerformCommand(manager, "NoSuchCommand", object::dictionary({}), response)
                .status,
            vorn::status::kBadRequest);

  dispatch::group done;
  done.enter();
  TelephonyXPC::Result asyncResult{-1, ""};
  object asyncResponse;
  vorn::client::PerformCommand(
      manager, vorn::kCommandTraceDumpState,
      [&](TelephonyXPC::Result r, object o) {
        asyncResult = r;
        asyncResponse = o;
        done.leave();
      },
      object::dictionary(
          {{vorn::kKeyTraceAction, object::string(vorn::kCollectTelephonyLogs)},
           {vorn::kKeyTraceDumpStatePerformCompression, object::int64(0)},
           {vorn::kKeyTraceDumpStateReason, object::string("[vorntool] e2e")}}));
  ASSERT_TRUE(done.wait(60s));
  EXPECT_EQ(asyncResult.status, 0);
  std::string ts = xpc::dyn_cast_or_default(asyncResponse.get(vorn::kKeyTimestampString), "");
  EXPECT_FALSE(ts.empty());
  EXPECT_TRUE(fs::exists(root_ + "/var/wireless/Library/Logs/CrashReporter/Baseband/log-bb-" + ts +
                         "-tel"));
}

TEST_F(ClientAgainstVornd, FallsBackToTracePropertiesOnceTheServerStops) {
  ASSERT_TRUE(startDaemon("vornd", "org.vorn.Manager", {}));
  auto manager = vorn::client::CreateManager("vorntool", queue_);
  auto query = object::dictionary({{vorn::kKeyTraceName, object::string(vorn::kTraceSystemLogs)},
                                   {vorn::kKeyTracePropertyName, object::string(vorn::kKeyTraceMode)}});
  object response;
  ASSERT_EQ(vorn::client::PerformCommand(manager, vorn::kCommandGetTraceProperty, query, response).status, 0);
  std::string live = xpc::dyn_cast_or_default(response.get(vorn::kKeyTracePropertyValue), "");
  daemons_.clear();  // SIGTERM: the daemon releases its name and exits
  setenv("VORN_ROOT", root_.c_str(), 1);
  auto offline = vorn::client::CreateManager("vorntool", queue_);
  unsetenv("VORN_ROOT");
  EXPECT_EQ(vorn::client::PerformCommand(offline, vorn::kCommandGetTraceProperty, query, response).status, 0);
  EXPECT_EQ(xpc::dyn_cast_or_default(response.get(vorn::kKeyTracePropertyValue), ""), live);
  EXPECT_EQ(vorn::client::PerformCommand(offline, vorn::kCommandTraceDumpState, object::dictionary({}),
                                         response)
                .status,
            kResultServerNotRunning);
}

TEST_F(ClientAgainstVornd, HelperAnswersWithoutASnapshot) {
  ASSERT_TRUE(startDaemon("vorn-helper", "org.vorn.Helper", {}));
  auto helper = vorn::HelperClient::create("logdump.helper", nullptr);
  xpc::dict request;
  request.set(vorn::helper::kKeyTimeout, object::int64(1500));
  xpc::dict response;
  EXPECT_EQ(helper->perform(vorn::helper::kTaskDiagsnapStatus, vorn::helper::kCommandDiagsnapStatus,
                            request, response)
                .status,
            vorn::status::kCollectionFailed);
  EXPECT_EQ(helper->perform(vorn::helper::TaskID(9), vorn::helper::kCommandDiagsnapStatus, request,
                            response)
                .status,
            vorn::status::kBadRequest);
}

}  // namespace
