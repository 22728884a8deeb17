// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Access to the storage controller: which driver exports counters, its tunnel commands, its
// services.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <vector>

#include "NANDInfo/DriverService.h"
#include "NANDInfo/Parsers.h"
#include "NANDInfo/Services.h"
#include "base/Exported.h"
#include "platform/DeviceRegistry.h"
#include "plist/Value.h"

namespace MORVEND_EXPORTED NANDInfo {

using SelectorGetter = const SelectorPair* (*)();

const SelectorPair* getStatsSelectors();
const SelectorPair* getReadStatsSelectors();
const SelectorPair* getMSPStatsSelectors();
const SelectorPair* getDefectsListSelectors();
const SelectorPair* getTelemetryListSelectors();
const SelectorPair* getTaskSchedulerSelectors();
const SelectorPair* getSnapshotSelectors();
const SelectorPair* getSnapshotHeaderSelectors();
const SelectorPair* getBandStatsSelectors();

// A list's command has no argument word: the argument stands in its flags, from the third bit on.
inline constexpr int kListArgumentShift = 2;

inline constexpr std::uint32_t kNoSelector = 0xFFFFFFFF;

// A controller driver that can export counters. Slots that it lacks are null.
struct nand_exporter_t {
  const char* className;                     // in the device registry; null ends the table
  const char* propertyKey;                   // of the device characteristics on the matched service
  platform::DriverConnection io_connection;  // 0 when none
  platform::RegistryObject service;          // 0 when none
  std::uint32_t recommendDeletionSelector;   // kNoSelector: there is no such query
  std::uint32_t sizeSelector, dataSelector;  // struct methods of the tunnel; 0: can't tunnel
  SelectorGetter getStatsSelectors, getReadStatsSelectors, getMSPStatsSelectors,
      getDefectsListSelectors, getTelemetryListSelectors, getTaskSchedulerSelectors,
      getSnapshotSelectors, getSnapshotHeaderSelectors, getBandStatsSelectors;
  bool (*parseLegacy)(LegacyNandInfoCxt* context, std::span<const std::byte> buffer);
  void (*releaseLegacy)(LegacyNandInfoCxt* context);
  std::uint32_t (*parseMSP)(GenericParserCxt* context, std::span<const std::byte> buffer);
  std::uint32_t (*parseFTL)(GenericParserCxt* context, std::span<const std::byte> buffer);
  std::uint32_t (*parseFTLStatKey)(GenericParserCxt* context, std::span<const std::byte> buffer);
  void (*releaseGeneric)(GenericParserCxt* context);
};

// The known drivers, in the order in which they are looked for; ended by an empty record. Shared,
// writable state: the library is called from one thread at a time.
inline constexpr std::size_t kExporters = 3;
extern nand_exporter_t nand_exporters_tunnel[kExporters + 1];

using Buffer = std::vector<std::byte>;

// The caller's part of a tunnel command; the rest of the 24-byte block is the command's own.
struct TunnelCommandBlock {
  std::uint32_t opType = 0;
  std::uint32_t sizeQuery = 0;
  std::uint32_t argument = 0;  // 0 for statistics, the MSP's index, the hours of history
  std::uint32_t inLength = 0;
  std::uint64_t inBuffer = 0;
};

// The first entry that conforms to a class, from a walk of the whole service plane; the caller
// releases it. 0 when there is none.
platform::RegistryObject FindServiceUsingIterator(const Services& services, const char* className);

// The service of the first known driver that is present, by matching, then by walking; the caller
// releases it. 0 when none is; `exporter` is then the empty record.
platform::RegistryObject findNandExporter(const Services& services, nand_exporter_t*& exporter);

// The first known driver that matches and can be opened; its record then holds the connection and
// the service, until ReleaseIOInterfaces. False when there is none (`exporter` is then null).
bool findNandExporterNew(const Services& services, nand_exporter_t*& exporter);
void ReleaseIOInterfaces(const Services& services, nand_exporter_t* exporter);

// Fetches a buffer of a size that the driver announces: a size phase, then a data phase. True with
// the bytes that the driver delivered; false with a message recorded. A failed size phase empties
// the caller's buffer, any other failure leaves it as it was.
bool executeTunnelCommand(const Services& services, platform::DriverConnection connection,
                          const nand_exporter_t* exporter, const SelectorPair* selectors,
                          TunnelCommandBlock& block, Buffer& buffer);

// Fetches and parses the legacy statistics; `exporter` is what findNandExporter made of it. The
// caller releases the context with the exporter's releaseLegacy.
bool load_nand_info(const Services& services, nand_exporter_t*& exporter,
                    LegacyNandInfoCxt* context);

struct zmc_connection_t {
  platform::RegistryObject service;
  platform::DriverConnection connection;
  nand_exporter_t* exporter;
};
bool openZMCConnection(const Services& services, zmc_connection_t& connection);
void closeZMCConnection(const Services& services, zmc_connection_t& connection);

}  // namespace NANDInfo
