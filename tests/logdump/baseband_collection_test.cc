// SPDX-License-Identifier: MIT
#include "logdump_fixture.h"

namespace {

using xpc::object;

using BasebandCollection = LogdumpTest;

const std::string kScratch = "/var/wireless/Library/Logs/ZelmarBasebandManager/DIAG.scratch";
const std::string kRunning = "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot;
const std::string kFailed = "Baseband log collection: Failed\n";
const std::string kNotEnabled = "Baseband logs are not enabled\n";

TEST_F(BasebandCollection, OutcomeTable) {
  struct Case {
    const char* what;
    FakeManager::Answer enabled;
    FakeManager::Answer dump;
    std::list<std::string> typed;
    std::string out;
    bool result;
  };
  const auto on = property("1");
  const std::vector<Case> cases = {
      {"enabled check failed", {kResultServerNotRunning, object()}, {}, {}, kFailed, false},
      {"enabled check without dictionary", {0, object::string("1")}, {}, {}, kFailed, true},
      {"not enabled", property("0"), {}, {}, kNotEnabled, true},
      {"enabled is case-sensitive", property("TRUE"), {}, {}, kNotEnabled, true},
      {"enabled is the whole text", property(" 1"), {}, {}, kNotEnabled, true},
      {"enabled value missing", {0, object::dictionary({})}, {}, {}, kNotEnabled, true},
      {"enabled as true", property("true"), timestamp("T"), {"tar"}, kRunning + "log-bb-T.tar\n", true},
      {"dump failed", on, {vorn::status::kCollectionFailed, object()}, {}, kFailed, true},
      {"dump succeeded", on, timestamp("T"), {"x"}, kRunning + "log-bb-T.tar.gz\n", true},
      {"dump succeeded, directory", on, timestamp("T"), {"nocompress", "x"}, kRunning + "log-bb-T-bb-trace\n", true},
      {"dump succeeded, no dictionary", on, {0, object()}, {}, kRunning + "log-bb-.tar.gz\n", true},
  };
  for (const auto& c : cases) {
    restart();
    manager->answer("GetTraceProperty", c.enabled, "Baseband");
    manager->answer("TraceDumpState", c.dump);
    auto r = run("bb", c.typed);
    EXPECT_EQ(r.out, kWaited + c.out) << c.what;
    EXPECT_EQ(r.result, c.result) << c.what;
  }
}

TEST_F(BasebandCollection, RequestsInOrderWithoutUserConfirmation) {
  manager->answer("GetTraceProperty", property("1"), "Baseband");
  manager->answer("GetTraceProperty", property("3"), "SystemLogs");
  manager->answer("TraceDumpState", timestamp("T"));
  EXPECT_EQ(run("bb", {"nonui", "tar"}).out, kWaited + kRunning + "log-bb-T-bb-trace\n");
  auto requests = manager->requests();
  ASSERT_EQ(requests.size(), 3u);
  EXPECT_EQ(requests[0].request, object::dictionary({{"TraceName", object::string("Baseband")},
                                                     {"TracePropertyName", object::string("Enabled")}}));
  EXPECT_EQ(requests[1].request, object::dictionary({{"TraceName", object::string("SystemLogs")},
                                                     {"TracePropertyName", object::string("Mode")}}));
  EXPECT_EQ(requests[2].request,
            object::dictionary({{"TraceDumpStateReason", object::string("[vorntool] User triggered")},
                                {"TraceAction", object::string("CollectBasebandLogs")},
                                {"TraceDumpStatePerformCompression", object::int64(0)}}));
  for (auto& req : requests) EXPECT_FALSE(req.async);
}

TEST_F(BasebandCollection, ServerDownAsksTheHelperOnInternalAndCarrierBuilds) {
  struct Case {
    platform::BuildKind build;
    bool available;
    std::int32_t helperStatus;
    object helperResponse;
    std::string path;
    bool asked;
  };
  const auto ts = object::dictionary({{"TimestampString", object::string("H")}});
  const std::string snapshot = kSnapshot + "log-bb-H-bb-trace";
  using enum platform::BuildKind;
  const std::vector<Case> cases = {
      {internal, true, 0, ts, snapshot, true},
      {carrier, true, 0, ts, snapshot, true},
      {customer, true, 0, ts, kScratch, false},
      {internal, true, vorn::status::kNoReply, ts, kScratch, true},
      {internal, true, 0, object::dictionary({}), kScratch, true},
      {internal, true, 0, object::string("H"), kScratch, true},
      {internal, false, 0, ts, kScratch, false},
  };
  manager->answer("GetTraceProperty", property("1"), "Baseband");
  manager->answer("TraceDumpState", {kResultServerNotRunning, object()});
  for (const auto& c : cases) {
    device->buildKind = c.build;
    helperAvailable = c.available;
    helper->calls.clear();
    helper->status = c.helperStatus;
    helper->response = c.helperResponse;
    auto r = run("bb", {"tar.gz"});
    EXPECT_TRUE(r.result);
    EXPECT_EQ(r.out, kWaited + "Baseband log collection: Success (Vorn not running)\nPath = " + c.path + "\n");
    ASSERT_EQ(helper->calls.size(), c.asked ? 1u : 0u);
    if (c.asked) {
      EXPECT_EQ(helper->client, "logdump.helper");
      EXPECT_EQ(helper->calls[0].task, 4u);
      EXPECT_EQ(helper->calls[0].command, "DiagsnapStatus");
      EXPECT_EQ(helper->calls[0].request, object::dictionary({{"Timeout", object::int64(1500)}}));
    }
  }
}

}  // namespace
