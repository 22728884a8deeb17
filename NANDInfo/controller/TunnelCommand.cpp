// Tunnel commands: buffers of a size that the driver announces.

#include <algorithm>
#include <array>
#include <cstdint>
#include <new>
#include <optional>

#include "NANDInfo/APIErrorMessage.h"
#include "NANDInfo/Controller.h"
#include "NANDInfo/Services.h"
#include "base/ByteReader.h"
#include "platform/DeviceRegistry.h"

namespace NANDInfo {

namespace {

using BlockBytes = std::array<std::byte, 24>;

BlockBytes serialized(const TunnelCommandBlock& block) {
  BlockBytes bytes;
  auto place = bytes.begin();
  const auto put = [&](std::uint64_t value, int width) {
    for (int i = 0; i < width; ++i, value >>= 8) *place++ = static_cast<std::byte>(value & 0xFF);
  };
  put(block.opType, 4);
  put(block.sizeQuery, 4);
  put(block.argument, 4);
  put(block.inLength, 4);
  put(block.inBuffer, 8);
  return bytes;
}

std::optional<Buffer> allocate(std::uint32_t size) {
  if (size > kLargestBuffer) return std::nullopt;
  try {
    return Buffer(size);
  } catch (const std::bad_alloc&) {
    return std::nullopt;
  }
}

}  // namespace

bool executeTunnelCommand(const Services& services, platform::DriverConnection connection,
                          const nand_exporter_t* exporter, const SelectorPair* selectors,
                          TunnelCommandBlock& block, Buffer& buffer) {
  block.inLength = 0;
  block.inBuffer = 0;
  if (connection == 0) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid connection");
    return false;
  }
  if (exporter == nullptr || exporter->sizeSelector == 0 || exporter->dataSelector == 0) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid exporter");
    return false;
  }
  if (selectors == nullptr) {
    SetAPIErrorMessage("executeTunnelCommand: Invalid opType Selector");
    return false;
  }

  block.inLength = static_cast<std::uint32_t>(buffer.size());
  block.inBuffer = reinterpret_cast<std::uintptr_t>(&buffer);
  block.opType = selectors->sizeOpType;
  block.sizeQuery = 1;
  std::array<std::byte, 4> announced{};
  if (services.drivers
          .DrvCallStructMethod(connection, exporter->sizeSelector, serialized(block), announced)
          .status != 0) {
    SetAPIErrorMessage(
        "executeTunnelCommand: DrvCallStructMethod failed while retrieving data size");
    buffer.clear();
    return false;
  }

  auto data = allocate(base::littleEndian<std::uint32_t>(announced));
  if (!data) {
    SetAPIErrorMessage("executeTunnelCommand: Could not allocate buffer");
    return false;
  }
  block.opType = selectors->dataOpType;
  block.sizeQuery = 0;
  const auto answer = services.drivers.DrvCallStructMethod(connection, exporter->dataSelector,
                                                           serialized(block), *data);
  if (answer.status != 0) {
    SetAPIErrorMessage("executeTunnelCommand: DrvCallStructMethod failed while retrieving data");
    return false;
  }
  data->resize(std::min(answer.outputSize, data->size()));
  buffer = std::move(*data);
  return true;
}

}  // namespace NANDInfo
