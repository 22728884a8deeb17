// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/EccEvents.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <string>

#include "base/ByteReader.h"

namespace morvend {

using plist::Dictionary;

namespace {

constexpr char kNextEvent[] = "kern.next_ecc_event";
constexpr std::int32_t kStructuredDataType = 172;
constexpr int kMaxEventsPerRun = 10;

constexpr std::size_t kDataOffset = 8, kEntrySize = 8, kMaxEntries = 8;
static_assert(kDataOffset + kMaxEntries * kEntrySize == kEccEventRecordSize);

}  // namespace

Dictionary eccEventData(std::span<const std::byte, kEccEventRecordSize> record) {
  const auto id = std::to_integer<std::int32_t>(record[0]);
  const auto count = std::to_integer<std::int32_t>(record[1]);
  Dictionary data{{"id", id}, {"count", count}};
  const std::size_t entries = std::min(static_cast<std::size_t>(count), kMaxEntries);
  for (std::size_t i = 0; i < entries; ++i) {
    const auto bytes = record.subspan(kDataOffset + i * kEntrySize).first<kEntrySize>();
    const auto entry = base::littleEndian<std::uint64_t>(bytes);
    data.set("reg" + std::to_string(i), static_cast<std::int64_t>(entry));
  }
  return data;
}

void CollectEccEvents(platform::Kernel& kernel, platform::FaultwatchSupport& faultwatch,
                      platform::SystemLog& log) {
  std::array<std::byte, kEccEventRecordSize> record{};
  // Each read is offered the length that the one before returned, in the same buffer.
  std::size_t length = record.size();
  for (int events = 0; events < kMaxEventsPerRun; ++events) {
    const auto read = kernel.sysctlbyname(kNextEvent, std::span(record).first(length));
    if (read.error != 0) {
      if (read.error != ENOENT && read.error != EBUSY) {
        log.log(platform::LogLevel::standard,
                "Unexpected errno (%d) reading ECC events from kernel", read.error);
      }
      return;
    }
    length = std::min(length, read.length);
    faultwatch.logStructuredData(kStructuredDataType, eccEventData(record));
  }
}

}  // namespace morvend
