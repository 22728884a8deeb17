// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The library's one error channel: the first message that the process ever recorded.
#pragma once

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// Records a message, cut to 1,023 bytes, if none is recorded yet; else does nothing, not even
// format.
void SetAPIErrorMessage(const char* format, ...) __attribute__((format(printf, 1, 2)));

// The recorded message, or "NA". It stays as it is for the rest of the process's life.
const char* GetAPIErrorMessage();

}  // namespace NANDInfo
