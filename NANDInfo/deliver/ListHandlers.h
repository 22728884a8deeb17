// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What becomes of each list that the storage controller's driver delivers.
//
// A handler gets the list as large as the driver announced it. It fails, with what is to be said on
// standard error, when it can make nothing of it.
#pragma once

#include <cstddef>
#include <span>
#include <string_view>

#include "NANDInfo/Services.h"
#include "NANDInfo/deliver/StructuredLogState.h"
#include "base/Result.h"
#include "plist/Value.h"

namespace NANDInfo {

// The type of the structured-data logs.
inline constexpr int kStorageLogType = 176;

// With the write amplification and the legacy counters, as a NAND log; nothing when this dump needs
// no validity list.
base::Result<void> DumpValidityList(const Services& services, const StructuredLogState& state,
                                    std::span<const std::byte> list);

// A structured-data log for each channel, as the device's characteristics say; what isn't
// hexadecimal in them is said on standard output.
base::Result<void> DumpTelemetryList(platform::FaultwatchSupport& faultwatch,
                                     platform::StandardStreams& streams,
                                     const plist::Value& characteristics,
                                     std::span<const std::byte> list);

// A structured-data log for the list, and one for each defect; an unknown defect mode is said on
// standard error. `className` is the driver's: the oldest one has no defect modes.
base::Result<void> DumpDefectsList(platform::FaultwatchSupport& faultwatch,
                                   platform::StandardStreams& streams,
                                   const plist::Value& characteristics, std::string_view className,
                                   std::span<const std::byte> list);

}  // namespace NANDInfo
