// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Tables of names in compact form: a family such as "padSizes_{0..3}" stands for one name per
// number in its braces ("{0..2, 4}" for four of them), any other text for itself.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <span>
#include <string_view>
#include <vector>

#include "base/Exported.h"
#include "base/KeyIndex.h"

namespace MORVEND_EXPORTED NANDInfo {

// The names of a counter: those of its family or, for an array, the family followed by the joint,
// if there is one, and by the index of each element, or of those elements that the items have.
struct NameRow {
  const char* family;
  std::uint8_t number = 0;  // whatever the table says of its names; 0 where it says nothing
  char joint = '\0';
  std::uint16_t elements = 1;
  const char* items = nullptr;  // such as "{0..2, 4}"
};

// The names that a table's rows stand for, in the order of the rows, found in constant time. Of
// rows with the same name the first holds.
class NameTable {
 public:
  struct Entry {
    std::string_view name;  // borrowed from the table
    std::uint8_t number;
  };

  explicit NameTable(std::span<const NameRow> rows);

  // The entry of a name, or null.
  const Entry* find(std::string_view name) const;
  bool contains(std::string_view name) const { return find(name) != nullptr; }

  std::size_t size() const { return entries_.size(); }
  const Entry* begin() const { return entries_.data(); }
  const Entry* end() const { return entries_.data() + entries_.size(); }

 private:
  std::unique_ptr<char[]> text_;  // the names, one after the other
  std::vector<Entry> entries_;
  base::KeyIndex index_;
};

}  // namespace NANDInfo
