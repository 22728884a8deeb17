#include "NANDInfo/SnapshotReader.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "NANDInfo/ByteReader.h"

namespace NANDInfo {

namespace {

enum : std::uint32_t {
  kContainerBegin = 0x13,
  kContainerEnd = 0x14,
  kIOStatistics = 0x901,
  kThreadName = 0x909,
  kEndOfBuffer = 0xF19158ED
};

constexpr std::size_t kSmallestContainerPayload = 4;  // its type
constexpr std::size_t kLongestThreadName = 64;

using Bytes = std::span<const std::byte>;

struct Item {
  std::uint32_t type;
  std::uint64_t flags;  // of a container's begin and end: which container
  Bytes payload;
};

// The next item; none at the end of the buffer, or when the item runs over it.
std::optional<Item> nextItem(ByteReader& reader) {
  const auto type = reader.read<std::uint32_t>();
  const auto size = reader.read<std::uint32_t>();
  const auto flags = reader.read<std::uint64_t>();
  if (!flags || *type == kEndOfBuffer) return std::nullopt;
  const auto payload = reader.take(*size);
  if (!payload) return std::nullopt;
  return Item{*type, *flags, *payload};
}

// A container whose end hasn't come yet.
struct Container {
  std::uint64_t identifier;
  std::optional<Bytes> threadName;
  Bytes statistics;

  // A name item need not hold a final zero; an empty one agrees with every name.
  bool isOfThread(std::string_view wanted) const {
    if (!threadName) return false;
    const std::size_t length = std::min(threadName->size(), kLongestThreadName);
    for (std::size_t i = 0; i < length; ++i) {
      const char character = static_cast<char>((*threadName)[i]);
      if (character != (i < wanted.size() ? wanted[i] : '\0')) return false;
      if (character == '\0') break;
    }
    return true;
  }
};

}  // namespace

std::optional<Bytes> getIOStatsWithThreadnameFromKCData(Bytes snapshot,
                                                        std::string_view threadName) {
  ByteReader reader(snapshot);
  std::vector<Container> open;  // a stack of our own: how deep they nest is up to the input
  while (const auto item = nextItem(reader)) {
    if (item->type == kContainerBegin && item->payload.size() >= kSmallestContainerPayload) {
      open.push_back({item->flags, std::nullopt, {}});
    } else if (open.empty()) {
      continue;
    } else if (item->type == kContainerEnd && item->flags == open.back().identifier) {
      if (open.back().isOfThread(threadName)) return open.back().statistics;
      open.pop_back();
      if (open.empty()) return std::nullopt;
    } else if (item->type == kThreadName) {
      open.back().threadName = item->payload;
    } else if (item->type == kIOStatistics) {
      open.back().statistics = item->payload;
    }
  }
  const auto found = std::find_if(open.rbegin(), open.rend(), [&](const Container& container) {
    return container.isOfThread(threadName);
  });
  return found != open.rend() ? std::optional(found->statistics) : std::nullopt;
}

}  // namespace NANDInfo
