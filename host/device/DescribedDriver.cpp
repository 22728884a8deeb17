// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/device/DescribedDriver.h"

#include <sys/stat.h>

#include <algorithm>
#include <cstring>

#include "base/ByteReader.h"
#include "base/ByteWriter.h"
#include "base/Text.h"
#include "host/files/Files.h"
#include "host/files/SystemError.h"

namespace host {

using CallResult = platform::DriverConnections::CallResult;

namespace {

constexpr std::uint32_t kRecommendsDeletionMethod = 5;
constexpr std::uint32_t kTunnelMethods[] = {8, 9};
constexpr std::size_t kTunnelBlockSize = 24;

base::Result<std::uint64_t> sizeOfRegularFile(const FileDescriptor& file) {
  struct stat status;
  if (::fstat(file.get(), &status) != 0) return systemError();
  if (!S_ISREG(status.st_mode)) return notRegular();
  return static_cast<std::uint64_t>(status.st_size);
}

CallResult failure(platform::DriverStatus status) { return {status, 0}; }

CallResult deliver(const void* bytes, std::size_t length, std::span<std::byte> output) {
  const std::size_t delivered = std::min(length, output.size());
  if (delivered > 0) std::memcpy(output.data(), bytes, delivered);
  return {0, delivered};
}

CallResult deliverWord(std::uint32_t value, std::span<std::byte> output) {
  const auto bytes = base::littleEndianBytes(value);
  return deliver(bytes.data(), bytes.size(), output);
}

// One answer of the tunnel, whichever way it is written: a file or data, alone or in a dictionary
// that says how the phases differ.
struct Answer {
  explicit Answer(const plist::Value& value) : options(value.as<plist::Dictionary>()) {
    file = options != nullptr ? options->text("File") : value.as<std::string>();
    data = options != nullptr ? options->data("Data") : value.as<plist::Data>();
  }

  const plist::Number* option(const char* key) const {
    return options != nullptr ? options->number(key) : nullptr;
  }
  platform::DriverStatus failureOf(const char* phase) const {
    const plist::Number* status = option(phase);
    return status != nullptr ? static_cast<platform::DriverStatus>(status->uint64Value()) : 0;
  }

  const plist::Dictionary* options;
  const std::string* file;
  const plist::Data* data;
};

CallResult announce(const Answer& answer, DriverFiles& files, std::span<std::byte> output) {
  if (const platform::DriverStatus status = answer.failureOf("FailSize")) return failure(status);
  std::optional<std::uint64_t> size;
  if (const plist::Number* announced = answer.option("Announce")) {
    size = announced->uint64Value();
  } else if (answer.file != nullptr) {
    size = files.size(*answer.file);
    if (!size) return failure(kDriverFailed);
  } else if (answer.data != nullptr) {
    size = answer.data->size();
  }
  if (!size) return failure(kNotSupported);
  return deliverWord(static_cast<std::uint32_t>(std::min<std::uint64_t>(*size, UINT32_MAX)),
                     output);
}

CallResult deliverData(const Answer& answer, DriverFiles& files, std::span<std::byte> output) {
  if (const platform::DriverStatus status = answer.failureOf("FailData")) return failure(status);
  if (answer.file != nullptr) {
    const auto length = files.read(*answer.file, output);
    return length ? CallResult{0, *length} : failure(kDriverFailed);
  }
  if (answer.data == nullptr) return failure(kNotSupported);
  return deliver(answer.data->data(), answer.data->size(), output);
}

}  // namespace

void DriverFiles::say(const std::string& name, const std::string& problem) {
  if (!said_.insert(name).second) return;
  log_.log(platform::LogLevel::error, "%s/%s: %s", root_.hostPath("device").c_str(),
           shownText(name).c_str(), problem.c_str());
}

bool DriverFiles::isBelowDevice(const std::string& name) {
  const bool climbs = ("/" + name + "/").find("/../") != std::string::npos;
  if (climbs) say(name, "not below device/");
  return !climbs;
}

std::optional<std::uint64_t> DriverFiles::size(const std::string& name) {
  if (!isBelowDevice(name)) return std::nullopt;
  const auto size = root_.openForStatus("device/" + name).and_then(sizeOfRegularFile);
  if (!size) say(name, size.error().text);
  return size ? std::optional(*size) : std::nullopt;
}

std::optional<std::size_t> DriverFiles::read(const std::string& name, std::span<std::byte> output) {
  if (!isBelowDevice(name)) return std::nullopt;
  const auto bytes = root_.readFile("device/" + name, output.size());
  if (bytes) return deliver(bytes->data(), bytes->size(), output).outputSize;
  say(name, bytes.error().text);
  return std::nullopt;
}

bool DescribedDriver::isSet(const char* key) const {
  const plist::Number* value = answers_.number(key);
  return value != nullptr && value->boolValue();
}

CallResult DescribedDriver::callStructMethod(std::uint32_t method, std::span<const std::byte> input,
                                             std::span<std::byte> output) const {
  if (method == kRecommendsDeletionMethod) return recommendsDeletion(output);
  if (std::ranges::count(kTunnelMethods, method) > 0) return tunnel(input, output);
  return failure(kNotSupported);
}

CallResult DescribedDriver::recommendsDeletion(std::span<std::byte> output) const {
  if (const plist::Number* number = answers_.number("RecommendsDeletion")) {
    return deliverWord(static_cast<std::uint32_t>(number->uint64Value()), output);
  }
  const plist::Data* data = answers_.data("RecommendsDeletion");
  return data != nullptr ? deliver(data->data(), data->size(), output) : failure(kNotSupported);
}

const plist::Value* DescribedDriver::bufferFor(std::uint32_t opType, std::uint32_t argument) const {
  const plist::Dictionary* buffers = answers_.dictionary("Buffers");
  if (buffers == nullptr) return nullptr;
  const plist::Value* value = buffers->find(base::format("%u:%u", opType, argument));
  return value == nullptr && argument == 0 ? buffers->find(base::format("%u", opType)) : value;
}

CallResult DescribedDriver::tunnel(std::span<const std::byte> block,
                                   std::span<std::byte> output) const {
  if (block.size() < kTunnelBlockSize) return failure(kNotSupported);
  base::ByteReader reader(block);
  const auto opType = *reader.read<std::uint32_t>(), flags = *reader.read<std::uint32_t>(),
             word = *reader.read<std::uint32_t>();
  const bool asksForSize = (flags & 1) != 0;
  const plist::Value* value = bufferFor(opType, word != 0 ? word : flags >> 2 & 0xFF);
  if (value == nullptr) return failure(kNotSupported);
  const Answer answer(*value);
  return asksForSize ? announce(answer, files_, output) : deliverData(answer, files_, output);
}

platform::DriverStatus DescribedDriver::callScalarMethod(std::uint32_t method,
                                                         std::span<const std::uint64_t> input,
                                                         std::span<std::uint64_t> output) const {
  const plist::Dictionary* scalars = answers_.dictionary("Scalars");
  if (scalars == nullptr || input.empty() || output.empty() || input[0] > UINT32_MAX) {
    return kNotSupported;
  }
  std::string key = base::format("%u:", method);
  for (int shift = 24; shift >= 0; shift -= 8) key += static_cast<char>(input[0] >> shift);
  const plist::Number* answer = scalars->number(key);
  if (answer == nullptr) return kNotSupported;
  output[0] = answer->uint64Value();
  return 0;
}

}  // namespace host
