// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include <gtest/gtest.h>

#include <algorithm>
#include <random>

#include "plist/Value.h"

namespace plist {
namespace {

// The growth of the index, removals, replacements and copies, beside a plain list of pairs.
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
      dictionary = Dictionary(dictionary);
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

TEST(Dictionary, EqualityIgnoresOrderAndNothingElse) {
  const Dictionary ab{{"a", 1}, {"b", 2}}, ba{{"b", 2}, {"a", 1}};
  EXPECT_EQ(ab, ba);
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}, {"b", 3}}));
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}, {"c", 2}}));
  EXPECT_FALSE(ab == (Dictionary{{"a", 1}}));
}

}  // namespace
}  // namespace plist
