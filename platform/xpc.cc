// SPDX-License-Identifier: MIT
#include "platform/xpc.h"

#include <unordered_map>
#include <variant>

namespace xpc {

struct object::node {
  struct dictionary_value {
    std::vector<entry> entries;
    std::unordered_map<std::string_view, std::size_t> index;
    friend bool operator==(const dictionary_value& a, const dictionary_value& b) {
      return a.entries == b.entries;
    }
  };
  std::variant<std::string, std::int64_t, std::uint64_t, bool, double, std::vector<object>,
               dictionary_value>
      value;
};

object object::string(std::string text) {
  return object(std::make_shared<const node>(node{std::move(text)}));
}
object object::int64(std::int64_t v) { return object(std::make_shared<const node>(node{v})); }
object object::uint64(std::uint64_t v) { return object(std::make_shared<const node>(node{v})); }
object object::boolean(bool v) { return object(std::make_shared<const node>(node{v})); }
object object::dbl(double v) { return object(std::make_shared<const node>(node{v})); }
object object::array(std::vector<object> items) {
  return object(std::make_shared<const node>(node{std::move(items)}));
}

object object::dictionary(std::vector<entry> entries) {
  auto n = std::make_shared<node>();
  auto& d = n->value.emplace<node::dictionary_value>();
  // Reserved up front so that the vector never moves: the index holds views
  // of the keys stored in it.
  d.entries.reserve(entries.size());
  for (auto& [key, value] : entries) {
    auto found = d.index.find(key);
    if (found != d.index.end()) {
      d.entries[found->second].second = std::move(value);
      continue;
    }
    d.entries.emplace_back(std::move(key), std::move(value));
    d.index.emplace(d.entries.back().first, d.entries.size() - 1);
  }
  return object(std::move(n));
}

type object::kind() const {
  if (!node_) return type::null;
  switch (node_->value.index()) {
    case 0: return type::string;
    case 1: return type::int64;
    case 2: return type::uint64;
    case 3: return type::boolean;
    case 4: return type::double_;
    case 5: return type::array;
    default: return type::dictionary;
  }
}

const std::string* object::asString() const {
  return node_ ? std::get_if<std::string>(&node_->value) : nullptr;
}
const std::int64_t* object::asInt64() const {
  return node_ ? std::get_if<std::int64_t>(&node_->value) : nullptr;
}
const std::uint64_t* object::asUint64() const {
  return node_ ? std::get_if<std::uint64_t>(&node_->value) : nullptr;
}
const bool* object::asBool() const { return node_ ? std::get_if<bool>(&node_->value) : nullptr; }
const double* object::asDouble() const {
  return node_ ? std::get_if<double>(&node_->value) : nullptr;
}
const std::vector<object>* object::asArray() const {
  return node_ ? std::get_if<std::vector<object>>(&node_->value) : nullptr;
}
const std::vector<entry>* object::asEntries() const {
  if (!node_) return nullptr;
  auto* d = std::get_if<node::dictionary_value>(&node_->value);
  return d ? &d->entries : nullptr;
}

object object::get(std::string_view key) const {
  if (!node_) return {};
  auto* d = std::get_if<node::dictionary_value>(&node_->value);
  if (!d) return {};
  auto found = d->index.find(key);
  return found == d->index.end() ? object() : d->entries[found->second].second;
}

bool operator==(const object& a, const object& b) {
  if (a.node_ == b.node_) return true;
  if (!a.node_ || !b.node_) return false;
  return a.node_->value == b.node_->value;
}

dict::dict() : obj_(object::dictionary({})) {}

dict::dict(object o) : obj_(o.isDictionary() ? std::move(o) : object()) {}

void dict::set(std::string key, object value) {
  std::vector<entry> entries;
  if (auto* old = obj_.asEntries()) entries = *old;
  entries.emplace_back(std::move(key), std::move(value));
  obj_ = object::dictionary(std::move(entries));
}

std::string dyn_cast_or_default(const object& o, const std::string& fallback) {
  auto* s = o.asString();
  return s ? *s : fallback;
}

}  // namespace xpc

namespace util {

bool equal_nocase(std::string_view a, std::string_view b) {
  if (a.size() != b.size()) return false;
  auto fold = [](unsigned char c) { return (c >= 'A' && c <= 'Z') ? c + ('a' - 'A') : c; };
  for (std::size_t i = 0; i < a.size(); ++i)
    if (fold(a[i]) != fold(b[i])) return false;
  return true;
}

}  // namespace util
