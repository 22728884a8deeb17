// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The kernel's memory error events.
#pragma once

#include <cstddef>
#include <span>

#include "platform/FaultwatchSupport.h"
#include "platform/Kernel.h"
#include "platform/SystemLog.h"
#include "plist/Value.h"

namespace morvend {

inline constexpr std::size_t kEccEventRecordSize = 72;

// What is logged of one event record, as the kernel delivers it: "id" and "count", and the data
// entries that count ("reg0" to "reg7").
plist::Dictionary eccEventData(std::span<const std::byte, kEccEventRecordSize> record);

// Logs the pending events, at most ten, as structured data of type 172. The rest stays for later
// runs.
void CollectEccEvents(platform::Kernel& kernel, platform::FaultwatchSupport& faultwatch,
                      platform::SystemLog& log);

}  // namespace morvend
