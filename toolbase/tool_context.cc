// SPDX-License-Identifier: MIT
#include "toolbase/tool_context.h"

ToolContext ToolContext::onThisDevice(std::shared_ptr<vorn::client::Manager> manager,
                                      dispatch::queue queue) {
  return {.manager = std::move(manager),
          .queue = std::move(queue),
          .device = DeviceProfile::ofThisDevice(),
          .helpers = vorn::HelperClient::create};
}
