// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/APIErrorMessage.h"

#include <cstdarg>
#include <cstdio>
#include <utility>

#include "NANDInfo/controller/APIErrorScope.h"

namespace NANDInfo {

namespace {

char message[1024];
bool recorded = false;

}  // namespace

void SetAPIErrorMessage(const char* format, ...) {
  if (recorded) return;
  std::va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(message, sizeof message, format, arguments);
  va_end(arguments);
  recorded = true;
}

const char* GetAPIErrorMessage() { return recorded ? message : "NA"; }

APIErrorScope::APIErrorScope()
    : outer_(recorded ? message : ""), outerRecorded_(std::exchange(recorded, false)) {}

APIErrorScope::~APIErrorScope() {
  recorded = outerRecorded_;
  if (recorded) std::snprintf(message, sizeof message, "%s", outer_.c_str());
}

}  // namespace NANDInfo
