// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The buffers that a sample controller's driver answers with, as the controller writes them.
#pragma once

#include <cstdint>
#include <string>

#include "tools/mkdevice/Wear.h"

namespace mkdevice {

inline constexpr std::uint64_t kMSPs = 4;
inline constexpr std::uint32_t kChannels = 2;

// The statistics: every key of the key table.
std::string ftlStatistics(const Wear& wear);

// The statistics of one MSP: every tag of the tag table.
std::string mspStatistics(const Wear& wear, std::uint64_t msp);

// The diagnostic lists.
std::string bandStatistics(const Wear& wear);
std::string telemetryList(const Wear& wear, std::uint32_t list);
std::string defectsList(const Wear& wear);

// What has no known format: random bytes that are always the same.
std::string unknownBuffer(const Wear& wear, const char* name, std::size_t size);

// A kernel snapshot whose swap-out thread has written something in every hour since the last boot.
std::string kernelSnapshot(const Wear& wear);

}  // namespace mkdevice
