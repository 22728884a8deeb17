// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/nandinfo/Decode.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "base/Text.h"
#include "host/files/FileDescriptor.h"
#include "tools/nandinfo/BufferKind.h"
#include "tools/nandinfo/DecodedBuffer.h"

namespace nandinfo {

namespace {

using base::Error;
using plist::Array;
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

// What has been read; a failed one says which file it is about.
CommandResult outcome(const std::string& path, plist::Dictionary decoded) {
  const std::string* error = decoded.text("error");
  if (decoded.number("ok")->boolValue()) return plist::Value(std::move(decoded));
  Error why{*error != "NA" ? *error : "nothing in it can be decoded"};
  return {plist::Value(std::move(decoded)), why.at(path)};
}

template <auto decode>
CommandResult decodeFile(const Invocation& invocation) {
  const std::string& path = invocation.arguments.file;
  const auto bytes = readInput(path);
  return bytes ? outcome(path, decode(*bytes)) : bytes.error();
}

}  // namespace

CommandResult decodeFTL(const Invocation& invocation) { return decodeFile<decodedFTL>(invocation); }
CommandResult decodeFTLStat(const Invocation& invocation) {
  return decodeFile<decodedFTLStat>(invocation);
}
CommandResult decodeLegacy(const Invocation& invocation) {
  return decodeFile<decodedLegacy>(invocation);
}
CommandResult decodeMSP(const Invocation& invocation) { return decodeFile<decodedMSP>(invocation); }
CommandResult decodeValidity(const Invocation& invocation) {
  return decodeFile<decodedValidity>(invocation);
}
CommandResult decodeDefects(const Invocation& invocation) {
  return decodeFile<decodedDefects>(invocation);
}
CommandResult decodeSnapshot(const Invocation& invocation) {
  return decodeFile<decodedSnapshot>(invocation);
}

CommandResult decodeTelemetry(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  const auto bytes = readInput(arguments.file);
  if (!bytes) return bytes.error();
  return outcome(arguments.file, decodedTelemetry(*bytes, *findCounterLayout(arguments.layout),
                                                  arguments.channels));
}

CommandResult decodeCounters(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  const CounterLayout* layout = findCounterLayout(arguments.layout);
  auto bytes = readInput(arguments.file);
  if (!bytes) return bytes.error();
  if (const std::string why = whyNot(BufferKind::counters, *bytes); !why.empty()) {
    return Error{why}.at(arguments.file);
  }
  if (bytes->size() < layout->words * sizeof(std::uint32_t)) {
    return Error{base::format("%s: %zu bytes, but the layout %s reads %zu", arguments.file.c_str(),
                              bytes->size(), layout->name, layout->words * sizeof(std::uint32_t))};
  }
  bytes->resize(NANDInfo::kCounterBlockSize);
  NANDInfo::NandCountersRecord record{};
  layout->parse(std::span<const std::byte>(*bytes).first<NANDInfo::kCounterBlockSize>(), record);
  Array words;
  for (const std::uint32_t word : record) words.push_back(std::uint64_t{word});
  return plist::Value(std::move(words));
}

}  // namespace nandinfo
