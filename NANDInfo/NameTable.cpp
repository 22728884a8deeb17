#include "NANDInfo/NameTable.h"

#include "NANDInfo/NameRows.h"

namespace NANDInfo {

namespace {

template <typename Visit>
void visitNames(std::string_view family, Visit visit) {
  const std::string stem(familyStem(family));
  if (stem.size() == family.size()) return visit(stem);
  visitRanges(family, [&](std::uint32_t first, std::uint32_t last) {
    for (std::uint32_t number = first; number <= last; ++number) {
      visit(stem + std::to_string(number));
    }
  });
}

}  // namespace

std::vector<std::string> expandFamily(std::string_view family) {
  std::vector<std::string> names;
  names.reserve(familySize(family));
  visitNames(family, [&names](std::string name) { names.push_back(std::move(name)); });
  return names;
}

NameTable::NameTable(std::span<const NameRow> rows) : index_(countNames(rows)) {
  entries_.reserve(countNames(rows));
  for (const NameRow& row : rows) {
    visitNames(row.family, [&](std::string name) {
      if (contains(name)) return;
      index_.insert(platform::keyHash(name), static_cast<std::uint32_t>(entries_.size()));
      entries_.push_back({std::move(name), row.number});
    });
  }
}

const NameTable::Entry* NameTable::find(std::string_view name) const {
  const std::uint32_t place = index_.find(
      platform::keyHash(name), [&](std::uint32_t at) { return entries_[at].name == name; });
  return place == platform::KeyIndex::kNone ? nullptr : &entries_[place];
}

}  // namespace NANDInfo
