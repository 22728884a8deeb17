// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/Value.h"

#include <algorithm>
#include <cstring>
#include <initializer_list>

#include "base/CivilDate.h"
#include "base/Convert.h"
#include "base/KeyIndex.h"
#include "base/Text.h"
#include "plist/Allowance.h"

namespace plist {

// Number

std::int64_t Number::int64Value() const {
  return isReal() ? base::saturatingCast<std::int64_t>(real_) : integer_;
}

std::uint64_t Number::uint64Value() const {
  return isReal() ? base::saturatingCast<std::uint64_t>(real_)
                  : static_cast<std::uint64_t>(integer_);
}

double Number::doubleValue() const {
  if (isReal()) return real_;
  return type_ == Type::uint64 ? static_cast<double>(static_cast<std::uint64_t>(integer_))
                               : static_cast<double>(integer_);
}

std::string Number::text() const {
  if (isReal()) return base::doubleText(real_);
  std::string digits;
  if (type_ == Type::uint64) {
    base::appendInteger(digits, static_cast<std::uint64_t>(integer_));
  } else {
    base::appendInteger(digits, integer_);
  }
  return digits;
}

bool Number::operator==(const Number& other) const {
  if (isReal() && other.isReal()) return real_ == other.real_;
  if (other.isReal()) return other == *this;
  if (isReal()) {
    // Not by the double of the integer, which may be rounded.
    if (real_ != other.doubleValue() || real_ >= 0x1p64) return false;
    return real_ < 0 ? Number(int64Value()) == other : Number(uint64Value()) == other;
  }
  const bool bothSigned = type_ != Type::uint64 && other.type_ != Type::uint64;
  return integer_ == other.integer_ && (bothSigned || type_ == other.type_ || integer_ >= 0);
}

// Dictionary

namespace {

// Up to this size a walk over the keys is as fast as a hash.
constexpr std::size_t kUnindexed = 8;

bool keyIsBelow(const Dictionary::Entry& entry, std::string_view key) { return entry.key < key; }

}  // namespace

// Keys often come in ascending order, and often in the order in which they came before.
struct Dictionary::Index {
  bool ascending;            // all keys so far: they are found by bisection, and `keys` is empty
  base::KeyIndex keys;       // otherwise
  std::size_t expected = 0;  // the place after the last one set; 0 after a new one
};

Dictionary::Dictionary() = default;
Dictionary::Dictionary(const Dictionary& other)
    : entries_(other.entries_),
      index_(other.index_ ? std::make_unique<Index>(*other.index_) : nullptr) {}
Dictionary::Dictionary(Dictionary&& other) noexcept = default;
Dictionary& Dictionary::operator=(const Dictionary& other) { return *this = Dictionary(other); }
Dictionary& Dictionary::operator=(Dictionary&& other) noexcept = default;
Dictionary::~Dictionary() = default;

Dictionary::Dictionary(std::initializer_list<Entry> entries) {
  for (const Entry& entry : entries) set(entry.key, entry.value);
}

// The key's place in entries_, or the size if it isn't there. The hash is read only with hashed
// keys.
std::size_t Dictionary::place(std::string_view key, std::uint32_t hash) const {
  if (!index_) {
    std::size_t i = 0;
    while (i < entries_.size() && entries_[i].key != key) ++i;
    return i;
  }
  if (index_->ascending) {
    const auto found = std::lower_bound(entries_.begin(), entries_.end(), key, keyIsBelow);
    return found != entries_.end() && found->key == key
               ? static_cast<std::size_t>(found - entries_.begin())
               : entries_.size();
  }
  const std::uint32_t found =
      index_->keys.find(hash, [&](std::uint32_t entry) { return entries_[entry].key == key; });
  return found == base::KeyIndex::kNone ? entries_.size() : found;
}

std::uint32_t Dictionary::hashFor(std::string_view key) const {
  return index_ && !index_->ascending ? base::keyHash(key) : 0;
}

void Dictionary::buildIndex() {
  const bool ascending =
      std::is_sorted(entries_.begin(), entries_.end(),
                     [](const Entry& a, const Entry& b) { return keyIsBelow(a, b.key); });
  index_ = std::make_unique<Index>(
      Index{ascending, base::KeyIndex(ascending ? 0 : 2 * entries_.size())});
  if (ascending) return;
  for (std::size_t i = 0; i < entries_.size(); ++i) {
    index_->keys.insert(base::keyHash(entries_[i].key), static_cast<std::uint32_t>(i));
  }
}

template <typename Key>
Value& Dictionary::setKey(Key&& key, Value&& value) {
  std::uint32_t hash = 0;
  std::size_t found = entries_.size();
  const bool comesAgain = index_ && index_->expected != 0 && index_->expected < entries_.size() &&
                          entries_[index_->expected].key == key;
  const bool last = !comesAgain && index_ && index_->ascending &&
                    (entries_.empty() || keyIsBelow(entries_.back(), key));
  if (comesAgain) {
    found = index_->expected;
  } else if (!last) {
    hash = hashFor(key);
    found = place(key, hash);
  }
  if (index_) index_->expected = found + 1;
  if (found < entries_.size()) return entries_[found].value = std::move(value);
  if (entries_.empty()) entries_.reserve(kUsualDictionarySize);
  entries_.emplace_back(std::forward<Key>(key), std::move(value));
  if (!index_) {
    if (entries_.size() > kUnindexed) buildIndex();
  } else {
    index_->expected = 0;
    if (!index_->ascending) {
      index_->keys.insert(hash, static_cast<std::uint32_t>(found));
    } else if (!last) {
      buildIndex();
    }
  }
  return entries_.back().value;
}

Value& Dictionary::set(std::string_view key, Value value) { return setKey(key, std::move(value)); }
Value& Dictionary::set(const char* key, Value value) {
  return setKey(std::string_view(key), std::move(value));
}
Value& Dictionary::set(std::string&& key, Value value) {
  return setKey(std::move(key), std::move(value));
}

bool Dictionary::remove(std::string_view key) {
  const std::size_t found = place(key, hashFor(key));
  if (found == entries_.size()) return false;
  entries_.erase(entries_.begin() + static_cast<std::ptrdiff_t>(found));
  if (index_) buildIndex();
  return true;
}

const Value* Dictionary::find(std::string_view key) const {
  const std::size_t found = place(key, hashFor(key));
  return found < entries_.size() ? &entries_[found].value : nullptr;
}

Value* Dictionary::find(std::string_view key) {
  return const_cast<Value*>(std::as_const(*this).find(key));
}

namespace {

template <typename T>
const T* typed(const Value* value) {
  return value != nullptr ? value->as<T>() : nullptr;
}

}  // namespace

const std::string* Dictionary::text(std::string_view key) const {
  return typed<std::string>(find(key));
}
const Number* Dictionary::number(std::string_view key) const { return typed<Number>(find(key)); }
const Array* Dictionary::array(std::string_view key) const { return typed<Array>(find(key)); }
const Dictionary* Dictionary::dictionary(std::string_view key) const {
  return typed<Dictionary>(find(key));
}
const Data* Dictionary::data(std::string_view key) const { return typed<Data>(find(key)); }
const Date* Dictionary::date(std::string_view key) const { return typed<Date>(find(key)); }

bool Dictionary::operator==(const Dictionary& other) const {
  if (size() != other.size()) return false;
  for (const Entry& entry : entries_) {
    const Value* value = other.find(entry.key);
    if (value == nullptr || !(*value == entry.value)) return false;
  }
  return true;
}

// Description

namespace {

bool isPlainWord(std::string_view text) {
  for (const char c : text) {
    const bool plain = (c >= '0' && c <= '9') || (c >= 'a' && c <= 'z') || (c >= 'A' && c <= 'Z') ||
                       c == '_' || c == '.' || c == '-' || c == '/';
    if (!plain) return false;
  }
  return !text.empty();
}

void appendQuoted(std::string& out, std::string_view text) {
  if (isPlainWord(text)) {
    out += text;
    return;
  }
  out += '"';
  for (const char c : text) {
    const auto byte = static_cast<unsigned char>(c);
    if (c == '"' || c == '\\') {
      out += '\\';
      out += c;
    } else if (c == '\n') {
      out += "\\n";
    } else if (byte < 0x20 || byte == 0x7f) {
      out += base::format("\\x%02x", byte);
    } else {
      out += c;
    }
  }
  out += '"';
}

void appendDate(std::string& out, const Date& date) {
  const base::CivilTime t = base::civilFromSeconds(date.secondsSince1970);
  out += base::format("%04lld-%02d-%02d %02d:%02d:%02d +0000", static_cast<long long>(t.date.year),
                      t.date.month, t.date.day, t.hour, t.minute, t.second);
}

// One element of a listing, with nested containers indented by four blanks a level.
void appendElement(std::string& out, const Value& value, int depth) {
  const std::string inner(4 * static_cast<std::size_t>(depth + 1), ' ');
  const std::string outer(4 * static_cast<std::size_t>(depth), ' ');
  if (const auto* text = value.as<std::string>()) {
    appendQuoted(out, *text);
  } else if (const auto* number = value.as<Number>()) {
    out += number->text();
  } else if (const auto* array = value.as<Array>()) {
    out += "(\n";
    for (std::size_t i = 0; i < array->size(); ++i) {
      out += inner;
      appendElement(out, (*array)[i], depth + 1);
      out += i + 1 < array->size() ? ",\n" : "\n";
    }
    out += outer + ")";
  } else if (const auto* dictionary = value.as<Dictionary>()) {
    out += "{\n";
    for (const Dictionary::Entry& entry : *dictionary) {
      out += inner;
      appendQuoted(out, entry.key);
      out += " = ";
      appendElement(out, entry.value, depth + 1);
      out += ";\n";
    }
    out += outer + "}";
  } else if (const auto* date = value.as<Date>()) {
    appendDate(out, *date);
  } else if (const auto* data = value.as<Data>()) {
    out += base::format("{length = %zu}", data->size());
  }
}

}  // namespace

std::string description(const Value& value) {
  if (const auto* text = value.as<std::string>()) return *text;
  std::string out;
  appendElement(out, value, 0);
  return out;
}

std::string description(const Value* value) { return value ? description(*value) : "(null)"; }

}  // namespace plist
