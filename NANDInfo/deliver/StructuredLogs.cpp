// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/StructuredLogs.h"

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>
#include <vector>

#include "NANDInfo/collect/BasicInfo.h"
#include "NANDInfo/controller/StorageController.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "NANDInfo/deliver/StructuredLogState.h"
#include "base/Text.h"
#include "platform/DeviceRegistry.h"
#include "platform/PreferenceStore.h"
#include "platform/StandardStreams.h"

namespace NANDInfo {

namespace {

// A list as it comes from the driver, and what its handler may want to know of the dump.
struct List {
  std::span<const std::byte> bytes;
  const plist::Value& characteristics;
  std::string_view className;
  const StructuredLogState& state;
};
using ListHandler = base::Result<void>(const Services& services, const List& list);

// The lists in the order of their retrieval; each is asked for with the arguments from 0 on.
struct ListRow {
  SelectorGetter nand_exporter_t::*slot;
  std::uint32_t arguments;
  ListHandler* handler;
  const char* unsupported;
};

constexpr ListRow kLists[] = {
    {&nand_exporter_t::getBandStatsSelectors, 1,
     [](const Services& services, const List& list) {
       return DumpValidityList(services, list.state, list.bytes);
     },
     "Validity list retrieval is not supported\n"},
    {&nand_exporter_t::getTelemetryListSelectors, 3,
     [](const Services& services, const List& list) {
       return DumpTelemetryList(services.faultwatch, services.streams, list.characteristics,
                                list.bytes);
     },
     "Telemetry list retrieval is not supported\n"},
    {&nand_exporter_t::getDefectsListSelectors, 1,
     [](const Services& services, const List& list) {
       return DumpDefectsList(services.faultwatch, services.streams, list.characteristics,
                              list.className, list.bytes);
     },
     "Defects list retrieval is not supported\n"},
};

struct ListRetrieval {
  SelectorGetter getSelectors;
  ListHandler* handler;
  std::uint32_t argument;
};

std::vector<ListRetrieval> retrievalsFrom(const Services& services,
                                          const nand_exporter_t& exporter) {
  std::vector<ListRetrieval> retrievals;
  for (const ListRow& row : kLists) {
    const SelectorGetter getter = exporter.*row.slot;
    if (getter == nullptr) {
      services.streams.writeError(row.unsupported);
      continue;
    }
    for (std::uint32_t argument = 0; argument < row.arguments; ++argument) {
      retrievals.push_back({getter, row.handler, argument});
    }
  }
  return retrievals;
}

// The flag of a list command that callers of the dump set.
constexpr std::uint32_t kCallersFlag = 2;

// An open driver whose lists are dumped.
struct Source {
  const DriverService& service;
  const nand_exporter_t& exporter;
  const plist::Value& characteristics;
  std::uint32_t flags;  // of every command
  const StructuredLogState& state;
};

// Fetches one list, `index` in the order of retrieval, and has it handled.
bool retrieveList(const Services& services, const Source& source, const ListRetrieval& retrieval,
                  int index) {
  const SelectorPair* selectors = retrieval.getSelectors();
  if (selectors == nullptr) return false;
  const TunnelAnswer list =
      source.service.exchange({.sizeMethod = source.exporter.sizeSelector,
                               .dataMethod = source.exporter.dataSelector,
                               .opTypes = *selectors,
                               .flags = source.flags | retrieval.argument << kListArgumentShift,
                               .fetchesNothing = false});
  switch (list.failure) {
    case TunnelAnswer::Failure::size:
      services.streams.writeError(
          base::format("DrvCallStructMethod failed with status 0x%x on selector index %d\n",
                       list.status, index));
      return true;
    case TunnelAnswer::Failure::memory:
      services.streams.writeError(base::format("Could not malloc %u bytes", list.announced));
      return false;
    case TunnelAnswer::Failure::data:
      services.streams.writeError(base::format(
          "Could not retrieve data from driver for selector %u\n", selectors->dataOpType));
      return true;
    case TunnelAnswer::Failure::none:
      break;
  }
  if (list.announced == 0) return true;
  const auto handled = retrieval.handler(
      services, {list.whole(), source.characteristics, source.exporter.className, source.state});
  if (!handled) services.streams.writeError(handled.error().text);
  return static_cast<bool>(handled);
}

bool retrieveLists(const Services& services, const Source& source) {
  bool handled = true;
  int index = 0;
  for (const ListRetrieval& retrieval : retrievalsFrom(services, source.exporter)) {
    if (!retrieveList(services, source, retrieval, index++)) handled = false;
  }
  return handled;
}

StructuredLogState stateOf(const Services& services, bool forceCollection) {
  const auto statistics = readLegacyStatistics(services);
  return structuredLogState(
      statistics ? &*statistics : nullptr,
      services.preferences.QNSPreferencesGetValue("userWAmp", "com.norba.NANDInfo"),
      forceCollection);
}

}  // namespace

bool dumpStructuredLogs(const Services& services, bool flag, bool forceCollection) {
  const StructuredLogState state = stateOf(services, forceCollection);
  auto [exporter, service] = findController(services);
  if (!service.isPresent()) {
    services.streams.writeError("Could not get matching Regmora service for exporting classes\n");
    return false;
  }
  if (service.open() != 0 || !service.isOpen()) {
    services.streams.writeError("Could not get connection to service\n");
    return false;
  }
  const auto characteristics =
      service.property(exporter->propertyKey, platform::DeviceRegistry::Direction::parents);
  bool handled = false;
  if (characteristics) {
    handled = retrieveLists(services,
                            {service, *exporter, *characteristics, flag ? kCallersFlag : 0, state});
  } else {
    services.streams.writeError("failed to create dictionary");
  }
  if (service.close() != 0) {
    services.streams.writeError("Could not close connection to service\n");
  }
  return handled;
}

}  // namespace NANDInfo
