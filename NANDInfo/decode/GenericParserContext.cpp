// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/GenericParserContext.h"

#include <algorithm>
#include <array>
#include <charconv>
#include <new>

#include "NANDInfo/NameTable.h"
#include "base/ByteReader.h"

namespace NANDInfo {

namespace {

// The index of an element has 16 bits.
constexpr std::uint32_t kMaxElements = 65535;

}  // namespace

GenericParserCxt::Field GenericParserCxt::operator[](std::size_t place) const {
  const std::size_t nameStart = place == 0 ? 0 : records_[place - 1].nameEnd;
  const auto& [value, nameEnd] = records_[place];
  return {std::string_view(names_).substr(nameStart, nameEnd - nameStart), value};
}

bool GenericParserCxt::add(std::string_view prefix, std::string_view suffix, std::uint64_t value) {
  const std::size_t nameStart = names_.size();
  prefix = prefix.substr(0, kMaxFieldName);
  suffix = suffix.substr(0, kMaxFieldName - prefix.size());
  try {
    names_.append(prefix).append(suffix);
    records_.push_back({value, names_.size()});
  } catch (const std::bad_alloc&) {
    names_.resize(nameStart);
    return false;
  }
  return true;
}

void GenericParserCxt::release() {
  decltype(records_)(records_.get_allocator()).swap(records_);
  decltype(names_)(names_.get_allocator()).swap(names_);
}

bool AddSingleValueToGenericContext(GenericParserCxt* context, std::string_view prefix,
                                    std::string_view suffix, std::uint64_t value) {
  return context != nullptr && context->add(prefix, suffix, value);
}

bool AddMultipleFieldsToGenericContext(GenericParserCxt* context, std::string_view name,
                                       std::span<const std::byte> source, std::uint32_t elementSize,
                                       std::uint32_t count) {
  if (elementSize == 0 || count == 0) return true;
  if (elementSize > sizeof(std::uint64_t)) return false;
  const std::size_t elements =
      std::min<std::size_t>(source.size() / elementSize, std::min(count, kMaxElements));
  bool allAdded = true;
  for (std::size_t i = 0; i < elements; ++i) {
    std::array<char, 8> digits;
    const char* end = digits.data();
    if (count > 1) end = std::to_chars(digits.data(), digits.data() + digits.size(), i).ptr;
    const auto value = base::littleEndianOfAnyWidth(source.subspan(i * elementSize, elementSize));
    allAdded &= AddSingleValueToGenericContext(context, name, {digits.data(), end}, value);
  }
  return allAdded;
}

void ReleaseGenericParserCxt(GenericParserCxt* context) {
  if (context != nullptr) context->release();
}

plist::Dictionary CreateDictFromCxt(const GenericParserCxt& context, const NameTable* allowedKeys) {
  plist::Dictionary dictionary;
  for (std::size_t i = 0; i < context.size(); ++i) {
    const auto [name, value] = context[i];
    if (allowedKeys == nullptr || allowedKeys->contains(name)) dictionary.set(name, value);
  }
  return dictionary;
}

}  // namespace NANDInfo
