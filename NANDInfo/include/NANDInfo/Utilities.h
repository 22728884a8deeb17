// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Small dictionary, number and text helpers of the storage library.
#pragma once

#include <cstdint>
#include <string_view>

#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

// The type of the number that a pointer designates.
enum class NumberKind { signed8, signed32, signed64, float64 };

// Sets, or appends, the number at the pointer. One that can't be had (a null pointer) is logged,
// and the collection stays as it is.
void setNumberValueForType(const Services& services, plist::Dictionary& dictionary,
                           std::string_view key, const void* value, NumberKind kind);
void appendNumberValueForType(const Services& services, plist::Array& array, const void* value,
                              NumberKind kind);

// The value of a key, or the number 0, or the text "empty".
plist::Value GetNumberFromDictionarySafe(const plist::Dictionary& dictionary, std::string_view key);
plist::Value GetStringFromDictionarySafe(const plist::Dictionary& dictionary, std::string_view key);

// Stores a value under a key in the target.
void CopyDictionary(std::string_view key, const plist::Value& value, plist::Dictionary& target);

// Stores all entries in the target; they replace what it has under their keys.
inline void addEntries(const plist::Dictionary& entries, plist::Dictionary& target) {
  for (const auto& [key, value] : entries) target.set(key, value);
}

// At most two, or eight, hexadecimal characters as a number. A character that isn't hexadecimal is
// said on standard output and adds nothing.
std::uint8_t hexStringToByte(const Services& services, std::string_view text);
std::uint32_t hexStringToInt32(const Services& services, std::string_view text);

}  // namespace NANDInfo
