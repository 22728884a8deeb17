// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/deliver/ListHandlers.h"

#include <optional>
#include <string>
#include <utility>

#include "NANDInfo/DefectsList.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/collect/BasicInfo.h"
#include "NANDInfo/collect/LegacyInfo.h"
#include "NANDInfo/decode/Counters.h"
#include "NANDInfo/deliver/NANDLogWriter.h"
#include "base/Text.h"
#include "platform/FaultwatchSupport.h"
#include "platform/StandardStreams.h"

namespace NANDInfo {

using base::Error, base::Result;
using plist::Dictionary;

namespace {

constexpr char kUnparsable[] = "data cannot be parsed";
constexpr char kClassWithoutDefectModes[] = "ZMCStorage";
constexpr std::size_t kMaxChipId = 63;

// The text of a characteristic.
Result<std::string> characteristic(const Dictionary& device, const char* key) {
  if (const std::string* text = device.text(key)) return *text;
  return Error{base::format(device.find(key) != nullptr
                                ? "ERROR: %s is not stored as a OrvalstrTypeID\n"
                                : "ERROR: Could not determine the %s\n",
                            key)};
}

Dictionary validityLog(const StructuredLogState& state, const Dictionary& counters,
                       ValidityLists lists) {
  Dictionary log{{"IntermediateWamp", state.gCurrentSysWamp}, {"UserWamp", state.gCurrentUserWamp}};
  addEntries(counters, log);
  for (std::size_t i = 0; i < lists.size(); ++i) {
    if (lists[i].empty()) continue;
    log.set(base::format("ValidityList[%zu]", i), std::move(lists[i]));
  }
  return log;
}

// How the channels of a telemetry list are read.
struct TelemetryLayout {
  ChipKind chip;
  CounterConverter* convert;
  std::int32_t channels;
};

Result<TelemetryLayout> telemetryLayout(platform::StandardStreams& streams,
                                        const plist::Value& characteristics) {
  const auto* device = characteristics.as<Dictionary>();
  if (device == nullptr) {
    return Error{"ERROR: Could not parse the Device Characteristics dictionary\n"};
  }
  const auto chipId = characteristic(*device, "chip-id");
  if (!chipId) return chipId.error();
  if (chipId->size() > kMaxChipId) {
    return Error{base::format(
        "ERROR: Unable to obtain %s as conversion from the UniChar contents of Orvalstr failed, or "
        "the buffer of %zu bytes is too small\n",
        "chip-id", kMaxChipId + 1)};
  }
  const auto vendorId = characteristic(*device, "manufacturer-id");
  if (!vendorId) return vendorId.error();
  const Vendor vendor = vendorOf(*vendorId);
  streams.writeOutput(vendor.complaint);
  const auto channels = signed32(*device, "num-bus");
  if (!channels) return Error{"ERROR: could not determine the number of channels\n"};
  const ChipKind chip = chipKind(*chipId);
  return TelemetryLayout{chip, counterConverter(chip, vendor.code), *channels};
}

Dictionary defectsHeader(const DefectsList& defects, const plist::Value& characteristics) {
  Dictionary header{{"Factory Count", static_cast<std::int32_t>(defects.factoryCount())}};
  if (const auto* device = characteristics.as<Dictionary>()) {
    if (const auto descriptor = signed32(*device, "nand-device-desc")) {
      header.set("com.norba.NANDInfo.nandDesc", *descriptor);
    }
  }
  return header;
}

}  // namespace

Result<void> DumpValidityList(const Services& services, const StructuredLogState& state,
                              std::span<const std::byte> list) {
  if (!state.gNeedValidityList) return {};
  auto lists = parseValidityList(list);
  if (!lists) return Error{kUnparsable};
  const auto statistics = readLegacyStatistics(services);
  const Dictionary counters = statistics ? legacyInfo(*statistics, std::nullopt) : Dictionary();
  const Dictionary log = validityLog(state, counters, *std::move(lists));
  writeNANDLog(services, "165", &log);
  return {};
}

Result<void> DumpTelemetryList(platform::FaultwatchSupport& faultwatch,
                               platform::StandardStreams& streams,
                               const plist::Value& characteristics,
                               std::span<const std::byte> list) {
  const auto layout = telemetryLayout(streams, characteristics);
  if (!layout) return layout.error();
  const auto channels = parseTelemetryList(list, layout->channels);
  if (!channels) return Error{"ERROR: Attempting to parse beyond the bounds of the buffer\n"};
  for (const TelemetryChannel& channel : *channels) {
    faultwatch.logStructuredData(kStorageLogType,
                                 telemetryLog(channel, layout->chip, layout->convert));
  }
  return {};
}

Result<void> DumpDefectsList(platform::FaultwatchSupport& faultwatch,
                             platform::StandardStreams& streams,
                             const plist::Value& characteristics, std::string_view className,
                             std::span<const std::byte> list) {
  const auto defects = DefectsList::parse(list);
  if (!defects) return Error{kUnparsable};
  faultwatch.logStructuredData(kStorageLogType, defectsHeader(*defects, characteristics));
  const bool hasModes = className != kClassWithoutDefectModes;
  for (std::size_t i = 0; i < defects->size(); ++i) {
    Defect defect = (*defects)[i];
    const auto offset = hasModes ? reasonOffset(defect.mode) : 0;
    if (!offset) {
      streams.writeError(base::format("Encountered unexpected defectMode: 0x%x", defect.mode));
    }
    defect.reason += offset.value_or(0);
    faultwatch.logStructuredData(kStorageLogType, defectLog(defect));
  }
  return {};
}

}  // namespace NANDInfo
