// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/DriverService.h"

#include <algorithm>
#include <array>
#include <cstring>
#include <utility>

#include "base/ByteReader.h"
#include "base/ByteWriter.h"

namespace NANDInfo {

namespace {

using BlockBytes = std::array<std::byte, 24>;

constexpr std::uint32_t kSizeQuery = 1;

BlockBytes block(const TunnelCommand& command, std::uint32_t opType, std::uint32_t flags) {
  BlockBytes bytes;
  auto place = bytes.begin();
  for (const std::uint32_t word : {opType, flags, command.argument, command.inLength}) {
    place = std::ranges::copy(base::littleEndianBytes(word), place).out;
  }
  std::ranges::copy(base::littleEndianBytes(command.inBuffer), place);
  return bytes;
}

// Zeroed memory that begins at a page; null when it is refused, and for no bytes.
std::byte* allocatePages(std::size_t size) {
  constexpr std::size_t kMaxPage = 16384;
  if (size > kMaxBuffer) return nullptr;
  const std::size_t rounded = (size + kMaxPage - 1) / kMaxPage * kMaxPage;
  void* const pages = rounded != 0 ? std::aligned_alloc(kMaxPage, rounded) : nullptr;
  if (pages != nullptr) std::memset(pages, 0, rounded);
  return static_cast<std::byte*>(pages);
}

}  // namespace

DriverService DriverService::matching(const DriverAccess& access, std::string_view className) {
  return {access, Handles{.service = access.registry.DrvGetMatchingService(className)}};
}

DriverService DriverService::walkedTo(const DriverAccess& access, std::string_view className) {
  auto& registry = access.registry;
  const DriverService root(access, Handles{.service = registry.rootEntry()});
  const DriverService walk(access,
                           Handles{.service = root.isPresent() ? registry.createIterator() : 0});
  while (const auto object = walk.isPresent() ? registry.next(walk.handles_.service) : 0) {
    DriverService entry(access, Handles{.service = object});
    if (registry.conformsTo(object, className)) return entry;
  }
  return {access, Handles{}};
}

DriverService::DriverService(DriverService&& other) noexcept
    : access_(other.access_), handles_(other.release()) {}

DriverService::~DriverService() {
  close();
  if (handles_.service != 0) access_.registry.release(handles_.service);
}

platform::DriverStatus DriverService::open() {
  const auto opened = access_.drivers.DrvServiceOpen(handles_.service, 0);
  handles_.connection = opened.connection;
  return opened.status;
}

platform::DriverStatus DriverService::close() {
  const auto connection = std::exchange(handles_.connection, 0);
  return connection != 0 ? access_.drivers.DrvServiceClose(connection) : 0;
}

std::optional<plist::Value> DriverService::property(
    std::string_view key, platform::DeviceRegistry::Direction direction) const {
  return access_.registry.searchProperty(handles_.service, key, direction);
}

TunnelAnswer DriverService::exchange(const TunnelCommand& command) const {
  using Failure = TunnelAnswer::Failure;
  TunnelAnswer answer;
  const auto fail = [&answer](Failure failure, platform::DriverStatus status) {
    answer.failure = failure;
    answer.status = status;
    answer.memory_.reset();
  };
  std::array<std::byte, 4> announced{};
  const auto asked = access_.drivers.DrvCallStructMethod(
      handles_.connection, command.sizeMethod,
      block(command, command.opTypes.sizeOpType, command.flags | kSizeQuery), announced);
  if (asked.status != 0) {
    fail(Failure::size, asked.status);
    return answer;
  }
  answer.announced = base::littleEndian<std::uint32_t>(announced);
  if (answer.announced == 0 && !command.fetchesNothing) return answer;
  answer.memory_.reset(allocatePages(answer.announced));
  if (!answer.memory_ && answer.announced != 0) {
    fail(Failure::memory, 0);
    return answer;
  }
  const auto fetched =
      access_.drivers.DrvCallStructMethod(handles_.connection, command.dataMethod,
                                          block(command, command.opTypes.dataOpType, command.flags),
                                          std::span(answer.memory_.get(), answer.announced));
  if (fetched.status != 0) {
    fail(Failure::data, fetched.status);
  } else {
    answer.delivered_ = std::min<std::size_t>(fetched.outputSize, answer.announced);
  }
  return answer;
}

platform::DriverConnections::CallResult DriverService::call(std::uint32_t method,
                                                            std::span<std::byte> output) const {
  return access_.drivers.DrvCallStructMethod(handles_.connection, method, {}, output);
}

platform::DriverStatus DriverService::call(std::uint32_t method,
                                           std::span<const std::uint64_t> input,
                                           std::span<std::uint64_t> output) const {
  return access_.drivers.DrvCallMethod(handles_.connection, method, input, output);
}

DriverService::Handles DriverService::release() { return std::exchange(handles_, Handles{}); }

}  // namespace NANDInfo
