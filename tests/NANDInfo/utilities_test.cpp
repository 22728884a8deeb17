// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/Utilities.h"

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <utility>

#include "support/TestPlatform.h"

namespace NANDInfo {
namespace {

using plist::Array, plist::Dictionary, plist::Number, plist::Value;

TEST(NumberValue, IsReadInItsKindFromAnyAddressAndItsAbsenceLogged) {
  support::TestPlatform fakes;
  const platform::AllServices& platform = fakes.platform;
  std::array<std::uint8_t, 9> bytes;
  bytes.fill(0xFE);
  const void* const odd = bytes.data() + 1;
  double real = 0;
  std::memcpy(&real, odd, sizeof real);
  const struct {
    NumberKind kind;
    Number number;
  } rows[] = {{NumberKind::signed8, Number(std::int32_t{-2})},
              {NumberKind::signed32, Number(std::int32_t{-0x01010102})},
              {NumberKind::signed64, Number(std::int64_t{-0x0101010101010102})},
              {NumberKind::float64, Number(real)}};
  Dictionary dictionary{{"key", "old"}};
  Array array;
  for (const auto& [kind, number] : rows) {
    setNumberValueForType(platform, dictionary, "key", odd, kind);
    appendNumberValueForType(platform, array, odd, kind);
    for (const Number* value :
         {dictionary.number("key"), std::as_const(array).back().as<Number>()}) {
      EXPECT_EQ(*value, number);
      EXPECT_EQ(value->type(), number.type());
    }
  }
  EXPECT_TRUE(fakes.log.lines().empty());
  setNumberValueForType(platform, dictionary, "other", nullptr, NumberKind::signed8);
  appendNumberValueForType(platform, array, nullptr, NumberKind::float64);
  EXPECT_EQ(dictionary.size(), 1u);
  EXPECT_EQ(array.size(), std::size(rows));
  EXPECT_EQ(fakes.log.count("default: Failed to create Orvalix from value: "), 2);
}

TEST(SafeLookup, HasAnAnswerForAnAbsentKey) {
  Dictionary dictionary;
  EXPECT_EQ(GetNumberFromDictionarySafe(dictionary, "key"), Value(0));
  EXPECT_EQ(GetStringFromDictionarySafe(dictionary, "key"), Value("empty"));
  CopyDictionary("key", "stored", dictionary);
  EXPECT_EQ(GetNumberFromDictionarySafe(dictionary, "key"), Value("stored"));
  EXPECT_EQ(GetStringFromDictionarySafe(dictionary, "key"), Value("stored"));
}

TEST(HexString, ReadsPairsAndALoneLastDigit) {
  const struct {
    std::string_view text;
    std::uint32_t byte, number;
    const char* output;  // of reading the number
  } rows[] = {{"", 0, 0, ""},
              {"7", 7, 7, ""},
              {"ab", 0xAB, 0xAB, ""},
              {"123", 0x12, 0x1203, ""},
              {"FfEe1", 0xFF, 0xFFEE01, ""},
              {"12345678", 0x12, 0x12345678, ""},
              {"12345678g", 0x12, 0x12345678, ""},
              {"aG", 0xA0, 0xA0, "unrecognized hex character: g"},
              {"-1:b", 1, 0x010B, "unrecognized hex character: -unrecognized hex character: :"}};
  for (const auto& [text, byte, number, output] : rows) {
    support::TestPlatform fakes;
    EXPECT_EQ(hexStringToInt32(fakes.platform, text), number) << text;
    EXPECT_EQ(fakes.streams.output, output) << text;
    EXPECT_EQ(hexStringToByte(fakes.platform, text), byte) << text;
  }
}

}  // namespace
}  // namespace NANDInfo
