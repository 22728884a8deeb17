// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Commands.h"

#include <algorithm>
#include <mutex>

#include "NANDInfo/NANDInfo.h"
#include "tools/nandinfo/Capture.h"
#include "tools/nandinfo/Counters.h"
#include "tools/nandinfo/Decode.h"
#include "tools/nandinfo/DecodeCapture.h"
#include "tools/nandinfo/Drives.h"
#include "tools/nandinfo/Health.h"

namespace nandinfo {

namespace {

using plist::Dictionary;
using plist::Value;

CommandResult result(std::optional<Dictionary> dictionary) {
  return dictionary ? Value(*std::move(dictionary)) : CommandResult();
}

CommandResult ftl(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  return result(arguments.all
                    ? NANDInfo::CopyNANDFTLInfo(invocation.services, arguments.statKeys, true)
                    : NANDInfo::CopyWhitelistedNANDFTLInfo(invocation.services, arguments.round));
}

// The functions that take the platform alone, and those that round on demand.
template <auto function>
CommandResult call(const Invocation& invocation) {
  return result(function(invocation.services));
}
template <auto function>
CommandResult callRounding(const Invocation& invocation) {
  return result(function(invocation.services, invocation.arguments.round));
}
// Without the statistics, the health is what the library says when it doesn't know.
template <auto function>
CommandResult health(const Invocation& invocation) {
  Dictionary figures = function(invocation.services);
  if (figures.find(NANDInfo::kNANDHealthInfoMaxPercentUsed) == nullptr) return {};
  return result(std::move(figures));
}
template <auto function>
CommandResult callWithCode(const Invocation& invocation) {
  std::uint32_t code = 0;
  for (const char c : invocation.arguments.code) code = code << 8 | static_cast<unsigned char>(c);
  return Value(function(invocation.services, code));
}

CommandResult daily(const Invocation& invocation) {
  return result(NANDInfo::CopyNANDInfoWithOptions(invocation.services));
}

CommandResult magazine(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  return result(arguments.history
                    ? NANDInfo::CopySMagNANDFTLCustomHistoryInfo(invocation.services, 0)
                    : NANDInfo::CopySMagNANDFTLInfo(invocation.services, arguments.hours,
                                                    arguments.noDelta ? 0 : 1, arguments.mode));
}

CommandResult extract(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  return result(NANDInfo::NandInfoExtractToEV_runAllSteps(
      invocation.services, nullptr, arguments.monthly ? NANDInfo::kAllowsMonthly : 0, true,
      arguments.from));
}

CommandResult dump(const Invocation& invocation) {
  // Whether the weekly log is due is asked and recorded by one process at a time.
  const auto alone = invocation.runLock != nullptr
                         ? std::unique_lock<platform::RunLock>(*invocation.runLock)
                         : std::unique_lock<platform::RunLock>();
  const bool handled = NANDInfo::DumpStorageStructuredLog(invocation.services, false);
  if (!handled) return {Value(false), base::Error{"not every list was dumped"}};
  return Value(true);
}

CommandResult recommendsDeletion(const Invocation& invocation) {
  return Value(NANDInfo::NandRecommendsContentDeletion(invocation.services));
}

constexpr Command kCommands[] = {
    {nullptr, "info", "The basic counters, for the counters service", kNothing, Needs::answer,
     nullptr, call<NANDInfo::CopyNANDInfo>},
    {nullptr, "daily", "The basic counters as the day's telemetry has them", kNothing,
     Needs::answer, "today all storage counters go to the analytics sink", daily},
    {nullptr, "ftl", "The whitelisted FTL statistics, or all of them", kRound | kAll, Needs::answer,
     nullptr, ftl},
    {nullptr, "msp", "The whitelisted statistics of each MSP", kRound, Needs::answer, nullptr,
     callRounding<NANDInfo::CopyWhitelistedNANDMSPInfo>},
    {nullptr, "magazine", "What the FTL counters came to over the last hours", kWindow,
     Needs::answer, nullptr, magazine},
    {nullptr, "storage", "The storage summary with the EAN images", kRound, Needs::answer, nullptr,
     callRounding<NANDInfo::CopyWhitelistedStorageStats>},
    {nullptr, "disk", "Capacity, fullness and available space", kNothing, Needs::nothing, nullptr,
     call<NANDInfo::GetDiskInfo>},
    {nullptr, "freezer", "What the kernel's swap-out thread has written", kNothing, Needs::nothing,
     "there is no kernel snapshot, or no swap-out thread in it",
     call<NANDInfo::CopyVMFreezerNANDInfo>},
    {nullptr, "drives", "This machine's flash drives, and what is known of each", kRecord,
     Needs::nothing, "there is none whose health can be told", drives},
    {nullptr, "health", "The verdict on the storage: good, watch, replace or unknown", kAcknowledge,
     Needs::nothing, nullptr, healthVerdict},
    {"health", "servita", "The health for the warranty service", kNothing, Needs::answer, nullptr,
     call<NANDInfo::CopyServitaNANDInfo>},
    {"health", "lab", "The health for internal lab tools", kNothing, Needs::answer, nullptr,
     health<NANDInfo::CopyInternalLabNANDInfo>},
    {"health", "ota", "The health for system updates", kNothing, Needs::answer, nullptr,
     health<NANDInfo::CopyOTANANDInfo>},
    {nullptr, "recommends-deletion", "Whether the controller asks for content to be deleted",
     kNothing, Needs::answer, nullptr, recommendsDeletion},
    {"ean", "image-size", "The size of an EAN image, in bytes", kCode, Needs::nothing, nullptr,
     callWithCode<NANDInfo::GetEANImageSize>},
    {"ean", "update-count", "The number of an EAN image's updates", kCode, Needs::nothing, nullptr,
     callWithCode<NANDInfo::GetEANUpdateCount>},
    {nullptr, "nvram", "Send the use of the boot variables' memory", kNothing, Needs::nothing,
     "there is no such memory that tells", call<NANDInfo::gatherNVRAMStats>},
    {nullptr, "extract", "Send the storage health as events, and sum it up", kSteps, Needs::answer,
     nullptr, extract},
    {nullptr, "dump", "Dump the controller's diagnostic lists into logs", kNothing, Needs::answer,
     nullptr, dump},
    {nullptr, "counters", "What is known of each counter, and where it may go", kNames,
     Needs::noDevice, nullptr, counters},
    {nullptr, "capture", "Save all that the commands read, as a device folder", kFolder,
     Needs::controller, nullptr, capture},
    {"decode", "ftl", "A buffer's FTL statistics under their names", kFile, Needs::nothing, nullptr,
     decodeFTL},
    {"decode", "ftl-stat", "A buffer's FTL statistics under their keys", kFile, Needs::nothing,
     nullptr, decodeFTLStat},
    {"decode", "legacy", "A buffer's FTL statistics in their legacy form", kFile, Needs::nothing,
     nullptr, decodeLegacy},
    {"decode", "msp", "A buffer's statistics of an MSP", kFile, Needs::nothing, nullptr, decodeMSP},
    {"decode", "validity", "A validity list: the values of each of its lists", kFile,
     Needs::nothing, nullptr, decodeValidity},
    {"decode", "telemetry", "A telemetry list: the summary and the counters of each channel",
     kLayout | kFile | kChannels, Needs::nothing, nullptr, decodeTelemetry},
    {"decode", "defects", "A defects list", kFile, Needs::nothing, nullptr, decodeDefects},
    {"decode", "snapshot", "A kernel snapshot: the swap-out thread's figures, and its items", kFile,
     Needs::nothing, nullptr, decodeSnapshot},
    {"decode", "capture", "Every buffer of a captured device", kCapture, Needs::nothing, nullptr,
     decodeCapture},
    {"decode", "counters", "A counter block as the 177 words of the common layout", kLayout | kFile,
     Needs::nothing, nullptr, decodeCounters},
};

}  // namespace

bool isCode(std::string_view text) {
  return text.size() == 4 &&
         std::all_of(text.begin(), text.end(), [](char c) { return c > ' ' && c < 0x7f; });
}

std::span<const Command> commands() { return kCommands; }

const char* groupDescription(std::string_view group) {
  if (group == "health") return "The health figures of the flash memory";
  if (group == "ean") return "The EAN service's images";
  return "Decode a captured buffer";
}

}  // namespace nandinfo
