// SPDX-License-Identifier: MIT
#include "logdump_fixture.h"

namespace {

using xpc::object;

/// The TraceDumpState request of `handler` ("tel" or "core").
object dumpRequest(const std::string& handler, const std::string& reason, std::int64_t compression, bool nonui) {
  std::vector<xpc::entry> e;
  if (handler == "tel") {
    e = {{"TraceAction", object::string("CollectTelephonyLogs")}, {"TraceDumpStateReason", object::string(reason)}};
  } else {
    e = {{"BasebandResetType", object::string("Hard")},
         {"BasebandResetSubType", object::string("OtherErrors")},
         {"TraceAction", object::string("CollectTelephonyLogsWithCoredump")},
         {"BasebandResetReason", object::string(reason)}};
  }
  e.emplace_back("TraceDumpStatePerformCompression", object::int64(compression));
  if (nonui) e.emplace_back("TraceUserConfirmation", object::boolean(false));
  return object::dictionary(e);
}

const object kModeQuery = object::dictionary(
    {{"TraceName", object::string("SystemLogs")}, {"TracePropertyName", object::string("Mode")}});

using TelephonyCollection = LogdumpTest;

TEST_F(TelephonyCollection, RequestsCarryExactlyTheirEntries) {
  struct Case {
    std::string handler;
    std::list<std::string> typed;
    std::string mode;  // the system-logs trace mode the server reports
    object expected;
  };
  const std::vector<Case> cases = {
      {"tel", {}, "1", dumpRequest("tel", "[vorntool] User triggered", 1, false)},
      {"tel", {"nonui", "x"}, "1", dumpRequest("tel", "[vorntool] x", 1, true)},
      {"tel", {"tar", "crash"}, "3", dumpRequest("tel", "[vorntool] crash", 0, false)},
      {"tel", {"tar"}, "0x3", dumpRequest("tel", "[vorntool] User triggered", 0, false)},
      {"tel", {"tar"}, "3 ", dumpRequest("tel", "[vorntool] User triggered", 2, false)},
      // Only "tel" asks for the trace mode.
      {"core", {"nocompress"}, "3", dumpRequest("core", "[vorntool] User triggered", 0, false)},
      {"core", {"tar", "NONUI", "why", "nocompress"}, "3", dumpRequest("core", "[vorntool] why", 2, true)},
  };
  for (const auto& c : cases) {
    restart();
    manager->answer("GetTraceProperty", property(c.mode));
    EXPECT_TRUE(run(c.handler, c.typed).result);
    auto requests = manager->requests();
    const std::size_t dumpAt = c.handler == "tel" ? 1 : 0;
    ASSERT_EQ(requests.size(), dumpAt + 1) << c.handler;
    if (dumpAt == 1) {
      EXPECT_EQ(requests[0].command, "GetTraceProperty");
      EXPECT_EQ(requests[0].request, kModeQuery);
      EXPECT_FALSE(requests[0].async);
    }
    EXPECT_EQ(requests[dumpAt].command, "TraceDumpState");
    EXPECT_TRUE(requests[dumpAt].async);
    EXPECT_EQ(requests[dumpAt].request, c.expected) << c.handler << " " << testing::PrintToString(c.typed);
  }
}

TEST_F(TelephonyCollection, CompletionPrintsResultAndPath) {
  const auto withTs = timestamp("2026-11-23-101500");
  struct Case {
    std::string handler;
    std::list<std::string> typed;
    FakeManager::Answer dump;
    std::string out;
  };
  const std::vector<Case> cases = {
      {"tel", {}, withTs,
       "Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-2026-11-23-101500.tar.gz\n"},
      {"tel", {"nocompress"}, withTs,
       "Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-2026-11-23-101500-*\n"},
      {"core", {"nocompress"}, withTs,
       "Telephony log collection with Coredump: Success\nPath = " + kSnapshot +
           "log-bb-2026-11-23-101500-coredump\n"},
      {"tel", {}, {0, object::dictionary({{"TimestampString", object::int64(5)}})},
       "Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-.tar.gz\n"},
      {"tel", {}, {0, object::string("not a dictionary")}, "Telephony log collection: Success\n"},
      {"tel", {}, {kResultServerNotRunning, withTs.response}, "Telephony log collection: Failed\n"},
      {"core", {}, {vorn::status::kNoReply, object()}, "Telephony log collection with Coredump: Failed\n"},
  };
  for (const auto& c : cases) {
    manager->answer("TraceDumpState", c.dump);
    auto r = run(c.handler, c.typed);
    EXPECT_TRUE(r.result) << c.out;  // the collection's outcome never fails the command
    EXPECT_EQ(r.out, kWaited + c.out);
    EXPECT_EQ(r.err, "");
  }
}

}  // namespace
