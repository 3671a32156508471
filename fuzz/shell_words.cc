// SPDX-License-Identifier: MIT
// A typed line into words, and words into "--"-separated groups.
#include <cctype>
#include <cstddef>
#include <cstdint>
#include <string>

#include "framework/command_shell.h"
#include "fuzz/fuzz_check.h"

namespace {

bool isBlank(char c) { return std::isspace(static_cast<unsigned char>(c)) != 0; }

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string line(reinterpret_cast<const char*>(data), size);
  const std::list<std::string> words = CommandShell::convertLineToList(line);

  // The words are the line's runs of non-blank characters: none is empty or
  // holds a blank, and together (first word at the back) they are the line
  // without its blanks.
  std::string unblanked;
  for (char c : line)
    if (!isBlank(c)) unblanked.push_back(c);
  std::string joined;
  for (auto it = words.rbegin(); it != words.rend(); ++it) {
    FUZZ_CHECK(!it->empty());
    for (char c : *it) FUZZ_CHECK(!isBlank(c));
    joined += *it;
  }
  FUZZ_CHECK(joined == unblanked);

  // Groups are non-empty, hold no "--", and keep every other word in order.
  std::list<std::string> others;
  for (auto it = words.rbegin(); it != words.rend(); ++it)
    if (*it != "--") others.push_back(*it);
  std::list<std::string> regrouped;
  for (const auto& group : CommandShell::splitCmdList(words)) {
    FUZZ_CHECK(!group.empty());
    for (auto it = group.rbegin(); it != group.rend(); ++it) {
      FUZZ_CHECK(*it != "--");
      regrouped.push_back(*it);
    }
  }
  FUZZ_CHECK(regrouped == others);
  return 0;
}
