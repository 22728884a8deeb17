#include "NANDInfo/Whitelists.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstdint>
#include <limits>
#include <set>
#include <string>
#include <vector>

#include "NANDInfo/KeyTables.h"
#include "NANDInfo/NameRows.h"
#include "platform/host/MD5Digest.h"

namespace NANDInfo {
namespace {

using platform::Dictionary;

std::string digestOf(const std::vector<std::string>& lines) {
  std::string text, digits;
  for (const std::string& line : lines) text += line + "\n";
  for (const std::uint8_t byte : platform::host::MD5Digest().md5(text)) {
    digits += "0123456789abcdef"[byte >> 4];
    digits += "0123456789abcdef"[byte & 15];
  }
  return digits;
}

struct SignificantDigits {
  const NameTable& table;
  std::size_t names;
  const char* digest;  // of the lines "name digits" in bytewise order
};

std::vector<SignificantDigits> allTables() {
  return {
      {WhitelistedRawNANDFTLCounters_SigDigDict(), 1445, "7c8b7f0685217993190a87a1b3016659"},
      {WhitelistedRawNANDMSPCounters_SigDigDict(), 825, "f0c38b41b1fe1772e04f7323fda9b26d"},
      {WhitelistedStorageStats_SigDigDict(), 20, "fad5e93c525865cb3e2a4f9417b8e5e9"},
      {PrivacyApprovedSMagNANDFTLCounters_Accum(), 731, "4d0fd679b75a27ad8112c3e0731687d5"},
      {PrivacyApprovedSMagNANDFTLCounters_Dynamic(), 41, "266a56f26870ad8f4d3e98ff97e98ab7"},
      {PrivacyApprovedSMagNANDFTLCounters_SigDigDict(), 805, "964b8a96a3a275d90dff9a9c7643e707"}};
}

TEST(Whitelists, HoldTheirNamesAndDigitsOnceEach) {
  for (const auto& [table, names, digest] : allTables()) {
    std::vector<std::string> lines;
    for (const NameTable::Entry& entry : table) {
      lines.push_back(std::string(entry.name) + " " + std::to_string(entry.number));
      ASSERT_EQ(table.find(entry.name), &entry);
      ASSERT_FALSE(table.contains(std::string(entry.name) + "x"));
    }
    std::ranges::sort(lines);
    EXPECT_EQ(lines.size(), names);
    EXPECT_EQ(digestOf(lines), digest) << names;
  }
  const auto derived = FTLStats4MSPStats();
  EXPECT_EQ(digestOf({derived.begin(), derived.end()}), "68f24c2fe3c0ba41eca9b630972bab84");
}

TEST(KeyMap, HoldsEveryCounterUnderItsKey) {
  std::vector<std::string> lines;
  std::set<std::string> keys;
  for (const KeyMapRow& row : keyMapRows()) {
    for (const std::string& counter : expandFamily(row.counters)) {
      const auto key = keyMapKey(counter);
      ASSERT_TRUE(key) << counter;
      lines.push_back(counter + " " + std::string(*key));
      keys.emplace(*key);
    }
  }
  std::ranges::sort(lines);
  EXPECT_EQ(digestOf(lines), "562c19eeae4f28db8d2c58516e3e8d25");
  EXPECT_EQ(keys.size(), 709u);
  for (const char* counter : {"", "boots", "padSizes", "padSizes4", "padSizes_0", "PadSize1"}) {
    EXPECT_FALSE(keyMapKey(counter)) << counter;
  }
}

// A whitelisted name that no buffer can produce is a typing error, in one table or the other.
TEST(Whitelists, NameWhatTheParsersProduce) {
  std::set<std::string> ftl, legacy, msp;
  const auto add = [](std::set<std::string>& names, const std::string& name, const char* separator,
                      unsigned elements) {
    if (elements == 1) names.insert(name);
    for (unsigned i = 0; elements > 1 && i < elements; ++i) {
      names.insert(name + separator + std::to_string(i));
    }
  };
  for (const FTLKey& key : FTLKeyTable()) {
    add(ftl, key.name, "_", key.elements);
    add(legacy, key.name, "", key.elements);
  }
  for (const MSPTag& tag : MSPTagTable()) add(msp, tag.name, "", tag.elements);

  for (const SignificantDigits& each : allTables()) {
    const bool ofMSP = &each.table == &WhitelistedRawNANDMSPCounters_SigDigDict();
    for (const NameTable::Entry& entry : each.table) {
      const bool derived = entry.name.starts_with("TLM_") || entry.name.starts_with("EAN_");
      EXPECT_TRUE(derived || (ofMSP ? msp : ftl).contains(std::string(entry.name))) << entry.name;
    }
  }
  for (const KeyMapRow& row : keyMapRows()) {
    for (const std::string& counter : expandFamily(row.counters)) {
      EXPECT_TRUE(legacy.contains(counter)) << counter;
    }
  }
}

constexpr NameRow kRows[] = {{"n{1, 3..4, 10}", 2}, {"all", 20}, {"n{4, 5}", 3}, {"zero", 0}};
static_assert(countNames(kRows) == 8);

TEST(NameTable, ExpandsFamiliesInOrderAndKeepsTheFirstOfAName) {
  std::string names;
  for (const NameTable::Entry& entry : NameTable(kRows)) {
    names += std::string(entry.name) + ":" + std::to_string(entry.number) + " ";
  }
  EXPECT_EQ(names, "n1:2 n3:2 n4:2 n10:2 all:20 n5:3 zero:0 ");
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
    EXPECT_EQ(rounded.number(key)->type(), platform::Number::Type::uint64) << key;
  }
}

TEST(RoundSig, RoundsHalfUpAtTheDigitsOfTheLogarithm) {
  constexpr std::uint64_t kMost = std::numeric_limits<std::uint64_t>::max();
  const struct {
    std::uint64_t value, digits, rounded;
  } rows[] = {{0, 0, 0},
              {0, 8, 0},
              {1, 0, 0},
              {4, 0, 0},
              {5, 0, 10},
              {123456, 0, 0},
              {999, 0, 1000},
              {12345, 2, 12000},
              {12499, 2, 12000},
              {12500, 2, 13000},
              {99, 2, 99},
              {995, 2, 1000},
              {123456, 3, 123000},
              {999999999999999999, 18, 1000000000000000000},
              {999999999999999999, 19, 999999999999999999},
              {kMost, 1, 0},
              {kMost, 2, 18000000000000000000u},
              {kMost, 20, kMost},
              {kMost, kMost, kMost}};
  for (const auto& [value, digits, rounded] : rows) {
    EXPECT_EQ(roundSig(value, digits), rounded) << value << " to " << digits;
  }
}

TEST(UserCapacity, IsThePowerOfTwoAboveOrTheOneBetween) {
  const struct {
    std::uint32_t megabytes, gigabytes;
  } rows[] = {{0, 0},
              {1, 0},
              {511, 0},
              {512, 1},
              {1024, 2},
              {119000, 128},
              {250000, 256},
              {1376255, 2048},
              {1376256, 1536},
              {1770495, 1536},
              {1770496, 2048},
              {(1u << 30) - 1, 1u << 20},
              {1u << 31, 1u << 22},
              {UINT32_MAX, 1u << 22}};
  for (const auto& [megabytes, gigabytes] : rows) {
    EXPECT_EQ(GetUserCapacityInGB(megabytes), gigabytes) << megabytes;
  }
}

}  // namespace
}  // namespace NANDInfo
