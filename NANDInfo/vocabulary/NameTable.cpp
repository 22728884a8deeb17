// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/NameTable.h"

#include <charconv>
#include <limits>

#include "NANDInfo/vocabulary/NameFamily.h"

namespace NANDInfo {

namespace {

constexpr std::size_t kMaxDigits = std::numeric_limits<std::uint32_t>::digits10 + 1;

// Calls visit(name) for each name of a row. Each is written where the one before ended if
// visit(name) says that this one is kept, else in its place; there must be room for all of them.
template <typename Visit>
char* writeNames(const NameRow& row, char* out, Visit visit) {
  const std::string_view stem = familyStem(row.family);
  const auto write = [&](const FamilyItem& item, auto appendNumber) {
    char* end = out + stem.copy(out, stem.size());
    if (row.joint != '\0') *end++ = row.joint;
    end = appendNumber(end + item.text.copy(end, item.text.size()));
    if (visit(std::string_view(out, static_cast<std::size_t>(end - out)))) out = end;
  };
  visitItems(row, [&](const FamilyItem& item) {
    if (item.count == 0) write(item, [](char* end) { return end; });
    for (std::uint32_t i = 0; i < item.count; ++i) {
      write(item, [number = item.first + i](char* end) {
        return std::to_chars(end, end + kMaxDigits, number).ptr;
      });
    }
  });
  return out;
}

// How many names rows stand for, and how many bytes they take at most.
struct Extent {
  std::size_t names = 0, bytes = 0;
};

Extent extentOf(std::span<const NameRow> rows) {
  Extent extent;
  for (const NameRow& row : rows) {
    const std::size_t stem = familyStem(row.family).size();
    visitItems(row, [&](const FamilyItem& item) {
      const std::size_t names = std::max(item.count, 1u);
      extent.names += names;
      extent.bytes += names * (stem + 1 + item.text.size() + kMaxDigits);
    });
  }
  return extent;
}

}  // namespace

std::vector<std::string> expandNames(const NameRow& row) {
  std::vector<std::string> names;
  std::string text(extentOf({&row, 1}).bytes, 0);
  writeNames(row, text.data(), [&names](std::string_view name) {
    names.emplace_back(name);
    return false;
  });
  return names;
}

NameTable::NameTable(std::span<const NameRow> rows) {
  const Extent extent = extentOf(rows);
  index_ = base::KeyIndex(extent.names);
  entries_.reserve(extent.names);
  text_ = std::make_unique_for_overwrite<char[]>(extent.bytes);
  char* end = text_.get();
  for (const NameRow& row : rows) {
    end = writeNames(row, end, [&](std::string_view name) {
      const auto found =
          index_.findOrInsert(base::keyHash(name), static_cast<std::uint32_t>(entries_.size()),
                              [&](std::uint32_t at) { return entries_[at].name == name; });
      if (found != base::KeyIndex::kNone) return false;
      entries_.push_back({name, row.number});
      return true;
    });
  }
}

const NameTable::Entry* NameTable::find(std::string_view name) const {
  const std::uint32_t found =
      index_.find(base::keyHash(name), [&](std::uint32_t at) { return entries_[at].name == name; });
  return found == base::KeyIndex::kNone ? nullptr : &entries_[found];
}

}  // namespace NANDInfo
