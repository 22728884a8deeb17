// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Commands.h"

#include <iterator>
#include <mutex>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "tools/nandinfo/Capture.h"
#include "tools/nandinfo/Counters.h"
#include "tools/nandinfo/Decode.h"
#include "tools/nandinfo/DecodeCapture.h"
#include "tools/nandinfo/Drives.h"
#include "tools/nandinfo/Health.h"

namespace nandinfo {

namespace {

using NANDInfo::Needs;
using plist::Value;

// The steps of the extraction, and the boot variables' memory, leave events.
CommandResult nvram(const Invocation& invocation) {
  return {Value(NANDInfo::gatherNVRAMStats(invocation.services))};
}

CommandResult extract(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  auto summary = NANDInfo::NandInfoExtractToEV_runAllSteps(
      invocation.services, nullptr, arguments.monthly ? NANDInfo::kAllowsMonthly : 0, true,
      arguments.from);
  return summary ? CommandResult(Value(*std::move(summary))) : CommandResult();
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

// What a command does beyond the query of its name.
constexpr struct {
  std::string_view name;
  std::uint16_t takes;
  CommandResult (*run)(const Invocation& invocation);
} kMore[] = {{"drives", kRecord, drives}, {"health", kAcknowledge, healthVerdict}};

// What no query does.
constexpr Command kOwn[] = {
    {nullptr, "nvram", "Send the use of the boot variables' memory", 0, Needs::nothing,
     "there is no such memory that tells", nvram},
    {nullptr, "extract", "Send the storage health as events, and sum it up", kSteps, Needs::answer,
     nullptr, extract},
    {nullptr, "dump", "Dump the controller's diagnostic lists into logs", 0, Needs::answer, nullptr,
     dump},
    {nullptr, "counters", "What is known of each counter, and where it may go", kNames,
     Needs::noDevice, nullptr, counters},
    {nullptr, "capture", "Save all that the commands read, as a device folder", kFolder,
     Needs::controller, nullptr, capture},
};

constexpr Command kDecodeCapture = {
    "decode", "capture",    "Every buffer of a captured device", kCapture, Needs::nothing,
    nullptr,  decodeCapture};

std::vector<Command> allCommands() {
  std::vector<Command> all;
  for (const NANDInfo::Query& query : NANDInfo::queries()) {
    Command& command =
        all.emplace_back(Command{query.group, query.name, query.description, query.takes,
                                 query.needs, query.empty, nullptr, &query});
    for (const auto& more : kMore) {
      if (query.group != nullptr || more.name != query.name) continue;
      command.takes |= more.takes;
      command.run = more.run;
    }
  }
  all.insert(all.end(), std::begin(kOwn), std::end(kOwn));
  for (const NANDInfo::BufferDecoder& decoder : NANDInfo::bufferDecoders()) {
    const auto takes = static_cast<std::uint16_t>(decoder.takes | kFile);
    all.push_back({"decode", decoder.kind, decoder.description, takes, Needs::nothing, nullptr,
                   nullptr, nullptr, &decoder});
  }
  all.push_back(kDecodeCapture);
  return all;
}

}  // namespace

std::span<const Command> commands() {
  static const std::vector<Command> all = allCommands();
  return all;
}

CommandResult run(const Command& command, const Invocation& invocation) {
  if (command.run != nullptr) return command.run(invocation);
  if (command.decoder != nullptr) return decodeFile(*command.decoder, invocation.arguments);
  auto answer = command.query->ask(invocation.services, invocation.arguments);
  return answer ? CommandResult(*std::move(answer)) : CommandResult();
}

const char* groupDescription(std::string_view group) {
  if (group == "health") return "The health figures of the flash memory";
  if (group == "ean") return "The EAN service's images";
  return "Decode a captured buffer";
}

}  // namespace nandinfo
