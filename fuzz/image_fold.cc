// SPDX-License-Identifier: MIT
// The fold behind image-path fragments: a fold is its own fold, valid UTF-8,
// and a path always contains itself.
#include "fuzz/support.h"
#include "platform/logstore/unicode_fold.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string text = fuzz::textOf(data, size);
  const std::string folded = logstore::foldForMatch(text);
  FUZZ_CHECK(logstore::foldForMatch(folded) == folded);
  FUZZ_CHECK(fuzz::validUtf8(folded));
  // Only a text that folds to nothing (empty, or nonspacing marks only) is
  // no fragment at all.
  FUZZ_CHECK(logstore::containsFolded(text, folded) == !folded.empty());
  return 0;
}
