// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The stats magazine: its arithmetic by hand-computed cases, then whole windows over a controller
// that lacks one snapshot or the other.

#include "NANDInfo/Magazine.h"

#include <gtest/gtest.h>

#include "NANDInfo/collect/MagazineDeltas.h"
#include "support/FreshErrors.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using plist::Dictionary;
using support::FTLFields, support::StorageDevice;
using u64 = std::uint64_t;

constexpr u64 kDay = 86400;

std::string textOf(const Dictionary& dictionary) {
  std::string text;
  for (const auto& [key, value] : dictionary) {
    text += key.substr(key.rfind('.') + 1) + "=" + description(value) + " ";
  }
  return text;
}

TEST(AveragePECycles, NeedAllThreeAndReplaceWhatIsThere) {
  const Dictionary statistics{{"numVirtualBlocks", u64{20}},
                              {"userPartitionStart", u64{8}},
                              {"intermediatePartitionStart", u64{6}}};
  const struct {
    Dictionary window, statistics;
    const char* averages;  // what is there afterwards
  } rows[] = {
      {{{"averageTLCPECycles", 7}, {"bandErases", 30.0}}, statistics, "averageTLCPECycles=2.5 "},
      {{{"intermediateBandErases", 3.0}}, statistics, "averageSLCPECycles=1.5 "},
      {{{"averageSLCPECycles", 7}}, statistics, "averageSLCPECycles=7 "},
      {{{"bandErases", 30.0}, {"intermediateBandErases", 3.0}}, {}, ""},
      {{{"bandErases", 30.0}, {"intermediateBandErases", 3.0}},
       {{"numVirtualBlocks", u64{8}},
        {"userPartitionStart", u64{8}},
        {"intermediatePartitionStart", u64{9}}},
       "averageTLCPECycles=0 averageSLCPECycles=-3 "}};
  for (auto [window, given, averages] : rows) {
    setAveragePECycles(window, given);
    window.remove("bandErases");
    window.remove("intermediateBandErases");
    EXPECT_EQ(textOf(window), averages);
  }
}

TEST(WriteAmplification, IsOfTheBucketThatGainsABand) {
  const u64 minus = static_cast<u64>(-1);
  const struct {
    u64 newerWrites, olderWrites;
    std::vector<std::pair<int, u64>> curve;
    int bucket;  // 0: the number 0
    double seconds = 1;
  } rows[] = {{6, 5, {{1, 2}}, 1},
              {6, 5, {{1, 1}, {2, 1}}, 2},
              {6, 5, {{0, 1000}, {31, 1000}}, 32},
              {6, 5, {{30, 99}}, 32},
              {6, 5, {{30, 101}}, 30},
              {6, 5, {{1, minus}, {2, 2}}, 32},
              {6, 5, {{1, minus}, {2, 3}}, 2},
              {minus, 0, {{1, 2}}, 1},
              {5, 5, {{1, 2}}, 0},
              {6, 5, {{1, 2}}, 0, 0},
              {6, 5, {{1, 2}}, 0, -1}};
  for (const auto& [newerWrites, olderWrites, curve, bucket, seconds] : rows) {
    Dictionary newer{{"gcWrites", newerWrites}, {kTLM_magazineTimeStamp, 100 + seconds}},
        older{{"gcWrites", olderWrites}, {kTLM_magazineTimeStamp, u64{100}}};
    for (const auto& [place, value] : curve) older.set("vcurve_" + std::to_string(place), value);
    const auto result = instantaneousWriteAmplification(newer, older);
    EXPECT_EQ(result, plist::Value(bucket == 0 ? 0.0 : 1.0 / (1.0 - 0.033 * bucket)))
        << newerWrites << " " << bucket;
  }
}

// The time is in the middle of it.
u64 metaAt(u64 time) { return u64{0xAB} << 56 | time << 24 | 0xABCDEF; }

FTLFields snapshotAt(u64 time, FTLFields counters, bool hasMagazine = true) {
  counters.push_back({"magazineInstanceMeta", {metaAt(time)}});
  if (hasMagazine) counters.push_back({"magazineFWVersion", {1, 2, 3}});
  return counters;
}

TEST(Magazine, ReportsAWindowAsFarAsItsSnapshotsGo) {
  const FTLFields early{{"hostWrites", {100}}, {"coldestCycle", {5, 6}}, {"bandErases", {10}}};
  const FTLFields late{{"hostWrites", {250}}, {"coldestCycle", {7, 8}}, {"bandErases", {70}}};
  const FTLFields statistics{
      {"numVirtualBlocks", {20}}, {"userPartitionStart", {8}}, {"magazineFWVersion", {1, 2, 3}}};
  const auto older = snapshotAt(kDay, early), newer = snapshotAt(2 * kDay + kDay / 2, late);
  FTLFields noMeta = late;
  noMeta.push_back({"magazineFWVersion", {1, 2, 3}});
  const std::string values = "hostWrites=100 coldestCycle_0=5 coldestCycle_1=6 bandErases=10 ";
  const std::string rest =
      "magazineInstanceMeta=" + std::to_string(metaAt(kDay)) +
      " magazineFWVersion_0=1 magazineFWVersion_1=2 magazineFWVersion_2=3 IsQRT1Controller=1 "
      "TLM_magazineTimeStamp=86400 averageTLCPECycles=0.8333333333333334 ";
  const auto bare = snapshotAt(kDay / 2, late, false);
  const struct {
    std::optional<FTLFields> newer, older, statistics;
    std::uint32_t deltaFlag, mode;
    std::string result;
    const char* message = "NA";
  } rows[] = {
      {newer, older, statistics, 1, 2,
       "1 TLM_SM_deltaDays=1.5 hostWrites=150 coldestCycle_0=5 coldestCycle_1=6 bandErases=60 "
       "averageTLCPECycles=5 "},
      {newer, older, statistics, 1, 0,
       "1 TLM_SM_deltaDays=1.5 hostWrites=150 bandErases=60 averageTLCPECycles=5 "},
      {newer, older, statistics, 1, 1, "1 TLM_SM_deltaDays=1.5 coldestCycle_0=5 coldestCycle_1=6 "},
      {newer, older, statistics, 1, 3, "1 TLM_SM_deltaDays=1.5 "},
      {newer, older, {}, 0, 2, "1 TLM_SM_deltaDays=1.5 " + values, "executeTunnelCommand"},
      {snapshotAt(kDay, late), older, statistics, 1, 2,
       "1 TLM_SM_deltaDays=0 " + values + "averageTLCPECycles=0.8333333333333334 "},
      {bare, older, {}, 1, 2, "0 TLM_SM_deltaDays=-0.5 " + values, "Stat Magazine not supported"},
      {noMeta, older, statistics, 1, 2, "1 ",
       "CopyWhitelistedNANDFTLInfo: Unable to gather other stats magazine deltas"},
      {{}, older, statistics, 1, 0, "1 " + values + rest, "executeTunnelCommand"},
      {newer, {}, statistics, 1, 2, "1 ", "executeTunnelCommand"},
      {{}, {}, statistics, 1, 2, "0 ", "executeTunnelCommand"}};
  for (const auto& row : rows) {
    SCOPED_TRACE(row.result);
    StorageDevice device(support::kZMCStorage);
    if (row.newer) device.setSnapshot(0, *row.newer);
    if (row.older) device.setSnapshot(24, *row.older);
    if (row.statistics) device.setStatistics(*row.statistics);
    Dictionary result =
        CopySMagNANDFTLInfo(device.platform, (u64{1} << 32) + 24, row.deltaFlag, row.mode);
    EXPECT_TRUE(result.text(kTLM_APIErrorMessage)->starts_with(row.message))
        << *result.text(kTLM_APIErrorMessage);

    // The derived fields are the collector's business, but none is missing.
    const Dictionary ftl{{"hostWrites", u64{250}}};
    for (const auto& [key, value] :
         gatherZMCFTLOtherData(device.platform, row.newer ? &ftl : nullptr)) {
      EXPECT_EQ(result.find(key) != nullptr ? *result.find(key) : "none", value) << key;
      result.remove(key);
    }
    result.remove(kTLM_APIErrorMessage);
    if (row.newer) {
      EXPECT_TRUE(!result.number("hostWrites") || result.number("hostWrites")->isReal());
      EXPECT_FALSE(result.number("coldestCycle_0") && result.number("coldestCycle_0")->isReal());
    }
    EXPECT_EQ(textOf(result), "IsStatMagSupported=" + row.result);
  }
}

TEST(Magazine, WalksSixWindowsOfFourHours) {
  StorageDevice device(support::kZMCStorage);
  std::vector<u64> curve(32);
  curve[1] = 2;
  const struct {
    std::uint32_t hours;
    FTLFields counters;
  } snapshots[] = {{0, {{"gcWrites", {100}}}},
                   {4, {{"gcWrites", {95}}, {"vcurve", curve}}},
                   {8, {{"gcWrites", {95}}, {"vcurve", curve}}},
                   {12, {{"gcWrites", {98}}, {"vcurve", curve}}},
                   {16, {{"gcWrites", {97}}}},
                   {24, {{"gcWrites", {1}}, {"vcurve", curve}}}};
  for (const auto& [hours, counters] : snapshots) {
    device.setSnapshot(hours, snapshotAt(kDay - hours * 3600, counters));
  }
  const Dictionary expected{{kTLM_instantaneous_gc_wamp_array[0], 1.0 / 0.967},
                            {kTLM_instantaneous_gc_wamp_array[1], 0},
                            {kTLM_instantaneous_gc_wamp_array[2], 0},
                            {kTLM_instantaneous_gc_wamp_array[3], 1.0 / (1.0 - 0.033 * 32)},
                            {kTLM_instantaneous_gc_wamp_array[4], 0},
                            {kTLM_instantaneous_gc_wamp_array[5], 0}};
  EXPECT_EQ(textOf(CopySMagNANDFTLCustomHistoryInfo(device.platform, 0)), textOf(expected));
  std::string asked;
  for (const std::string& call : device.registry.calls) {
    if (call.starts_with("8 size ")) asked += call.substr(7) + " ";
  }
  EXPECT_EQ(asked, "10/0 10/4 10/8 10/12 10/16 10/20 10/24 ");

  EXPECT_EQ(CopySMagNANDFTLCustomHistoryInfo(device.platform, 1), Dictionary());
  device.setSnapshot(0, snapshotAt(kDay, {}, false));
  support::freshErrors();
  for (const std::uint32_t skips : {0U, 1U}) {
    EXPECT_EQ(CopySMagNANDFTLCustomHistoryInfo(device.platform, skips),
              (Dictionary{{kNANDInfoErrorMessageKey, "Stat Magazine not supported"}}));
  }

  StorageDevice bare;
  EXPECT_EQ(CopySMagNANDFTLCustomHistoryInfo(bare.platform, 0).size(), 6u);
}

}  // namespace
}  // namespace NANDInfo
