// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/DiskInfo.h"

#include <algorithm>
#include <cstdint>
#include <optional>

#include "NANDInfo/Keys.h"
#include "NANDInfo/Whitelists.h"
#include "platform/DeviceProperties.h"
#include "platform/FileSystem.h"

namespace NANDInfo {

namespace {

constexpr char kVolume[] = "/private/var";

// In basis points; without overflow at any size.
std::uint64_t usedShare(std::uint64_t total, std::uint64_t available) {
  if (available >= total) return 0;
  const std::uint64_t used = total - available;
  return used <= UINT64_MAX / 10000 ? used * 10000 / total : used / (total / 10000);
}

// What isn't known, and what is below 0, is nothing.
std::uint64_t mebibytes(std::optional<std::int64_t> bytes) {
  return static_cast<std::uint64_t>(std::max<std::int64_t>(bytes.value_or(0), 0)) >> 20;
}

struct Figures {
  std::uint64_t capacityGB = 0, userMB = 0, availableMB = 0, fullness = 0;
};

Figures ofFileSystem(platform::FileSystem& files) {
  const auto statistics = files.statfs(kVolume);
  if (!statistics) return {};
  const std::uint64_t total = statistics->blocks * statistics->blockSize;
  const std::uint64_t available = statistics->blocksAvailable * statistics->blockSize;
  return {.capacityGB = GetUserCapacityInGB(static_cast<std::uint32_t>(total / 1000000)),
          .userMB = total >> 20,
          .availableMB = available >> 20,
          .fullness = usedShare(total, available)};
}

Figures ofDevice(platform::DeviceProperties& properties) {
  const auto usage = properties.diskUsage();
  if (!usage) return {};
  const std::uint64_t total = mebibytes(usage->totalDiskCapacity);
  return {.capacityGB = GetUserCapacityInGB(static_cast<std::uint32_t>(total)),
          .userMB = total,
          .availableMB = mebibytes(usage->amountDataAvailable),
          .fullness = usedShare(total, mebibytes(usage->totalDataAvailable))};
}

}  // namespace

plist::Dictionary diskInfo(platform::FileSystem& files, platform::DeviceProperties& properties) {
  Figures figures = ofFileSystem(files);
  if (figures.capacityGB == 0 || figures.fullness == 0) figures = ofDevice(properties);
  return {{kDiskInfo_TLM_DQ_AmountDataAvailable_MB, figures.availableMB},
          {kDiskInfo_TLM_DQ_Diskfullness_BP, figures.fullness},
          {kDiskInfo_TLM_DQ_Capacity_GB, figures.capacityGB},
          {kDiskInfo_TLM_Capacity_GB, figures.capacityGB},
          {kDiskInfo_TLM_Diskfullness_BP, figures.fullness},
          {kDiskInfo_TLM_UserCapacity_MB, figures.userMB}};
}

}  // namespace NANDInfo
