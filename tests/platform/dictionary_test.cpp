#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "platform/PropertyList.h"

namespace platform {
namespace {

// The growth of the index, removals and replacements, beside a plain list of pairs.
TEST(Dictionary, KeepsOrderAndFindsEveryKeyWhateverIsDoneToIt) {
  std::mt19937 random(1);
  Dictionary dictionary;
  std::vector<std::pair<std::string, std::int64_t>> expected;
  for (std::int64_t step = 0; step < 4000; ++step) {
    const std::string key(1 + random() % 12, static_cast<char>('a' + random() % 26));
    const auto found = std::find_if(expected.begin(), expected.end(),
                                    [&](const auto& entry) { return entry.first == key; });
    if (random() % 200 == 0) {
      const std::int64_t dropped = step % 3;
      dictionary.keepIf([&](std::string_view, Value& value) {
        const std::int64_t number = value.as<Number>()->int64Value();
        value = number + 1;
        return number % 3 != dropped;
      });
      std::erase_if(expected, [&](const auto& entry) { return entry.second % 3 == dropped; });
      for (auto& entry : expected) ++entry.second;
    } else if (random() % 4 == 0) {
      EXPECT_EQ(dictionary.remove(key), found != expected.end());
      if (found != expected.end()) expected.erase(found);
    } else {
      EXPECT_EQ(dictionary.set(key, step), Value(step));
      if (found != expected.end()) {
        found->second = step;
      } else {
        expected.emplace_back(key, step);
      }
    }
    ASSERT_EQ(dictionary.size(), expected.size());
    const Number* number = dictionary.number(key);
    ASSERT_EQ(number != nullptr, std::any_of(expected.begin(), expected.end(),
                                             [&](const auto& e) { return e.first == key; }));
  }
  ASSERT_GT(expected.size(), 100u);
  std::size_t i = 0;
  for (const auto& [key, value] : dictionary) {
    EXPECT_EQ(key, expected[i].first);
    EXPECT_EQ(value, Value(expected[i].second));
    ++i;
  }
}

TEST(Dictionary, CopiesAndMovedOnesKeepTheirIndex) {
  Dictionary dictionary;
  for (int i = 0; i < 100; ++i) dictionary.set("key" + std::to_string(i), i);
  const Dictionary copy = dictionary;
  Dictionary moved = std::move(dictionary);
  dictionary = Dictionary{{"only", true}};
  moved.remove("key50");
  EXPECT_EQ(copy.size(), 100u);
  EXPECT_NE(copy.find("key50"), nullptr);
  EXPECT_EQ(moved.find("key50"), nullptr);
  EXPECT_EQ(*moved.find("key99"), Value(99));
  EXPECT_NE(dictionary.find("only"), nullptr);
}

TEST(Dictionary, AccessorsYieldNothingForAnotherType) {
  const Dictionary all{{"text", "t"},          {"number", 1},        {"array", Array{}},
                       {"dict", Dictionary{}}, {"data", Data{1, 2}}, {"date", Date{0}}};
  for (const auto& [key, value] : all) {
    EXPECT_EQ(all.text(key) != nullptr, key == "text");
    EXPECT_EQ(all.number(key) != nullptr, key == "number");
    EXPECT_EQ(all.array(key) != nullptr, key == "array");
    EXPECT_EQ(all.dictionary(key) != nullptr, key == "dict");
    EXPECT_EQ(all.data(key) != nullptr, key == "data");
    EXPECT_EQ(all.date(key) != nullptr, key == "date");
  }
  EXPECT_EQ(all.text("missing"), nullptr);
}

TEST(Dictionary, EqualityIgnoresOrderAndNothingElse) {
  const Dictionary ab{{"a", 1}, {"b", 2}}, ba{{"b", 2}, {"a", 1}};
  EXPECT_EQ(ab, ba);
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}, {"b", 3}}));
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}, {"c", 2}}));
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}}));
}

}  // namespace
}  // namespace platform
