#include "NANDInfo/CounterRecords.h"

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "support/ControllerBuffers.h"
#include "support/Fingerprint.h"

namespace NANDInfo {
namespace {

// Word k of the block is k + 1000, words of the record are 7 beforehand: the fingerprint tells
// copied, zeroed and untouched words apart.
TEST(CounterRecords, EachConverterWritesTheWordsOfItsMap) {
  support::Bytes block;
  for (std::uint64_t k = 1000; block.size() < kCounterBlockSize; ++k) support::put(block, k, 4);
  const struct {
    void (*convert)(CounterBlock, NandCountersRecord&);
    std::uint64_t fingerprint;
    std::vector<std::pair<std::size_t, std::uint32_t>> samples;
  } rows[] = {
      {parseCounters1y, 0x8cf41de0364d1580, {{0, 1256}, {74, 1015}, {76, 1532}, {157, 7}}},
      {parseCounters1xSandisk, 0xa643238a1cbde590, {{5, 1261}, {7, 0}, {74, 1010}, {103, 7}}},
      {parseCounters1xHynix, 0xb81ea124160ffdc5, {{3, 1259}, {4, 0}, {40, 0}, {63, 1293}}},
      {parseOnlyAlgoGenericCounters, 0x60dfc5d6559117a0, {{0, 1000}, {164, 1113}, {165, 7}}},
      {parseCountersAlgoGeneric, 0x60dfc5d6559117a0, {}},
      {parseOnlyAlgoGenericCountersQ8, 0xbf0d94708632bead, {{29, 1008}, {168, 1076}, {176, 0}}},
      {parseCountersAlgoGenericQ8, 0xbf0d94708632bead, {}},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    NandCountersRecord record;
    record.fill(7);
    row.convert(CounterBlock(block), record);
    std::string text;
    for (const std::uint32_t word : record) text += std::to_string(word) + "\n";
    EXPECT_EQ(support::fingerprint(text), row.fingerprint);
    for (const auto& [place, value] : row.samples) EXPECT_EQ(record[place], value) << place;
  }
}

}  // namespace
}  // namespace NANDInfo
