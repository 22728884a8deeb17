// What becomes of each list that the storage controller's driver delivers.
//
// A handler gets the list as large as the driver announced it, the device characteristics and the
// driver's class name. False, with a message on standard error, when it could make nothing of them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <span>
#include <string_view>

#include "NANDInfo/Services.h"
#include "plist/Value.h"

namespace NANDInfo {

using ListHandler = bool(const Services& services, std::span<const std::byte> list,
                         const plist::Value& characteristics, std::string_view className);

// The type of the structured-data logs.
inline constexpr int kStorageLogType = 176;

// With the write amplification and the legacy counters, as a NAND log; nothing when this run needs
// no validity list.
ListHandler DumpValidityList;

// A structured-data log for each channel.
ListHandler DumpTelemetryList;

// A structured-data log for the list, and one for each defect.
ListHandler DumpDefectsList;

}  // namespace NANDInfo
