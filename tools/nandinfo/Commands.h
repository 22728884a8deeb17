// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the command line can ask for: one row a command.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <span>
#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include "NANDInfo/Services.h"
#include "NANDInfo/queries/BufferDecoders.h"
#include "NANDInfo/queries/Outcome.h"
#include "NANDInfo/queries/Queries.h"
#include "base/Result.h"
#include "platform/RunLock.h"

namespace nandinfo {

// What the command line says; each command looks at its own part.
struct Arguments : NANDInfo::QueryOptions, NANDInfo::BufferOptions {
  bool monthly = false, redact = false, record = false, acknowledge = false;
  std::uint32_t from = 0;
  std::string file, folder;
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
struct [[nodiscard]] CommandResult : NANDInfo::Outcome {
  using Outcome::Outcome;
  CommandResult(Outcome outcome) : Outcome(std::move(outcome)) {}

  std::string text = {};  // what a terminal shows instead of the value's table; empty: nothing else
  int status = 0;         // the exit status, unless the work failed
};

// The parts of the command line that a command takes, besides the options of queries and buffers.
enum Takes : std::uint16_t {
  kFile = NANDInfo::kBufferTakesEnd,
  kFolder = kFile << 1,
  kSteps = kFile << 2,
  kCapture = kFile << 3,
  kNames = kFile << 4,
  kRecord = kFile << 5,
  kAcknowledge = kFile << 6,
};

struct Command {
  const char* group;  // the word before the name, or null
  const char* name;
  const char* description;
  std::uint16_t takes;  // of QueryTakes, BufferTakes and Takes
  NANDInfo::Needs needs;
  const char* empty;  // what an empty result means to a person, or null
  // Null: what the command asks is the library's query, or the decoder of a file.
  CommandResult (*run)(const Invocation& invocation);
  const NANDInfo::Query* query = nullptr;
  const NANDInfo::BufferDecoder* decoder = nullptr;
};

// The library's queries, then what else a command line can ask for. Commands of one group stand
// together. A command may have the name of the group that follows it: it is what the group's word
// alone means.
std::span<const Command> commands();

// Runs a command of the table.
CommandResult run(const Command& command, const Invocation& invocation);

// What the groups are, for the help.
const char* groupDescription(std::string_view group);

}  // namespace nandinfo
