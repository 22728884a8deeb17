// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The exporter table, finding drivers, tunnel commands, the EAN service: each exchange by its
// failures, and no handle left open by any.

#include "NANDInfo/Controller.h"

#include <gtest/gtest.h>

#include <functional>

#include "platform/DeviceRegistry.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using platform::fakes::FakeDeviceRegistry;
using support::Bytes, support::kEmbedded, support::kQRT3, support::kZMCStorage;
using Entry = FakeDeviceRegistry::Entry;
using Lines = std::vector<std::string>;

constexpr std::uint32_t kError = 0x2BC;

struct ControllerTest : testing::Test, support::StorageDevice {
  void restart() {
    EXPECT_EQ(registry.problems(), Lines());
    ResetExporters();
    support::freshErrors();
    registry = FakeDeviceRegistry();
    streams.errors.clear();
    log.clear();
  }
};

// Whether or not any exchange below asks for them.
TEST_F(ControllerTest, EachDriverHasItsLists) {
  for (std::size_t i = 0; i < kExporters; ++i) {
    const auto& row = nand_exporters_tunnel[i];
    EXPECT_STREQ(row.propertyKey, i < 2 ? "Controller Characteristics" : "PropertyMatch");
    EXPECT_EQ(row.recommendDeletionSelector, i < 2 ? kNoSelector : 5);
    for (const auto& [getter, opType] : {std::pair(row.getDefectsListSelectors, 15u),
                                         {row.getTelemetryListSelectors, 17u},
                                         {row.getTaskSchedulerSelectors, 39u},
                                         {row.getSnapshotSelectors, 22u},
                                         {row.getSnapshotHeaderSelectors, 145u},
                                         {row.getBandStatsSelectors, 11u}}) {
      EXPECT_EQ(getter()->sizeOpType, opType);
      EXPECT_EQ(getter()->dataOpType, opType);
    }
  }
}

// The service plane, and what each of the three ways of looking makes of it.
TEST_F(ControllerTest, DriversAreFoundInTheOrderOfTheTable) {
  const Entry none{"Other"};
  const Entry nested{.className = "Bus", .children = {{.className = kZMCStorage}}};
  const Entry conforming{.className = "Derived", .conforms = {kEmbedded}};
  const Entry unregistered{.className = "Bus",
                           .registered = false,
                           .children = {{.className = kQRT3, .registered = false}}};
  const Entry refusing{.className = kQRT3, .openStatus = kError};
  const Entry refusingOddly{.className = kQRT3, .openStatus = kError, .oddHandle = true};
  const struct {
    std::vector<Entry> plane;
    int found, walked, opened;  // rows of the table; 3: none
  } cases[] = {{{}, 3, 3, 3},
               {{none}, 3, 3, 3},
               {{none, nested}, 2, 2, 2},
               {{nested, conforming}, 1, 1, 1},
               {{none, unregistered}, 0, 0, 3},
               {{unregistered, nested}, 2, 0, 2},
               {{refusing, nested}, 0, 0, 2},
               {{refusingOddly}, 0, 0, 3},
               {{refusingOddly, conforming}, 0, 0, 1}};
  for (const auto& row : cases) {
    restart();
    registry.root->children = row.plane;
    nand_exporter_t* exporter = nullptr;
    const auto found = findNandExporter(platform, exporter);
    EXPECT_EQ(exporter - nand_exporters_tunnel, row.found == 3 ? row.walked : row.found);
    EXPECT_EQ(found != 0, row.walked != 3 || row.found != 3);
    if (found != 0) registry.release(found);

    const char* const walked = nand_exporters_tunnel[row.walked].className;
    const auto entry = FindServiceUsingIterator(platform, walked != nullptr ? walked : kZMCStorage);
    EXPECT_EQ(entry != 0, walked != nullptr);
    if (entry != 0) registry.release(entry);

    EXPECT_EQ(findNandExporterNew(platform, exporter), row.opened != 3);
    EXPECT_EQ(exporter, row.opened != 3 ? nand_exporters_tunnel + row.opened : nullptr);
    if (exporter == nullptr) continue;
    EXPECT_NE(exporter->io_connection, 0u);
    EXPECT_NE(exporter->service, 0u);
    ReleaseIOInterfaces(platform, exporter);
    EXPECT_EQ(exporter->io_connection + exporter->service, 0u);
  }
}

TEST_F(ControllerTest, FindingSaysWhatItFound) {
  nand_exporter_t* exporter;
  registry.add({.className = kZMCStorage});
  registry.release(findNandExporter(platform, exporter));
  findNandExporterNew(platform, exporter);
  ReleaseIOInterfaces(platform, exporter);
  registry.root->children[0].registered = false;
  registry.release(findNandExporter(platform, exporter));
  EXPECT_EQ(log.lines(),
            (Lines{"default: NANDInfo: findNandExporter: Controller found: ZMCStorage\n",
                   "default: NANDInfo: findNandExporterNew: Controller found: ZMCStorage\n",
                   "default: Find service for class ZMCStorage\n"}));
  registry.canIterate = false;
  EXPECT_EQ(findNandExporter(platform, exporter), 0u);
  registry.root.reset();
  EXPECT_EQ(findNandExporter(platform, exporter), 0u);
}

TEST_F(ControllerTest, TunnelCommandsByTheirFailures) {
  constexpr SelectorPair kPair = {13, 14};
  const Bytes sent{std::byte{1}, std::byte{2}, std::byte{3}};
  const Bytes old{std::byte{9}};
  const auto announce = FakeDeviceRegistry::announce;
  using Step = FakeDeviceRegistry::Step;
  const std::string size = "9 size 13/7", data = "9 data 14/7";
  const std::string call = "executeTunnelCommand: DrvCallStructMethod failed while retrieving data";
  const struct {
    std::vector<Step> script;
    std::string message;  // "NA": success
    Bytes left;
  } cases[] = {
      {{{size, announce(3)}, {data, {.output = sent}}}, "NA", sent},
      {{{size, announce(8)}, {data, {.output = sent}}}, "NA", sent},
      {{{size, announce(2)}, {data, {.output = sent}}}, "NA", Bytes(sent.data(), &sent[2])},
      {{{size, announce(3)}, {data, {.output = sent, .claimedSize = 4}}}, "NA", sent},
      {{{size, announce(8)}, {data, {.output = sent, .claimedSize = 1}}}, "NA", {sent[0]}},
      {{{size, announce(0)}, {data, {}}}, "NA", {}},
      {{{size, {.output = {std::byte{1}}}}, {data, {.output = sent}}}, "NA", {sent[0]}},
      {{{size, {.claimedSize = 99}}, {data, {}}}, "NA", {}},
      {{{size, announce(kMaxBuffer)}, {data, {.output = sent}}}, "NA", sent},
      {{{size, {kError, announce(3).output}}}, call + " size", {}},
      {{{size, announce(kMaxBuffer + 1)}}, "executeTunnelCommand: Could not allocate buffer", old},
      {{{size, announce(3)}, {data, {kError, sent}}}, call, old},
  };
  for (const auto& row : cases) {
    restart();
    registry.add({.className = kQRT3});
    nand_exporter_t* exporter;
    ASSERT_TRUE(findNandExporterNew(platform, exporter));
    registry.script.assign(row.script.begin(), row.script.end());
    TunnelCommandBlock block{.argument = 7};
    Buffer buffer = old;
    EXPECT_EQ(
        executeTunnelCommand(platform, exporter->io_connection, exporter, &kPair, block, buffer),
        row.message == "NA");
    EXPECT_EQ(GetAPIErrorMessage(), row.message);
    EXPECT_EQ(buffer, row.left);
    EXPECT_EQ(block.argument, 7u);
    ReleaseIOInterfaces(platform, exporter);
  }
}

TEST_F(ControllerTest, TunnelCommandsThatCannotBeSent) {
  nand_exporter_t mute = nand_exporters_tunnel[0];
  mute.dataSelector = 0;
  const struct {
    platform::DriverConnection connection;
    const nand_exporter_t* exporter;
    const SelectorPair* pair;
    const char* message;
  } cases[] = {{0, &mute, nullptr, "connection"},
               {1, &mute, getStatsSelectors(), "exporter"},
               {1, &nand_exporters_tunnel[0], nullptr, "opType Selector"}};
  for (const auto& row : cases) {
    support::freshErrors();
    TunnelCommandBlock block;
    Buffer buffer;
    EXPECT_FALSE(
        executeTunnelCommand(platform, row.connection, row.exporter, row.pair, block, buffer));
    EXPECT_EQ(GetAPIErrorMessage(), std::string("executeTunnelCommand: Invalid ") + row.message);
  }
}

// One controller; what opening, the calls and closing come to; what is said and answered.
TEST_F(ControllerTest, DeletionAndConnectionsByTheirFailures) {
  const std::string noService =
      "Failed to find matching service with DrvGetMatchingService, "
      "trying iterator...\n";
  const std::string missing =
      "_load_nand_infoCould not get matching Regmora service for exporting classes\n";
  const std::string notOpened = "Could not get connection to service\n";
  const std::string notClosed = "Could not close connection to service\n";
  const auto announce = FakeDeviceRegistry::announce;
  const auto recommends = [&] {
    const auto value = NandRecommendsContentDeletion(platform);
    EXPECT_EQ(value.as<plist::Number>()->type(), plist::Number::Type::boolean);
    return value == plist::Value(true);
  };
  const auto connect = [&] {
    zmc_connection_t connection{};
    const bool open = openZMCConnection(platform, connection);
    EXPECT_EQ(open, connection.connection != 0 && connection.service != 0);
    EXPECT_EQ(connection.exporter->io_connection, connection.connection);
    closeZMCConnection(platform, connection);
    EXPECT_EQ(connection.exporter->io_connection + connection.connection + connection.service, 0u);
    // Another's connection, which the record got since, stays in it.
    if (open) openZMCConnection(platform, connection);
    connection.exporter->io_connection = 99;
    closeZMCConnection(platform, connection);
    EXPECT_EQ(std::exchange(connection.exporter->io_connection, 0), 99u);
    return open;
  };
  const Bytes threeBytes(3, std::byte{1});
  const std::string unmatched = "Can't get ZMC Connection, no matching service!\n";
  const std::string unconnected = "Can't get ZMC Connection!\n";
  const std::string refused = "DrvServiceOpen failed for class 'ZMCStorage', result 0xe00002bc\n";
  const Entry storage{.className = kZMCStorage};
  const Entry refusing{.className = kZMCStorage, .openStatus = 0xE00002BC};
  const Entry failing{.className = kZMCStorage, .closeStatus = kError};
  const Entry handleless{.className = kZMCStorage, .oddHandle = true};
  const struct {
    const char* name;
    std::function<bool()> act;
    std::optional<Entry> entry;
    std::vector<FakeDeviceRegistry::Step> script;
    bool result;
    Lines errors;
  } cases[] = {
      {"deletion", recommends, storage, {{"5", announce(0x01000000)}}, true, {}},
      {"deletion, no", recommends, storage, {{"5", announce(0)}}, false, {}},
      {"deletion, failing", recommends, storage, {{"5", {kError, announce(1).output}}}, false, {}},
      {"deletion, short", recommends, storage, {{"5", {.output = threeBytes}}}, false, {}},
      {"deletion, not closed", recommends, failing, {{"5", announce(1)}}, true, {notClosed}},
      {"deletion, refused", recommends, refusing, {}, false, {notOpened}},
      {"deletion, none", recommends, {}, {}, false, {noService, missing}},
      {"deletion, not asked", recommends, Entry{.className = kQRT3}, {}, false, {}},
      {"connection", connect, storage, {}, true, {}},
      {"connection, none", connect, {}, {}, false, {noService, unmatched}},
      {"connection, refused", connect, refusing, {}, false, {refused, unconnected}},
      {"connection, no handle", connect, handleless, {}, false, {unconnected}},
  };
  for (const auto& row : cases) {
    SCOPED_TRACE(row.name);
    restart();
    if (row.entry) registry.add(*row.entry);
    registry.script.assign(row.script.begin(), row.script.end());
    EXPECT_EQ(row.act(), row.result);
    EXPECT_EQ(streams.errors, row.errors);
  }
}

TEST_F(ControllerTest, EANQueriesAskInOrderAndAnswerZeroOnFailure) {
  const struct {
    const char *key, *call;
  } rows[] = {{"EAN_imageSize_BIC", "3(1682065731)"},
              {"EAN_imageSize_LTH", "3(1682723912)"},
              {"EAN_updateCount_FW", "7(1768322865)"},
              {"EAN_updateCount_BIC", "7(1682065731)"},
              {"EAN_updateCount_LTH", "7(1682723912)"},
              {"EAN_updateCount_dConfig", "7(1682138727)"},
              {"EAN_updateCount_fConfig", "7(1715693159)"},
              {"EAN_updateCount_NonEssentialFW", "7(1852139127)"},
              {"EAN_updateCount_LowPowerEM", "7(1280329037)"}};
  registry.add({.className = kEANClassName});
  ASSERT_EQ(EANQueries().size(), std::size(rows));
  for (std::uint64_t i = 0; i < std::size(rows); ++i) {
    const EANQuery& query = EANQueries()[i];
    registry.script.push_back({rows[i].call, {.scalar = ~i}});
    EXPECT_STREQ(query.key, rows[i].key);
    auto* const ask = query.figure == EANFigure::imageSize ? GetEANImageSize : GetEANUpdateCount;
    EXPECT_EQ(ask(platform, query.code), ~i);
  }
  EXPECT_EQ(log.lines(), Lines());

  auto& entry = registry.root->children[0];
  const auto size = [&] { return GetEANImageSize(platform, 0x64424943); };
  const auto count = [&] { return GetEANUpdateCount(platform, 0x69667731); };
  registry.script = {{"3(1682065731)", {kError}}, {"7(1768322865)", {kError}}};
  EXPECT_EQ(size() + count(), 0u);
  entry.openStatus = kError;
  EXPECT_EQ(size() + count(), 0u);
  entry.oddHandle = true;
  EXPECT_EQ(size(), 0u);
  entry = {.className = kEANClassName, .oddHandle = true};
  EXPECT_EQ(size(), 0u);
  registry.root->children.clear();
  EXPECT_EQ(size(), 0u);
  const std::string noSize =
      "default: GetEANImageSize: Unable to get EAN Io service connection "
      "for key (1682065731): dBIC\n";
  const std::string missing =
      "_load_nand_infoCould not get matching Regmora service for exporting classes\n";
  const std::string notOpened =
      "default: getEANConnection: DrvServiceOpen on NorbaNVMeEAN failed kernResult:2bc\n";
  EXPECT_EQ(log.lines(),
            (Lines{"default: GetImageSize: DrvCallMethod failed (key (1682065731): dBIC) "
                   "kernResult:2bc\n",
                   "default: GetUpdateCount: DrvCallMethod failed (key (1768322865): ifw1) "
                   "kernResult:2bc\n",
                   notOpened, noSize, notOpened,
                   "default: GetEANUpdateCount: Unable to get EAN Io service connection for key "
                   "(1768322865): ifw1\n",
                   notOpened, noSize, noSize,
                   "default: getEANConnection: Couldn't find NorbaNVMeEAN object\n", noSize}));
}

}  // namespace
}  // namespace NANDInfo
