// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Kernel snapshots: nesting, cuts, lies about sizes, and the one counter that is read from them.

#include <gtest/gtest.h>

#include <cstdint>
#include <string>

#include "NANDInfo/SnapshotReader.h"
#include "support/StorageDevice.h"

namespace NANDInfo {
namespace {

using support::Bytes, support::put;

Bytes item(std::uint32_t type, std::uint64_t flags, const Bytes& payload = {}) {
  Bytes bytes;
  put(bytes, type, 4);
  put(bytes, payload.size(), 4);
  put(bytes, flags, 8);
  bytes.insert(bytes.end(), payload.begin(), payload.end());
  return bytes;
}

Bytes operator+(Bytes left, const Bytes& right) {
  left.insert(left.end(), right.begin(), right.end());
  return left;
}

Bytes begin(std::uint64_t id) { return item(0x13, id, Bytes(4)); }
Bytes end(std::uint64_t id) { return item(0x14, id); }
const Bytes kStop = item(0xF19158ED, 0);

Bytes name(const std::string& text) {
  const auto* first = reinterpret_cast<const std::byte*>(text.data());
  return item(0x909, 0, Bytes(first, first + text.size()));
}
Bytes statistics(std::uint64_t written) {
  return item(0x901, 0, support::words({1, 2, 3, written, 5}));
}
Bytes thread(std::uint64_t id, const std::string& text, std::uint64_t written) {
  return begin(id) + name(text) + statistics(written) + end(id);
}

const std::string kSwapout("VM_swapout\0", 11);

struct Row {
  const char* what;
  Bytes snapshot;
  std::int64_t written;  // -1: the thread isn't found
};

const Row kRows[] = {
    {"nothing", {}, -1},
    {"no container", name(kSwapout) + statistics(7), -1},
    {"after its neighbours",
     begin(1) + thread(2, "a", 1) + begin(3) + end(3) + thread(4, kSwapout, 7) + end(1), 7},
    {"items in front, arrays stepped over",
     item(0x59A25807, 0, Bytes(5)) + name("x") + begin(1) + item(0x2A, 0, Bytes(3)) +
         thread(2, kSwapout, 7),
     7},
    {"an outer thread behind its inner ones",
     begin(1) + thread(2, "a", 1) + name(kSwapout) + statistics(7) + end(1), 7},
    {"a second container of the top level", thread(1, "a", 1) + thread(2, kSwapout, 7), -1},
    {"the first of two", begin(9) + thread(1, kSwapout, 7) + thread(2, kSwapout, 8), 7},
    {"a longer name", thread(1, "VM_swapout_x", 7), -1},
    {"a longer name cut to ten", thread(1, "VM_swapout", 7), 7},
    {"a shorter item", thread(1, "VM_sw", 7), 7},
    {"a shorter name", thread(1, std::string("VM_sw\0", 6), 7), -1},
    {"an empty item", thread(1, "", 7), 7},
    {"the later of two names", begin(1) + name(kSwapout) + statistics(7) + name("a") + end(1), -1},
    {"no statistics", begin(1) + name(kSwapout) + end(1), 0},
    {"statistics of three counters",
     begin(1) + name(kSwapout) + item(0x901, 0, support::words({1, 2, 3})) + end(1), 0},
    {"statistics of another", begin(1) + statistics(9) + begin(2) + name(kSwapout) + end(2), 0},
    {"another one's end", begin(1) + end(2) + name(kSwapout) + statistics(7) + end(1), 7},
    {"a begin without a type inside",
     begin(1) + item(0x13, 2, Bytes(3)) + name(kSwapout) + statistics(7), 7},
    {"the stop before the end", begin(1) + name(kSwapout) + kStop + statistics(7) + end(1), 0},
    {"the stop in a nested one, and what follows it",
     begin(1) + begin(2) + name("a") + kStop + thread(3, kSwapout, 7) + end(1), 7},
    {"more than 32 bits", thread(1, kSwapout, 5'000'000'000'000), 5'000'000'000'000},
    {"the stop before the container", kStop + thread(1, kSwapout, 7), -1},
    {"half a header", begin(1) + name(kSwapout) + statistics(7) + Bytes(15), 7},
};

TEST(Snapshot, TheThreadIsFoundWhereverItIs) {
  for (const Row& row : kRows) {
    SCOPED_TRACE(row.what);
    support::StorageDevice device;
    device.snapshots.snapshot = row.snapshot;
    const auto info = CopyVMFreezerNANDInfo(device.platform);
    EXPECT_EQ(device.snapshots.flags, 0x10000u);
    if (row.written < 0) {
      EXPECT_TRUE(info.empty());
    } else {
      const auto written = static_cast<std::uint64_t>(row.written);
      EXPECT_EQ(info,
                (plist::Dictionary{{"TLM_VMFreezer_bytesWritten", written},
                                   {"com.norba.NANDInfo.VMFreezer.NumPhysicalWrites", written}}));
    }
  }
  support::StorageDevice withoutSnapshots;
  EXPECT_TRUE(CopyVMFreezerNANDInfo(withoutSnapshots.platform).empty());
}

// What is handed out lies in the snapshot, whatever was cut off or claimed.
TEST(Snapshot, CutsAndLiesStayInside) {
  for (const Row& row : kRows) {
    for (std::size_t size = 0; size <= row.snapshot.size(); ++size) {
      Bytes cut(row.snapshot.begin(), row.snapshot.begin() + static_cast<std::ptrdiff_t>(size));
      for (const bool lies : {false, true}) {
        if (lies && size >= 8) std::fill_n(cut.begin() + 4, 4, std::byte{0xFF});
        const auto found = getIOStatsWithThreadnameFromKCData(cut, "VM_swapout");
        if (!found || found->empty()) continue;
        EXPECT_GE(found->data(), cut.data());
        EXPECT_LE(found->data() + found->size(), cut.data() + cut.size());
      }
    }
  }
}

TEST(Snapshot, AWalkTellsWhereItStopped) {
  const Bytes first = thread(1, "a", 7);
  KCDataPosition stopped;
  EXPECT_FALSE(getIOStatsWithThreadnameFromKCDataHelper(first + thread(2, kSwapout, 7),
                                                        "VM_swapout", stopped));
  EXPECT_EQ(stopped.item, first.size() - 16);
  EXPECT_EQ(stopped.end, 2 * first.size() + kSwapout.size() - 1);
  EXPECT_FALSE(getIOStatsWithThreadnameFromKCData(first, std::string_view()));
}

TEST(Snapshot, NamesAreComparedOverTheir64Characters) {
  const std::string shared(63, 'n');
  const Bytes snapshot = thread(1, shared + "ab", 7);
  EXPECT_TRUE(getIOStatsWithThreadnameFromKCData(snapshot, shared + "ac"));
  EXPECT_FALSE(getIOStatsWithThreadnameFromKCData(snapshot, shared + "bb"));
}

TEST(Snapshot, NestingHasNoLimit) {
  const Bytes kBegin = begin(1);
  Bytes deep;
  for (int i = 0; i < 100000; ++i) deep.insert(deep.end(), kBegin.begin(), kBegin.end());
  const auto found =
      getIOStatsWithThreadnameFromKCData(deep + name(kSwapout) + statistics(7), "VM_swapout");
  ASSERT_TRUE(found);
  EXPECT_EQ(found->size(), 40u);
}

}  // namespace
}  // namespace NANDInfo
