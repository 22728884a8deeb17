// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the command line can ask for: one row a command.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/Services.h"
#include "base/Result.h"
#include "platform/RunLock.h"
#include "plist/Value.h"

namespace nandinfo {

// What the command line says; each command looks at its own part.
struct Arguments {
  bool round = false, all = false, statKeys = false, noDelta = false, history = false,
       monthly = false, redact = false, record = false, acknowledge = false;
  std::uint32_t hours = 0, mode = 2, from = 0, channels = 0;  // channels: 0 if it isn't said
  std::string code, layout, file, folder;
  std::vector<std::string> names;
};

// What became of the record of each drive of this machine, by its name.
using RecordedDrives = std::vector<std::pair<std::string, base::Result<void>>>;

struct Invocation {
  const NANDInfo::Services& services;
  const Arguments& arguments;
  std::function<void(const std::string&)> progress;
  std::size_t width = 80;  // of the terminal, in columns
  // What only some commands use: reads this machine's NVMe drives, and brings preferences to disk.
  std::function<base::Result<RecordedDrives>()> recordDrives = {};
  std::function<base::Result<void>()> kept = {};
  platform::RunLock* runLock = nullptr;  // held by what leaves logs that are due now and then
};

// What a command came to: a value to print, or none; and why the work failed, where the command
// knows better than the library.
struct [[nodiscard]] CommandResult {
  CommandResult() = default;
  CommandResult(plist::Value shown, std::optional<base::Error> failure = {})
      : value(std::move(shown)), error(std::move(failure)) {}
  CommandResult(base::Error failure) : error(std::move(failure)) {}

  std::optional<plist::Value> value;
  std::optional<base::Error> error;
  std::string text = {};  // what a terminal shows instead of the value's table; empty: nothing else
  int status = 0;         // the exit status, unless the work failed
};

// The parts of the command line that a command takes.
enum Takes : std::uint16_t {
  kNothing = 0,
  kRound = 1,
  kAll = 2,
  kCode = 4,
  kFile = 8,
  kLayout = 16,
  kFolder = 32,
  kWindow = 64,
  kSteps = 128,
  kCapture = 256,
  kChannels = 512,
  kNames = 1024,
  kRecord = 2048,
  kAcknowledge = 4096,
};

// What a command needs before its result means something: not even a device; nothing of a storage
// controller; that it can be opened (and the command itself says so when it can't); an answer.
enum class Needs : std::uint8_t { noDevice, nothing, controller, answer };

struct Command {
  const char* group;  // the word before the name, or null
  const char* name;
  const char* description;
  std::uint16_t takes;  // of Takes
  Needs needs;
  const char* empty;  // what an empty result means to a person, or null
  CommandResult (*run)(const Invocation& invocation);
};

// Commands of one group stand together. A command may have the name of the group that follows it:
// it is what the group's word alone means.
std::span<const Command> commands();

// Whether a text is the code of an image: four printable characters.
bool isCode(std::string_view text);

// What the groups are, for the help.
const char* groupDescription(std::string_view group);

}  // namespace nandinfo
