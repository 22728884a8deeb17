// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The parsers of the controller's counter buffers, beside what a list of separately allocated
// records costs before it holds anything.
#include <array>
#include <charconv>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <vector>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/Parsers.h"
#include "base/ByteWriter.h"
#include "bench/Rows.h"

namespace bench {

namespace {

using Bytes = std::vector<std::byte>;

void put(Bytes& bytes, std::uint64_t number, unsigned width) {
  base::appendLittleEndian(bytes, number, width);
}

// Counters of all magnitudes.
class Counters {
 public:
  std::uint64_t next() {
    state_ = state_ * 6364136223846793005u + 1;
    return state_ >> (state_ >> 58);
  }

 private:
  std::uint64_t state_ = 1;
};

Bytes everyFTLKey(Counters counters) {
  Bytes buffer;
  for (const auto& row : NANDInfo::FTLKeyTable()) {
    put(buffer, row.key, 4);
    put(buffer, row.elements, 4);
    for (unsigned i = 0; i < row.elements; ++i) put(buffer, counters.next(), 8);
  }
  return buffer;
}

Bytes everyMSPTag(Counters counters) {
  Bytes buffer;
  for (const auto& row : NANDInfo::MSPTagTable()) {
    put(buffer, row.tag, 2);
    put(buffer, std::uint64_t{row.elements} * row.width, 2);
    for (unsigned i = 0; i < row.elements; ++i) put(buffer, counters.next(), row.width);
  }
  return buffer;
}

// A name and a value record for each field, zeroed, and the value as a text.
void allocateRecords(std::size_t fields, Counters counters) {
  struct NameRecord {
    std::array<char, 100> text;
    NameRecord* next;
  };
  struct ValueRecord {
    std::array<char, 100> text;
    std::uint64_t number;
    ValueRecord* next;
  };
  std::vector<void*> records;
  records.reserve(2 * fields);
  for (std::size_t i = 0; i < fields; ++i) {
    auto* value = static_cast<ValueRecord*>(std::calloc(1, sizeof(ValueRecord)));
    records.push_back(value);
    records.push_back(std::calloc(1, sizeof(NameRecord)));
    if (value == nullptr) std::abort();
    std::to_chars(value->text.data(), value->text.data() + value->text.size(), counters.next());
    keep(records.back());
  }
  for (void* record : records) std::free(record);
}

template <typename Parse>
void compareParser(Table& table, const char* what, Parse parse, const Bytes& buffer) {
  NANDInfo::GenericParserCxt whole;
  const std::size_t fields = parse(&whole, buffer);
  if (fields != whole.size()) {
    std::fprintf(stderr, "%s: not all of the buffer was read\n", what);
    std::abort();
  }
  const auto ours = [&] {
    NANDInfo::GenericParserCxt context;
    keep(parse(&context, buffer));
  };
  table.compare(
      what, "two zeroed allocations and a number's text", 1.3, static_cast<double>(fields), ours,
      [&] { allocateRecords(fields, Counters{}); }, 201);
}

}  // namespace

void addStorageParserRows(Table& table) {
  const Counters counters;
  const Bytes ftl = everyFTLKey(counters);
  compareParser(table, "FTL statistics: a value, by name", NANDInfo::ZMCFTLParseBufferToCxt, ftl);
  compareParser(table, "FTL statistics: a value, by key", NANDInfo::ZMCFTLParseStatKeyBufferToCxt,
                ftl);
  compareParser(table, "MSP statistics: a value", NANDInfo::ZMCMSPParseBufferToCxt,
                everyMSPTag(counters));
}

}  // namespace bench
