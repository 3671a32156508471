// SPDX-License-Identifier: MIT
#include "server/common/daemon_options.h"

#include <getopt.h>

#include <algorithm>
#include <charconv>
#include <functional>

#include "platform/vorn_version.h"
#include "server/common/text_util.h"

namespace vorn::server {

namespace {

/// One long option: its name, and what to do with its value (every option
/// but --help and --version takes one).
struct Option {
  const char* name;
  const char* value;  // how --help names the value
  const char* usage;
  std::function<bool(const std::string& value, std::string* error)> take;
};

[[maybe_unused]] std::function<bool(const std::string&, std::string*)> delayInto(long* target, const std::string& name) {
  return [target, name](const std::string& value, std::string* error) {
    if (parseCount(value, target)) return true;
    *error = name + " wants a number of milliseconds, not \"" + value + "\"";
    return false;
  };
}

std::function<bool(const std::string&, std::string*)> rootInto(std::string* target) {
  return [target](const std::string& value, std::string* error) {
    if (value.empty()) {
      *error = "--root wants a folder";
      return false;
    }
    *target = value;
    return true;
  };
}

std::string defaultRoot(const char* envRoot) { return envRoot != nullptr && *envRoot != '\0' ? envRoot : "/"; }

std::string usage(const char* program, const std::vector<Option>& options) {
  std::string text = std::string("Usage: ") + program + " [OPTION]...\n";
  auto line = [&](const std::string& option, const char* usage) {
    text += "  " + option + std::string(option.size() < 32 ? 32 - option.size() : 1, ' ') + usage + "\n";
  };
  for (const auto& o : options) line("--" + std::string(o.name) + " " + o.value, o.usage);
  line("--help", "show this help and exit");
  line("--version", "show the version and exit");
  return text;
}

/// Reads `args` with getopt_long against `options`.
OptionsVerdict walk(const char* program, const std::vector<std::string>& args, const std::vector<Option>& options,
                    std::string* text) {
  enum { kHelp = 1000, kVersion = 1001 };
  std::vector<struct option> table;
  for (size_t i = 0; i < options.size(); ++i) table.push_back({options[i].name, required_argument, nullptr, int(i)});
  table.push_back({"help", no_argument, nullptr, kHelp});
  table.push_back({"version", no_argument, nullptr, kVersion});
  table.push_back({nullptr, 0, nullptr, 0});

  std::vector<std::string> words = {program};
  words.insert(words.end(), args.begin(), args.end());
  std::vector<char*> argv;
  for (auto& w : words) argv.push_back(w.data());
  argv.push_back(nullptr);

  // getopt keeps its state in globals: start afresh, and report errors
  // ourselves ("+": stop at the first word that is not an option; ":": a
  // missing value is told apart from an unknown option).
  optind = 0;
  opterr = 0;
  for (;;) {
    const int previous = optind == 0 ? 1 : optind;
    // NOLINTNEXTLINE(concurrency-mt-unsafe): options are read before any thread starts
    const int c = getopt_long(int(words.size()), argv.data(), "+:", table.data(), nullptr);
    if (c == -1) break;
    const std::string word = words[static_cast<size_t>(std::min<int>(previous, int(words.size()) - 1))];
    if (c == kHelp) {
      *text = usage(program, options);
      return OptionsVerdict::help;
    }
    if (c == kVersion) {
      *text = std::string(program) + " " + kVornVersion + "\n";
      return OptionsVerdict::version;
    }
    if (c == ':') {
      *text = word.substr(0, word.find('=')) + " needs a value";
      return OptionsVerdict::error;
    }
    if (c == '?') {
      *text = "unknown option " + word;
      return OptionsVerdict::error;
    }
    if (!options[static_cast<size_t>(c)].take(optarg != nullptr ? optarg : "", text)) return OptionsVerdict::error;
  }
  if (optind < int(words.size())) {
    *text = "unexpected argument " + words[static_cast<size_t>(optind)];
    return OptionsVerdict::error;
  }
  return OptionsVerdict::run;
}

}  // namespace

OptionsVerdict parseManagerOptions(const std::vector<std::string>& args, const char* envRoot, ManagerOptions* out,
                                   std::string* text) {
  ManagerOptions opts;
  opts.root = defaultRoot(envRoot);
  std::vector<Option> options = {
      {"root", "DIR", "the platform root (default: $VORN_ROOT, else /)", rootInto(&opts.root)},
      {"max-collection-bytes", "N", "data bytes one collection stores at most (default 1 GiB)",
       [&](const std::string& v, std::string* e) {
         std::uint64_t n = 0;
         auto [end, ec] = std::from_chars(v.data(), v.data() + v.size(), n);
         if (ec == std::errc() && end == v.data() + v.size() && !v.empty()) {
           opts.maxCollectionBytes = n;
           return true;
         }
         *e = "--max-collection-bytes wants a number of bytes, not \"" + v + "\"";
         return false;
       }},
#ifdef VORN_TEST_SWITCHES
      {"state", "TEXT", "report this state instead of Started",
       [&](const std::string& v, std::string*) { opts.state = v; return true; }},
      {"start-delay-ms", "N", "announce the state N ms after taking the name",
       delayInto(&opts.startDelayMs, "--start-delay-ms")},
      {"reply-delay-ms", "N", "delay every answer by N ms", delayInto(&opts.replyDelayMs, "--reply-delay-ms")},
      {"collect-delay-ms", "N", "hold each collection N ms before it starts",
       delayInto(&opts.collectDelayMs, "--collect-delay-ms")},
      {"fail", "COMMAND=STATUS", "answer COMMAND with STATUS",
       [&](const std::string& v, std::string* e) {
         auto eq = v.rfind('=');
         int status = 0;
         if (eq == std::string::npos || eq == 0 || !parseStatus(v.substr(eq + 1), &status)) {
           *e = "--fail wants COMMAND=STATUS, not \"" + v + "\"";
           return false;
         }
         opts.fail[v.substr(0, eq)] = status;
         return true;
       }},
      {"no-reply", "COMMAND", "never answer COMMAND",
       [&](const std::string& v, std::string*) { opts.noReply.insert(v); return true; }},
      {"exit-on", "COMMAND", "exit at once when COMMAND arrives",
       [&](const std::string& v, std::string*) { opts.exitOn.insert(v); return true; }},
#endif
  };
  OptionsVerdict verdict = walk("vornd", args, options, text);
  if (verdict == OptionsVerdict::run) *out = std::move(opts);
  return verdict;
}

OptionsVerdict parseHelperOptions(const std::vector<std::string>& args, const char* envRoot, HelperOptions* out,
                                  std::string* text) {
  HelperOptions opts;
  opts.root = defaultRoot(envRoot);
  std::vector<Option> options = {
      {"root", "DIR", "the platform root (default: $VORN_ROOT, else /)", rootInto(&opts.root)},
#ifdef VORN_TEST_SWITCHES
      {"reply-delay-ms", "N", "delay every answer by N ms", delayInto(&opts.replyDelayMs, "--reply-delay-ms")},
      {"fail", "STATUS", "answer every request with STATUS",
       [&](const std::string& v, std::string* e) {
         int status = 0;
         if (!parseStatus(v, &status)) {
           *e = "--fail wants a status, not \"" + v + "\"";
           return false;
         }
         opts.fail = status;
         return true;
       }},
#endif
  };
  OptionsVerdict verdict = walk("vorn-helper", args, options, text);
  if (verdict == OptionsVerdict::run) *out = std::move(opts);
  return verdict;
}

}  // namespace vorn::server
