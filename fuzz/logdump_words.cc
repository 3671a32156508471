// SPDX-License-Identifier: MIT
// The collection commands' argument words: logdump's option words and reason,
// trace modes, and the oslog command's history, path and filter words. The
// input is the words in command-line order, each ended by a NUL.
#include <algorithm>
#include <cctype>
#include <cstddef>
#include <cstdint>
#include <list>
#include <string>
#include <vector>

#include "fuzz/fuzz_check.h"
#include "logdump/logdump_options.h"
#include "logdump/oslog_command.h"

namespace {

std::vector<std::string> wordsOf(const std::uint8_t* data, std::size_t size) {
  std::vector<std::string> words;
  std::string word;
  for (std::size_t i = 0; i < size; ++i) {
    if (data[i] == 0) {
      words.push_back(std::move(word));
      word.clear();
    } else {
      word.push_back(static_cast<char>(data[i]));
    }
  }
  if (!word.empty()) words.push_back(std::move(word));
  return words;
}

/// A handler's word list: the first word at the back.
std::list<std::string> wordList(std::vector<std::string>::const_iterator begin,
                                std::vector<std::string>::const_iterator end) {
  std::list<std::string> list;
  for (auto it = begin; it != end; ++it) list.push_front(*it);
  return list;
}

/// `part` is `whole` with some words left out, the rest in order.
bool keptInOrder(const std::vector<std::string>& part, std::vector<std::string>::const_iterator begin,
                 std::vector<std::string>::const_iterator end) {
  auto at = begin;
  for (const auto& word : part) {
    at = std::find(at, end, word);
    if (at == end) return false;
    ++at;
  }
  return true;
}

void checkLogdumpOptions(const std::vector<std::string>& words) {
  auto args = wordList(words.begin(), words.end());
  auto compression = static_cast<CompressionMode>(-1);
  std::string reason;
  bool noUserConfirmation = false;
  parseLogdumpOptions(args, compression, reason, noUserConfirmation);
  // Options come first; the first other word is the reason and what follows
  // it is left for the caller untouched.
  const std::size_t consumed = words.size() - args.size();
  FUZZ_CHECK(args == wordList(words.begin() + static_cast<std::ptrdiff_t>(consumed), words.end()));
  if (words.empty()) {
    FUZZ_CHECK(reason == "[vorntool] User triggered");
  } else {
    // Only options at all keep the default reason.
    FUZZ_CHECK(consumed > 0);
    FUZZ_CHECK(reason == "[vorntool] " + words[consumed - 1] ||
               (args.empty() && reason == "[vorntool] User triggered"));
  }
  FUZZ_CHECK(compression == static_cast<CompressionMode>(-1) || compression == None || compression == TarGz ||
             compression == Tar);
}

void checkTraceMode(const std::string& word) {
  bool valid = false;
  const int mode = parseTraceMode(word, valid);
  if (!valid) {
    FUZZ_CHECK(mode == 0);
    return;
  }
  // Whatever was accepted names a number that reads back as itself.
  bool again = false;
  FUZZ_CHECK(parseTraceMode(std::to_string(mode), again) == mode && again);
  // Letters may come in either case: names, hexadecimal digits and "0x".
  std::string upper = word;
  for (char& c : upper) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  FUZZ_CHECK(parseTraceMode(upper, again) == mode && again);
}

void checkOsLogArguments(const std::vector<std::string>& words) {
  auto request = logdump::parseOsLogArguments(wordList(words.begin(), words.end()));
  FUZZ_CHECK(request.has_value() == (words.size() >= 2));
  if (!request) return;
  FUZZ_CHECK(request->path == words[1]);
  if (words.size() == 2) {
    FUZZ_CHECK(request->processes == logdump::defaultOsLogProcesses());
    FUZZ_CHECK(request->imagePaths == logdump::defaultOsLogImagePaths());
    return;
  }
  // Filter terms are words after the path, in order, and never a mode word.
  for (const auto* terms : {&request->processes, &request->imagePaths}) {
    FUZZ_CHECK(keptInOrder(*terms, words.begin() + 2, words.end()));
    for (const auto& term : *terms) FUZZ_CHECK(!term.starts_with("-"));
  }
  FUZZ_CHECK(request->processes.size() + request->imagePaths.size() <= words.size() - 2);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::vector<std::string> words = wordsOf(data, size);
  checkLogdumpOptions(words);
  for (const auto& word : words) checkTraceMode(word);
  checkOsLogArguments(words);
  return 0;
}
