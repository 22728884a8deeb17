// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <limits>
#include <type_traits>

#include "base/Convert.h"
#include "base/Text.h"
#include "plist/Value.h"

namespace plist {
namespace {

constexpr double kInfinity = std::numeric_limits<double>::infinity();
constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();

// A value is made from exactly the types that it can hold: nothing else compiles.
template <typename T>
constexpr bool kHolds = std::is_convertible_v<T, Value>&& std::is_constructible_v<Number, T>;
static_assert(kHolds<std::int32_t> && kHolds<std::int64_t> && kHolds<std::uint64_t> &&
              kHolds<float> && kHolds<double> && kHolds<bool>);
template <typename T>
constexpr bool kRefuses = !std::is_constructible_v<Value, T> && !std::is_constructible_v<Number, T>;
static_assert(kRefuses<const Value*> && kRefuses<Dictionary*> && kRefuses<void*> &&
              kRefuses<std::nullptr_t> && kRefuses<char> && kRefuses<unsigned> &&
              kRefuses<std::uint16_t> && kRefuses<long double>);

TEST(SaturatingCast, HoldsAtTheEdgesWhereADoubleCantNameTheLimit) {
  struct Row {
    double from;
    std::int32_t as32;
    std::int64_t as64;
    std::uint64_t asUnsigned;
  };
  for (const Row& row : {
           Row{kNaN, 0, 0, 0},
           Row{-1.9, -1, -1, 0},
           Row{2147483647.5, INT32_MAX, 2147483647, 2147483647},
           Row{2147483648.0, INT32_MAX, 2147483648, 2147483648},
           Row{-2147483648.5, INT32_MIN, -2147483648, 0},
           Row{0x1p63, INT32_MAX, INT64_MAX, std::uint64_t{1} << 63},
           Row{0x1.fffffffffffffp62, INT32_MAX, 9223372036854774784, 9223372036854774784u},
           Row{-0x1p63, INT32_MIN, INT64_MIN, 0},
           Row{0x1p64, INT32_MAX, INT64_MAX, UINT64_MAX},
           Row{0x1.fffffffffffffp63, INT32_MAX, INT64_MAX, 18446744073709549568u},
           Row{-kInfinity, INT32_MIN, INT64_MIN, 0},
       }) {
    EXPECT_EQ(base::saturatingCast<std::int32_t>(row.from), row.as32) << row.from;
    EXPECT_EQ(base::saturatingCast<std::int64_t>(row.from), row.as64) << row.from;
    EXPECT_EQ(base::saturatingCast<std::uint64_t>(row.from), row.asUnsigned) << row.from;
    EXPECT_EQ(Number(row.from).int64Value(), row.as64);
    EXPECT_EQ(Number(row.from).uint64Value(), row.asUnsigned);
  }
}

TEST(Number, IsTrueUnlessItIsZero) {
  EXPECT_TRUE(Number(0.25).boolValue());
  EXPECT_FALSE(Number(-0.0).boolValue());
  EXPECT_TRUE(Number(std::int64_t{1} << 40).boolValue());
}

// Each group stands for one number, no two groups for the same.
TEST(Number, IsEqualByTheNumberWhateverItsType) {
  const std::vector<std::vector<Number>> groups = {
      {Number(0), Number(std::uint64_t{0}), Number(0.0), Number(-0.0f), Number(false)},
      {Number(1), Number(std::int64_t{1}), Number(1.0f), Number(true)},
      {Number(-1), Number(std::int64_t{-1}), Number(-1.0)},
      {Number(UINT64_MAX)},
      {Number(0x1p64)},
      {Number(INT64_MAX), Number(std::uint64_t{INT64_MAX})},
      {Number(0x1p63), Number(std::uint64_t{1} << 63)},
      {Number(INT64_MIN), Number(-0x1p63)},
      {Number(std::int64_t{1} << 53), Number(0x1p53)},
      {Number((std::int64_t{1} << 53) + 1)},
      {Number(0.5), Number(0.5f)},
  };
  for (std::size_t i = 0; i < groups.size(); ++i) {
    for (std::size_t j = 0; j < groups.size(); ++j) {
      for (const Number& a : groups[i]) {
        for (const Number& b : groups[j]) EXPECT_EQ(a == b, i == j) << a.text() << " " << b.text();
      }
    }
  }
  EXPECT_FALSE(Number(kNaN) == Number(kNaN));
  EXPECT_FALSE(Number(kNaN) == Number(0));
}

TEST(Number, TextHasNoPointWhenIntegral) {
  struct Row {
    Number number;
    const char* text;
  };
  for (const Row& row : {
           Row{Number(INT64_MIN), "-9223372036854775808"},
           Row{Number(UINT64_MAX), "18446744073709551615"},
           Row{Number(1e15), "1000000000000000"},
           Row{Number(1e16), "1e+16"},
           Row{Number(1.0 / 3), "0.3333333333333333"},
           Row{Number(0.1f), "0.1000000014901161"},
           Row{Number(-kInfinity), "-inf"},
           Row{Number(-kNaN), "nan"},
       }) {
    EXPECT_EQ(row.number.text(), row.text);
  }
}

TEST(Description, ShowsTextsAsTheyAreAndContainersAsListings) {
  EXPECT_EQ(description(Value("two words\n")), "two words\n");
  EXPECT_EQ(description(Value(2.5)), "2.5");
  EXPECT_EQ(description(Array{}), "(\n)");
  EXPECT_EQ(description(static_cast<const Value*>(nullptr)), "(null)");
  EXPECT_EQ(description(std::optional<std::string>()), "(null)");
  EXPECT_EQ(description(std::optional<std::string>("x")), "x");
  const Value value = Dictionary{
      {"plain.key", "word"},
      {"two words", "say \"hi\"\n\x01\\"},
      {"", ""},
      {"list", Array{1, true, Dictionary{{"date", Date{0}}}, Data{1, 2, 3}}},
  };
  EXPECT_EQ(description(value), R"({
    plain.key = word;
    "two words" = "say \"hi\"\n\x01\\";
    "" = "";
    list = (
        1,
        1,
        {
            date = 1970-01-01 00:00:00 +0000;
        },
        {length = 3}
    );
})");
}

TEST(Text, FormatsBeyondItsFixedBuffer) {
  const std::string longText(1000, 'x');
  EXPECT_EQ(base::format("<%s|%d>", longText.c_str(), 5), "<" + longText + "|5>");
  EXPECT_EQ(base::format("%s", longText.substr(0, 255).c_str()).size(), 255u);
  EXPECT_EQ(base::format("%s", longText.substr(0, 256).c_str()).size(), 256u);
}

}  // namespace
}  // namespace plist
