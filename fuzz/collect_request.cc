// SPDX-License-Identifier: MIT
// The server's collection requests, as any message object a client may send.
#include <cstddef>
#include <cstdint>

#include "fuzz/fuzz_check.h"
#include "fuzz/xpc_from_bytes.h"
#include "platform/protocol/protocol.h"
#include "server/common/collect_request.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  fuzz::XpcFromBytes objects(in,
                             {vorn::kKeyTraceAction, vorn::kCollectTelephonyLogs,
                              vorn::kCollectTelephonyLogsWithCoredump, vorn::kCollectBasebandLogs,
                              vorn::kKeyTraceDumpStateReason, vorn::kKeyTraceDumpStatePerformCompression,
                              vorn::kKeyBasebandResetReason, vorn::kKeyTraceUserConfirmation},
                             /* maxDepth= */ 3);
  const xpc::object request = objects.object();
  const auto parsed = vorn::server::parseCollectRequest(request);
  if (!parsed) return 0;

  // A request that was taken names its action and, when it gives a reason,
  // gives it as text.
  const std::string* action = request.get(vorn::kKeyTraceAction).asString();
  FUZZ_CHECK(action && *action == vorn::server::actionName(parsed->action));
  const xpc::object reason =
      request.get(parsed->action == vorn::server::CollectAction::telephonyLogsWithCoredump
                      ? vorn::kKeyBasebandResetReason
                      : vorn::kKeyTraceDumpStateReason);
  FUZZ_CHECK(reason.isNull() ? parsed->reason == vorn::kUnknown : *reason.asString() == parsed->reason);
  return 0;
}
