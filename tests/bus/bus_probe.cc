// SPDX-License-Identifier: MIT
// Makes one call through the client library ("manager" or "helper") and prints
// its status: the tests run it as another user to meet the bus policy.
#include <cstdio>
#include <string>

#include "platform/helper_client.h"
#include "platform/vorn_client.h"

int main(int argc, char** argv) {
  xpc::object response;
  xpc::dict helperResponse;
  auto result = argc > 1 && std::string(argv[1]) == "helper"
                    ? vorn::HelperClient::create("probe", nullptr)
                          ->perform(vorn::helper::kTaskDiagsnapStatus, "DiagsnapStatus", xpc::dict(), helperResponse)
                    : vorn::client::PerformCommand(vorn::client::CreateManager("probe", dispatch::queue("probe.queue")),
                                                   "TraceDumpState", xpc::object::dictionary({}), response);
  std::printf("%d\n", result.status);
}
