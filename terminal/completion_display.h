// SPDX-License-Identifier: MIT
#pragma once

#include <cstddef>
#include <string>
#include <vector>

#include "framework/line_reader.h"

namespace terminal {

/// What one press of Tab does: insert text at the cursor, or list the
/// candidates when nothing can be inserted. Neither: nothing fits.
struct CompletionStep {
  std::string insert;
  bool list = false;

  bool operator==(const CompletionStep&) const = default;
};

/// A single candidate is completed and followed by a space; several are
/// completed as far as they agree, and listed once they agree no further.
CompletionStep planCompletion(const Completions& completions);

/// The candidates as the listing shows them: a path shows only its last part.
std::vector<std::string> listedNames(const Completions& completions);

/// Names in columns filled top to bottom, as many as fit in `width` less one
/// (at least one); each line ends with '\n', without trailing blanks.
std::string formatColumns(const std::vector<std::string>& names, std::size_t width);

}  // namespace terminal
