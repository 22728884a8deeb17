// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The command nandinfo: calls the storage library and prints what it returns.
#pragma once

#include <cstddef>
#include <functional>
#include <ostream>

#include "NANDInfo/Services.h"
#include "platform/RunLock.h"
#include "tools/common/CommandLog.h"
#include "tools/nandinfo/Commands.h"

namespace nandinfo {

struct CommandServices {
  NANDInfo::Services storage;
  std::ostream& out;
  std::ostream& err;
  bool outIsTerminal = false;        // then results are tables for people, else JSON
  bool errIsTerminal = false;        // then long work shows its progress there
  std::size_t width = 80;            // of the terminal, in columns
  base::Result<void> root = {};      // whether the device root is there
  tools::CommandLog* log = nullptr;  // the services', for the reasons of a failure
  // As Invocation has them.
  std::function<base::Result<RecordedDrives>()> recordDrives = {};
  std::function<base::Result<void>()> kept = {};
  platform::RunLock* runLock = nullptr;
};

// Runs the command line; returns the exit status: 0 done; 1 the work failed, with one line on
// `err`; 2 wrong usage; what a verdict comes to.
int runNandinfo(const CommandServices& services, int argc, const char* const* argv);

}  // namespace nandinfo
