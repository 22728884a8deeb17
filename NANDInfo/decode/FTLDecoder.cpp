// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/FTLDecoder.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <string_view>
#include <system_error>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/decode/Complaint.h"
#include "NANDInfo/decode/FTLRecord.h"

namespace NANDInfo {

namespace {

constexpr std::uint32_t kEndKey = 0xFFFF;

struct Record {
  std::uint32_t key, count;
  std::span<const std::byte> values;
};

// The next record that holds values; none at the end of the data. A header without values is passed
// over whatever its key, the end key included.
std::optional<Record> nextRecord(base::ByteReader& words) {
  while (const auto header = readFTLHeader(words)) {
    const auto [key, count] = *header;
    if (count == 0) continue;
    if (key == kEndKey || key > kMaxFTLKey) return std::nullopt;
    const auto values = takeFTLValues(words, *header);
    if (!values) return std::nullopt;
    return Record{key, count, *values};
  }
  return std::nullopt;
}

// A field's name, put together without an allocation and cut to what a context keeps.
class Name {
 public:
  Name& append(std::string_view text) {
    end_ = std::copy_n(text.data(), std::min(text.size(), room()), end_);
    return *this;
  }
  Name& append(std::uint32_t number) {
    const auto [end, error] = std::to_chars(end_, end_ + room(), number);
    if (error == std::errc()) end_ = end;
    return *this;
  }
  operator std::string_view() const { return {text_.data(), end_}; }

 private:
  std::size_t room() const { return static_cast<std::size_t>(text_.data() + text_.size() - end_); }

  std::array<char, kMaxFieldName> text_;
  char* end_ = text_.data();
};

// Appends a record's fields. The number of values that count as added; none ends the decoding.
using Added = std::optional<std::uint32_t>;
using Add = Added(GenericParserCxt* context, const Record& record, Complaint& complaint);

Added addUnderKey(GenericParserCxt* context, const Record& record, Complaint& complaint) {
  Name name;
  name.append("Stat_").append(record.key).append(record.count > 1 ? "_" : "");
  if (!AddMultipleFieldsToGenericContext(context, name, record.values, kFTLValueSize,
                                         record.count)) {
    complaint.say("ZMCFTLParseBufferToCxt %u: Cannot add %u elements to context", record.key,
                  record.count);
    return std::nullopt;
  }
  return record.count;
}

Added addSingle(GenericParserCxt* context, const Record& record, const FTLKey& row,
                Complaint& complaint) {
  if (!AddMultipleFieldsToGenericContext(context, row.name, record.values, kFTLValueSize, 1)) {
    complaint.say("ZMCFTLParseBufferToCxt: %s(%u) cannot add 1 element to context", row.name,
                  record.key);
  }
  return 1;
}

Added addArray(GenericParserCxt* context, const Record& record, const FTLKey& row,
               Complaint& complaint) {
  const std::uint32_t configured = row.elements;
  if (record.count != configured) {
    complaint.say("ZMCFTLParseBufferToCxt: %s(%u): (#%u) cfg elements != (%u) buffer elements",
                  row.name, record.key, configured, record.count);
  }
  const std::uint32_t count = std::min(record.count, configured);
  Name name;
  name.append(row.name).append("_");
  if (!AddMultipleFieldsToGenericContext(context, name, record.values, kFTLValueSize, count)) {
    complaint.say("ZMCFTLParseBufferToCxt: %s(%u): Cannot add %u elements to context", row.name,
                  record.key, configured);
    return std::nullopt;
  }
  return count;
}

Added addUnderName(GenericParserCxt* context, const Record& record, Complaint& complaint) {
  const FTLKey* row = findFTLKey(record.key);
  if (row == nullptr) return addUnderKey(context, record, complaint);
  return row->elements == 1 ? addSingle(context, record, *row, complaint)
                            : addArray(context, record, *row, complaint);
}

Decoded decode(std::span<const std::byte> buffer, GenericParserCxt* context, Add* add) {
  base::ByteReader words(buffer);
  std::uint32_t total = 0;
  Complaint complaint;
  while (const auto record = nextRecord(words)) {
    const Added added = add(context, *record, complaint);
    if (!added) break;
    total += *added;
  }
  return {total, complaint.text()};
}

}  // namespace

Decoded decodeFTL(std::span<const std::byte> buffer, GenericParserCxt* context) {
  return decode(buffer, context, addUnderName);
}

Decoded decodeFTLByKey(std::span<const std::byte> buffer, GenericParserCxt* context) {
  return decode(buffer, context, addUnderKey);
}

}  // namespace NANDInfo
