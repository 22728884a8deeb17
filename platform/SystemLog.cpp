// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "platform/SystemLog.h"

#include "base/Text.h"

namespace platform {

void SystemLog::log(LogLevel level, const char* format, ...) {
  if (!shows(level)) return;
  std::va_list arguments;
  va_start(arguments, format);
  write(level, format, base::vformat(format, arguments));
  va_end(arguments);
}

}  // namespace platform
