// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's table of controller drivers. Programs that use the library can't reset it.
#pragma once

#include <array>

#include "NANDInfo/Controller.h"

namespace NANDInfo {

// A table in its first state, for a call that doesn't share the process's.
using ExporterTable = std::array<nand_exporter_t, kExporters + 1>;
ExporterTable freshExporters();

// Sets the table to its first state.
void ResetExporters();

}  // namespace NANDInfo
