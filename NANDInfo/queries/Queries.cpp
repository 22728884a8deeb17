// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/Queries.h"

#include <algorithm>
#include <utility>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/queries/Drives.h"
#include "NANDInfo/queries/StorageHealth.h"

namespace NANDInfo {

namespace {

using plist::Dictionary;
using plist::Value;
using Answer = std::optional<Value>;

Answer answer(std::optional<Dictionary> dictionary) {
  return dictionary ? Answer(*std::move(dictionary)) : std::nullopt;
}

Answer ftl(const Services& services, const QueryOptions& options) {
  return answer(options.all ? CopyNANDFTLInfo(services, options.statKeys, true)
                            : CopyWhitelistedNANDFTLInfo(services, options.round));
}

// The functions that take the platform alone, and those that round on demand.
template <auto function>
Answer call(const Services& services, const QueryOptions&) {
  return answer(function(services));
}
template <auto function>
Answer callRounding(const Services& services, const QueryOptions& options) {
  return answer(function(services, options.round));
}
// Without the statistics, the health is what the library says when it doesn't know.
template <auto function>
Answer health(const Services& services, const QueryOptions&) {
  Dictionary figures = function(services);
  if (figures.find(kNANDHealthInfoMaxPercentUsed) == nullptr) return {};
  return figures;
}
template <auto function>
Answer callWithCode(const Services& services, const QueryOptions& options) {
  std::uint32_t code = 0;
  for (const char c : options.code) code = code << 8 | static_cast<unsigned char>(c);
  return Value(function(services, code));
}

Answer daily(const Services& services, const QueryOptions&) {
  return answer(CopyNANDInfoWithOptions(services));
}

Answer magazine(const Services& services, const QueryOptions& options) {
  return options.history
             ? CopySMagNANDFTLCustomHistoryInfo(services, 0)
             : CopySMagNANDFTLInfo(services, options.hours, options.noDelta ? 0 : 1, options.mode);
}

Answer drives(const Services& services, const QueryOptions&) {
  return describedDrives(services.registry);
}

Answer healthVerdict(const Services& services, const QueryOptions&) {
  return describe(storageHealth(services));
}

Answer recommendsDeletion(const Services& services, const QueryOptions&) {
  return NandRecommendsContentDeletion(services);
}

constexpr Query kQueries[] = {
    {nullptr, "info", "The basic counters, for the counters service", kNothing, Needs::answer,
     nullptr, call<CopyNANDInfo>},
    {nullptr, "daily", "The basic counters as the day's telemetry has them", kNothing,
     Needs::answer, "today all storage counters go to the analytics sink", daily},
    {nullptr, "ftl", "The whitelisted FTL statistics, or all of them", kRound | kAll, Needs::answer,
     nullptr, ftl},
    {nullptr, "msp", "The whitelisted statistics of each MSP", kRound, Needs::answer, nullptr,
     callRounding<CopyWhitelistedNANDMSPInfo>},
    {nullptr, "magazine", "What the FTL counters came to over the last hours", kWindow,
     Needs::answer, nullptr, magazine},
    {nullptr, "storage", "The storage summary with the EAN images", kRound, Needs::answer, nullptr,
     callRounding<CopyWhitelistedStorageStats>},
    {nullptr, "disk", "Capacity, fullness and available space", kNothing, Needs::nothing, nullptr,
     call<GetDiskInfo>},
    {nullptr, "freezer", "What the kernel's swap-out thread has written", kNothing, Needs::nothing,
     "there is no kernel snapshot, or no swap-out thread in it", call<CopyVMFreezerNANDInfo>},
    {nullptr, "drives", "This machine's flash drives, and what is known of each", kNothing,
     Needs::nothing, "there is none whose health can be told", drives},
    {nullptr, "health", "The verdict on the storage: good, watch, replace or unknown", kNothing,
     Needs::nothing, nullptr, healthVerdict},
    {"health", "servita", "The health for the warranty service", kNothing, Needs::answer, nullptr,
     call<CopyServitaNANDInfo>},
    {"health", "lab", "The health for internal lab tools", kNothing, Needs::answer, nullptr,
     health<CopyInternalLabNANDInfo>},
    {"health", "ota", "The health for system updates", kNothing, Needs::answer, nullptr,
     health<CopyOTANANDInfo>},
    {nullptr, "recommends-deletion", "Whether the controller asks for content to be deleted",
     kNothing, Needs::answer, nullptr, recommendsDeletion},
    {"ean", "image-size", "The size of an EAN image, in bytes", kCode, Needs::nothing, nullptr,
     callWithCode<GetEANImageSize>},
    {"ean", "update-count", "The number of an EAN image's updates", kCode, Needs::nothing, nullptr,
     callWithCode<GetEANUpdateCount>},
};

}  // namespace

std::span<const Query> queries() { return kQueries; }

std::string nameOf(const Query& query) {
  return query.group != nullptr ? std::string(query.group) + " " + query.name : query.name;
}

bool isCode(std::string_view text) {
  return text.size() == 4 &&
         std::all_of(text.begin(), text.end(), [](char c) { return c > ' ' && c < 0x7f; });
}

}  // namespace NANDInfo
