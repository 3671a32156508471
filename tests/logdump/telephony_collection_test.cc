// SPDX-License-Identifier: MIT
#include "logdump_fixture.h"

namespace {

using xpc::object;

object telRequest(const std::string& reason, std::int64_t compression, bool nonui) {
  std::vector<xpc::entry> e{{"TraceAction", object::string("CollectTelephonyLogs")},
                            {"TraceDumpStateReason", object::string(reason)},
                            {"TraceDumpStatePerformCompression", object::int64(compression)}};
  if (nonui) e.emplace_back("TraceUserConfirmation", object::boolean(false));
  return object::dictionary(e);
}

object coreRequest(const std::string& reason, std::int64_t compression, bool nonui) {
  std::vector<xpc::entry> e{{"BasebandResetType", object::string("Hard")},
                            {"BasebandResetSubType", object::string("OtherErrors")},
                            {"TraceAction", object::string("CollectTelephonyLogsWithCoredump")},
                            {"BasebandResetReason", object::string(reason)},
                            {"TraceDumpStatePerformCompression", object::int64(compression)}};
  if (nonui) e.emplace_back("TraceUserConfirmation", object::boolean(false));
  return object::dictionary(e);
}

const object kModeQuery = object::dictionary(
    {{"TraceName", object::string("SystemLogs")}, {"TracePropertyName", object::string("Mode")}});

class TelephonyCollection : public LogdumpTest {};

TEST_F(TelephonyCollection, RequestsCarryExactlyTheirEntries) {
  struct Case {
    std::string handler;
    std::list<std::string> typed;
    std::string mode;  // the system-logs trace mode the server reports
    object expected;
    bool asksMode;
  };
  const std::vector<Case> cases = {
      {"tel", {}, "1", telRequest("[vorntool] User triggered", 1, false), true},
      {"tel", {"nonui", "x"}, "1", telRequest("[vorntool] x", 1, true), true},
      {"tel", {"tar", "crash"}, "3", telRequest("[vorntool] crash", 0, false), true},
      {"tel", {"tar"}, "0x3", telRequest("[vorntool] User triggered", 0, false), true},
      {"tel", {"tar"}, "3 ", telRequest("[vorntool] User triggered", 2, false), true},
      {"core", {"nocompress"}, "3", coreRequest("[vorntool] User triggered", 0, false), false},
      {"core", {"tar", "NONUI", "why", "nocompress"}, "3", coreRequest("[vorntool] why", 2, true), false},
  };
  for (const auto& c : cases) {
    auto fresh = std::make_shared<FakeManager>(queue);
    fresh->answer("GetTraceProperty", property(c.mode));
    auto cmd = LogdumpCommand::create("logdump", {}, contextWith(fresh));
    std::list<std::string> words(c.typed.rbegin(), c.typed.rend());
    StdioCapture io;
    EXPECT_TRUE(cmd->execCommand(c.handler, words));
    auto requests = fresh->requests();
    const std::size_t dumpAt = c.asksMode ? 1 : 0;
    ASSERT_EQ(requests.size(), dumpAt + 1) << c.handler;
    if (c.asksMode) {
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
      {"core", {"tar"}, withTs,
       "Telephony log collection with Coredump: Success\nPath = " + kSnapshot + "log-bb-2026-11-23-101500.tar\n"},
      {"tel", {}, {0, object::dictionary({{"TimestampString", object::int64(5)}})},
       "Telephony log collection: Success\nPath = " + kSnapshot + "log-bb-.tar.gz\n"},
      {"tel", {}, {0, object::string("not a dictionary")}, "Telephony log collection: Success\n"},
      {"core", {}, {0, object()}, "Telephony log collection with Coredump: Success\n"},
      {"tel", {}, {kResultServerNotRunning, withTs.response}, "Telephony log collection: Failed\n"},
      {"core", {}, {vorn::status::kNoReply, object()}, "Telephony log collection with Coredump: Failed\n"},
  };
  for (const auto& c : cases) {
    manager->answer("TraceDumpState", c.dump);
    auto r = run(c.handler, c.typed);
    EXPECT_TRUE(r.result) << c.out;  // the collection's outcome never fails the command
    EXPECT_EQ(r.out, c.out);
    EXPECT_EQ(r.err, "");
  }
}

}  // namespace
