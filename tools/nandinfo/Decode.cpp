#include "tools/nandinfo/Decode.h"

#include <fcntl.h>

#include <algorithm>
#include <cerrno>
#include <cstring>
#include <vector>

#include "NANDInfo/NANDInfo.h"
#include "platform/Text.h"
#include "platform/host/FileDescriptor.h"

namespace nandinfo {

namespace {

using NANDInfo::GenericParserCxt;
using platform::Array;
using platform::Dictionary;
using platform::Value;
using Bytes = std::vector<std::byte>;

// Of a file of any kind that can be read to its end.
platform::Result<Bytes> readInput(const std::string& path) {
  constexpr std::size_t kStep = std::size_t{1} << 16;
  const auto failed = [&path](const char* why) {
    return platform::Result<Bytes>::failure(path + ": " + why);
  };
  const platform::host::FileDescriptor file(
      path == "-" ? ::dup(STDIN_FILENO) : ::open(path.c_str(), O_RDONLY | O_CLOEXEC));
  if (!file) return failed(std::strerror(errno));
  Bytes bytes;
  for (;;) {
    const std::size_t filled = bytes.size();
    bytes.resize(filled + kStep);
    const ssize_t got = ::read(file.get(), bytes.data() + filled, kStep);
    const int error = errno;
    bytes.resize(filled + static_cast<std::size_t>(std::max<ssize_t>(got, 0)));
    if (got < 0 && error == EINTR) continue;
    if (got < 0) return failed(std::strerror(error));
    if (got == 0) return platform::Result<Bytes>::success(std::move(bytes));
    if (bytes.size() > NANDInfo::kLargestBuffer) return failed("longer than 16 MiB");
  }
}

CommandResult decoded(bool ok, const GenericParserCxt& context) {
  Array fields;
  fields.reserve(context.size());
  for (std::size_t i = 0; i < context.size(); ++i) {
    const GenericParserCxt::Field field = context[i];
    fields.push_back(Array{Value(field.name), Value(field.value)});
  }
  return CommandResult::success(Dictionary{
      {"ok", ok}, {"fields", std::move(fields)}, {"error", NANDInfo::GetAPIErrorMessage()}});
}

template <auto parse>
CommandResult decode(const Invocation& invocation) {
  const auto bytes = readInput(invocation.arguments.file);
  if (!bytes) return CommandResult::failure(bytes.error);
  GenericParserCxt context;
  const bool ok = parse(&context, *bytes) > 0;
  return decoded(ok, context);
}

constexpr CounterLayout kLayouts[] = {
    {"1y", 533, NANDInfo::parseCounters1y},
    {"1x-sandisk", 316, NANDInfo::parseCounters1xSandisk},
    {"1x-hynix", 312, NANDInfo::parseCounters1xHynix},
    {"generic", 121, NANDInfo::parseCountersAlgoGeneric},
    {"q8", 127, NANDInfo::parseCountersAlgoGenericQ8},
};

}  // namespace

CommandResult decodeFTL(const Invocation& invocation) {
  return decode<NANDInfo::ZMCFTLParseBufferToCxt>(invocation);
}
CommandResult decodeFTLStat(const Invocation& invocation) {
  return decode<NANDInfo::ZMCFTLParseStatKeyBufferToCxt>(invocation);
}
CommandResult decodeMSP(const Invocation& invocation) {
  return decode<NANDInfo::ZMCMSPParseBufferToCxt>(invocation);
}

CommandResult decodeLegacy(const Invocation& invocation) {
  const auto bytes = readInput(invocation.arguments.file);
  if (!bytes) return CommandResult::failure(bytes.error);
  NANDInfo::LegacyNandInfoCxt context;
  const bool ok = NANDInfo::ZMCParseBufferToCxt(&context, *bytes);
  return decoded(ok, context.fields);
}

CommandResult decodeCounters(const Invocation& invocation) {
  const Arguments& arguments = invocation.arguments;
  const CounterLayout* layout = findCounterLayout(arguments.layout);
  auto bytes = readInput(arguments.file);
  if (!bytes) return CommandResult::failure(bytes.error);
  if (bytes->size() < layout->words * sizeof(std::uint32_t)) {
    return CommandResult::failure(
        platform::format("%s: %zu bytes, but the layout %s reads %zu", arguments.file.c_str(),
                         bytes->size(), layout->name, layout->words * sizeof(std::uint32_t)));
  }
  bytes->resize(NANDInfo::kCounterBlockSize);
  NANDInfo::NandCountersRecord record{};
  layout->parse(std::span<const std::byte>(*bytes).first<NANDInfo::kCounterBlockSize>(), record);
  Array words;
  for (const std::uint32_t word : record) words.push_back(std::uint64_t{word});
  return CommandResult::success(std::move(words));
}

std::span<const CounterLayout> counterLayouts() { return kLayouts; }

const CounterLayout* findCounterLayout(std::string_view name) {
  const auto* layout = std::find_if(std::begin(kLayouts), std::end(kLayouts),
                                    [&](const CounterLayout& row) { return row.name == name; });
  return layout != std::end(kLayouts) ? layout : nullptr;
}

}  // namespace nandinfo
