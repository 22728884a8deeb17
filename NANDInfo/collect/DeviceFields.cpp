// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/DeviceFields.h"

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Utilities.h"
#include "NANDInfo/collect/DerivedFields.h"
#include "NANDInfo/collect/DiskInfo.h"
#include "NANDInfo/collect/VMFreezer.h"
#include "platform/PreferenceStore.h"
#include "platform/PurgeableSpace.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

constexpr char kSpacereapError[] = "com.norba.NANDInfo.Spacereap.Error";

}  // namespace

std::int32_t storeDemoMode(platform::PreferenceStore& preferences) {
  return preferences.QNSPreferencesGetBooleanValue("StoreDemoMode", "com.norba.demo-settings") ? 1
                                                                                               : 0;
}

Dictionary purgeableSpace(platform::PurgeableSpace& space) {
  Dictionary info;
  if (!space.isPresent()) return info;
  const auto answer =
      space.SpacereapCopyItemizedPurgeableSpaceWithInfo({{"SPACEREAP_VOLUME", "/private/var"}});
  if (!answer) {
    SetAPIErrorMessage(
        "getSpacereapInfo: unable to get output from SpacereapCopyItemizedPurgeableSpaceWithInfo");
    return info;
  }
  if (answer->find(kSpacereapError) != nullptr) return info;
  copyIfPresent(*answer, "SPACEREAP_TOTAL_AVAILABLE", info, kTLM_Spacereap_totalPurgeable);
  copyIfPresent(*answer, "SPACEREAP_NONPURGEABLE_AMOUNT", info, kTLM_Spacereap_totalNonPurgeable);
  return info;
}

Dictionary deviceFields(const CollectServices& services) {
  Dictionary fields = purgeableSpace(services.purgeableSpace);
  addEntries(swapOutInfo(services.snapshots), fields);
  addEntries(diskInfo(services.files, services.deviceProperties), fields);
  fields.set(kTLM_storeDemoMode, storeDemoMode(services.preferences));
  return fields;
}

Dictionary otherFields(const CollectServices& services, const Dictionary* ftl) {
  Dictionary fields = deviceFields(services);
  if (ftl != nullptr) {
    addEntries(derivedFields(*ftl), fields);
  } else {
    SetAPIErrorMessage("gatherZMCFTLOtherData: ftlDict is NULL");
  }
  return fields;
}

}  // namespace NANDInfo
