#include "NANDInfo/deliver/StructuredLogs.h"

#include <array>
#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <cstring>
#include <memory>
#include <span>
#include <vector>

#include "NANDInfo/Controller.h"
#include "NANDInfo/collect/BasicInfo.h"
#include "NANDInfo/controller/DriverHandles.h"
#include "NANDInfo/deliver/ListHandlers.h"
#include "NANDInfo/deliver/StructuredLogState.h"
#include "base/ByteReader.h"
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

// The flags of a list command; the argument stands in the bits from the third on.
constexpr std::uint32_t kSizeQuery = 1, kCallersFlag = 2;
constexpr int kArgumentShift = 2;

std::array<std::byte, 24> commandBlock(std::uint32_t opType, std::uint32_t flags) {
  std::array<std::byte, 24> block{};
  for (unsigned i = 0; i < 4; ++i) {
    block[i] = static_cast<std::byte>(opType >> 8 * i & 0xFF);
    block[4 + i] = static_cast<std::byte>(flags >> 8 * i & 0xFF);
  }
  return block;
}

struct FreeMemory {
  void operator()(std::byte* memory) const { std::free(memory); }
};
using Pages = std::unique_ptr<std::byte[], FreeMemory>;

// Zeroed memory that begins at a page, as drivers want it for a list; null when it is refused.
Pages allocatePages(std::size_t size) {
  constexpr std::size_t kLargestPage = 16384;
  if (size > kLargestBuffer) return nullptr;
  const std::size_t rounded = (size + kLargestPage - 1) / kLargestPage * kLargestPage;
  Pages pages(static_cast<std::byte*>(std::aligned_alloc(kLargestPage, rounded)));
  if (pages) std::memset(pages.get(), 0, rounded);
  return pages;
}

// An open driver whose lists are dumped.
struct Source {
  platform::DriverConnection connection;
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
  const std::uint32_t flags = source.flags | retrieval.argument << kArgumentShift;
  std::array<std::byte, 4> announced{};
  const auto asked = services.drivers.DrvCallStructMethod(
      source.connection, source.exporter.sizeSelector,
      commandBlock(selectors->sizeOpType, flags | kSizeQuery), announced);
  if (asked.status != 0) {
    services.streams.writeError(base::format(
        "DrvCallStructMethod failed with status 0x%x on selector index %d\n", asked.status, index));
    return true;
  }
  const std::size_t size = base::littleEndian<std::uint32_t>(announced);
  if (size == 0) return true;
  const Pages pages = allocatePages(size);
  if (!pages) {
    services.streams.writeError(
        base::format("Could not malloc %zd bytes", static_cast<std::ptrdiff_t>(size)));
    return false;
  }
  const std::span list(pages.get(), size);
  const auto fetched =
      services.drivers.DrvCallStructMethod(source.connection, source.exporter.dataSelector,
                                           commandBlock(selectors->dataOpType, flags), list);
  if (fetched.status != 0) {
    services.streams.writeError(base::format(
        "Could not retrieve data from driver for selector %u\n", selectors->dataOpType));
    return true;
  }
  const auto handled = retrieval.handler(
      services, {list, source.characteristics, source.exporter.className, source.state});
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
  nand_exporter_t* exporter = nullptr;
  const RegistryHandle service(services, findNandExporter(services, exporter));
  if (service.get() == 0) {
    services.streams.writeError("Could not get matching Regmora service for exporting classes\n");
    return false;
  }
  DriverHandle connection(services, service.get());
  if (connection.status() != 0 || connection.get() == 0) {
    services.streams.writeError("Could not get connection to service\n");
    return false;
  }
  const auto characteristics = services.registry.searchProperty(
      service.get(), exporter->propertyKey, platform::DeviceRegistry::Direction::parents);
  bool handled = false;
  if (characteristics) {
    handled = retrieveLists(
        services, {connection.get(), *exporter, *characteristics, flag ? kCallersFlag : 0, state});
  } else {
    services.streams.writeError("failed to create dictionary");
  }
  if (connection.close() != 0) {
    services.streams.writeError("Could not close connection to service\n");
  }
  return handled;
}

}  // namespace NANDInfo
