// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/APIErrorMessage.h"

#include <cstdarg>
#include <cstdio>
#include <utility>

#include "NANDInfo/controller/APIErrorScope.h"

namespace NANDInfo {

namespace {

APIErrorChannel ofTheProcess;
thread_local APIErrorChannel* current = &ofTheProcess;

}  // namespace

void SetAPIErrorMessage(const char* format, ...) {
  if (current->recorded) return;
  std::va_list arguments;
  va_start(arguments, format);
  std::vsnprintf(current->message, sizeof current->message, format, arguments);
  va_end(arguments);
  current->recorded = true;
}

const char* GetAPIErrorMessage() { return current->recorded ? current->message : "NA"; }

APIErrorScope::APIErrorScope() : outer_(std::exchange(current, &own_)) {}

APIErrorScope::~APIErrorScope() { current = outer_; }

}  // namespace NANDInfo
