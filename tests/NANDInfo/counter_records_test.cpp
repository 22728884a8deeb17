#include "NANDInfo/CounterRecords.h"

#include <gtest/gtest.h>

#include <string>

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
  } rows[] = {
      {parseCounters1y, 0x8cf41de0364d1580},
      {parseCounters1xSandisk, 0xa643238a1cbde590},
      {parseCounters1xHynix, 0xb81ea124160ffdc5},
      {parseOnlyAlgoGenericCounters, 0x60dfc5d6559117a0},
      {parseCountersAlgoGeneric, 0x60dfc5d6559117a0},
      {parseOnlyAlgoGenericCountersQ8, 0xbf0d94708632bead},
      {parseCountersAlgoGenericQ8, 0xbf0d94708632bead},
  };
  for (const auto& row : rows) {
    SCOPED_TRACE(&row - rows);
    NandCountersRecord record;
    record.fill(7);
    row.convert(CounterBlock(block), record);
    std::string text;
    for (const std::uint32_t word : record) text += std::to_string(word) + "\n";
    EXPECT_EQ(support::fingerprint(text), row.fingerprint);
  }
}

}  // namespace
}  // namespace NANDInfo
