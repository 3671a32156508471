// SPDX-License-Identifier: MIT
// Makes one call through the client library ("manager" or "helper") and prints
// its status; for the manager also whether it reports access denied, before
// and after the call. The tests run it as another user to meet the bus policy.
#include <cstdio>
#include <string>

#include "platform/helper_client.h"
#include "platform/vorn_client.h"

int main(int argc, char** argv) {
  if (argc > 1 && std::string(argv[1]) == "helper") {
    xpc::dict response;
    auto result = vorn::HelperClient::create("probe", nullptr)
                      ->perform(vorn::helper::kTaskDiagsnapStatus, "DiagsnapStatus", xpc::dict(), response);
    std::printf("%d\n", result.status);
    return 0;
  }
  auto manager = vorn::client::CreateManager("probe", dispatch::queue("probe.queue"));
  const bool deniedBefore = manager->accessDenied();
  xpc::object response;
  auto result = vorn::client::PerformCommand(manager, "TraceDumpState", xpc::object::dictionary({}), response);
  std::printf("%d %d %d\n", result.status, deniedBefore, manager->accessDenied());
}
