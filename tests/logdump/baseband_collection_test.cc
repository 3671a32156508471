// SPDX-License-Identifier: MIT
#include "logdump_fixture.h"

namespace {

using xpc::object;

class BasebandCollection : public LogdumpTest {
 protected:
  void enabled(const std::string& value) { manager->answer("GetTraceProperty", property(value), "Baseband"); }
};

const std::string kScratch = "/var/wireless/Library/Logs/ZelmarBasebandManager/DIAG.scratch";

TEST_F(BasebandCollection, OutcomeTable) {
  struct Case {
    const char* what;
    FakeManager::Answer enabledAnswer;
    FakeManager::Answer dump;
    std::list<std::string> typed;
    std::string out;
    bool result;
  };
  const auto on = property("1");
  const std::vector<Case> cases = {
      {"enabled check failed", {kResultServerNotRunning, object()}, {}, {}, "Baseband log collection: Failed\n", false},
      {"enabled check without dictionary", {0, object::string("1")}, {}, {}, "Baseband log collection: Failed\n", true},
      {"not enabled", property("0"), {}, {}, "Baseband logs are not enabled\n", true},
      {"enabled is case-sensitive", property("TRUE"), {}, {}, "Baseband logs are not enabled\n", true},
      {"enabled is the whole text", property(" 1"), {}, {}, "Baseband logs are not enabled\n", true},
      {"enabled value missing", {0, object::dictionary({})}, {}, {}, "Baseband logs are not enabled\n", true},
      {"enabled as true", property("true"), timestamp("T"), {"tar"},
       "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot + "log-bb-T.tar\n", true},
      {"dump failed", on, {vorn::status::kCollectionFailed, object()}, {}, "Baseband log collection: Failed\n", true},
      {"dump succeeded", on, timestamp("T"), {"x"},
       "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot + "log-bb-T.tar.gz\n", true},
      {"dump succeeded, directory", on, timestamp("T"), {"nocompress", "x"},
       "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot + "log-bb-T-bb-trace\n", true},
      {"dump succeeded, no dictionary", on, {0, object()}, {},
       "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot + "log-bb-.tar.gz\n", true},
      {"server not running, customer build", on, {kResultServerNotRunning, object()}, {"tar.gz"},
       "Baseband log collection: Success (Vorn not running)\nPath = " + kScratch + "\n", true},
  };
  for (const auto& c : cases) {
    auto fresh = std::make_shared<FakeManager>(queue);
    fresh->answer("GetTraceProperty", c.enabledAnswer, "Baseband");
    fresh->answer("TraceDumpState", c.dump);
    command = LogdumpCommand::create("logdump", {}, contextWith(fresh));
    auto r = run("bb", c.typed);
    EXPECT_EQ(r.out, c.out) << c.what;
    EXPECT_EQ(r.result, c.result) << c.what;
    EXPECT_TRUE(helper->calls.empty()) << c.what;
    // Nothing is dumped unless tracing is enabled.
    const bool dumped = fresh->requests().back().command == "TraceDumpState";
    EXPECT_EQ(dumped, c.out.find("not enabled") == std::string::npos && c.enabledAnswer.status == 0 &&
                          c.enabledAnswer.response.isDictionary())
        << c.what;
  }
}

TEST_F(BasebandCollection, RequestsInOrderWithoutUserConfirmation) {
  enabled("1");
  manager->answer("GetTraceProperty", property("3"), "SystemLogs");
  manager->answer("TraceDumpState", timestamp("T"));
  auto r = run("bb", {"nonui", "tar"});
  EXPECT_EQ(r.out, "Baseband log collection: Success (Vorn running)\nPath = " + kSnapshot + "log-bb-T-bb-trace\n");
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
  const std::vector<Case> cases = {
      {platform::BuildKind::internal, true, 0, ts, snapshot, true},
      {platform::BuildKind::carrier, true, 0, ts, snapshot, true},
      {platform::BuildKind::customer, true, 0, ts, kScratch, false},
      {platform::BuildKind::internal, true, vorn::status::kNoReply, ts, kScratch, true},
      {platform::BuildKind::internal, true, 0, object::dictionary({}), kScratch, true},
      {platform::BuildKind::internal, true, 0, object::dictionary({{"TimestampString", object::int64(1)}}), kScratch, true},
      {platform::BuildKind::internal, true, 0, object::string("H"), kScratch, true},
      {platform::BuildKind::internal, false, 0, ts, kScratch, false},
  };
  enabled("1");
  manager->answer("TraceDumpState", {kResultServerNotRunning, object()});
  for (const auto& c : cases) {
    device->buildKind = c.build;
    helperAvailable = c.available;
    helper->calls.clear();
    helper->status = c.helperStatus;
    helper->response = c.helperResponse;
    auto r = run("bb", {"tar.gz"});
    EXPECT_TRUE(r.result);
    EXPECT_EQ(r.out, "Baseband log collection: Success (Vorn not running)\nPath = " + c.path + "\n");
    ASSERT_EQ(helper->calls.size(), c.asked ? 1u : 0u);
    if (c.asked) {
      EXPECT_EQ(helper->calls[0].client, "logdump.helper");
      EXPECT_EQ(helper->calls[0].task, 4u);
      EXPECT_EQ(helper->calls[0].command, "DiagsnapStatus");
      EXPECT_EQ(helper->calls[0].request, object::dictionary({{"Timeout", object::int64(1500)}}));
    }
  }
}

}  // namespace
