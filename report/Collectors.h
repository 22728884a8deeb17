// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The values that the report collects itself, in the order in which they are added: each function
// reads one source and adds what the whitelist lets through.
#pragma once

#include "device/DeviceContext.h"
#include "platform/Eventra.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/LocaleService.h"
#include "platform/SystemLog.h"
#include "report/Sections.h"

namespace report {

// How many applications there are, all and the user's own. The same goes to the analytics sink as
// an event. Counted only if somebody wants it.
void addInstalledAppInfo(Sections& sections, platform::InstalledApplications& applications,
                         platform::Eventra& eventra);

// The user's language and region, as texts; the languages are "<unknown>" where there is none.
void addMetadataKeys(Sections& sections, platform::LocaleService& locale);

// Of the counters database: its size in MiB, and how often it was found corrupt, which is then
// counted from 0 again.
void reportDatabaseSize(Sections& sections, morvend::DeviceContext& context);

// Minutes awake since boot; -1, with a line in the log, when the ticks' length isn't known.
void reportCPUUptime(Sections& sections, platform::Kernel& kernel, platform::SystemLog& log);

// The kernel's memory statistics. A value that can't be read is all ones of its width; the values
// on which others depend are read whether or not a key is whitelisted.
void reportVMStats(Sections& sections, platform::Kernel& kernel);

}  // namespace report
