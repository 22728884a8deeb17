// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the system refuses, as errors: the one place that translates error numbers.
#pragma once

#include <cerrno>
#include <string_view>

#include "base/Result.h"
#include "host/files/FileDescriptor.h"

namespace host {

// What an error number says; errno's, just after the call that failed.
base::Error systemError(int number = errno);

// What is refused here though the system would do it: anything but a regular file, and to write to
// a file that has other names.
base::Error notRegular();
base::Error severalNames();

// A call that returns -1 on failure, with errno set.
base::Result<void> checked(int result);
base::Result<FileDescriptor> opened(int descriptor);

// Whether there is no such file.
bool isMissing(const base::Error& error);

// Nothing where there is no such file; else the error, at its place.
base::Result<void> unlessMissing(const base::Error& error, std::string_view place);

}  // namespace host
