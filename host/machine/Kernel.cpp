// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/machine/Kernel.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstddef>
#include <cstdint>
#include <limits>
#include <optional>
#include <span>
#include <string_view>
#include <vector>

#include "base/ByteWriter.h"
#include "host/machine/SourceFiles.h"

namespace host::machine {

namespace {

constexpr std::size_t kBootIdLength = 36;
constexpr std::size_t kSwapUsageSize = 32;

std::uint64_t product(std::uint64_t left, std::uint64_t right) {
  std::uint64_t result = 0;
  const bool overflows = __builtin_mul_overflow(left, right, &result);
  return overflows ? std::numeric_limits<std::uint64_t>::max() : result;
}

// Items of chunked data: a type, the size of the payload, flags, the payload.
class ChunkedData {
 public:
  void item(std::uint32_t type, std::uint64_t flags, std::span<const std::byte> payload = {}) {
    base::appendLittleEndian(bytes_, type);
    base::appendLittleEndian(bytes_, static_cast<std::uint32_t>(payload.size()));
    base::appendLittleEndian(bytes_, flags);
    bytes_.insert(bytes_.end(), payload.begin(), payload.end());
  }
  std::vector<std::byte> take() { return std::move(bytes_); }

 private:
  std::vector<std::byte> bytes_;
};

std::vector<std::byte> snapshotOfSwapOut(std::uint64_t bytesWritten) {
  enum : std::uint32_t {
    kContainerBegin = 0x13,
    kContainerEnd = 0x14,
    kIOStatistics = 0x901,
    kThreadName = 0x909,
    kEndOfBuffer = 0xF19158ED
  };
  constexpr std::uint32_t kThread = 3;     // the kind of container
  constexpr std::uint64_t kContainer = 1;  // its identifier
  const auto name = std::as_bytes(std::span("VM_swapout"));
  const std::array<std::uint64_t, 4> statistics{0, 0, 0, bytesWritten};
  ChunkedData snapshot;
  snapshot.item(kContainerBegin, kContainer, base::littleEndianBytes(kThread));
  snapshot.item(kThreadName, 0, name);
  snapshot.item(kIOStatistics, 0, base::littleEndianBytes(statistics));
  snapshot.item(kContainerEnd, kContainer);
  snapshot.item(kEndOfBuffer, 0);
  return snapshot.take();
}

}  // namespace

platform::Kernel::ReadResult Kernel::sysctlbyname(std::string_view name,
                                                  std::span<std::byte> buffer) {
  if (name == "kern.bootsessionuuid") return bootSession(buffer);
  if (name == "vm.swapusage") return swapUsage(buffer);
  return failed(ENOENT);
}

platform::Kernel::ReadResult Kernel::bootSession(std::span<std::byte> buffer) {
  auto identifier = sourceLine(files_, "/proc/sys/kernel/random/boot_id");
  if (!identifier || identifier->size() != kBootIdLength ||
      identifier->find_first_not_of("0123456789abcdef-") != identifier->npos) {
    return failed(ENOENT);
  }
  for (char& c : *identifier) {
    if (c >= 'a') c = static_cast<char>(c - 'a' + 'A');
  }
  return delivered(*identifier, buffer);
}

platform::Kernel::ReadResult Kernel::swapUsage(std::span<std::byte> buffer) {
  const auto kibibytes = countNamed(sourceText(files_, "/proc/meminfo"), "SwapTotal:");
  if (!kibibytes) return failed(ENOENT);
  const auto total = base::littleEndianBytes(product(*kibibytes, 1024));
  std::array<std::byte, kSwapUsageSize> record{};
  std::ranges::copy(total, record.begin());
  return delivered(buffer.size() < record.size() ? std::span<const std::byte>(total) : record,
                   buffer);
}

std::optional<std::vector<std::byte>> KernelSnapshots::capture(std::uint32_t flags) {
  if ((flags & kChunkedData) == 0) return std::nullopt;
  const auto pages = countNamed(sourceText(files_, "/proc/vmstat"), "pswpout");
  if (!pages) return std::nullopt;
  return snapshotOfSwapOut(product(*pages, kernel_.pageSize()));
}

}  // namespace host::machine
