// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process: what morvend does between its start and its end.
#pragma once

#include "daemon/Services.h"
#include "device/DeviceContext.h"

namespace morvend {

// Acts on the argument vector as `main` gets it: without arguments serves messages until ten
// seconds pass without one or the process is told to end, with "-d" runs the gate, with "-f" or
// "-t" the daily sequence for yesterday or today. Everything that goes wrong is logged; the exit
// status is 0 in every case.
void RunProcess(const Services& services, DeviceContext& context, int argumentCount,
                const char* const* arguments);

}  // namespace morvend
