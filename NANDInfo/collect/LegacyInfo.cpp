// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/LegacyInfo.h"

#include <array>
#include <string_view>

#include "NANDInfo/KeyMap.h"
#include "NANDInfo/Keys.h"
#include "NANDInfo/Whitelists.h"
#include "NANDInfo/decode/Weeks.h"

namespace NANDInfo {

using plist::Dictionary;

namespace {

// A partition's start that is not known.
constexpr std::uint64_t kNotSeen = 0xFFFFFFFF;

std::int64_t bits(std::uint64_t value) { return static_cast<std::int64_t>(value); }

// What several fields make together. Counts wrap around.
class Summary {
 public:
  // Whether the field was one of them.
  bool take(const GenericParserCxt::Field& field) {
    if (field.name == "userPartitionStart") {
      userStart_ = field.value;
    } else if (field.name == "intermediatePartitionStart") {
      intermediateStart_ = field.value;
    } else if (field.name == "numBootBlockRefreshSuccess0" ||
               field.name == "numBootBlockRefreshFail0") {
      requests_ += field.value;
    } else {
      return takeFailure(field);
    }
    return true;
  }

  void addTo(Dictionary& dictionary) const {
    if (userStart_ != kNotSeen && intermediateStart_ != kNotSeen) {
      dictionary.set(kNANDInfoIntermediatePartitionSizeKey, bits(userStart_ - intermediateStart_));
    }
    dictionary.set(kNANDInfoNumMaintenanceRequestsKey, bits(requests_));
    for (const Failures& failures : failures_) dictionary.set(failures.key, failures.count);
  }

 private:
  // How many of the boot blocks 0 to 2 failed.
  struct Failures {
    std::string_view name;
    const char* key;
    std::int64_t count = 0;
  };

  bool takeFailure(const GenericParserCxt::Field& field) {
    for (Failures& failures : failures_) {
      if (!field.name.starts_with(failures.name)) continue;
      const auto index = field.name.substr(failures.name.size());
      if (index != "0" && index != "1" && index != "2") continue;
      if (field.value != 0) ++failures.count;
      return true;
    }
    return false;
  }

  std::uint64_t userStart_ = kNotSeen, intermediateStart_ = kNotSeen, requests_ = 0;
  std::array<Failures, 3> failures_ = {
      {{"mspBootBlockReadFail", kNANDInfoMaintenanceFailedReadKey},
       {"mspBootBlockProgFail", kNANDInfoMaintenanceFailedProgKey},
       {"mspBootBlockEraseFail", kNANDInfoMaintenanceFailedEraseKey}}};
};

// Two durations are told no finer than to three digits.
std::int64_t reported(const GenericParserCxt::Field& field) {
  const bool isDuration = field.name == "maxMemLowDuration" || field.name == "maxMemChokeDuration";
  return bits(isDuration ? roundSig(static_cast<std::uint32_t>(field.value), 3) : field.value);
}

}  // namespace

Dictionary legacyInfo(const LegacyNandInfoCxt& context, std::optional<std::int32_t> demoMode) {
  Dictionary dictionary;
  const auto set32 = [&](const char* key, std::uint32_t value) {
    dictionary.set(key, static_cast<std::int32_t>(value));
  };
  const auto set64 = [&](const char* key, std::uint64_t value) {
    dictionary.set(key, bits(value));
  };
  if (demoMode) {
    set32(kNANDInfoExportVersionKey, context.exportVersion);
    set32(kNANDInfoDriverVersionKey, context.driverVersion);
    dictionary.set(kNANDInfoDemoModeKey, std::int64_t{*demoMode});
  }
  set32(kNANDInfoNumVirtualBlocksKey, context.numVirtualBlocks);
  set32(kNANDInfoPagesPerVirtualBlockKey, context.pagesPerVirtualBlock);
  set32(kNANDInfoBytesPerPageKey, context.bytesPerPage);
  set64(kNANDInfoNumLogicalReadsKey, context.hostReads);
  set64(kNANDInfoNumLogicalWritesKey, context.hostWrites);
  set64(kNANDInfoNumFreeVirtualBlocksKey, context.numFreeVirtualBlocks);
  set64(kNANDInfoNumWearLevelOpsKey, context.wearLevMoves);
  set64(kNANDInfoNumPhysicalReadsKey, context.nandReads);
  set64(kNANDInfoNumPhysicalWritesKey, context.nandWrites);
  set64(kNANDInfoNumPhysicalErasesKey, context.bandErases);
  set64(kNANDInfoNumNodesFreeKey, context.IND_pool_free);
  set64(kNANDInfoNumNodesTotalKey, context.IND_pool_count);
  set64(kNANDInfoNumSleepOpsKey, context.numSleepOps);
  set64(kNANDInfoHighEnduranceBlockEraseCountKey, context.maxHighEnduranceBlockErases);
  set32(kNANDInfoBlocksPerVirtualBlock, context.blocksPerVirtualBlock);
  dictionary.set(kNANDInfoFormatWeeksSince2000Key, weeksSince2000(context.utilFormatTime));
  for (std::size_t i = 0; i < context.readCountHisto.size(); ++i) {
    set64(kNANDInfoReadsBeforeErasureKeys[i], context.readCountHisto[i]);
  }
  Summary summary;
  for (std::size_t i = 0; i < context.fields.size(); ++i) {
    const auto field = context.fields[i];
    if (summary.take(field)) continue;
    if (const auto key = keyMapKey(field.name)) dictionary.set(*key, reported(field));
  }
  summary.addTo(dictionary);
  return dictionary;
}

}  // namespace NANDInfo
