// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Where a failure ends that a result goes on without.
#pragma once

#include <optional>
#include <utility>

#include "NANDInfo/APIErrorMessage.h"
#include "base/Result.h"

namespace NANDInfo {

// The value. Of a failure nothing is handed on: why it failed is recorded as the process's message,
// and then what is missing for it, if that has a name; the first message of the process stays.
template <typename T>
std::optional<T> recorded(base::Result<T> result, const char* missing = nullptr) {
  if (!result) {
    SetAPIErrorMessage("%s", result.error().text.c_str());
    if (missing != nullptr) SetAPIErrorMessage("%s", missing);
  }
  return std::move(result).orNone();
}

}  // namespace NANDInfo
