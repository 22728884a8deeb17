// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process's table of controller drivers. Programs that use the library can't reset it.
#pragma once

namespace NANDInfo {

// Sets the table to its first state.
void ResetExporters();

}  // namespace NANDInfo
