// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What is wrong with a buffer that is decoded all the same.
#pragma once

#include <cstdarg>
#include <string>

#include "base/Text.h"

namespace NANDInfo {

// Keeps the first thing that is said.
class Complaint {
 public:
  [[gnu::format(printf, 2, 3)]] void say(const char* format, ...) {
    if (!text_.empty()) return;
    std::va_list arguments;
    va_start(arguments, format);
    text_ = base::vformat(format, arguments);
    va_end(arguments);
  }

  const std::string& text() const { return text_; }

 private:
  std::string text_;
};

}  // namespace NANDInfo
