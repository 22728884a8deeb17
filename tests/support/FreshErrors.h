// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The library's first error message, as it is when a process begins.
#pragma once

#include <optional>

#include "NANDInfo/controller/APIErrorScope.h"

namespace support {

inline void freshErrors() {
  static std::optional<NANDInfo::APIErrorScope> errors;
  errors.emplace();
}

}  // namespace support
