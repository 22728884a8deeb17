// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/SnapshotReader.h"

#include <algorithm>
#include <cstdint>
#include <vector>

#include "base/ByteReader.h"

namespace NANDInfo {

namespace {

enum : std::uint32_t {
  kContainerBegin = 0x13,
  kContainerEnd = 0x14,
  kIOStatistics = 0x901,
  kThreadName = 0x909,
  kEndOfBuffer = 0xF19158ED
};

constexpr std::size_t kMinContainerPayload = 4;  // its type
constexpr std::size_t kMaxThreadName = 64;

using Bytes = std::span<const std::byte>;

struct Item {
  std::uint32_t type;
  std::uint64_t flags;  // of a container's begin and end: which container
  Bytes payload;
};

// The next item; none, with the reader where it is, when it runs over the end of the buffer.
std::optional<Item> nextItem(base::ByteReader& reader) {
  base::ByteReader ahead = reader;
  const auto type = ahead.read<std::uint32_t>();
  const auto size = ahead.read<std::uint32_t>();
  const auto flags = ahead.read<std::uint64_t>();
  const auto payload = flags ? ahead.take(*size) : std::nullopt;
  if (!payload) return std::nullopt;
  reader = ahead;
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
    const std::size_t length = std::min(threadName->size(), kMaxThreadName);
    for (std::size_t i = 0; i < length; ++i) {
      const char character = static_cast<char>((*threadName)[i]);
      if (character != (i < wanted.size() ? wanted[i] : '\0')) return false;
      if (character == '\0') break;
    }
    return true;
  }
};

}  // namespace

std::optional<Bytes> getIOStatsWithThreadnameFromKCDataHelper(Bytes snapshot,
                                                              std::string_view threadName,
                                                              KCDataPosition& stopped) {
  stopped = {0, snapshot.size()};
  if (threadName.data() == nullptr) return std::nullopt;
  base::ByteReader reader(snapshot);
  std::vector<Container> open;  // a stack of our own: how deep they nest is up to the input
  for (;;) {
    stopped.item = snapshot.size() - reader.rest().size();
    const auto item = nextItem(reader);
    const bool begins =
        item && item->type == kContainerBegin && item->payload.size() >= kMinContainerPayload;
    const bool ends =
        !item || item->type == kEndOfBuffer ||
        (item->type == kContainerEnd && !open.empty() && item->flags == open.back().identifier);
    if (begins) {
      open.push_back({item->flags, std::nullopt, {}});
    } else if (ends) {
      if (open.empty()) return std::nullopt;
      if (open.back().isOfThread(threadName)) return open.back().statistics;
      open.pop_back();
      if (open.empty()) return std::nullopt;
    } else if (open.empty()) {
      continue;
    } else if (item->type == kThreadName) {
      open.back().threadName = item->payload;
    } else if (item->type == kIOStatistics) {
      open.back().statistics = item->payload;
    }
  }
}

std::optional<Bytes> getIOStatsWithThreadnameFromKCData(Bytes snapshot,
                                                        std::string_view threadName) {
  KCDataPosition stopped;
  return getIOStatsWithThreadnameFromKCDataHelper(snapshot, threadName, stopped);
}

}  // namespace NANDInfo
