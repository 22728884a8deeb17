// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The kernel's memory error events: what each read delivers, up to the tenth event.

#include <cerrno>
#include <string>
#include <vector>

#include "Input.h"
#include "daemon/EccEvents.h"
#include "platform/testing/FakePlatform.h"

namespace {

using fuzz::require;

void checkLogged(const plist::Dictionary& data) {
  const auto* count = data.number("count");
  const auto* id = data.number("id");
  require(id != nullptr && count != nullptr, "an event has an id and a count");
  require(id->int64Value() >= 0 && id->int64Value() < 256, "an id is a byte");
  const auto entries = std::min<std::size_t>(count->uint64Value(), 8);
  require(count->int64Value() < 256 && data.size() == 2 + entries, "entries that count are logged");
  for (std::size_t i = 0; i < entries; ++i) {
    require(data.number("reg" + std::to_string(i)) != nullptr, "each under its name");
  }
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  platform::fakes::Journal journal;
  platform::fakes::FakeHousekeeping housekeeping(journal);
  platform::fakes::RecordingLog log;
  platform::fakes::FakeKernel kernel;
  fuzz::Input input(bytes, size);
  std::vector<std::vector<std::byte>> delivered;
  auto& deliveries = kernel.deliveries["kern.next_ecc_event"];
  while (!input.empty() && deliveries.size() < 12) {
    // Reads that fail have no bytes.
    constexpr int kErrors[] = {0, 0, 0, ENOMEM, ENOENT, EBUSY};
    const std::uint8_t head = input.number<std::uint8_t>();
    const int error = head < std::size(kErrors) ? kErrors[head] : 0;
    const auto event = input.bytes(error != 0 ? 0 : input.number<std::uint8_t>());
    deliveries.push_back({error, {event.begin(), event.end()}});
    delivered.emplace_back(event.begin(), event.end());
  }
  morvend::CollectEccEvents(kernel, housekeeping, log);
  const auto& logs = housekeeping.structured;
  require(logs.size() <= 10 && logs.size() <= delivered.size(), "ten events at most");
  std::size_t room = morvend::kEccEventRecordSize;
  for (std::size_t i = 0; i < kernel.rooms.size(); ++i) {
    require(kernel.rooms[i] <= room, "a read is offered no more than the last one returned");
    room = std::min(kernel.rooms[i], delivered[i].size());
  }
  for (std::size_t i = 0; i < logs.size(); ++i) {
    require(logs[i].first == 172, "events are of one type");
    checkLogged(logs[i].second);
  }
  require(log.lines().size() <= 1, "one failure ends it");
  if (!logs.empty() && delivered[0].size() >= 16) {
    const auto& data = logs[0].second;
    const auto* first = data.number("reg0");
    const auto word = base::littleEndian<std::uint64_t>(std::span(delivered[0]).subspan<8, 8>());
    require(first == nullptr || first->uint64Value() == word, "an entry is the record's");
  }
  return 0;
}
