// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a flash drive says of its own health, and which storage counters that is.
//
// Everything here is pure: the pages and attributes are foreign bytes, of which each is read at its
// place and believed to be no more than a number or a text.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace host::machine {

// A figure of a drive under its name, which is a text of this module's tables.
struct DriveFigure {
  const char* name;
  std::uint64_t value;
};
using DriveFigures = std::vector<DriveFigure>;

std::optional<std::uint64_t> figureNamed(const DriveFigures& figures, std::string_view name);

// NVMe: the pages that a controller answers with, of just these sizes.
inline constexpr std::size_t kHealthLogSize = 512, kIdentifySize = 4096;
using HealthLog = std::span<const std::byte, kHealthLogSize>;
using IdentifyPage = std::span<const std::byte, kIdentifySize>;

// The figures of the standard health log, as the drive counts them: data units are 512,000 bytes,
// temperatures Kelvin, 128-bit counters saturate at 64 bits. A temperature of 0 is none.
DriveFigures figuresOf(HealthLog page);

// Who a controller says that it is; texts without the blanks around them.
struct DriveIdentity {
  std::string model, serial, firmware;
  std::uint64_t capacity;  // bytes; 0: it doesn't say
};
DriveIdentity identityOf(IdentifyPage page);

// eMMC and UFS: the estimates of the life time of two kinds of memory (1: up to a tenth is used,
// 2: up to two tenths, …; 11: more than all), and of the reserve (1: normal, 2: warning, 3:
// urgent). What is 0 or beyond its last value says nothing, and is left out. "percentageUsed" is
// what is used at least of the kind of which more is used.
DriveFigures figuresOfLifeTime(std::optional<std::uint64_t> lifeTimeA,
                               std::optional<std::uint64_t> lifeTimeB,
                               std::optional<std::uint64_t> endOfLife);

// The answer to the statistics command: the records, in the order of their keys, that the figures
// fill truly. Products saturate. Empty when there is none.
std::vector<std::uint8_t> statisticsOf(const DriveFigures& figures);

}  // namespace host::machine
