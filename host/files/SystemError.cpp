// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/files/SystemError.h"

#include <cstring>
#include <system_error>

namespace host {

base::Error systemError(int number) {
  const auto what = static_cast<std::errc>(number);
  if (number == ELOOP) return {"too many links, or one where none is followed", what};
  return {std::strerror(number), what};
}

base::Error notRegular() { return {"not a regular file", std::errc::invalid_argument}; }
base::Error severalNames() { return {"a file with several names", std::errc::too_many_links}; }

base::Result<void> checked(int result) {
  if (result < 0) return systemError();
  return {};
}

base::Result<FileDescriptor> opened(int descriptor) {
  if (descriptor < 0) return systemError();
  return FileDescriptor(descriptor);
}

bool isMissing(const base::Error& error) { return error.is(std::errc::no_such_file_or_directory); }

base::Result<void> unlessMissing(const base::Error& error, std::string_view place) {
  if (isMissing(error)) return {};
  return error.at(place);
}

}  // namespace host
