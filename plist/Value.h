// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The property-list value: what reports, options, messages, events and preferences are made of.
//
// A value is a number, a text, an array, a dictionary, a date or data; it owns what it holds.
// "No value" is not a value: it is std::optional or a null pointer.
#pragma once

#include <concepts>
#include <cstddef>
#include <cstdint>
#include <initializer_list>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <utility>
#include <variant>
#include <vector>

#include "base/Exported.h"

namespace MORVEND_EXPORTED plist {

class Value;

// The types that a number can have. Nothing is converted into one of them silently: a pointer is
// not a boolean.
template <typename T>
concept NumberType = std::same_as<T, std::int32_t> || std::same_as<T, std::int64_t> ||
    std::same_as<T, std::uint64_t> || std::same_as<T, float> || std::same_as<T, double> ||
    std::same_as<T, bool>;

// A number that remembers the type it was stored with.
class Number {
 public:
  enum class Type : std::uint8_t { int32, int64, uint64, float32, float64, boolean };

  template <NumberType T>
  explicit Number(T value) : type_(typeOf<T>()) {
    if constexpr (std::floating_point<T>) {
      real_ = static_cast<double>(value);
    } else {
      integer_ = static_cast<std::int64_t>(value);
    }
  }

  Type type() const { return type_; }
  bool isReal() const { return type_ == Type::float32 || type_ == Type::float64; }

  // The value in another type. Reals saturate and not-a-number is 0; between the two 64-bit integer
  // types the bits stay as they are; a boolean is 0 or 1.
  std::int64_t int64Value() const;
  std::uint64_t uint64Value() const;
  double doubleValue() const;
  bool boolValue() const { return isReal() ? real_ != 0.0 : integer_ != 0; }

  // Integral values without a decimal point, others as "%.16g"; booleans as 1 and 0.
  std::string text() const;

  // Equal when they stand for the same number, whatever their types.
  bool operator==(const Number& other) const;

 private:
  template <NumberType T>
  static constexpr Type typeOf() {
    if (std::same_as<T, std::int32_t>) return Type::int32;
    if (std::same_as<T, std::int64_t>) return Type::int64;
    if (std::same_as<T, std::uint64_t>) return Type::uint64;
    if (std::same_as<T, float>) return Type::float32;
    return std::same_as<T, double> ? Type::float64 : Type::boolean;
  }

  Type type_;
  union {
    std::int64_t integer_;  // the bits of the value, for uint64 too
    double real_;
  };
};

// A moment. The XML form holds whole seconds, rounded down; the binary one all of it.
struct Date {
  double secondsSince1970;
  bool operator==(const Date&) const = default;
};

using Array = std::vector<Value>;
using Data = std::vector<std::uint8_t>;

// A dictionary that keeps the order in which its keys were first set. Lookup takes constant time
// (with the logarithm of the size while all keys came in ascending order), removal time in
// proportion to the size.
class Dictionary {
 public:
  struct Entry;

  Dictionary();
  Dictionary(std::initializer_list<Entry> entries);
  Dictionary(const Dictionary& other);
  Dictionary(Dictionary&& other) noexcept;
  Dictionary& operator=(const Dictionary& other);
  Dictionary& operator=(Dictionary&& other) noexcept;
  ~Dictionary();

  // Sets a key; one that is there keeps its place. The reference holds until the next change.
  Value& set(std::string_view key, Value value);
  Value& set(const char* key, Value value);
  Value& set(std::string&& key, Value value);

  // Removes a key; true if it was there.
  bool remove(std::string_view key);

  // Keeps the entries for which `keep(key, value)` is true, in their order; it may change the
  // value. Takes time in proportion to the size.
  template <typename Keep>
  void keepIf(Keep keep);

  // The value of a key, or null. Borrowed until the next change.
  const Value* find(std::string_view key) const;
  Value* find(std::string_view key);

  // The value of a key if it has the type asked for, else null or none.
  const std::string* text(std::string_view key) const;
  const Number* number(std::string_view key) const;
  const Array* array(std::string_view key) const;
  const Dictionary* dictionary(std::string_view key) const;
  const Data* data(std::string_view key) const;
  const Date* date(std::string_view key) const;

  std::size_t size() const;
  bool empty() const { return size() == 0; }
  const Entry* begin() const;
  const Entry* end() const;

  // Equal when they hold equal values under the same keys, in any order.
  bool operator==(const Dictionary& other) const;

 private:
  struct Index;

  std::uint32_t hashFor(std::string_view key) const;
  std::size_t place(std::string_view key, std::uint32_t hash) const;
  template <typename Key>
  Value& setKey(Key&& key, Value&& value);
  void buildIndex();

  std::vector<Entry> entries_;
  std::unique_ptr<Index> index_;  // null while the dictionary is small
};

// One value of any of the six kinds, made of it without a cast; a null pointer is none of them.
// Copies are deep, moves are cheap and leave an empty value behind.
class Value {
 public:
  using Variant = std::variant<Number, std::string, Array, Dictionary, Date, Data>;

  Value(Number value) : variant_(value) {}
  template <NumberType T>
  Value(T value) : variant_(Number(value)) {}
  Value(std::string value) : variant_(std::move(value)) {}
  Value(std::string_view value) : variant_(std::string(value)) {}
  Value(const char* value) : variant_(std::string(value)) {}
  Value(std::nullptr_t) = delete;
  Value(Array value) : variant_(std::move(value)) {}
  Value(Dictionary value) : variant_(std::move(value)) {}
  Value(Date value) : variant_(value) {}
  Value(Data value) : variant_(std::move(value)) {}

  // The content if it has the type asked for, else null.
  template <typename T>
  const T* as() const {
    return std::get_if<T>(&variant_);
  }
  template <typename T>
  T* as() {
    return std::get_if<T>(&variant_);
  }

  const Variant& variant() const { return variant_; }

  bool operator==(const Value& other) const { return variant_ == other.variant_; }

 private:
  Variant variant_;
};

// A key with its value. The order of a dictionary's entries is theirs; a key is never changed
// where it stands.
struct Dictionary::Entry {
  // Of anything that a text and a value can be made of.
  template <typename Key, typename Content>
  Entry(Key&& k, Content&& v) : key(std::forward<Key>(k)), value(std::forward<Content>(v)) {}

  std::string key;
  Value value;
};

// The deepest nesting of arrays and dictionaries that is read or written; the top level counts
// as 1.
inline constexpr int kMaxDepth = 128;

// A value's text in a message: a text as it is, a number as its text, anything else as an indented
// listing in which texts that aren't plain words are quoted.
std::string description(const Value& value);

// The same for a value that may be missing: "(null)".
std::string description(const Value* value);
template <typename T>
std::string description(const std::optional<T>& value) {
  return value ? description(Value(*value)) : description(static_cast<const Value*>(nullptr));
}

template <typename Keep>
void Dictionary::keepIf(Keep keep) {
  auto end = entries_.begin();
  for (Entry& entry : entries_) {
    if (!keep(std::string_view(entry.key), entry.value)) continue;
    if (&entry != &*end) *end = std::move(entry);
    ++end;
  }
  if (end == entries_.end()) return;
  entries_.erase(end, entries_.end());
  if (index_) buildIndex();
}

inline std::size_t Dictionary::size() const { return entries_.size(); }
inline const Dictionary::Entry* Dictionary::begin() const { return entries_.data(); }
inline const Dictionary::Entry* Dictionary::end() const {
  return entries_.data() + entries_.size();
}

}  // namespace plist
