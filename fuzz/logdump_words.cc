// SPDX-License-Identifier: MIT
// The collection commands' argument words: logdump's option words and reason,
// trace modes, and the oslog command's history, path and filter words. The
// input is the words in command-line order, each ended by a NUL.
#include <algorithm>
#include <cctype>
#include <list>

#include "fuzz/support.h"
#include "logdump/logdump_options.h"
#include "logdump/oslog_command.h"

namespace {

void checkLogdumpOptions(const std::vector<std::string>& words) {
  std::list<std::string> args(words.rbegin(), words.rend());
  auto compression = static_cast<CompressionMode>(-1);
  std::string reason;
  bool noUserConfirmation = false;
  parseLogdumpOptions(args, compression, reason, noUserConfirmation);
  // Options come first; the first other word is the reason and what follows
  // it is left for the caller untouched. Only options at all keep the
  // default reason.
  const auto consumed = static_cast<std::ptrdiff_t>(words.size() - args.size());
  FUZZ_CHECK(args == std::list<std::string>(words.rbegin(), words.rend() - consumed));
  FUZZ_CHECK((consumed > 0 && reason == "[vorntool] " + words[consumed - 1]) ||
             (args.empty() && reason == "[vorntool] User triggered"));
  FUZZ_CHECK(compression == static_cast<CompressionMode>(-1) || compression == None || compression == TarGz ||
             compression == Tar);
}

void checkTraceMode(const std::string& word) {
  bool valid = false;
  const int mode = parseTraceMode(word, valid);
  FUZZ_CHECK(valid || mode == 0);
  if (!valid) return;
  // Whatever was accepted names a number that reads back as itself, and
  // letters may come in either case: names, hexadecimal digits and "0x".
  std::string upper = word;
  for (char& c : upper) c = static_cast<char>(std::toupper(static_cast<unsigned char>(c)));
  for (const auto& again : {std::to_string(mode), upper}) {
    FUZZ_CHECK(parseTraceMode(again, valid) == mode && valid);
  }
}

void checkOsLogArguments(const std::vector<std::string>& words) {
  auto request = logdump::parseOsLogArguments({words.rbegin(), words.rend()});
  FUZZ_CHECK(request.has_value() == (words.size() >= 2));
  if (!request) return;
  FUZZ_CHECK(request->path == words[1]);
  if (words.size() == 2) return;  // the default lists
  // Filter terms are words after the path, in order, and never a mode word.
  for (const auto* terms : {&request->processes, &request->imagePaths}) {
    auto at = words.begin() + 2;
    for (const auto& term : *terms) {
      at = std::find(at, words.end(), term);
      FUZZ_CHECK(at != words.end() && !term.starts_with("-"));
      ++at;
    }
  }
  FUZZ_CHECK(request->processes.size() + request->imagePaths.size() <= words.size() - 2);
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* data, std::size_t size) {
  const std::vector<std::string> words = fuzz::wordsOf(fuzz::textOf(data, size));
  checkLogdumpOptions(words);
  for (const auto& word : words) checkTraceMode(word);
  checkOsLogArguments(words);
  return 0;
}
