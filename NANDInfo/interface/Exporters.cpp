// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/interface/Exporters.h"

#include <algorithm>
#include <iterator>

#include "NANDInfo/Services.h"
#include "platform/DeviceRegistry.h"

namespace NANDInfo {

namespace {

constexpr SelectorPair statsSelector = {13, 13};
constexpr SelectorPair readStatsSelector = {10, 10};
constexpr SelectorPair mspStatsSelector = {221, 221};
constexpr SelectorPair defectsListSelector = {15, 15};
constexpr SelectorPair telemetryListSelectors = {17, 17};
constexpr SelectorPair taskSchedulerSelectors = {39, 39};
constexpr SelectorPair snapshotSelectors = {22, 22};
constexpr SelectorPair snapshotHeaderSelectors = {145, 145};
constexpr SelectorPair bandStatsSelector = {11, 11};

constexpr char kCharacteristics[] = "Controller Characteristics";

// A row of the table: what the drivers don't have in common.
constexpr nand_exporter_t exporter(const char* className, const char* propertyKey,
                                   std::uint32_t recommendDeletionSelector,
                                   std::uint32_t tunnelSelector, bool hasMSPs) {
  return {.className = className,
          .propertyKey = propertyKey,
          .io_connection = 0,
          .service = 0,
          .recommendDeletionSelector = recommendDeletionSelector,
          .sizeSelector = tunnelSelector,
          .dataSelector = tunnelSelector,
          .getStatsSelectors = getStatsSelectors,
          .getReadStatsSelectors = getReadStatsSelectors,
          .getMSPStatsSelectors = hasMSPs ? getMSPStatsSelectors : nullptr,
          .getDefectsListSelectors = getDefectsListSelectors,
          .getTelemetryListSelectors = getTelemetryListSelectors,
          .getTaskSchedulerSelectors = getTaskSchedulerSelectors,
          .getSnapshotSelectors = getSnapshotSelectors,
          .getSnapshotHeaderSelectors = getSnapshotHeaderSelectors,
          .getBandStatsSelectors = getBandStatsSelectors,
          .parseLegacy = ZMCParseBufferToCxt,
          .releaseLegacy = ZMCReleaseContext,
          .parseMSP = hasMSPs ? ZMCMSPParseBufferToCxt : nullptr,
          .parseFTL = ZMCFTLParseBufferToCxt,
          .parseFTLStatKey = ZMCFTLParseStatKeyBufferToCxt,
          .releaseGeneric = ReleaseGenericParserCxt};
}

constexpr ExporterTable kTable = {
    exporter("NorbaQRT3NVMeController", kCharacteristics, kNoSelector, 9, true),
    exporter("NorbaEmbeddedNVMeController", kCharacteristics, kNoSelector, 9, false),
    exporter("ZMCStorage", platform::kRegistryPropertyMatchKey, 5, 8, false),
    {}};

}  // namespace

nand_exporter_t nand_exporters_tunnel[] = {kTable[0], kTable[1], kTable[2], kTable[3]};

nand_exporter_t* exporterTable() { return nand_exporters_tunnel; }

ExporterTable freshExporters() { return kTable; }

void ResetExporters() {
  std::copy(kTable.begin(), kTable.end(), std::begin(nand_exporters_tunnel));
}

const SelectorPair* getStatsSelectors() { return &statsSelector; }
const SelectorPair* getReadStatsSelectors() { return &readStatsSelector; }
const SelectorPair* getMSPStatsSelectors() { return &mspStatsSelector; }
const SelectorPair* getDefectsListSelectors() { return &defectsListSelector; }
const SelectorPair* getTelemetryListSelectors() { return &telemetryListSelectors; }
const SelectorPair* getTaskSchedulerSelectors() { return &taskSchedulerSelectors; }
const SelectorPair* getSnapshotSelectors() { return &snapshotSelectors; }
const SelectorPair* getSnapshotHeaderSelectors() { return &snapshotHeaderSelectors; }
const SelectorPair* getBandStatsSelectors() { return &bandStatsSelector; }

}  // namespace NANDInfo
