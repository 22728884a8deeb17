// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What every decoder of a counter buffer fills: an ordered list of named unsigned 64-bit values.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory_resource>
#include <span>
#include <string>
#include <string_view>

#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

class NameTable;

// The longest name that is kept; what is longer is cut to it.
inline constexpr std::size_t kMaxFieldName = 98;

// Fields in the order in which they were added; names may occur more than once. An allocation that
// fails leaves the context as it was.
class GenericParserCxt {
 public:
  struct Field {
    std::string_view name;  // borrowed until the context changes
    std::uint64_t value;
  };

  GenericParserCxt() = default;
  explicit GenericParserCxt(std::pmr::memory_resource* memory) : records_(memory), names_(memory) {}

  std::size_t size() const { return records_.size(); }
  bool empty() const { return size() == 0; }
  Field operator[](std::size_t place) const;

  // What the functions below do to a context that is there.
  bool add(std::string_view prefix, std::string_view suffix, std::uint64_t value);
  void release();

 private:
  struct Record {
    std::uint64_t value;
    std::size_t nameEnd;  // in the names; it begins where the name before it ends
  };

  std::pmr::vector<Record> records_;
  std::pmr::string names_;  // of all records, one after the other
};

// What became of a buffer that was decoded into a context.
struct Decoded {
  std::uint32_t values =
      0;                  // that count as added, dropped ones among them; 0: it is no such buffer
  std::string complaint;  // the first thing that was wrong with it; empty: nothing was
};

// Appends one field named prefix followed by suffix. False when the context is null or memory is
// refused.
bool AddSingleValueToGenericContext(GenericParserCxt* context, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value);

// Appends `count` fields of `elementSize` bytes each (1 to 8, little-endian) from the source: one
// alone under the name itself, several under the name followed by the index. Nothing to add is a
// success; elements beyond the 65,535th, or beyond the source, are dropped. False when an element
// is wider than 8 bytes or memory was refused for one; the others are added all the same.
bool AddMultipleFieldsToGenericContext(GenericParserCxt* context, std::string_view name,
                                       std::span<const std::byte> source, std::uint32_t elementSize,
                                       std::uint32_t count);

// Frees all fields; null is accepted.
void ReleaseGenericParserCxt(GenericParserCxt* context);

// The fields as a dictionary of unsigned 64-bit numbers, the later of two equal names winning; with
// a table, only the names that it holds.
plist::Dictionary CreateDictFromCxt(const GenericParserCxt& context,
                                    const NameTable* allowedKeys = nullptr);

}  // namespace NANDInfo
