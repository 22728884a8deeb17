// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Decode.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstddef>
#include <cstring>
#include <string>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "host/files/FileDescriptor.h"

namespace nandinfo {

namespace {

using base::Error;
using FileBytes = std::vector<std::byte>;

// Of a file of any kind that can be read to its end.
base::Result<FileBytes> readInput(const std::string& path) {
  constexpr std::size_t kStep = std::size_t{1} << 16;
  const auto failed = [&path](const char* why) { return Error{why}.at(path); };
  const host::FileDescriptor file(path == "-" ? ::dup(STDIN_FILENO)
                                              : ::open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (!file) return failed(std::strerror(errno));
  FileBytes bytes;
  for (;;) {
    const std::size_t filled = bytes.size();
    bytes.resize(filled + kStep);
    const ssize_t got = ::read(file.get(), bytes.data() + filled, kStep);
    const int error = errno;
    bytes.resize(filled + static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
    if (got < 0 && error == EINTR) continue;
    if (got < 0) return failed(std::strerror(error));
    if (got == 0) return bytes;
    if (bytes.size() > NANDInfo::kMaxBuffer) return failed("longer than 16 MiB");
  }
}

}  // namespace

CommandResult decodeFile(const NANDInfo::BufferDecoder& decoder, const Arguments& arguments) {
  const auto bytes = readInput(arguments.file);
  if (!bytes) return bytes.error();
  CommandResult result(decoder.decode(*bytes, arguments));
  if (result.error) result.error = result.error->at(arguments.file);
  return result;
}

}  // namespace nandinfo
