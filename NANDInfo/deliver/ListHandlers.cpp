#include "NANDInfo/deliver/ListHandlers.h"

#include <cstdint>
#include <optional>
#include <string>
#include <utility>

#include "NANDInfo/DefectsList.h"
#include "NANDInfo/NANDLogWriter.h"
#include "NANDInfo/Services.h"
#include "NANDInfo/StructuredLogs.h"
#include "NANDInfo/TelemetryList.h"
#include "NANDInfo/ValidityList.h"
#include "NANDInfo/decode/Counters.h"
#include "NANDInfo/deliver/StructuredLogState.h"
#include "base/Text.h"
#include "platform/FaultwatchSupport.h"
#include "platform/StandardStreams.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr char kUnparsable[] = "data cannot be parsed";
constexpr char kClassWithoutDefectModes[] = "ZMCStorage";

// Writes the message, and is the handler's answer to it.
bool refuse(const Services& services, const std::string& message) {
  services.streams.writeError(message);
  return false;
}

// The text of a characteristic; null, with a message, when it is missing or no text.
const std::string* characteristic(const Services& services, const Dictionary& device,
                                  const char* key) {
  const char* problem = device.find(key) != nullptr
                            ? "ERROR: %s is not stored as a OrvalstrTypeID\n"
                            : "ERROR: Could not determine the %s\n";
  const std::string* text = device.text(key);
  if (text == nullptr) services.streams.writeError(base::format(problem, key));
  return text;
}

}  // namespace

bool DumpValidityList(const Services& services, std::span<const std::byte> list,
                      const plist::Value&, std::string_view) {
  if (!gNeedValidityList) return true;
  auto lists = parseValidityList(list);
  if (!lists) return refuse(services, kUnparsable);
  Dictionary log{{"IntermediateWamp", gCurrentSysWamp}, {"UserWamp", gCurrentUserWamp}};
  DumpNANDInfo(services, log);
  for (std::size_t i = 0; i < lists->size(); ++i) {
    if ((*lists)[i].empty()) continue;
    log.set(base::format("ValidityList[%d]", static_cast<int>(i)), std::move((*lists)[i]));
  }
  NLW_WriteLog(services, "165", &log);
  return true;
}

bool DumpTelemetryList(const Services& services, std::span<const std::byte> list,
                       const plist::Value& characteristics, std::string_view) {
  constexpr int kLongestChipId = 63;
  const auto* device = characteristics.as<Dictionary>();
  if (device == nullptr) {
    return refuse(services, "ERROR: Could not parse the Device Characteristics dictionary\n");
  }
  const std::string* chipId = characteristic(services, *device, "chip-id");
  if (chipId == nullptr) return false;
  if (chipId->size() > kLongestChipId) {
    return refuse(
        services,
        base::format("ERROR: Unable to obtain %s as conversion from the UniChar contents of "
                     "Orvalstr failed, or the buffer of %d bytes is too small\n",
                     "chip-id", kLongestChipId + 1));
  }
  const std::string* vendorId = characteristic(services, *device, "manufacturer-id");
  if (vendorId == nullptr) return false;
  const Vendor vendor = vendorOf(*vendorId);
  services.streams.writeOutput(vendor.complaint);
  const auto count = signed32(*device, "num-bus");
  if (!count) return refuse(services, "ERROR: could not determine the number of channels\n");
  const auto channels = parseTelemetryList(list, *count);
  if (!channels) {
    return refuse(services, "ERROR: Attempting to parse beyond the bounds of the buffer\n");
  }
  const ChipKind chip = chipKind(*chipId);
  for (const TelemetryChannel& channel : *channels) {
    services.faultwatch.logStructuredData(
        kStorageLogType, telemetryLog(channel, chip, counterConverter(chip, vendor.code)));
  }
  return true;
}

bool DumpDefectsList(const Services& services, std::span<const std::byte> list,
                     const plist::Value& characteristics, std::string_view className) {
  const auto defects = DefectsList::parse(list);
  if (!defects) return refuse(services, kUnparsable);
  Dictionary header{{"Factory Count", static_cast<std::int32_t>(defects->factoryCount())}};
  if (const auto* device = characteristics.as<Dictionary>()) {
    if (const auto descriptor = signed32(*device, "nand-device-desc")) {
      header.set("com.norba.NANDInfo.nandDesc", *descriptor);
    }
  }
  services.faultwatch.logStructuredData(kStorageLogType, header);
  for (std::size_t i = 0; i < defects->size(); ++i) {
    Defect defect = (*defects)[i];
    if (className != kClassWithoutDefectModes) {
      const auto offset = reasonOffset(defect.mode);
      if (!offset) {
        services.streams.writeError(
            base::format("Encountered unexpected defectMode: 0x%x", defect.mode));
      }
      defect.reason += offset.value_or(0);
    }
    services.faultwatch.logStructuredData(kStorageLogType, defectLog(defect));
  }
  return true;
}

}  // namespace NANDInfo
