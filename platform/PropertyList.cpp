#include "platform/PropertyList.h"

#include <array>
#include <cmath>
#include <cstring>
#include <random>

#include "platform/CivilDate.h"
#include "platform/Convert.h"
#include "platform/Text.h"

namespace platform {

// Number

std::int64_t Number::int64Value() const {
  return isReal() ? saturatingCast<std::int64_t>(real_) : integer_;
}

std::uint64_t Number::uint64Value() const {
  return isReal() ? saturatingCast<std::uint64_t>(real_) : static_cast<std::uint64_t>(integer_);
}

double Number::doubleValue() const {
  if (isReal()) return real_;
  return type_ == Type::uint64 ? static_cast<double>(static_cast<std::uint64_t>(integer_))
                               : static_cast<double>(integer_);
}

std::string Number::text() const {
  if (isReal()) return doubleText(real_);
  std::string digits;
  if (type_ == Type::uint64) {
    appendInteger(digits, static_cast<std::uint64_t>(integer_));
  } else {
    appendInteger(digits, integer_);
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

std::uint64_t load(const char* bytes, std::size_t count) {
  std::uint64_t word = 0;
  std::memcpy(&word, bytes, count);
  return word;
}

std::uint64_t mix(std::uint64_t a, std::uint64_t b) {
  __extension__ using Wide = unsigned __int128;
  const Wide product = static_cast<Wide>(a) * b;
  return static_cast<std::uint64_t>(product) ^ static_cast<std::uint64_t>(product >> 64);
}

// Seeded for each process: keys come from files and messages, and nobody outside shall be able to
// choose keys that collide.
std::uint32_t hashOf(std::string_view key) {
  static const std::uint64_t seed = [] {
    std::random_device device;
    return (static_cast<std::uint64_t>(device()) << 32) | device();
  }();
  constexpr std::uint64_t kFactor = 0x9e3779b97f4a7c15u;
  std::uint64_t hash = seed ^ key.size();
  const char* bytes = key.data();
  std::size_t left = key.size();
  for (; left >= 8; left -= 8, bytes += 8) hash = mix(hash ^ load(bytes, 8), kFactor);
  if (left > 0) hash = mix(hash ^ load(bytes, left), kFactor);
  return static_cast<std::uint32_t>(mix(hash, seed | 1));
}

}  // namespace

Dictionary::Dictionary() = default;
Dictionary::Dictionary(const Dictionary& other) = default;
Dictionary::Dictionary(Dictionary&& other) noexcept = default;
Dictionary& Dictionary::operator=(const Dictionary& other) = default;
Dictionary& Dictionary::operator=(Dictionary&& other) noexcept = default;
Dictionary::~Dictionary() = default;

Dictionary::Dictionary(std::initializer_list<Entry> entries) {
  for (const Entry& entry : entries) set(entry.key, entry.value);
}

// The key's place in entries_, or the size if it isn't there. The hash is read only with an index.
std::size_t Dictionary::place(std::string_view key, std::uint32_t hash) const {
  if (index_.empty()) {
    std::size_t i = 0;
    while (i < entries_.size() && entries_[i].key != key) ++i;
    return i;
  }
  const std::size_t mask = index_.size() - 1;
  for (std::size_t slot = hash & mask; index_[slot].entry != 0; slot = (slot + 1) & mask) {
    const std::size_t entry = index_[slot].entry - 1;
    if (index_[slot].hash == hash && entries_[entry].key == key) return entry;
  }
  return entries_.size();
}

void Dictionary::insertIntoIndex(std::uint32_t hash, std::uint32_t entry) {
  const std::size_t mask = index_.size() - 1;
  std::size_t slot = hash & mask;
  while (index_[slot].entry != 0) slot = (slot + 1) & mask;
  index_[slot] = {hash, entry + 1};
}

void Dictionary::buildIndex(std::size_t slots) {
  index_.assign(slots, Slot{0, 0});
  for (std::size_t i = 0; i < entries_.size(); ++i) {
    insertIntoIndex(hashOf(entries_[i].key), static_cast<std::uint32_t>(i));
  }
}

template <typename Key>
Value& Dictionary::setKey(Key&& key, Value&& value) {
  std::uint32_t hash = index_.empty() ? 0 : hashOf(key);
  const std::size_t found = place(key, hash);
  if (found < entries_.size()) return entries_[found].value = std::move(value);
  if (entries_.empty()) entries_.reserve(kUnindexed / 2);
  entries_.emplace_back(std::string(std::forward<Key>(key)), std::move(value));
  if (index_.empty()) {
    if (entries_.size() > kUnindexed) buildIndex(4 * kUnindexed);
  } else if (entries_.size() * 2 > index_.size()) {
    std::vector<Slot> old(index_.size() * 2, Slot{0, 0});
    old.swap(index_);
    for (const Slot& slot : old) {
      if (slot.entry != 0) insertIntoIndex(slot.hash, slot.entry - 1);
    }
    insertIntoIndex(hash, static_cast<std::uint32_t>(entries_.size() - 1));
  } else {
    insertIntoIndex(hash, static_cast<std::uint32_t>(entries_.size() - 1));
  }
  return entries_.back().value;
}

Value& Dictionary::set(std::string_view key, Value value) { return setKey(key, std::move(value)); }
Value& Dictionary::set(std::string&& key, Value value) {
  return setKey(std::move(key), std::move(value));
}

bool Dictionary::remove(std::string_view key) {
  const std::size_t found = place(key, index_.empty() ? 0 : hashOf(key));
  if (found == entries_.size()) return false;
  entries_.erase(entries_.begin() + static_cast<std::ptrdiff_t>(found));
  if (!index_.empty()) buildIndex(index_.size());
  return true;
}

const Value* Dictionary::find(std::string_view key) const {
  const std::size_t found = place(key, index_.empty() ? 0 : hashOf(key));
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
      out += format("\\x%02x", byte);
    } else {
      out += c;
    }
  }
  out += '"';
}

void appendDate(std::string& out, const Date& date) {
  const CivilTime t = civilFromSeconds(date.secondsSince1970);
  out += format("%04lld-%02d-%02d %02d:%02d:%02d +0000", static_cast<long long>(t.date.year),
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
    out += format("{length = %zu}", data->size());
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

}  // namespace platform
