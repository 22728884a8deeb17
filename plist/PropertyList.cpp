// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/PropertyList.h"

#include "base/Text.h"
#include "plist/Allowance.h"
#include "plist/BinaryReader.h"
#include "plist/XMLReader.h"

namespace plist {

std::size_t memoryOf(const Value& value) {
  constexpr std::size_t kOverhead = 16;
  std::size_t all = sizeof(Value);
  if (const auto* text = value.as<std::string>()) {
    if (text->capacity() >= sizeof(std::string) / 2) all += text->capacity() + kOverhead;
  } else if (const auto* data = value.as<Data>()) {
    all += data->capacity() + kOverhead;
  } else if (const auto* array = value.as<Array>()) {
    all += (array->capacity() - array->size()) * sizeof(Value) + kOverhead;
    for (const Value& element : *array) all += memoryOf(element);
  } else if (const auto* dictionary = value.as<Dictionary>()) {
    all += kOverhead;
    for (const Dictionary::Entry& entry : *dictionary) {
      all += memoryOf(entry.value) + sizeof(std::string) + entry.key.size();
    }
    const bool hasUnused = !dictionary->empty() && dictionary->size() < kUsualDictionarySize;
    if (hasUnused) all += (kUsualDictionarySize - dictionary->size()) * sizeof(Dictionary::Entry);
  }
  return all;
}

base::Result<Value> read(std::string_view bytes) {
  if (bytes.empty()) return base::Error{"the property list is empty"};
  if (bytes.size() > kMaxSize) {
    return base::Error{
        base::format("the property list has %zu bytes, more than %zu", bytes.size(), kMaxSize)};
  }
  return bytes.starts_with("bplist") ? readBinary(bytes) : readXML(bytes);
}

}  // namespace plist
