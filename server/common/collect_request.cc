// SPDX-License-Identifier: MIT
#include "server/common/collect_request.h"

#include "platform/protocol/protocol.h"

namespace vorn::server {

namespace {

std::optional<CollectAction> actionFromName(const std::string& name) {
  if (name == kCollectTelephonyLogs) return CollectAction::telephonyLogs;
  if (name == kCollectTelephonyLogsWithCoredump) return CollectAction::telephonyLogsWithCoredump;
  if (name == kCollectBasebandLogs) return CollectAction::basebandLogs;
  return std::nullopt;
}

// The tool sends a 64-bit signed integer; an unsigned one is as good.
std::optional<Compression> compressionFrom(const xpc::object& value) {
  if (value.isNull()) return Compression::tarGz;
  long long n = -1;
  if (const auto* v = value.asInt64()) {
    n = *v;
  } else if (const auto* u = value.asUint64()) {
    n = *u <= 2 ? static_cast<long long>(*u) : -1;
  }
  switch (n) {
    case 0: return Compression::none;
    case 1: return Compression::tarGz;
    case 2: return Compression::tar;
    default: return std::nullopt;
  }
}

/// Roughly the bytes `value` takes; stops counting past `limit`.
size_t weight(const xpc::object& value, size_t limit) {
  constexpr size_t kScalar = 16;
  if (const auto* text = value.asString()) return kScalar + text->size();
  size_t total = kScalar;
  if (const auto* entries = value.asEntries()) {
    for (const auto& [key, item] : *entries) {
      total += key.size() + weight(item, limit);
      if (total > limit) break;
    }
  } else if (const auto* items = value.asArray()) {
    for (const auto& item : *items) {
      total += weight(item, limit);
      if (total > limit) break;
    }
  }
  return total;
}

}  // namespace

std::optional<CollectRequest> parseCollectRequest(const xpc::object& request) {
  if (weight(request, kRequestLimit) > kRequestLimit) return std::nullopt;
  const std::string* action = request.get(kKeyTraceAction).asString();
  if (action == nullptr) return std::nullopt;
  auto parsed = actionFromName(*action);
  if (!parsed) return std::nullopt;
  auto compression = compressionFrom(request.get(kKeyTraceDumpStatePerformCompression));
  if (!compression) return std::nullopt;

  CollectRequest out;
  out.action = *parsed;
  out.compression = *compression;
  const char* reasonKey = out.action == CollectAction::telephonyLogsWithCoredump ? kKeyBasebandResetReason
                                                                                 : kKeyTraceDumpStateReason;
  xpc::object reason = request.get(reasonKey);
  if (reason.isNull()) {
    out.reason = kUnknown;
  } else if (const auto* text = reason.asString(); text != nullptr && text->size() <= kReasonLimit) {
    out.reason = *text;
  } else {
    return std::nullopt;
  }
  return out;
}

const char* actionName(CollectAction action) {
  switch (action) {
    case CollectAction::telephonyLogs: return kCollectTelephonyLogs;
    case CollectAction::telephonyLogsWithCoredump: return kCollectTelephonyLogsWithCoredump;
    case CollectAction::basebandLogs: return kCollectBasebandLogs;
  }
  return kUnknown;
}

}  // namespace vorn::server
