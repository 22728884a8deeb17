// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/bus/BusMessage.h"

#include <cstdint>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "support/SealedMessage.h"

namespace {

using namespace host;
using support::SealedMessage;
using Make = std::function<void(sd_bus_message*)>;

// Reads a message of the one entry "k" whose variant is made by `makeValue`.
std::optional<BusDictionary> readEntry(const Make& makeValue) {
  const SealedMessage message([&](sd_bus_message* m) {
    sd_bus_message_open_container(m, 'a', "{sv}");
    sd_bus_message_open_container(m, 'e', "sv");
    sd_bus_message_append(m, "s", "k");
    makeValue(m);
    sd_bus_message_close_container(m);
    sd_bus_message_close_container(m);
  });
  return readDictionary(message.get());
}

// The outer array's signature is `type`, its elements come from `element`, as often as `count`
// says.
Make arrayOf(const std::string& type, std::size_t count, const Make& element) {
  return [=](sd_bus_message* m) {
    sd_bus_message_open_container(m, 'v', ("a" + type).c_str());
    sd_bus_message_open_container(m, 'a', type.c_str());
    for (std::size_t i = 0; i < count; ++i) element(m);
    sd_bus_message_close_container(m);
    sd_bus_message_close_container(m);
  };
}

template <typename... Arguments>
Make variant(const char* signature, Arguments... arguments) {
  return [=](sd_bus_message* m) { sd_bus_message_append(m, "v", signature, arguments...); };
}

TEST(BusMessage, EachTypeBecomesItsCounterpartAndOthersAreLeftOut) {
  const struct {
    const char* type;
    Make make;
    std::optional<plist::Value> expected;
  } rows[] = {
      {"y", variant("y", 255), plist::Value(std::int64_t{255})},
      {"n", variant("n", -32768), plist::Value(std::int64_t{-32768})},
      {"q", variant("q", 65535), plist::Value(std::int64_t{65535})},
      {"i", variant("i", INT32_MIN), plist::Value(std::int64_t{INT32_MIN})},
      {"u", variant("u", UINT32_MAX), plist::Value(std::int64_t{UINT32_MAX})},
      {"x", variant("x", INT64_MIN), plist::Value(std::int64_t{INT64_MIN})},
      {"t", variant("t", std::uint64_t{INT64_MAX}), plist::Value(std::int64_t{INT64_MAX})},
      {"t beyond int64", variant("t", UINT64_MAX), plist::Value(std::uint64_t{UINT64_MAX})},
      {"b", variant("b", 1), plist::Value(true)},
      {"d", variant("d", -0.5), plist::Value(-0.5)},
      {"s", variant("s", "text"), plist::Value("text")},
      {"o", variant("o", "/a/b"), plist::Value("/a/b")},
      {"g", variant("g", "a{sv}"), plist::Value("a{sv}")},
      {"ay", variant("ay", 2, 1, 2), plist::Value(plist::Data{1, 2})},
      {"empty ay", variant("ay", 0), plist::Value(plist::Data{})},
      {"as", variant("as", 2, "a", "b"), plist::Value(plist::Array{"a", "b"})},
      {"aai", variant("aai", 1, 1, 5), plist::Array{plist::Value(plist::Array{std::int64_t{5}})}},
      {"av with a struct", variant("av", 2, "(is)", 1, "x", "s", "y"),
       plist::Value(plist::Array{"y"})},
      {"v in v", variant("v", "v", "i", 5), plist::Value(std::int64_t{5})},
      {"a{ss}", variant("a{ss}", 1, "a", "b"), plist::Value(plist::Dictionary{{"a", "b"}})},
      {"s with a control", variant("s", "a\x01\t"), plist::Value("a\xEF\xBF\xBD\t")},
      {"a{ss} with controls", variant("a{ss}", 2, "\x01", "a", "\x02", "b"),
       plist::Value(plist::Dictionary{{"\xEF\xBF\xBD", "b"}})},
      {"aa{sv}", variant("aa{sv}", 2, 1, "a", "s", "b", 0),
       plist::Value(plist::Array{plist::Dictionary{{"a", "b"}}, plist::Dictionary{}})},
      {"a{is}", variant("a{is}", 1, 7, "x"), std::nullopt},
      {"struct", variant("(is)", 1, "x"), std::nullopt},
      {"h", variant("h", 0), std::nullopt},
  };
  for (const auto& row : rows) {
    const auto read = readEntry(row.make);
    ASSERT_TRUE(read) << row.type;
    const plist::Value* found = read->dictionary.find("k");
    EXPECT_EQ(found != nullptr ? std::optional(*found) : std::nullopt, row.expected) << row.type;
    if (found != nullptr && found->as<plist::Number>() != nullptr) {
      EXPECT_EQ(found->as<plist::Number>()->type(), row.expected->as<plist::Number>()->type())
          << row.type;
    }
    EXPECT_EQ(read->dropped, 0u) << row.type;
  }
}

TEST(BusMessage, WhatIsBeyondALimitIsDroppedAndTheRestIsRead) {
  const std::string kilobyte(1024, 't');
  const auto text = [&](sd_bus_message* m) { sd_bus_message_append(m, "s", kilobyte.c_str()); };
  const auto integers = [](sd_bus_message* m) {
    const std::vector<std::int32_t> many(4096);
    sd_bus_message_append_array(m, 'i', many.data(), many.size() * sizeof many[0]);
  };
  // An element of its own fits as often as this; the key "k" takes a byte, each array a value: the
  // 16th array is cut by 17, four aren't begun.
  const struct {
    const char* what;
    Make make;
    std::size_t kept, dropped;
  } rows[] = {
      {"elements", arrayOf("a{sv}", 5000, [](auto* m) { sd_bus_message_append(m, "a{sv}", 0); }),
       4096, 904},
      {"bytes", arrayOf("s", 1025, text), 1023, 2},
      {"values", arrayOf("ai", 20, integers), 16, 17 + 4},
  };
  for (const auto& row : rows) {
    const auto read = readEntry(row.make);
    ASSERT_TRUE(read) << row.what;
    EXPECT_EQ(read->dictionary.array("k")->size(), row.kept) << row.what;
    EXPECT_EQ(read->dropped, row.dropped) << row.what;
  }
}

TEST(BusMessage, NestingEndsAtItsLimit) {
  const auto nested = [](int depth) {
    return [depth](sd_bus_message* m) {
      for (int i = 0; i < depth; ++i) sd_bus_message_open_container(m, 'v', "v");
      sd_bus_message_append(m, "v", "i", 5);
      for (int i = 0; i < depth; ++i) sd_bus_message_close_container(m);
    };
  };
  EXPECT_NE(readEntry(nested(kMaxNesting - 3))->dictionary.number("k"), nullptr);
  const auto deep = readEntry(nested(kMaxNesting));
  EXPECT_EQ(deep->dictionary.size(), 0u);
  EXPECT_EQ(deep->dropped, 1u);
}

TEST(BusMessage, ABodyOfAnotherSignatureIsNoDictionary) {
  for (const char* signature : {"", "i", "a{ss}", "as"}) {
    const SealedMessage message([&](sd_bus_message* m) {
      if (*signature != '\0') sd_bus_message_append(m, signature, 0);
    });
    EXPECT_FALSE(readDictionary(message.get())) << signature;
  }
}

}  // namespace
