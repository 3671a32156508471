// SPDX-License-Identifier: MIT
#include "framework/completion.h"

#include <algorithm>
#include <string>
#include <vector>

#include "framework/command_shell.h"

namespace {

using Words = std::vector<std::string>;

/// The words of `text` in typed order, split as the shell splits a line.
Words wordsOf(std::string_view text) {
  auto list = CommandShell::convertLineToList(std::string(text));
  return Words(list.rbegin(), list.rend());
}

bool isBlank(char c) { return c == ' ' || c == '\t' || c == '\n' || c == '\v' || c == '\f' || c == '\r'; }

void addMatching(Words& into, const Words& from, const std::string& prefix) {
  for (const auto& word : from)
    if (word.starts_with(prefix)) into.push_back(word);
}

/// Paths of "cd": the last '/' separates the folder typed so far, which must
/// resolve, from the name being typed in it.
Words pathCandidates(std::shared_ptr<CommandBase> node, const std::string& partial) {
  const auto slash = partial.rfind('/');
  const std::string folder = slash == std::string::npos ? "" : partial.substr(0, slash + 1);
  std::string components = folder;
  std::replace(components.begin(), components.end(), '/', ' ');
  for (const auto& component : wordsOf(components)) {
    if (node->isValidSubCommand(component)) {
      node = node->getSubCommandObj(component);
    } else if (component == "..") {
      if (auto parent = node->getParent().lock()) node = parent;
    } else {
      return {};
    }
  }
  Words names = node->getSubCommandNames();
  names.push_back("..");
  for (auto& name : names) name = folder + name;
  Words found;
  addMatching(found, names, partial);
  return found;
}

Words optionCandidates(const CommandBase& node, const std::string& handler, const Words& args,
                       const std::string& partial) {
  const OptionWords options = node.getOptionWords(handler);
  if (args.size() < options.positionals) return {};
  const Words given(args.begin() + static_cast<std::ptrdiff_t>(options.positionals), args.end());
  auto isOption = [&](const std::string& word) {
    return std::find(options.words.begin(), options.words.end(), word) != options.words.end();
  };
  if (options.leadingOnly && !std::all_of(given.begin(), given.end(), isOption)) return {};
  Words found;
  for (const auto& word : options.words)
    if (word.starts_with(partial) && std::find(given.begin(), given.end(), word) == given.end())
      found.push_back(word);
  return found;
}

Words candidatesAt(std::shared_ptr<CommandBase> node, const Words& group, const std::string& partial) {
  for (std::size_t i = 0; i < group.size(); ++i) {
    const std::string& word = group[i];
    const Words rest(group.begin() + static_cast<std::ptrdiff_t>(i) + 1, group.end());
    if (word == "cd") return rest.empty() ? pathCandidates(node, partial) : Words{};
    if (node->isValidCommand(word)) return optionCandidates(*node, word, rest, partial);
    if (!node->isValidSubCommand(word)) return {};
    node = node->getSubCommandObj(word);
  }
  Words found;
  addMatching(found, node->getHandlerNames(), partial);
  addMatching(found, node->getSubCommandNames(), partial);
  addMatching(found, {"cd", "help"}, partial);
  // "back", "quit" and "exit" count only as the single word of their group.
  if (group.empty()) addMatching(found, {"back", "quit", "exit"}, partial);
  return found;
}

}  // namespace

Completions completeLine(const std::shared_ptr<CommandBase>& start, std::string_view beforeCursor) {
  Completions result;
  Words words = wordsOf(beforeCursor);
  if (!beforeCursor.empty() && !isBlank(beforeCursor.back()) && !words.empty()) {
    result.word = std::move(words.back());
    words.pop_back();
  }
  if (!start) return result;
  auto separator = std::find(words.rbegin(), words.rend(), "--");
  const Words group(separator.base(), words.end());
  result.candidates = candidatesAt(start, group, result.word);
  std::sort(result.candidates.begin(), result.candidates.end());
  result.candidates.erase(std::unique(result.candidates.begin(), result.candidates.end()),
                          result.candidates.end());
  return result;
}
