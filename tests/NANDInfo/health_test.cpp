// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The health figures and their three subsets.

#include <gtest/gtest.h>

#include "support/StorageDevice.h"

#include <cstdint>
#include <initializer_list>

namespace NANDInfo {
namespace {

using plist::Dictionary;
using support::kQRT3, support::kZMCStorage, support::StorageDevice;

constexpr std::uint64_t kNegative = 0xFFFFFFFF;  // in 32 bits
constexpr std::uint64_t kNegative64 = ~std::uint64_t{0};

struct Figures {
  std::int64_t used, e2e, reads, bad = -1, spare = -1, dies = -1;
};

const struct {
  const char* controller;
  support::FTLFields fields;
  Figures figures;
  bool retirable = false;
} kRows[] = {
    {kQRT3, {{"hostWrites", {1}}}, {0, 0, 0}},
    {kQRT3,
     {{"fwUpdatesPercentUsed", {kNegative}}, {"slcPercentUsed", {12}}, {"percentUsed", {11}}},
     {12, 0, 0}},
    {kQRT3, {{"E2EDPErrorCounters", {kNegative64, 2, 3, 4, 9, 5, 6, 7, 8, 1, 1, 10}}}, {0, 10, 0}},
    {kQRT3, {{"ueccReads", {7}}, {"raidSmartErrors", {8}}}, {0, 0, 8}},
    {kQRT3, {{"ueccReads", {7}}, {"raidSmartErrors", {kNegative64}}}, {0, 0, 0}},
    // All but these two are read as the 64-bit numbers that they are.
    {kQRT3,
     {{"percentUsed", {0x1'0000'0002}},
      {"E2EDPErrorCounters", {0, 0x1'0000'0003, 0, 0, 0, 0, 0, 0, 0, 0, 0, 0}},
      {"raidSmartErrors", {kNegative}},
      {"numGrownBad", {0x1'0000'0005}},
      {"spareAvailablePercent", {0x1'0000'0006}},
      {"numDieFailures", {0x1'0000'0007}}},
     {2, 4294967299, 4294967295, 4294967301, 4294967302, 4294967303}},
    {kZMCStorage, {{"ueccReads", {0x1'0000'0004}}}, {0, 0, 4}},
    {kZMCStorage, {{"ueccReads", {7}}, {"raidSmartErrors", {8}}}, {0, 0, 7}},
    {kZMCStorage, {{"ueccReads", {kNegative}}}, {0, 0, 0}},
    {kQRT3,
     {{"numGrownBad", {3}},
      {"spareAvailablePercent", {100}},
      {"numDieFailures", {0}},
      {"percentUsed", {99}}},
     {99, 0, 0, 3, 100, 0}},
    {kQRT3, {{"spareAvailablePercent", {99}}}, {0, 0, 0, -1, 99}, true},
    {kQRT3, {{"spareAvailablePercent", {100}}, {"percentUsed", {100}}}, {100, 0, 0, -1, 100}, true},
    {kQRT3, {{"percentUsed", {100}}}, {100, 0, 0}},
};

Dictionary prefixed(std::initializer_list<std::pair<const char*, std::int64_t>> entries) {
  Dictionary dictionary;
  for (const auto& [key, value] : entries) {
    dictionary.set(std::string(kNANDHealthInfoPrefix) + key, value);
  }
  return dictionary;
}

TEST(HealthInfo, EachConsumerGetsItsFigures) {
  for (const auto& [controller, fields, f, retirable] : kRows) {
    SCOPED_TRACE(fields.front().first);
    StorageDevice device(controller);
    device.setStatistics(fields);
    const Dictionary all = gatherNANDHealthInfo(device.platform);
    EXPECT_EQ(all, prefixed({{"MaxPercentageNANDUsed", f.used},
                             {"MaxE2EErrors", f.e2e},
                             {"HostReadErrors", f.reads},
                             {"NumGrownBadBlocks", f.bad},
                             {"SpareAvailablePercent", f.spare},
                             {"NumDieFailures", f.dies}}));
    for (const auto& [key, value] : all) {
      EXPECT_EQ(value.as<plist::Number>()->type(), plist::Number::Type::int64) << key;
    }
    const auto common = prefixed({{"MaxPercentageNANDUsed", f.used},
                                  {"HostReadErrors", f.reads},
                                  {"MaxE2EErrors", f.e2e},
                                  {"NumGrownBadBlocks", f.bad}});
    EXPECT_EQ(CopyOTANANDInfo(device.platform), common);
    Dictionary servita = common, lab = common;
    servita.set(kNANDHealthInfoNumDieFailures, f.dies);
    lab.set(kNANDHealthInfoSpareAvailablePercent, f.spare);
    lab.set(kNANDHealthInfoIsNANDRetirable, retirable ? 1 : 0);
    for (Dictionary* subset : {&servita, &lab}) {
      subset->set("TLM_APIErrorMessage", "Stat Magazine not supported");
    }
    EXPECT_EQ(CopyServitaNANDInfo(device.platform), servita);
    EXPECT_EQ(CopyInternalLabNANDInfo(device.platform), lab);
  }
}

TEST(HealthInfo, WithoutAController) {
  StorageDevice device;
  const char text[] = "gatherZMCFTLData: Could not get nand_exporter_t";
  EXPECT_TRUE(gatherNANDHealthInfo(device.platform).empty());
  EXPECT_TRUE(CopyOTANANDInfo(device.platform).empty());
  EXPECT_EQ(CopyServitaNANDInfo(device.platform), (Dictionary{{"TLM_APIErrorMessage", text}}));
  EXPECT_EQ(CopyInternalLabNANDInfo(device.platform),
            (Dictionary{{"com.norba.NANDInfo.Health.IsNANDRetirable", 0},
                        {"TLM_APIErrorMessage", text}}));
}

}  // namespace
}  // namespace NANDInfo
