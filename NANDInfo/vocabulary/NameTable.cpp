#include "NANDInfo/NameTable.h"

#include <charconv>
#include <limits>

#include "NANDInfo/vocabulary/NameRows.h"

namespace NANDInfo {

namespace {

constexpr std::size_t kMostDigits = std::numeric_limits<std::uint32_t>::digits10 + 1;

// Calls visit(name) for each name of a family. Each is written where the one before ended if
// visit(name) says that this one is kept, else in its place; there must be room for all of them.
template <typename Visit>
char* writeNames(std::string_view family, char* out, Visit visit) {
  const std::string_view stem = familyStem(family);
  const auto write = [&](auto appendNumber) {
    char* const end = appendNumber(out + stem.copy(out, stem.size()));
    if (visit(std::string_view(out, static_cast<std::size_t>(end - out)))) out = end;
  };
  if (stem.size() == family.size()) write([](char* end) { return end; });
  visitRanges(family, [&](std::uint32_t first, std::uint32_t last) {
    for (std::uint32_t number = first; number <= last; ++number) {
      write([number](char* end) { return std::to_chars(end, end + kMostDigits, number).ptr; });
    }
  });
  return out;
}

std::size_t mostBytes(std::string_view family) {
  return familySize(family) * (familyStem(family).size() + kMostDigits);
}

}  // namespace

std::vector<std::string> expandFamily(std::string_view family) {
  std::vector<std::string> names;
  std::string text(familyStem(family).size() + kMostDigits, 0);
  writeNames(family, text.data(), [&names](std::string_view name) {
    names.emplace_back(name);
    return false;
  });
  return names;
}

NameTable::NameTable(std::span<const NameRow> rows) : index_(countNames(rows)) {
  std::size_t bytes = 0;
  for (const NameRow& row : rows) bytes += mostBytes(row.family);
  text_ = std::make_unique_for_overwrite<char[]>(bytes);
  entries_.reserve(countNames(rows));
  char* end = text_.get();
  for (const NameRow& row : rows) {
    end = writeNames(row.family, end, [&](std::string_view name) {
      const std::uint32_t hash = base::keyHash(name);
      if (place(name, hash) != base::KeyIndex::kNone) return false;
      index_.insert(hash, static_cast<std::uint32_t>(entries_.size()));
      entries_.push_back({name, row.number});
      return true;
    });
  }
}

std::uint32_t NameTable::place(std::string_view name, std::uint32_t hash) const {
  return index_.find(hash, [&](std::uint32_t at) { return entries_[at].name == name; });
}

const NameTable::Entry* NameTable::find(std::string_view name) const {
  const std::uint32_t found = place(name, base::keyHash(name));
  return found == base::KeyIndex::kNone ? nullptr : &entries_[found];
}

}  // namespace NANDInfo
