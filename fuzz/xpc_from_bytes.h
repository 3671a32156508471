// SPDX-License-Identifier: MIT
#pragma once

#include <fuzzer/FuzzedDataProvider.h>

#include <string>
#include <string_view>
#include <vector>

#include "platform/xpc.h"

namespace fuzz {

/// Message objects of every kind, nested up to `maxDepth` containers, drawn
/// from fuzz bytes. Texts are sometimes taken from `words` (keys and values a
/// parser looks for), which random bytes would rarely spell.
class XpcFromBytes {
 public:
  XpcFromBytes(FuzzedDataProvider& in, std::vector<std::string_view> words, int maxDepth)
      : in_(in), words_(std::move(words)), maxDepth_(maxDepth) {}

  xpc::object object(int depth = 0);
  std::string text();

 private:
  FuzzedDataProvider& in_;
  std::vector<std::string_view> words_;
  int maxDepth_;
};

/// Equal, with doubles compared bit for bit: a NaN must arrive as the same
/// NaN, though it equals nothing.
bool identical(const xpc::object& a, const xpc::object& b);

}  // namespace fuzz
