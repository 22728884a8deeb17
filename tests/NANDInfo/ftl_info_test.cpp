// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The FTL statistics: the exchange, the fields that are derived from them, the whitelist.

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <optional>

#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using plist::Dictionary, plist::Number;
using support::kQRT3, support::kZMCStorage, support::StorageDevice;

constexpr std::uint64_t kMany = ~std::uint64_t{0};

TEST(FTLInfo, GatheringByItsFailures) {
  const auto buffer = support::ftlBuffer({{"hostWrites", {7}}, {"magazineFWVersion", {1, 2, 3}}});
  const auto flags = [](Dictionary counters, int isQRT1, int hasMagazine) {
    counters.set("com.norba.NANDInfo.IsQRT1Controller", isQRT1);
    counters.set("com.norba.NANDInfo.IsStatMagSupported", hasMagazine);
    return counters;
  };
  const Dictionary named{{"hostWrites", 7},
                         {"magazineFWVersion_0", 1},
                         {"magazineFWVersion_1", 2},
                         {"magazineFWVersion_2", 3}};
  const Dictionary keys{{"Stat_4", 7}, {"Stat_680_0", 1}, {"Stat_680_1", 2}, {"Stat_680_2", 3}};
  const auto nothing = [](StorageDevice&) {};
  const auto loseHandle = [](StorageDevice& device) {
    device.registry.root->children[0].oddHandle = true;
  };
  const auto loseGetters = [](StorageDevice&) {
    nand_exporters_tunnel[0].getStatsSelectors = nullptr;
    nand_exporters_tunnel[0].getReadStatsSelectors = nullptr;
  };
  constexpr FTLParser byName = FTLParser::named;
  constexpr char noMagazine[] = "Stat Magazine not supported";
  constexpr char noGetter[] = "No getStatsSelectors exist";
  constexpr char noReadGetter[] = "No getReadStatsSelectors exist";
  const std::string failed = "gatherZMCFTLData: ";
  for (const bool statistics : {true, false}) {
    const struct {
      const char* controller;
      std::function<void(StorageDevice&)> prepare;
      FTLParser parser;
      std::optional<support::Bytes> answer;
      std::optional<Dictionary> counters;
      std::string message;
    } rows[] = {
        {kQRT3, nothing, byName, buffer, flags(named, 0, 1), "NA"},
        {kZMCStorage, nothing, byName, buffer, flags(named, 1, 1), "NA"},
        {kQRT3, nothing, FTLParser::statKey, buffer, flags(keys, 0, 0), noMagazine},
        {kQRT3, nothing, byName, support::Bytes(), {}, failed + "parseFTL failed"},
        {nullptr, nothing, byName, {}, {}, failed + "Could not get nand_exporter_t"},
        {kQRT3, loseHandle, byName, {}, {}, failed + "No io_connection exist"},
        {kQRT3, loseGetters, byName, {}, {}, failed + (statistics ? noGetter : noReadGetter)},
    };
    for (const auto& row : rows) {
      StorageDevice device(row.controller);
      row.prepare(device);
      if (row.answer) {
        device.registry.willTunnel(row.controller == kZMCStorage ? 8 : 9, statistics ? 13 : 10,
                                   statistics ? 0 : 24, *row.answer);
      }
      const auto source = statistics ? FTLSource::statistics : FTLSource::readStatistics;
      EXPECT_EQ(gatherZMCFTLData(device.platform, row.parser, source, 24), row.counters);
      EXPECT_EQ(GetAPIErrorMessage(), row.message);
    }
  }
}

// The derived fields of FTL counters: what there is of each, and what it comes to.
TEST(FTLInfo, DerivedFields) {
  StorageDevice device;
  const std::uint64_t negative = 0xFFFFFFFF;  // -1 in 32 bits
  const struct {
    Dictionary ftl, derived;
  } rows[] = {
      {{{"userPartitionStart", 9}}, {}},
      {{{"userPartitionStart", 9}, {"intermediatePartitionStart", 4}},
       {{"TLM_intermediatePartitionSize", 5}}},
      {{{"userPartitionStart", negative}, {"intermediatePartitionStart", INT32_MAX}},
       {{"TLM_intermediatePartitionSize", std::uint64_t{0} - 0x80000000}}},
      {{{"averageSLCPECycles", 1},
        {"averageTLCPECycles", 2},
        {"hostWrites", kMany},
        {"powerOnHours", 4},
        {"powerOnSeconds", 5}},
       {{"TLM_averageSLCPECycles", 1},
        {"TLM_averageTLCPECycles", 2},
        {"TLM_hostWrites", kMany},
        {"TLM_powerOnHours", 4},
        {"TLM_powerOnSeconds", 5}}},
      {{{"numBootBlockRefreshSuccess_0", 3},
        {"numBootBlockRefreshFail_0", 4},
        {"numBootBlockRefreshFail_7", 8},
        {"numBootBlockRefreshFail_8", 99}},
       {{"TLM_numBootBlockRefreshes_max", 8}}},
      {{{"numBootBlockRefreshSuccess_0", negative}, {"numBootBlockRefreshSuccess_1", negative - 1}},
       {{"TLM_numBootBlockRefreshes_max", 0}}},
      {{{"mspBootBlockCountPerMsp", 4},
        {"mspBootBlockReadFails_0", 1},
        {"mspBootBlockReadFails_1", 2},
        {"mspBootBlockReadFails_3", 4},
        {"mspBootBlockReadFails_4", 8},
        {"mspBootBlockReadFails_28", 16},
        {"mspBootBlockReadFails_31", 32},
        {"mspBootBlockReadFails_32", 64},
        {"mspBootBlockProgFails_4", 1},
        {"mspBootBlockProgFails_5", negative},
        {"mspBootBlockEraseFails_2", 7}},
       {{"TLM_mspBootBlockReadFails_main", 25},
        {"TLM_mspBootBlockReadFails_backup", 38},
        {"TLM_mspBootBlockProgFails_main", 1},
        {"TLM_mspBootBlockProgFails_backup", -1},
        {"TLM_mspBootBlockEraseFails_main", 0},
        {"TLM_mspBootBlockEraseFails_backup", 7}}},
      // Names beyond the largest number: they wrap around, and are found nowhere or twice.
      {{{"mspBootBlockCountPerMsp", kMany},
        {"mspBootBlockReadFails_0", 1},
        {"mspBootBlockReadFails_1", 2}},
       {{"TLM_mspBootBlockReadFails_main", 1}, {"TLM_mspBootBlockReadFails_backup", 9}}},
  };
  for (const auto& row : rows) {
    const auto derived = gatherZMCFTLOtherData(device.platform, &row.ftl);
    for (const auto& [key, value] : row.derived) {
      const auto* found = derived.find(key);
      EXPECT_TRUE(found != nullptr && *found == value) << key << ": " << description(found);
    }
    for (const char* key : {"TLM_intermediatePartitionSize", "TLM_averageSLCPECycles",
                            "TLM_averageTLCPECycles", "TLM_hostWrites", "TLM_powerOnHours",
                            "TLM_powerOnSeconds", "TLM_mspBootBlockReadFails_main"}) {
      EXPECT_EQ(derived.find(key) != nullptr, row.derived.find(key) != nullptr) << key;
    }
    EXPECT_NE(derived.find("TLM_numBootBlockRefreshes_max"), nullptr);
    EXPECT_EQ(derived.number("TLM_storeDemoMode")->type(), Number::Type::int32);
  }
  EXPECT_EQ(gatherZMCFTLOtherData(device.platform, nullptr).size(), 7u);
  EXPECT_STREQ(GetAPIErrorMessage(), "gatherZMCFTLOtherData: ftlDict is NULL");
}

TEST(FTLInfo, PurgeableSpaceAsFarAsKnown) {
  const Dictionary answer{{"SPACEREAP_TOTAL_AVAILABLE", 5}, {"SPACEREAP_NONPURGEABLE_AMOUNT", 6}};
  Dictionary failed = answer, half = answer;
  failed.set("com.norba.NANDInfo.Spacereap.Error", 1);
  half.remove("SPACEREAP_TOTAL_AVAILABLE");
  const Dictionary nonPurgeable{{"TLM_Spacereap_totalNonPurgeable", 6}};
  Dictionary all = nonPurgeable;
  all.set("TLM_Spacereap_totalPurgeable", 5);
  const char none[] =
      "getSpacereapInfo: unable to get output from SpacereapCopyItemizedPurgeableSpaceWithInfo";
  const struct {
    bool present;
    std::optional<Dictionary> answer;
    Dictionary info;
    const char* message;
  } rows[] = {{true, answer, all, "NA"},      {true, half, nonPurgeable, "NA"},
              {true, failed, {}, "NA"},       {true, Dictionary(), {}, "NA"},
              {true, std::nullopt, {}, none}, {false, answer, {}, "NA"}};
  for (const auto& row : rows) {
    StorageDevice device;
    device.purgeableSpace.present = row.present;
    device.purgeableSpace.answer = row.answer;
    EXPECT_EQ(getSpacereapInfo(device.platform), row.info);
    EXPECT_STREQ(GetAPIErrorMessage(), row.message);
  }
}

TEST(FTLInfo, WhitelistedAndWhole) {
  StorageDevice device(kQRT3);
  device.setStatistics({{"hostWrites", {123456789012}}, {"magazineFWVersion", {1, 2, 3}}});
  const auto plain = CopyWhitelistedNANDFTLInfo(device.platform, false);
  const auto rounded = CopyWhitelistedNANDFTLInfo(device.platform, true);
  EXPECT_EQ(plain->number("TLM_hostWrites")->uint64Value(), 123456789012u);
  EXPECT_EQ(rounded->number("TLM_hostWrites")->uint64Value(), 123456790000u);
  for (const auto& [key, value] : *plain) {
    EXPECT_TRUE(key == "TLM_APIErrorMessage" ||
                WhitelistedRawNANDFTLCounters_SigDigDict().contains(key))
        << key;
  }
  EXPECT_EQ(*plain->text("TLM_APIErrorMessage"), "NA");
  EXPECT_EQ(CopyNANDFTLInfo(device.platform, true, false), std::nullopt);
  EXPECT_EQ(CopyWhitelistedNANDFTLCountersInfo(), std::nullopt);
  const auto whole = CopyNANDFTLInfo(device.platform, false, true);
  EXPECT_EQ(whole->number("hostWrites")->uint64Value(), 123456789012u);
  EXPECT_EQ(*whole->text("TLM_APIErrorMessage"), "NA");
  EXPECT_NE(CopyNANDFTLInfo(device.platform, true, true)->find("Stat_4"), nullptr);
}

}  // namespace
}  // namespace NANDInfo
