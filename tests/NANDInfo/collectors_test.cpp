// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// MSP and storage statistics, disk information; and every collector with each call failing in turn.

#include <gtest/gtest.h>

#include <functional>

#include "base/Text.h"
#include "platform/DeviceProperties.h"
#include "platform/FileSystem.h"
#include "platform/testing/FaultInjector.h"
#include "support/FreshErrors.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using plist::Dictionary;
using support::kEmbedded, support::kQRT3, support::kZMCStorage, support::StorageDevice;
using Lines = std::vector<std::string>;

Dictionary justMessage(const char* text) { return {{"TLM_APIErrorMessage", text}}; }

// The calls of one MSP, answered with a buffer or not at all.
void mspStep(StorageDevice& device, std::uint32_t index, std::optional<std::uint64_t> version) {
  using support::records;
  auto& registry = device.registry;
  if (!version) {
    registry.script.push_back({"9 size 221/" + std::to_string(index), {1}});
  } else if (*version == 0) {
    registry.willTunnel(9, 221, index, {});
  } else {
    const auto& table = MSPTagTable();
    const auto row = std::find_if(table.begin(), table.end(), [](const MSPTag& tag) {
      return std::string_view(tag.name) == "fw_version_identifier";
    });
    // The first one has a counter that the others don't have.
    const std::uint16_t tag = index == 0 ? 0x1001 : 0xFFF;
    registry.willTunnel(
        9, 221, index,
        records({{row->tag, row->width, {*version}}, {0x1000, 4, {1234567}}, {tag, 4, {5}}}));
  }
}

TEST(MSPInfo, EachExchange) {
  constexpr std::uint64_t kVersion = 0x0004000300020001;
  // The failed probe of the MSP after the last is the first message.
  const char noSize[] =
      "executeTunnelCommand: DrvCallStructMethod failed while retrieving data size";
  const std::vector<std::optional<std::uint64_t>> ten(10, kVersion);
  const struct {
    const char* what;
    std::uint32_t answering;  // MSPs that answer the probe
    std::vector<std::optional<std::uint64_t>> second;
    std::size_t read;
    const char* message;
  } rows[] = {
      {"three", 3, {kVersion, kVersion, kVersion}, 3, noSize},
      {"all ten", 10, ten, 10, "Stat Magazine not supported"},
      {"one is empty", 3, {kVersion, 0}, 1, noSize},
      {"one has gone", 2, {kVersion, std::nullopt}, 1, noSize},
      {"none", 0, {}, 0, noSize},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(row.what);
    StorageDevice device(kQRT3);
    for (std::uint32_t i = 0; i < row.answering; ++i) mspStep(device, i, kVersion);
    if (row.answering < 10) mspStep(device, row.answering, std::nullopt);
    for (std::uint32_t i = 0; i < row.second.size(); ++i) mspStep(device, i, row.second[i]);
    device.registry.willTunnel(9, 13, 0, support::ftlBuffer({{"hostWrites", {7}}}));
    const Dictionary info = CopyWhitelistedNANDMSPInfo(device.platform, true);
    ASSERT_EQ(info.size(), row.read + 1);
    for (std::size_t i = 0; i < row.read; ++i) {
      const auto* msp = info.dictionary(std::to_string(i));
      ASSERT_NE(msp, nullptr);
      EXPECT_EQ(msp->number("passWithTmodeHard")->uint64Value(), 1200000u);
      EXPECT_EQ(msp->find("passWithTmodeFS1_2b") != nullptr, i == 0);
      EXPECT_EQ(msp->number("TLM_hostWrites")->uint64Value(), 7u);
      for (int part = 0; part < 4; ++part) {
        const auto key = "fw_version_identifier_" + std::to_string(part);
        EXPECT_EQ(msp->number(key)->int64Value(), part + 1);
      }
    }
    EXPECT_EQ(*info.text("TLM_APIErrorMessage"), row.message);
  }
}

TEST(MSPInfo, ControllersWithoutThem) {
  for (const char* const controller : {kEmbedded, kZMCStorage}) {
    StorageDevice device(controller);
    EXPECT_EQ(CopyWhitelistedNANDMSPInfo(device.platform, true),
              justMessage("gatherZMCMSPData: Controller does not support MSP data"));
  }
  StorageDevice missing;
  EXPECT_EQ(CopyWhitelistedNANDMSPInfo(missing.platform, true),
            justMessage("gatherZMCMSPData: Could not get nand_exporter_t"));
  StorageDevice handleless(kQRT3);
  handleless.registry.root->children[0].oddHandle = true;
  EXPECT_EQ(CopyWhitelistedNANDMSPInfo(handleless.platform, true),
            justMessage("gatherZMCMSPData: No io_connection exist"));
}

TEST(StorageStats, DerivedFieldsAndImages) {
  StorageDevice device(kZMCStorage);
  device.files.volumes["/private/var"] = {4096, 30000000, 10000000};
  device.setStatistics({{"hostWrites", {123456789012}}, {"averageTLCPECycles", {1234567}}});
  device.registry.add({.className = kEANClassName});
  std::uint64_t answer = 1234561;
  for (const EANQuery& query : EANQueries()) {
    const int method = query.figure == EANFigure::imageSize ? 3 : 7;
    device.registry.standing[base::format("%d(%u)", method, query.code)] = {.scalar = answer++};
  }
  const Dictionary derived{{"TLM_formatWeeksSince2000", 0},
                           {"TLM_DQ_Capacity_GB", 128},
                           {"TLM_averageTLCPECycles", 1234600},
                           {"TLM_hostWrites", 123456790000},
                           {"TLM_DQ_Diskfullness_BP", 6666}};
  const auto expect = [&](StorageDevice& on, bool hasDerived, bool hasImages, const char* text) {
    Dictionary expected = hasDerived ? derived : Dictionary();
    for (const EANQuery& query : EANQueries()) {
      const bool isSize = query.figure == EANFigure::imageSize;
      expected.set(query.key, !hasImages ? 0 : isSize ? 1234600 : 1235000);
    }
    expected.set("TLM_APIErrorMessage", text);
    EXPECT_EQ(CopyWhitelistedStorageStats(on.platform, true), expected);
  };
  expect(device, true, true, "Stat Magazine not supported");
  EXPECT_EQ(CopyWhitelistedStorageStats(device.platform, false)
                .number("EAN_updateCount_LowPowerEM")
                ->uint64Value(),
            1234569u);
  device.registry.root->children.pop_back();
  expect(device, true, false, "Stat Magazine not supported");
  StorageDevice missing;
  expect(missing, false, false, "gatherZMCFTLData: Could not get nand_exporter_t");
}

TEST(DiskInfo, FromTheFileSystemOrElseFromTheDevice) {
  constexpr std::int64_t kMB = 1 << 20;
  using Statistics = platform::FileSystem::Statistics;
  using Usage = platform::DeviceProperties::DiskUsage;
  const Usage usage{250000 * kMB + 5, 50000 * kMB, 40000 * kMB + kMB - 1};
  const struct {
    std::optional<Statistics> volume;
    std::optional<Usage> usage;
    std::uint64_t userMB, availableMB, fullness, capacity;
  } rows[] = {
      {Statistics{4096, 25600000, 6400000}, usage, 100000, 25000, 7500, 128},
      {Statistics{4096, 25600000, 0}, usage, 100000, 0, 10000, 128},
      {Statistics{1, std::uint64_t{1} << 62, 1}, usage, std::uint64_t{1} << 42, 0, 10000, 4194304},
      {Statistics{4096, 25600000, 25600000}, usage, 250000, 40000, 8000, 256},
      {Statistics{4096, 0, 0}, usage, 250000, 40000, 8000, 256},
      {std::nullopt, usage, 250000, 40000, 8000, 256},
      {std::nullopt, Usage{kMB - 1, kMB, 3 * kMB}, 0, 3, 0, 0},
      {std::nullopt, Usage{-kMB, -kMB, -kMB}, 0, 0, 0, 0},
      {std::nullopt, std::nullopt, 0, 0, 0, 0},
  };
  for (const auto& row : rows) {
    StorageDevice device;
    if (row.volume) device.files.volumes["/private/var"] = *row.volume;
    device.device.usage = row.usage;
    const Dictionary info = GetDiskInfo(device.platform);
    EXPECT_EQ(info.size(), 6u);
    EXPECT_EQ(info.number("TLM_UserCapacity_MB")->uint64Value(), row.userMB);
    EXPECT_EQ(info.number("TLM_DQ_AmountDataAvailable_MB")->uint64Value(), row.availableMB);
    for (const char* dq : {"TLM_DQ_", "TLM_"}) {
      EXPECT_EQ(info.number(std::string(dq) + "Diskfullness_BP")->uint64Value(), row.fullness);
      EXPECT_EQ(info.number(std::string(dq) + "Capacity_GB")->uint64Value(), row.capacity);
    }
  }
}

// Every collector with each of its calls failing in turn: it comes to an end, gives back every
// handle, and holds nothing but what it holds when all goes well, and what says that it didn't.
TEST(Collectors, AnyCallMayFail) {
  const struct {
    const char* name;
    std::function<Dictionary(const platform::AllServices& platform)> collect;
    int calls;  // at least
  } rows[] = {
      {"CopyNANDInfo", [](auto& p) { return *CopyNANDInfo(p); }, 6},
      {"CopyNANDInfoWithOptions", [](auto& p) { return *CopyNANDInfoWithOptions(p); }, 7},
      {"FTL", [](auto& p) { return *CopyWhitelistedNANDFTLInfo(p, true); }, 9},
      {"FTL keys", [](auto& p) { return *CopyNANDFTLInfo(p, true, true); }, 5},
      {"MSP", [](auto& p) { return CopyWhitelistedNANDMSPInfo(p, true); }, 20},
      {"storage", [](auto& p) { return CopyWhitelistedStorageStats(p, true); }, 40},
      {"freezer", [](auto& p) { return CopyVMFreezerNANDInfo(p); }, 1},
      {"servita", [](auto& p) { return CopyServitaNANDInfo(p); }, 5},
      {"lab", [](auto& p) { return CopyInternalLabNANDInfo(p); }, 5},
      {"ota", [](auto& p) { return CopyOTANANDInfo(p); }, 5},
      {"deletion",
       [](auto& p) {
         return Dictionary{{"", NandRecommendsContentDeletion(p)}};
       },
       5},
  };
  for (const char* const controller : {kQRT3, kZMCStorage}) {
    StorageDevice device(controller);
    device.setStatistics({{"hostWrites", {7}}, {"mspBootBlockCountPerMsp", {4}}});
    for (const std::uint32_t msp : {0U, 1U}) {
      device.registry.alwaysTunnels(9, 221, msp, support::records({{0x1000, 4, {1234567}}}));
    }
    device.registry.standing["5"] = device.registry.announce(1);
    device.registry.add({.className = kEANClassName});
    device.purgeableSpace.present = true;
    device.purgeableSpace.answer = {{"SPACEREAP_TOTAL_AVAILABLE", 5}};
    device.snapshots.snapshot = support::Bytes(64);
    device.clock.secondsSince1970 = 86400;
    device.kernel.integers["kern.bootsessionuuid"] = '0';
    platform::fakes::FaultInjector faults(device.platform);
    for (const auto& row : rows) {
      Dictionary whole;
      int calls = 0;
      for (int failing = 0; failing <= calls; ++failing) {
        SCOPED_TRACE(std::string(row.name) + " " + std::to_string(failing));
        support::freshErrors();
        faults.failAt(failing);
        const Dictionary result = row.collect(faults.platform());
        if (failing == 0) whole = result, calls = faults.calls();
        EXPECT_EQ(device.registry.problems(), Lines());
        EXPECT_EQ(result.find("TLM_APIErrorMessage") != nullptr,
                  whole.find("TLM_APIErrorMessage") != nullptr);
        for (const auto& [key, value] : result) {
          EXPECT_TRUE(whole.find(key) != nullptr || key.starts_with("com.norba.NANDInfo.Error"))
              << key;
        }
      }
      if (controller == kQRT3 && std::string_view(row.name) != "deletion") {
        EXPECT_GE(calls, row.calls) << row.name;
      }
    }
  }
}

}  // namespace
}  // namespace NANDInfo
