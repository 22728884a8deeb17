// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/GenericParserContext.h"
#include "NANDInfo/NameTable.h"
#include "support/ControllerBuffers.h"
#include "support/FreshErrors.h"

namespace NANDInfo {
namespace {

using support::Bytes, support::Fields, support::fieldsOf, support::RefusingMemory;

constexpr std::uint64_t kMax = ~std::uint64_t{0};

TEST(GenericParserContext, AddsElementsOfEveryWidth) {
  const Bytes source = support::words({0x8182838485868788, 0x9192939495969798});
  const struct {
    std::uint32_t width, count;
    bool result;
    Fields expected;
  } rows[] = {
      {1, 1, true, {{"n_", 0x88}}},
      {4, 2, true, {{"n_0", 0x85868788}, {"n_1", 0x81828384}}},
      {0, 3, true, {}},
      {8, 0, true, {}},
      {9, 1, false, {}},
      // Never beyond the source.
      {8, 3, true, {{"n_0", 0x8182838485868788}, {"n_1", 0x9192939495969798}}},
      {5, 0xFFFFFFFF, true, {{"n_0", 0x8485868788}, {"n_1", 0x9798818283}, {"n_2", 0x9293949596}}},
  };
  for (const auto& [width, count, result, expected] : rows) {
    GenericParserCxt context;
    EXPECT_EQ(AddMultipleFieldsToGenericContext(&context, "n_", source, width, count), result)
        << width << " " << count;
    EXPECT_EQ(fieldsOf(context), expected) << width << " " << count;
  }
  EXPECT_FALSE(AddSingleValueToGenericContext(nullptr, "a", "b", 1));
  EXPECT_FALSE(AddMultipleFieldsToGenericContext(nullptr, "n", source, 8, 2));
}

TEST(GenericParserContext, CutsLongNamesAndKeepsEqualOnes) {
  GenericParserCxt context;
  const std::string longName(120, 'x'), name97(97, 'y');
  AddSingleValueToGenericContext(&context, longName, "suffix", 1);
  AddSingleValueToGenericContext(&context, name97, "12", kMax);
  AddSingleValueToGenericContext(&context, "", "boots", 2);
  AddSingleValueToGenericContext(&context, "bo", "ots", 4);
  EXPECT_EQ(
      fieldsOf(context),
      (Fields{{longName.substr(0, 98), 1}, {name97 + "1", kMax}, {"boots", 2}, {"boots", 4}}));
  const auto dictionary = CreateDictFromCxt(context);
  EXPECT_EQ(dictionary.size(), 3u);
  EXPECT_EQ(dictionary.number("boots")->uint64Value(), 4u);
  EXPECT_EQ(dictionary.number("boots")->type(), plist::Number::Type::uint64);
  EXPECT_EQ(dictionary.number(name97 + "1")->uint64Value(), kMax);
  const NameRow allowed[] = {{"boots", 0}, {"absent", 0}};
  const NameTable table(allowed);
  EXPECT_EQ(CreateDictFromCxt(context, &table), (plist::Dictionary{{"boots", std::uint64_t{4}}}));
  for (int i = 0; i < 2; ++i) ReleaseGenericParserCxt(&context);
  EXPECT_TRUE(context.empty() && CreateDictFromCxt(context).empty());
  AddSingleValueToGenericContext(&context, "again", "", 5);
  EXPECT_EQ(fieldsOf(context), (Fields{{"again", 5}}));
  ReleaseGenericParserCxt(nullptr);
}

// Whichever allocation is refused: only the field that needed it is missing.
TEST(GenericParserContext, SurvivesARefusalAtEachAllocation) {
  constexpr std::uint32_t kCount = 1000;
  Bytes source;
  for (std::uint64_t i = 0; i < kCount; ++i) support::put(source, i * i, 8);
  bool refused = true;
  for (int granted = 0; refused; ++granted) {
    ASSERT_LT(granted, 100);
    RefusingMemory memory(granted, 1);
    GenericParserCxt context(&memory);
    refused = !AddMultipleFieldsToGenericContext(&context, "name", source, 8, kCount);
    ASSERT_EQ(context.size(), refused ? kCount - 1 : kCount);
    std::uint64_t element = 0;
    for (const auto& [name, value] : fieldsOf(context)) {
      if (name != "name" + std::to_string(element)) ++element;
      ASSERT_EQ(name, "name" + std::to_string(element));
      ASSERT_EQ(value, element * element);
      ++element;
    }
  }
}

TEST(APIErrorMessage, KeepsTheFirstOne) {
  support::freshErrors();
  EXPECT_STREQ(GetAPIErrorMessage(), "NA");
  SetAPIErrorMessage("%d%s", 7, std::string(2000, 'm').c_str());
  SetAPIErrorMessage("second");
  EXPECT_EQ(GetAPIErrorMessage(), "7" + std::string(1022, 'm'));
}

}  // namespace
}  // namespace NANDInfo
