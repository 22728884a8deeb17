// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Utilities.h"

#include <cstring>
#include <optional>

#include "NANDInfo/Services.h"
#include "NANDInfo/decode/Hex.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

namespace NANDInfo {

using plist::Value;

namespace {

template <typename Stored, typename Read>
Value valueAt(const void* pointer) {
  Read number;
  std::memcpy(&number, pointer, sizeof number);
  return Stored{number};
}

// The number at the pointer; its absence is logged.
std::optional<Value> numberAt(const Services& services, const void* pointer, NumberKind kind) {
  if (pointer != nullptr) {
    switch (kind) {
      case NumberKind::signed8:
        return valueAt<std::int32_t, std::int8_t>(pointer);
      case NumberKind::signed32:
        return valueAt<std::int32_t, std::int32_t>(pointer);
      case NumberKind::signed64:
        return valueAt<std::int64_t, std::int64_t>(pointer);
      case NumberKind::float64:
        return valueAt<double, double>(pointer);
    }
  }
  services.log.log(platform::LogLevel::standard, "Failed to create Orvalix from value: %p",
                   pointer);
  return std::nullopt;
}

}  // namespace

void setNumberValueForType(const Services& services, plist::Dictionary& dictionary,
                           std::string_view key, const void* value, NumberKind kind) {
  if (auto number = numberAt(services, value, kind)) dictionary.set(key, *number);
}

void appendNumberValueForType(const Services& services, plist::Array& array, const void* value,
                              NumberKind kind) {
  if (auto number = numberAt(services, value, kind)) array.push_back(*number);
}

Value GetNumberFromDictionarySafe(const plist::Dictionary& dictionary, std::string_view key) {
  const Value* const value = dictionary.find(key);
  return value != nullptr ? *value : Value(std::int32_t{0});
}

Value GetStringFromDictionarySafe(const plist::Dictionary& dictionary, std::string_view key) {
  const Value* const value = dictionary.find(key);
  return value != nullptr ? *value : Value("empty");
}

void CopyDictionary(std::string_view key, const Value& value, plist::Dictionary& target) {
  target.set(key, value);
}

std::uint8_t hexStringToByte(const Services& services, std::string_view text) {
  const HexNumber byte = hexByte(text);
  services.streams.writeOutput(byte.complaint);
  return static_cast<std::uint8_t>(byte.value);
}

std::uint32_t hexStringToInt32(const Services& services, std::string_view text) {
  const HexNumber number = hexNumber(text);
  services.streams.writeOutput(number.complaint);
  return number.value;
}

}  // namespace NANDInfo
