#include <algorithm>
#include <array>
#include <charconv>
#include <string_view>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/KeyTables.h"
#include "NANDInfo/Parsers.h"
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
    if (key == kEndKey || key > kLargestFTLKey) return std::nullopt;
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

  std::array<char, kLongestFieldName> text_;
  char* end_ = text_.data();
};

// The number of values that count as added; none ends the parse.
using Added = std::optional<std::uint32_t>;

Added addUnderKey(GenericParserCxt* context, const Record& record) {
  Name name;
  name.append("Stat_").append(record.key).append(record.count > 1 ? "_" : "");
  if (!AddMultipleFieldsToGenericContext(context, name, record.values, kFTLValueSize,
                                         record.count)) {
    SetAPIErrorMessage("ZMCFTLParseBufferToCxt %u: Cannot add %u elements to context", record.key,
                       record.count);
    return std::nullopt;
  }
  return record.count;
}

Added addSingle(GenericParserCxt* context, const Record& record, const FTLKey& row) {
  if (!AddMultipleFieldsToGenericContext(context, row.name, record.values, kFTLValueSize, 1)) {
    SetAPIErrorMessage("ZMCFTLParseBufferToCxt: %s(%u) cannot add 1 element to context", row.name,
                       record.key);
  }
  return 1;
}

Added addArray(GenericParserCxt* context, const Record& record, const FTLKey& row) {
  const std::uint32_t configured = row.elements;
  if (record.count != configured) {
    SetAPIErrorMessage("ZMCFTLParseBufferToCxt: %s(%u): (#%u) cfg elements != (%u) buffer elements",
                       row.name, record.key, configured, record.count);
  }
  const std::uint32_t count = std::min(record.count, configured);
  Name name;
  name.append(row.name).append("_");
  if (!AddMultipleFieldsToGenericContext(context, name, record.values, kFTLValueSize, count)) {
    SetAPIErrorMessage("ZMCFTLParseBufferToCxt: %s(%u): Cannot add %u elements to context",
                       row.name, record.key, configured);
    return std::nullopt;
  }
  return count;
}

Added addUnderName(GenericParserCxt* context, const Record& record) {
  const FTLKey* row = findFTLKey(record.key);
  if (row == nullptr) return addUnderKey(context, record);
  return row->elements == 1 ? addSingle(context, record, *row) : addArray(context, record, *row);
}

std::uint32_t parse(GenericParserCxt* context, std::span<const std::byte> buffer,
                    Added (*add)(GenericParserCxt* context, const Record& record)) {
  base::ByteReader words(buffer);
  std::uint32_t total = 0;
  while (const auto record = nextRecord(words)) {
    const Added added = add(context, *record);
    if (!added) break;
    total += *added;
  }
  return total;
}

}  // namespace

std::uint32_t ZMCFTLParseBufferToCxt(GenericParserCxt* context, std::span<const std::byte> buffer) {
  return parse(context, buffer, addUnderName);
}

std::uint32_t ZMCFTLParseStatKeyBufferToCxt(GenericParserCxt* context,
                                            std::span<const std::byte> buffer) {
  return parse(context, buffer, addUnderKey);
}

}  // namespace NANDInfo
