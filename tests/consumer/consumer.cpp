// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A program of somebody else's that loads the storage library.
#include <NANDInfo/NANDInfo.h>
#include <host/Library.h>
#include <platform/CountersService.h>
#include <platform/StandardStreams.h>
#include <platform/SystemLog.h>
#include "platform/SystemLog.h"

int main() {
  const auto services = host::makeServices();
  services->log.log(platform::LogLevel::debug, "not shown");
  services->streams.writeOutput(description(plist::Value(NANDInfo::GetDiskInfo(*services))) + "\n");
  services->counters.PLClientAddValueForScalarKey("consumer", 5);
  if (host::PLIsInternalDevice()) services->streams.writeOutput("internal\n");
}
