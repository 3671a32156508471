// SPDX-License-Identifier: MIT
// A typed line into words, and words into "--"-separated groups.
#include <algorithm>
#include <cctype>

#include "framework/command_shell.h"
#include "fuzz/support.h"

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::string line = fuzz::textOf(data, size);
  const std::list<std::string> words = CommandShell::convertLineToList(line);
  auto blank = [](char c) { return std::isspace(static_cast<unsigned char>(c)) != 0; };

  // The words are the line's runs of non-blank characters: none is empty or
  // holds a blank, and together (first word at the back) they are the line
  // without its blanks. Groups are non-empty, hold no "--", and keep every
  // other word in order.
  std::string unblanked, joined;
  std::ranges::copy_if(line, std::back_inserter(unblanked), [&](char c) { return !blank(c); });
  std::list<std::string> others, regrouped;
  for (const auto& word : std::list<std::string>(words.rbegin(), words.rend())) {
    FUZZ_CHECK(!word.empty() && std::ranges::none_of(word, blank));
    joined += word;
    if (word != "--") others.push_back(word);
  }
  FUZZ_CHECK(joined == unblanked);
  for (const auto& group : CommandShell::splitCmdList(words)) {
    FUZZ_CHECK(!group.empty());
    regrouped.insert(regrouped.end(), group.rbegin(), group.rend());
  }
  FUZZ_CHECK(regrouped == others);
  return 0;
}
