// SPDX-License-Identifier: MIT
#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

/// Message objects: an immutable, reference-counted value of one of eight
/// kinds. Copying an object shares it, like retaining the original.
namespace xpc {

enum class type { null, dictionary, string, int64, uint64, boolean, double_, array };

class object;
using entry = std::pair<std::string, object>;

class object {
 public:
  object() = default;  // the null object

  static object string(std::string text);
  static object int64(std::int64_t value);
  static object uint64(std::uint64_t value);
  static object boolean(bool value);
  static object dbl(double value);
  static object array(std::vector<object> items);
  /// Entries keep the order given; a later duplicate key replaces the value
  /// of the earlier one in its place.
  static object dictionary(std::vector<entry> entries);

  type kind() const;
  bool isNull() const { return kind() == type::null; }
  bool isDictionary() const { return kind() == type::dictionary; }

  /// Typed views; null when the object is of another kind.
  const std::string* asString() const;
  const std::int64_t* asInt64() const;
  const std::uint64_t* asUint64() const;
  const bool* asBool() const;
  const double* asDouble() const;
  const std::vector<object>* asArray() const;
  const std::vector<entry>* asEntries() const;

  /// The value under `key` of a dictionary; null when missing or not a dictionary.
  object get(std::string_view key) const;

  /// True when both are the same kind with equal contents.
  friend bool operator==(const object& a, const object& b);

 private:
  struct node;
  explicit object(std::shared_ptr<const node> n) : node_(std::move(n)) {}
  std::shared_ptr<const node> node_;
};

/// A dictionary under construction or a view of a received one. Made from an
/// object that is not a dictionary it stands for the null object: lookups give
/// null and `valid()` is false.
class dict {
 public:
  dict();  // a new, empty dictionary
  explicit dict(object o);

  bool valid() const { return obj_.isDictionary(); }
  object get(std::string_view key) const { return obj_.get(key); }
  /// Sets or replaces one entry. Other holders of the same object keep the
  /// value they had: objects are immutable, so this builds a new one.
  void set(std::string key, object value);
  const object& obj() const { return obj_; }
  operator const object&() const { return obj_; }

 private:
  object obj_;
};

/// The text of a string object, or `fallback` for any other object.
std::string dyn_cast_or_default(const object& o, const std::string& fallback);

}  // namespace xpc

namespace util {
/// Equal when the strings differ at most in the case of ASCII letters.
bool equal_nocase(std::string_view a, std::string_view b);
}  // namespace util
