// The basic dictionary: its keys, the fields that make one, the exchange, and its days.

#include <gtest/gtest.h>

#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using platform::Dictionary;
using platform::Number;
using support::kZMCStorage;
using support::StorageDevice;
using Lines = std::vector<std::string>;

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

TEST(BasicInfo, EveryFieldHasItsKeyAndType) {
  StorageDevice device;
  device.preferences.setMobile("com.norba.demo-settings", "StoreDemoMode", true);
  LegacyNandInfoCxt context;
  std::uint32_t next = 0xFFFFFF00;
  for (auto field : {&LegacyNandInfoCxt::exportVersion, &LegacyNandInfoCxt::driverVersion,
                     &LegacyNandInfoCxt::numVirtualBlocks, &LegacyNandInfoCxt::pagesPerVirtualBlock,
                     &LegacyNandInfoCxt::bytesPerPage, &LegacyNandInfoCxt::blocksPerVirtualBlock}) {
    context.*field = next++;
  }
  std::uint64_t value = std::uint64_t{1} << 63;
  for (auto field : {&LegacyNandInfoCxt::hostReads, &LegacyNandInfoCxt::hostWrites,
                     &LegacyNandInfoCxt::numFreeVirtualBlocks, &LegacyNandInfoCxt::wearLevMoves,
                     &LegacyNandInfoCxt::nandReads, &LegacyNandInfoCxt::nandWrites,
                     &LegacyNandInfoCxt::bandErases, &LegacyNandInfoCxt::IND_pool_free,
                     &LegacyNandInfoCxt::IND_pool_count, &LegacyNandInfoCxt::numSleepOps,
                     &LegacyNandInfoCxt::maxHighEnduranceBlockErases}) {
    context.*field = value++;
  }
  context.readCountHisto = {value, value + 1, value + 2, value + 3, value + 4};

  // In the order in which they are set, each with its value's distance from the first one's.
  const struct {
    std::vector<const char*> keys;
    std::int64_t first;
    Number::Type type;
  } groups[] = {
      {{"ExportVersion", "DriverVersion"}, -256, Number::Type::int32},
      {{"DemoMode"}, 1, Number::Type::int64},
      {{"NumVirtualBlocks", "PagesPerVirtualBlock", "BytesPerPage"}, -254, Number::Type::int32},
      {{"NumLogicalReads", "NumLogicalWrites", "NumFreeVirtualBlocks", "NumWearLevelOps",
        "NumPhysicalReads", "NumPhysicalWrites", "NumPhysicalErases", "NodesFree", "NodesTotal",
        "NumSleepOps", "HighEnduranceBlockEraseCount"},
       INT64_MIN,
       Number::Type::int64},
      {{"BlocksPerVirtualBlock"}, -251, Number::Type::int32},
      {{"formatDaysSince2000"}, 0, Number::Type::int64},
      {{"ReadsBeforeErasure0", "ReadsBeforeErasure50000", "ReadsBeforeErasure100000",
        "ReadsBeforeErasure150000", "ReadsBeforeErasure200000"},
       INT64_MIN + 11,
       Number::Type::int64},
      {{"NumMaintenanceRequests"}, 0, Number::Type::int64},
      {{"MaintenanceRequestsFailedRead"}, 0, Number::Type::int64},
      {{"MaintenanceRequestsFailedProg"}, 0, Number::Type::int64},
      {{"MaintenanceRequestsFailedErase"}, 0, Number::Type::int64},
  };
  const Dictionary info = buildLegacyNANDInfoDict(device.platform, context, false);
  const auto* entry = info.begin();
  for (const auto& group : groups) {
    for (std::size_t i = 0; i < group.keys.size(); ++i, ++entry) {
      ASSERT_NE(entry, info.end());
      EXPECT_EQ(entry->key, std::string(kPrefix) + group.keys[i]);
      const auto& number = *entry->value.as<Number>();
      EXPECT_EQ(number.int64Value(), group.first + static_cast<std::int64_t>(i)) << entry->key;
      EXPECT_EQ(number.type(), group.type) << entry->key;
    }
  }
  EXPECT_EQ(entry, info.end());
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
                                                         {kYear2000, 0},
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
