// SPDX-License-Identifier: MIT
// Makes one call through the client library and prints its status: the tests
// run it as another user to meet the bus policy.
#include <cstdio>
#include <cstring>

#include "platform/helper_client.h"
#include "platform/vorn_client.h"

int main(int argc, char** argv) {
  bool helper = argc > 1 && std::strcmp(argv[1], "helper") == 0;
  TelephonyXPC::Result result;
  if (helper) {
    auto client = vorn::HelperClient::create("probe", nullptr);
    xpc::dict response;
    result = client->perform(vorn::helper::kTaskDiagsnapStatus, vorn::helper::kCommandDiagsnapStatus,
                             xpc::dict(), response);
  } else {
    auto manager = vorn::client::CreateManager("probe", dispatch::queue("probe.queue"));
    xpc::object response;
    result = vorn::client::PerformCommand(manager, vorn::kCommandTraceDumpState,
                                          xpc::object::dictionary({}), response);
  }
  std::printf("%d\n", result.status);
  return 0;
}
