// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "report/PLConfig.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <random>
#include <vector>

#include "support/TestPlatform.h"

namespace report {
namespace {

using plist::Array;
using plist::Dictionary;
using plist::Value;

Dictionary bucket(std::int64_t interval) { return {{"bucket_interval", interval}}; }

class PLConfigTest : public ::testing::Test {
 protected:
  std::unique_ptr<PLConfig> load() {
    context_ = std::make_unique<morvend::DeviceContext>(platform.platform);
    return PLConfig::init(platform.platform, *context_);
  }

  // The bucket interval that a key gets; -1 when the key is not reported, 0 when it is unrounded.
  static int interval(const CounterOptions* options) {
    return options == nullptr ? -1 : static_cast<int>(options->bucketInterval.value_or(0));
  }

  support::TestPlatform platform;

 private:
  std::unique_ptr<morvend::DeviceContext> context_;
};

TEST_F(PLConfigTest, LooksUpExactKeysThenTheLongestPrefixThenTheDevice) {
  platform.setWhitelist(
      {{"First",
        Dictionary{{"ScalarKeys", Dictionary{{"a.b", bucket(1)}, {"twice", bucket(2)}}},
                   {"ScalarKeyPrefixes",
                    Dictionary{{"a.", bucket(3)}, {"a.b.c.", bucket(4)}, {"a.b.", bucket(5)}}},
                   {"DistributionKeys", Dictionary{{"only.distribution", bucket(6)}}},
                   {"DistributionKeyPrefixes", Dictionary{{"d.", bucket(7)}}},
                   {"Unknown", Dictionary{{"x", bucket(8)}}}}},
       {"Second", Dictionary{{"ScalarKeys", Dictionary{{"twice", bucket(9)}}}}}});
  const struct {
    const char* key;
    int scalar, distribution;
  } rows[] = {{"a.b", 1, -1},   {"twice", 9, -1},   {"a.x", 3, -1},  {"a.b.", 5, -1},
              {"a.b.c", 5, -1}, {"a.b.c.d", 4, -1}, {"A.x", -1, -1}, {"a", -1, -1},
              {"", -1, -1},     {"d.1", -1, 7},     {"x", -1, -1},   {"only.distribution", -1, 6}};
  for (const bool internal : {false, true}) {
    platform.device.internalBuild = internal;
    const auto config = load();
    ASSERT_NE(config, nullptr);
    for (const auto& row : rows) {
      const int missing = internal ? 0 : -1;
      EXPECT_EQ(interval(config->configOptionsForScalarKey(row.key)),
                row.scalar == -1 ? missing : row.scalar)
          << row.key;
      EXPECT_EQ(interval(config->configOptionsForDistributionKey(row.key)),
                row.distribution == -1 ? missing : row.distribution)
          << row.key;
    }
  }
  EXPECT_EQ(platform.log.count("debug: prefix match a.b. for a.b.c"), 2);
  EXPECT_EQ(platform.log.count("debug: passing @{} for A.x as device is Norba Internal"), 2);
}

TEST_F(PLConfigTest, TakesKeyGroupsAsTheDeviceAndItsSwitchesSay) {
  const Dictionary section{{"ScalarKeys", Dictionary{{"key", bucket(1)}}}};
  const struct {
    const char* group;
    std::optional<bool> preference;
    bool internal, taken;
  } rows[] = {{"Group", {}, false, true},
              {"Group", true, false, true},
              {"Group", false, false, false},
              {"Group", false, true, true},
              {"InternalTesting", true, false, false},
              {"InternalTesting", {}, false, false},
              {"InternalTesting", false, true, true}};
  for (const auto& row : rows) {
    support::TestPlatform device;
    device.setWhitelist({{row.group, section}});
    device.device.internalBuild = row.internal;
    if (row.preference) device.preferences.setMobile("com.norba.da", row.group, *row.preference);
    morvend::DeviceContext context(device.platform);
    const auto config = PLConfig::init(device.platform, context);
    ASSERT_NE(config, nullptr);
    EXPECT_EQ(interval(config->configOptionsForScalarKey("key")),
              row.taken ? 1 : (row.internal ? 0 : -1));
    const bool said = !row.taken && std::string(row.group) == "Group";
    EXPECT_EQ(device.log.lines(),
              said ? std::vector<std::string>{"default: keyGroup Group is disabled by tasking"}
                   : std::vector<std::string>{});
  }
}

TEST_F(PLConfigTest, RefusesFilesThatAreNoWhitelist) {
  EXPECT_EQ(load(), nullptr);
  EXPECT_EQ(platform.log.lines(), std::vector<std::string>{"error: Couldn't load whitelist"});
  for (const std::string bytes : {"", "<plist", "<plist version=\"1.0\"><array/></plist>"}) {
    platform.log.clear();
    platform.files.contents[support::TestPlatform::kWhitelist] = bytes;
    EXPECT_EQ(load(), nullptr);
    ASSERT_EQ(platform.log.lines().size(), 1u);
    EXPECT_EQ(platform.log.count("error: Couldn't parse the contents of the config file. Error: "),
              1);
  }
  EXPECT_EQ(platform.log.count("Error: the top level is not a dictionary"), 1);
}

// A key whose rounding can't be understood must not leave the device unrounded.
TEST_F(PLConfigTest, SkipsEntriesOfTheWrongTypeAndKeepsTheRest) {
  platform.setWhitelist(
      {{"NotAGroup", 1},
       {"Group",
        Dictionary{
            {"ScalarKeyPrefixes", "text"},
            {"ScalarKeys", Dictionary{{"good", bucket(5)},
                                      {"not.a.dictionary", 5},
                                      {"text.interval", Dictionary{{"bucket_interval", "10"}}},
                                      {"negative", bucket(-1)},
                                      {"boolean", Dictionary{{"bucket_interval", true}}},
                                      {"intervals", Dictionary{{"intervals", 5}}},
                                      {"bounds", Dictionary{{"intervals", Array{Value(1), "2"}}}},
                                      {"real", Dictionary{{"bucket_interval", 20.0}}},
                                      {"large", Dictionary{{"bucket_interval", ~std::uint64_t{0}}}},
                                      {"empty", Dictionary()}}}}}});
  const auto config = load();
  ASSERT_NE(config, nullptr);
  EXPECT_EQ(interval(config->configOptionsForScalarKey("good")), 5);
  EXPECT_EQ(interval(config->configOptionsForScalarKey("real")), 20);
  EXPECT_EQ(interval(config->configOptionsForScalarKey("boolean")), 1);
  EXPECT_EQ(interval(config->configOptionsForScalarKey("empty")), 0);
  EXPECT_EQ(config->configOptionsForScalarKey("large")->bucketInterval, ~std::uint64_t{0});
  for (const char* key : {"not.a.dictionary", "text.interval", "negative", "intervals", "bounds"}) {
    EXPECT_EQ(config->configOptionsForScalarKey(key), nullptr) << key;
    EXPECT_EQ(platform.log.count(std::string("error: Whitelist: skipping Group/ScalarKeys/") + key),
              1);
  }
  EXPECT_EQ(platform.log.count("error: Whitelist: skipping NotAGroup,"), 1);
  EXPECT_EQ(platform.log.count("error: Whitelist: skipping Group/ScalarKeyPrefixes,"), 1);
}

TEST_F(PLConfigTest, DigestsTheBytesOfTheFile) {
  platform.files.contents[support::TestPlatform::kWhitelist] =
      "<plist version=\"1.0\"><dict/></plist>";
  EXPECT_EQ(load()->configFileDigest(), "be5a5e8f37d7f11fc2c74e4372ebb8f0");
}

TEST(PrefixTable, FindsTheLongestPrefixThatASearchThroughAllFinds) {
  std::mt19937 random(3);
  auto word = [&](std::size_t longest) {
    std::string text;
    const std::size_t length = random() % (longest + 1);
    while (text.size() < length) text += "ab\xff"[random() % 3];
    return text;
  };
  for (int round = 0; round < 200; ++round) {
    OptionsTable prefixes;
    const std::size_t count = random() % 40;
    while (prefixes.entries().size() < count) {
      prefixes.set(word(7), CounterOptions{prefixes.entries().size(), {}, {}});
    }
    const auto copy = prefixes.entries();
    const PrefixTable table(std::move(prefixes));
    for (int i = 0; i < 50; ++i) {
      const std::string key = word(9);
      const OptionsTable::Entry* longest = nullptr;
      for (const auto& entry : copy) {
        const bool longer = longest == nullptr || entry.key.size() > longest->key.size();
        if (key.starts_with(entry.key) && longer) longest = &entry;
      }
      const auto match = table.longestPrefix(key);
      ASSERT_EQ(match.options != nullptr, longest != nullptr);
      if (longest == nullptr) continue;
      EXPECT_EQ(match.prefix, longest->key);
      EXPECT_EQ(match.options->bucketInterval, longest->options.bucketInterval);
    }
  }
}

}  // namespace
}  // namespace report
