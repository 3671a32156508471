// SPDX-License-Identifier: MIT
// The server's collection requests, as any message object a client may send.
#include "fuzz/support.h"
#include "platform/protocol/protocol.h"
#include "server/common/collect_request.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  FuzzedDataProvider in(data, size);
  const xpc::object request = fuzz::objectFromBytes(
      in,
      {vorn::kKeyTraceAction, vorn::kCollectTelephonyLogs, vorn::kCollectTelephonyLogsWithCoredump,
       vorn::kCollectBasebandLogs, vorn::kKeyTraceDumpStateReason, vorn::kKeyTraceDumpStatePerformCompression,
       vorn::kKeyBasebandResetReason, vorn::kKeyTraceUserConfirmation},
      /* maxDepth= */ 3);
  const auto parsed = vorn::server::parseCollectRequest(request);
  if (!parsed) return 0;
  // A request that was taken names its action and, when it gives a reason,
  // gives it as text.
  FUZZ_CHECK(request.get(vorn::kKeyTraceAction) == xpc::object::string(vorn::server::actionName(parsed->action)));
  const xpc::object reason =
      request.get(parsed->action == vorn::server::CollectAction::telephonyLogsWithCoredump
                      ? vorn::kKeyBasebandResetReason
                      : vorn::kKeyTraceDumpStateReason);
  FUZZ_CHECK(reason.isNull() ? parsed->reason == vorn::kUnknown : reason == xpc::object::string(parsed->reason));
  return 0;
}
