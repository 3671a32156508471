// SPDX-License-Identifier: MIT
// One trace.properties file read two ways: by a running vornd, and by the
// client library answering for it while it is down. They must agree.
#include <gtest/gtest.h>

#include <fstream>

#include "platform/protocol/protocol.h"
#include "platform/vorn_client.h"
#include "tests/server/daemons_fixture.h"

using namespace std::chrono_literals;
using namespace vorn::test;
using xpc::object;

namespace {

struct Property {
  const char* trace;
  const char* name;
};

/// TracePropertyValue, or "<none>" when there is no answer with one.
std::string valueOf(const object& response) {
  const std::string* value = response.get(vorn::kKeyTracePropertyValue).asString();
  return value != nullptr ? *value : "<none>";
}

object request(const Property& p) {
  return dict({{vorn::kKeyTraceName, object::string(p.trace)}, {vorn::kKeyTracePropertyName, object::string(p.name)}});
}

TEST_F(Daemons, TraceServerAndClientLibraryReadTheSamePropertiesFile) {
  // Both built-in defaults are in the file, so that the server's defaults
  // cannot make the two differ.
  write("var/lib/vorn/trace.properties",
        "# comment\n"
        "Baseband.Enabled=1 # note\n"
        "  SystemLogs.Mode = 3  \n"
        "Baseband.Path=/a=b\n"
        "#Baseband.Hidden=1\n"
        "junk line\n"
        "Baseband.Later=1\n"
        "Baseband.Later=2\n");
  const std::vector<Property> asked = {{"Baseband", "Enabled"}, {"SystemLogs", "Mode"}, {"Baseband", "Path"},
                                       {"Baseband", "Hidden"},  {"Baseband", "Later"},  {"baseband", "Enabled"},
                                       {"Baseband", "Missing"}, {"junk line", ""}};
  start({VORND_PATH});
  std::vector<std::string> fromServer;
  for (const auto& p : asked) fromServer.push_back(valueOf(perform(vorn::kCommandGetTraceProperty, request(p)).response));
  EXPECT_EQ(fromServer[0], "1 # note");
  EXPECT_EQ(fromServer[1], "3");

  daemons.clear();
  ASSERT_TRUE(vorn::test::waitForBusName("org.vorn.Manager", 0ms) == false);
  setenv("VORN_ROOT", root.c_str(), 1);
  dispatch::queue queue("vorn.test.properties");
  auto manager = vorn::client::CreateManager("vorntool-test", queue);
  std::vector<std::string> fromLibrary;
  for (const auto& p : asked) {
    object response;
    vorn::client::PerformCommand(manager, vorn::kCommandGetTraceProperty, request(p), response);
    fromLibrary.push_back(valueOf(response));
  }
  unsetenv("VORN_ROOT");
  EXPECT_EQ(fromLibrary, fromServer);
}

}  // namespace
