// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The basic dictionary: its keys, the fields that make one, the exchange, and its days.

#include <gtest/gtest.h>

#include "support/StorageDevice.h"

#include <cstdint>
#include <optional>

namespace NANDInfo {
namespace {

using plist::Dictionary, plist::Number;
using support::kZMCStorage, support::StorageDevice;

constexpr char kPrefix[] = "com.norba.NANDInfo.";
constexpr std::uint64_t kMany = ~std::uint64_t{0};

// A context of the legacy form, from fields.
LegacyNandInfoCxt contextOf(const support::Fields& fields) {
  LegacyNandInfoCxt context;
  for (const auto& [name, value] : fields) {
    AddSingleValueToGenericContext(&context.fields, "", name, value);
  }
  return context;
}

// From a buffer with every key that there is; without memory the fixed fields are there all the
// same.
TEST(BasicInfo, EveryFixedFieldHasItsKeyAndType) {
  constexpr auto int32 = Number::Type::int32, int64 = Number::Type::int64;
  constexpr std::uint64_t kFirst = 0x8000'0000'8000'0000;
  std::vector<std::uint64_t> buffer;
  for (const FTLKey& row : FTLKeyTable()) {
    buffer.push_back(support::header(row.key, row.elements));
    for (std::uint64_t i = 0; i < row.elements; ++i) buffer.push_back(kFirst + row.key + i);
  }
  support::RefusingMemory memory;
  LegacyNandInfoCxt context{.fields = GenericParserCxt(&memory)};
  EXPECT_TRUE(ZMCParseBufferToCxt(&context, support::words(buffer)));
  EXPECT_TRUE(context.fields.empty());
  EXPECT_EQ(std::exchange(context.utilFormatTime, 0), kFirst + 56);

  StorageDevice device;
  device.preferences.setMobile("com.norba.demo-settings", "StoreDemoMode", true);
  // In the order in which they are set, each with its key in the buffer or its value.
  const struct {
    const char* key;
    Number::Type type;
    std::uint32_t from;
    std::int64_t value = 0;
  } rows[] = {{"ExportVersion", int32, 53},
              {"DriverVersion", int32, 0, -1},
              {"DemoMode", int64, 0, 1},
              {"NumVirtualBlocks", int32, 52},
              {"PagesPerVirtualBlock", int32, 50},
              {"BytesPerPage", int32, 49},
              {"NumLogicalReads", int64, 7},
              {"NumLogicalWrites", int64, 4},
              {"NumFreeVirtualBlocks", int64, 48},
              {"NumWearLevelOps", int64, 17},
              {"NumPhysicalReads", int64, 19},
              {"NumPhysicalWrites", int64, 18},
              {"NumPhysicalErases", int64, 20},
              {"NodesFree", int64, 12},
              {"NodesTotal", int64, 13},
              {"NumSleepOps", int64, 28},
              {"HighEnduranceBlockEraseCount", int64, 45},
              {"BlocksPerVirtualBlock", int32, 51},
              {"formatDaysSince2000", int64, 0},
              {"ReadsBeforeErasure0", int64, 265},
              {"ReadsBeforeErasure50000", int64, 266},
              {"ReadsBeforeErasure100000", int64, 267},
              {"ReadsBeforeErasure150000", int64, 268},
              {"ReadsBeforeErasure200000", int64, 269},
              {"NumMaintenanceRequests", int64, 0},
              {"MaintenanceRequestsFailedRead", int64, 0},
              {"MaintenanceRequestsFailedProg", int64, 0},
              {"MaintenanceRequestsFailedErase", int64, 0}};
  const Dictionary info = buildLegacyNANDInfoDict(device.platform, context, false);
  ZMCReleaseContext(&context);
  const Dictionary none = buildLegacyNANDInfoDict(device.platform, context, false);
  ASSERT_EQ(info.size(), std::size(rows));
  for (std::size_t i = 0; i < std::size(rows); ++i) {
    const auto& [key, type, from, value] = rows[i];
    const auto* entry = info.begin() + i;
    const std::int64_t least = type == int32 ? INT32_MIN : INT64_MIN + (std::int64_t{1} << 31);
    EXPECT_EQ(entry->key, std::string(kPrefix) + key);
    EXPECT_EQ(entry->value, plist::Value(from != 0 ? least + from : value)) << key;
    EXPECT_EQ(entry->value.as<Number>()->type(), type) << key;
    EXPECT_EQ(none.number(entry->key)->int64Value(), i == 2 ? 1 : 0) << key;
  }
  EXPECT_EQ(buildLegacyNANDInfoDict(device.platform, context, true).size(), info.size() - 3);
}

TEST(BasicInfo, SeveralFieldsMakeOne) {
  const std::string user = "userPartitionStart", middle = "intermediatePartitionStart",
                    success = "numBootBlockRefreshSuccess", failure = "numBootBlockRefreshFail",
                    read = "mspBootBlockReadFail", program = "mspBootBlockProgFail";
  constexpr char size[] = "IntermediatePartitionSize";
  const struct {
    support::Fields fields;
    const char* key;
    std::optional<std::int64_t> value;
  } rows[] = {
      {{{user, 50}, {middle, 8}}, size, 42},
      {{{middle, 8}, {user, 1}}, size, -7},
      {{{user, 50}}, size, std::nullopt},
      {{{user, 50}, {middle, 0xFFFFFFFF}}, size, std::nullopt},
      {{{success + "0", 3}, {failure + "0", 4}, {failure + "1", 9}}, "NumMaintenanceRequests", 7},
      {{{success + "0", kMany}, {failure + "0", 3}}, "NumMaintenanceRequests", 2},
      {{{read + "0", 9}, {read + "1", 0}, {read + "2", 1}, {read + "3", 1}, {read + "20", 1}},
       "MaintenanceRequestsFailedRead",
       2},
      {{{program + "1", 9}, {read + "0", 0}}, "MaintenanceRequestsFailedProg", 1},
      {{{"mspBootBlockEraseFail2", 9}, {program + "1", 1}}, "MaintenanceRequestsFailedErase", 1},
      {{{"maxMemLowDuration", 123456}}, "maxMemExtremeDuration", 123000},
      {{{"maxMemLowDuration", 0x100000000 + 99950}}, "maxMemExtremeDuration", 100000},
      {{{"maxMemChokeDuration", 123456}}, "maxMemChokeDuration", 123000},
      {{{"memChokeDuration", 123456}}, "memChokeDuration", 123456},
      {{{"ueccReads", kMany}, {"ueccReads", 5}}, "ueccReads", 5},
      {{{"noCounter", 1}}, "noCounter", std::nullopt},
  };
  StorageDevice device;
  for (const auto& row : rows) {
    SCOPED_TRACE(row.fields.front().first);
    const auto info = buildLegacyNANDInfoDict(device.platform, contextOf(row.fields), false);
    const auto* number = info.number(std::string(kPrefix) + row.key);
    ASSERT_EQ(number != nullptr, row.value.has_value());
    if (number != nullptr) {
      EXPECT_EQ(number->int64Value(), *row.value);
    }
  }
}

TEST(BasicInfo, WeeksSinceTheFormat) {
  constexpr std::uint64_t kYear2000 = 946684800, kWeek = 604800;
  const std::pair<std::uint64_t, std::int64_t> rows[] = {{0, 0},
                                                         {kYear2000 - 1, 0},
                                                         {kYear2000 + kWeek - 1, 0},
                                                         {kYear2000 + kWeek, 1},
                                                         {kYear2000 + 1000 * kWeek, 1000}};
  StorageDevice device;
  for (const auto& [time, weeks] : rows) {
    LegacyNandInfoCxt context;
    context.utilFormatTime = time;
    const auto info = buildLegacyNANDInfoDict(device.platform, context, true);
    EXPECT_EQ(info.number("com.norba.NANDInfo.formatDaysSince2000")->int64Value(), weeks);
    const Dictionary ftl{{"utilFormatTime", time}};
    EXPECT_EQ(gatherZMCFTLOtherData(device.platform, &ftl)
                  .number("TLM_formatWeeksSince2000")
                  ->int64Value(),
              weeks);
  }
}

TEST(BasicInfo, TheExchange) {
  const Dictionary error{{"com.norba.NANDInfo.Error", "1"},
                         {"com.norba.NANDInfo.ErrorMessage", "Unable to parse buffer"}};
  StorageDevice missing;
  EXPECT_EQ(CopyNANDInfo(missing.platform), error);

  StorageDevice device(kZMCStorage);
  device.registry.willTunnel(8, 13, 0, support::ftlBuffer({{"hostWrites", {77}}}));
  device.purgeableSpace.present = true;
  device.purgeableSpace.answer = {{"SPACEREAP_TOTAL_AVAILABLE", 5.5},
                                  {"SPACEREAP_NONPURGEABLE_AMOUNT", "6"}};
  const auto info = CopyNANDInfo(device.platform);
  EXPECT_EQ(info->number("com.norba.NANDInfo.NumLogicalWrites")->int64Value(), 77);
  EXPECT_EQ(info->number("com.norba.NANDInfo.Spacereap.TotalPurgeableBytes")->doubleValue(), 5.5);
  EXPECT_EQ(*info->text("com.norba.NANDInfo.Spacereap.TotalNonPurgeableBytes"), "6");
  EXPECT_EQ(device.purgeableSpace.lastQuery, (Dictionary{{"SPACEREAP_VOLUME", "/private/var"}}));
  device.registry.willTunnel(8, 13, 0, {});
  EXPECT_EQ(CopyNANDInfo(device.platform), error);
}

// A boot session's identifier and the day; half the days belong to the analytics sink.
TEST(BasicInfo, EveryOtherDayItIsEmpty) {
  const struct {
    std::optional<char> first;
    double seconds;
    bool toSink;
  } rows[] = {{'0', 0, true},      {'0', 86399, true},       {'0', 86400, false},
              {'1', 86400, true},  {'9', 86400, true},       {'A', 0, true},
              {'B', 86400, true},  {'F', 2 * 86400., false}, {'a', 86400, false},
              {'b', 86400, false}, {'G', 0, true},           {std::nullopt, 0, false}};
  for (const auto& row : rows) {
    StorageDevice device(kZMCStorage);
    device.setStatistics({{"hostWrites", {77}}});
    device.clock.secondsSince1970 = row.seconds;
    if (row.first) {
      device.kernel.integers["kern.bootsessionuuid"] = static_cast<std::uint64_t>(*row.first);
    }
    EXPECT_EQ(NandInfoShouldLogAllToEV(device.platform), row.toSink);
    EXPECT_EQ(CopyNANDInfoWithOptions(device.platform)->empty(), row.toSink);
    EXPECT_EQ(device.registry.calls.empty(), row.toSink);
    EXPECT_EQ(device.log.count("default: NANDInfo: CopyNANDInfoWithOptions: "), row.toSink ? 0 : 2);
  }
}

}  // namespace
}  // namespace NANDInfo
