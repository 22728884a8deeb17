// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <limits>
#include <tuple>
#include <utility>

#include "plist/BinaryReader.h"
#include "plist/PropertyList.h"
#include "support/BinaryPropertyList.h"

namespace plist {
namespace {

using support::BinaryPropertyList;
using namespace std::string_view_literals;

base::Result<Value> readObject(std::string_view object) {
  BinaryPropertyList list;
  const std::size_t top = list.object(object);
  return readBinary(list.finish(top));
}

TEST(PropertyListBinary, ReadsEveryObject) {
  const double infinity = std::numeric_limits<double>::infinity();
  struct Row {
    std::string_view object;
    Value value;
  };
  for (const Row& row : {
           Row{"\x08"sv, false},
           Row{"\x09"sv, true},
           Row{"\x10\xFF"sv, 255},
           Row{"\x11\xFF\xFE"sv, 65534},
           Row{"\x12\xFF\xFF\xFF\xFF"sv, std::int64_t{4294967295}},
           Row{"\x13\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFE"sv, -2},
           Row{"\x14\0\0\0\0\0\0\0\0\x80\0\0\0\0\0\0\0"sv, std::uint64_t{1} << 63},
           Row{"\x14\0\0\0\0\0\0\0\0\0\0\0\0\0\0\0\x07"sv, 7},
           Row{"\x14\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\x80\0\0\0\0\0\0\0"sv, INT64_MIN},
           Row{"\x22\x3F\0\0\0"sv, 0.5f},
           Row{"\x23\xFF\xF0\0\0\0\0\0\0"sv, -infinity},
           Row{"\x33\0\0\0\0\0\0\0\0"sv, Date{978307200}},
           Row{"\x42\0\xFF"sv, Data{0, 255}},
           Row{"\x52hi"sv, "hi"},
           Row{"\x5F\x10\x10zero123456789abcdef"sv.substr(0, 19), "zero123456789abc"},
           Row{"\x5F\x11\0\x01z"sv, "z"},
           Row{"\x52h\xE4"sv, "h\xEF\xBF\xBD"},
           Row{"\x73h\xC3\xA4"sv, "h\xC3\xA4"},
           Row{"\x64\0a\x20\xAC\xD8\x3D\xDE\0"sv, "a\xE2\x82\xAC\xF0\x9F\x98\x80"},
           Row{"\x63\xDE\0\xD8\x3D\0a"sv,
               "\xEF\xBF\xBD\xEF\xBF\xBD"
               "a"},
           Row{"\x61\xD8\x3D"sv, "\xEF\xBF\xBD"},
           Row{"\x53\x01\t\x7F"sv, "\xEF\xBF\xBD\t\x7F"},
           Row{"\x62\0\x1F\xFF\xFF"sv, "\xEF\xBF\xBD\xEF\xBF\xBD"},
           Row{"\xA0"sv, Array{}},
           Row{"\xD0"sv, Dictionary{}},
       }) {
    const base::Result<Value> result = readObject(row.object);
    ASSERT_TRUE(result) << description(row.value) << ": " << result.error().text;
    EXPECT_TRUE(*result == row.value) << description(*result) << " " << description(row.value);
    EXPECT_EQ(result->variant().index(), row.value.variant().index());
  }
  EXPECT_EQ(readObject("\x22\x3F\0\0\0"sv)->as<Number>()->type(), Number::Type::float32);
  EXPECT_EQ(readObject("\x10\x01"sv)->as<Number>()->type(), Number::Type::int64);
}

TEST(PropertyListBinary, RefusesOtherObjectsAndSaysWhereAndWhy) {
  const std::pair<const char*, std::vector<std::string_view>> refused[] = {
      {"no property-list value (marker 0x",
       {"\0"sv, "\x0F"sv, "\x80\x01"sv, "\x90"sv, "\xB0"sv, "\xC0"sv, "\xE1\0"sv}},
      {"an integer of more than 16 bytes", {"\x15"sv, "\x1F"sv}},
      {"the integer is cut off", {"\x13\0\0"sv}},
      {"the integer is out of range",
       {"\x14\0\0\0\0\0\0\0\x01\0\0\0\0\0\0\0\0"sv,
        "\x14\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF\x70\0\0\0\0\0\0\0"sv}},
      {"a real of neither 4 nor 8 bytes", {"\x21\0\0"sv, "\x24"sv}},
      {"the real is cut off", {"\x22\0\0\0"sv}},
      {"a date not of 8 bytes", {"\x32\0\0\0\0"sv}},
      {"the date is cut off", {"\x33\0\0\0\0"sv}},
      {"the date is no instant", {"\x33\x7F\xF0\0\0\0\0\0\0"sv, "\x33\x7F\xF8\0\0\0\0\0\0"sv}},
      {"the count is cut off", {"\x5F"sv}},
      {"the count is not an integer",
       {"\x5F\x50"sv, "\x5F\x10"sv, "\x5F\x14\0\0\0\0\0\0\0\0\0\0\0\0\0\0\0\x01z"sv}},
      {"the count is beyond the objects",
       {"\x43\0\0"sv, "\x52h"sv, "\x62\0a\0"sv, "\x4F\x13\xFF\xFF\xFF\xFF\xFF\xFF\xFF\xFF"sv,
        "\x6F\x13\x80\0\0\0\0\0\0\0"sv, "\xAF\x13\x80\0\0\0\0\0\0\0"sv,
        "\xDF\x13\x40\0\0\0\0\0\0\0"sv, "\xAF\x12\x7F\xFF\xFF\xFF"sv, "\xA1\0"sv, "\xD1\0\0\0"sv}}};
  for (const auto& [why, objects] : refused) {
    for (const std::string_view object : objects) {
      const base::Result<Value> result = readObject(object);
      EXPECT_FALSE(result) << description(*result);
      EXPECT_TRUE(
          result.error().text.starts_with(std::string("binary property list, offset 8: ") + why))
          << result.error().text << " " << why;
    }
  }
  EXPECT_FALSE(readObject("\xA1\0\x01"sv)) << "a reference to no object";
  EXPECT_FALSE(readObject(""sv)) << "an object behind the last";
}

TEST(PropertyListBinary, AcceptsEveryWidthOfReferences) {
  for (std::size_t width = 1; width <= 8; ++width) {
    BinaryPropertyList list(width);
    const std::size_t one = list.add(1), text = list.add("t");
    const std::size_t top = list.container(0xD, {text, one});
    EXPECT_EQ(*readBinary(list.finish(top)), Value(Dictionary{{"t", 1}}));
  }
}

TEST(PropertyListBinary, KeysAreTextsAndTheLaterCounts) {
  BinaryPropertyList list;
  const std::size_t key = list.add("k"), one = list.add(1), two = list.add(2);
  const std::size_t twice = list.container(0xD, {key, key, one, two});
  const std::size_t asWritten = list.container(0xD, {list.add("\x01"), list.add("\xFF"), one, two});
  const std::size_t wrong = list.container(0xD, {one, key});
  EXPECT_EQ(*readBinary(list.finish(twice)), Value(Dictionary{{"k", 2}}));
  EXPECT_EQ(*readBinary(list.finish(asWritten)), Value(Dictionary{{"\xEF\xBF\xBD", 2}}));
  EXPECT_FALSE(readBinary(list.finish(wrong)));
}

TEST(PropertyListBinary, NamesTheContainerThatHoldsItself) {
  BinaryPropertyList list;
  list.container(0xA, {1});
  const std::size_t offset = list.offset();
  list.container(0xA, {2});
  list.container(0xD, {3, 1});
  list.add("key");
  EXPECT_EQ(
      readBinary(list.finish(0)).error().text,
      "binary property list, offset " + std::to_string(offset) + ": the container holds itself");
}

TEST(PropertyListBinary, DepthIsLimited) {
  BinaryPropertyList list;
  std::size_t top = list.container(0xA, {});
  for (int depth = 2; depth <= kMaxDepth; ++depth) top = list.container(0xA, {top});
  EXPECT_TRUE(readBinary(list.finish(top)));
  top = list.container(0xA, {top});
  EXPECT_FALSE(readBinary(list.finish(top)));
}

TEST(PropertyListBinary, SharedObjectsDontMultiplyWithoutBound) {
  const auto errorOf = [](BinaryPropertyList& list, std::size_t top) {
    const std::string error = readBinary(list.finish(top)).error().text;
    return error.substr(std::min(error.size(), error.find(": ") + 2));
  };
  BinaryPropertyList laughs;
  std::size_t top = laughs.add("ha");
  for (int level = 0; level < 100; ++level) {
    top = laughs.container(0xA, std::vector<std::size_t>(10, top));
  }
  EXPECT_EQ(errorOf(laughs, top), "too many objects");
  const std::string text(1 << 20, 'x');
  const Data data(text.begin(), text.end());
  for (const auto& [kind, large] :
       {std::pair<unsigned, Value>{0xA, text}, {0xA, data}, {0xD, text}}) {
    BinaryPropertyList list;
    const std::vector<std::size_t> many(100, list.add(large));
    EXPECT_EQ(errorOf(list, list.container(kind, many)), "too much text and data");
  }
  // Each place counts, and in memory too: a small file is not to fill the machine.
  for (const std::size_t beyond : {std::size_t{0}, std::size_t{1}}) {
    BinaryPropertyList list;
    const std::vector<std::size_t> some(1000, list.add(true));
    std::vector<std::size_t> all(1998, list.container(0xA, some));
    all.push_back(list.container(0xA, std::vector<std::size_t>(1 + beyond, some[0])));
    list.object(std::string(kMaxValues, ' '));
    EXPECT_EQ(bool(readBinary(list.finish(list.container(0xA, all)))), beyond == 0);
  }
}

// Lying trailers, counts, offsets and references: each byte in turn gets other values.
TEST(PropertyListBinary, SurvivesCutsAndAlterations) {
  const Value value =
      Dictionary{{"array", Array{1, 0.5, "text that is longer than fifteen bytes", Array{true}}},
                 {"data", Data(20)},
                 {"date", Date{0}}};
  const std::string whole = BinaryPropertyList::of(value);
  ASSERT_EQ(*read(whole), value);
  for (std::size_t length = 6; length < whole.size(); ++length) {
    EXPECT_FALSE(read(whole.substr(0, length))) << length;
    std::ignore = read("bplist00" + whole.substr(whole.size() - length));
  }
  for (std::size_t i = 0; i < whole.size(); ++i) {
    for (const int byte : {0x00, 0x01, 0x0F, 0x10, 0x7F, 0x80, 0xA1, 0xD1, 0xFF}) {
      std::string altered = whole;
      altered[i] = static_cast<char>(byte);
      const base::Result<Value> result = read(altered);
      EXPECT_TRUE(!result || read(*writeXML(*result))) << i;
    }
  }
}

}  // namespace
}  // namespace plist
