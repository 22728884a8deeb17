// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/BasicInfo.h"

#include <array>
#include <cstdint>

#include "NANDInfo/Keys.h"
#include "NANDInfo/collect/DerivedFields.h"
#include "NANDInfo/collect/DeviceFields.h"
#include "NANDInfo/collect/LegacyInfo.h"
#include "NANDInfo/controller/StorageController.h"
#include "base/CivilDate.h"
#include "base/Convert.h"
#include "platform/Clock.h"
#include "platform/Kernel.h"

namespace NANDInfo {

using plist::Dictionary;

base::Result<LegacyNandInfoCxt> readLegacyStatistics(const ControllerServices& services) {
  LegacyNandInfoCxt context;
  nand_exporter_t* exporter = nullptr;
  if (!loadLegacy(services, exporter, &context)) return base::Error{"Unable to parse buffer"};
  return context;
}

Dictionary basicInfo(const CollectServices& services) {
  const auto context = readLegacyStatistics(services.controller);
  if (!context) {
    return {{kNANDInfoErrorKey, "1"}, {kNANDInfoErrorMessageKey, context.error().text}};
  }
  Dictionary info = legacyInfo(*context, storeDemoMode(services.preferences));
  const Dictionary space = purgeableSpace(services.purgeableSpace);
  copyIfPresent(space, kTLM_Spacereap_totalPurgeable, info, kNANDInfoSpacereapTotalPurgeableKey);
  copyIfPresent(space, kTLM_Spacereap_totalNonPurgeable, info,
                kNANDInfoSpacereapTotalNonPurgeableKey);
  return info;
}

bool belongsToSink(char session, plist::Date today) {
  std::int64_t digit = 0;
  if (session >= '0' && session <= '9') digit = session - '0';
  if (session >= 'A' && session <= 'F') digit = session - 'A' + 10;
  const auto day =
      base::saturatingCast<std::int64_t>(today.secondsSince1970 / base::kSecondsPerDay);
  return (day & 1) == (digit & 1);
}

bool belongsToSink(platform::Kernel& kernel, platform::Clock& clock) {
  std::array<std::byte, 100> session{};
  if (kernel.sysctlbyname("kern.bootsessionuuid", session).error != 0) return false;
  return belongsToSink(static_cast<char>(session.front()), clock.now());
}

}  // namespace NANDInfo
