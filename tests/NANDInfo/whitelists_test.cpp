// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The small tools of the whitelists: name tables, filters, rounding.

#include "NANDInfo/Whitelists.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <limits>
#include <span>
#include <string>

namespace NANDInfo {
namespace {

using plist::Dictionary;

constexpr NameRow kRows[] = {{"n{1, 3..4, 10}", 2}, {"all", 20}, {"n{4, 5}", 3}, {"zero", 0}};

TEST(NameTable, ExpandsFamiliesInOrderAndKeepsTheFirstOfAName) {
  const auto names = [](std::span<const NameRow> rows) {
    std::string text;
    for (const NameTable::Entry& entry : NameTable(rows)) {
      text += std::string(entry.name) + ":" + std::to_string(entry.number) + " ";
    }
    return text;
  };
  EXPECT_EQ(names(kRows), "n1:2 n3:2 n4:2 n10:2 all:20 n5:3 zero:0 ");
  constexpr NameRow kArrays[] = {
      {"a", 1, '_', 2}, {"b", 2, '\0', 9, "{0, 7..8}"}, {"k{, A9..10, B2C}"}};
  EXPECT_EQ(names(kArrays), "a_0:1 a_1:1 b0:2 b7:2 b8:2 k:0 kA9:0 kA10:0 kB2C:0 ");
}

TEST(Filter, KeepsTheNamedInOrderAndRoundsOnlyNumbersOnDemand) {
  const NameTable table(kRows);
  Dictionary input{{"zero", 4}};
  for (int i = 0; i < 50; ++i) input.set("dropped" + std::to_string(i), i);
  for (const auto& [key, value] : Dictionary{{"n10", 1.9e4},
                                             {"n3", std::int32_t{-1}},
                                             {"n1", "12345"},
                                             {"n2", 1},
                                             {"all", 12345.75},
                                             {"n4", Dictionary{{"n2", 12345}}}}) {
    input.set(key, value);
  }
  EXPECT_EQ(CreateFilteredDict(input, nullptr), input);
  EXPECT_EQ(CreateFilteredDict_SigDig(input, nullptr, true), input);

  const Dictionary unrounded = CreateFilteredDict(input, &table);
  EXPECT_EQ(CreateFilteredDict_SigDig(input, &table, false), unrounded);
  std::string order;
  for (const auto& [key, value] : unrounded) {
    order += key + " ";
    EXPECT_EQ(value, *input.find(key));
  }
  EXPECT_EQ(order, "zero n10 n3 n1 all n4 ");

  const Dictionary rounded = CreateFilteredDict_SigDig(input, &table, true);
  EXPECT_EQ(rounded, (Dictionary{{"zero", std::uint64_t{0}},
                                 {"n10", std::uint64_t{19000}},
                                 {"n3", std::uint64_t{18000000000000000000u}},
                                 {"n1", "12345"},
                                 {"all", std::uint64_t{12345}},
                                 {"n4", Dictionary{{"n2", 12345}}}}));
  for (const char* key : {"zero", "n10", "n3", "all"}) {
    EXPECT_EQ(rounded.number(key)->type(), plist::Number::Type::uint64) << key;
  }
}

TEST(RoundSig, RoundsHalfUpAtTheDigitsOfTheLogarithm) {
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint64_t>::max();
  const struct {
    std::uint64_t value, digits, rounded;
  } rows[] = {{0, 0, 0},
              {4, 0, 0},
              {5, 0, 10},
              {123456, 0, 0},
              {999, 0, 1000},
              {12499, 2, 12000},
              {12500, 2, 13000},
              {99, 2, 99},
              {995, 2, 1000},
              {123456, 3, 123000},
              {999999999999999999, 18, 1000000000000000000},
              {999999999999999999, 19, 999999999999999999},
              {kMax, 1, 0},
              {kMax, 2, 18000000000000000000u},
              {kMax, 20, kMax},
              {kMax, kMax, kMax}};
  for (const auto& [value, digits, rounded] : rows) {
    EXPECT_EQ(roundSig(value, digits), rounded) << value << " to " << digits;
  }
}

TEST(UserCapacity, IsThePowerOfTwoAboveOrTheOneBetween) {
  const struct {
    std::uint32_t megabytes, gigabytes;
  } rows[] = {{0, 0},
              {511, 0},
              {512, 1},
              {119000, 128},
              {1376255, 2048},
              {1376256, 1536},
              {1770495, 1536},
              {1770496, 2048},
              {(1u << 30) - 1, 1u << 20},
              {UINT32_MAX, 1u << 22}};
  for (const auto& [megabytes, gigabytes] : rows) {
    EXPECT_EQ(GetUserCapacityInGB(megabytes), gigabytes) << megabytes;
  }
}

}  // namespace
}  // namespace NANDInfo
