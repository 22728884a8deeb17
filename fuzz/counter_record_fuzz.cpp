// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Counter blocks in each vendor's layout, and the text that names the vendor. A converter copies
// words: which ones, and which it leaves alone, doesn't depend on what is in them.

#include "NANDInfo/CounterRecords.h"

#include <array>
#include <cstring>

#include "Input.h"
#include "NANDInfo/TelemetryList.h"
#include "base/ByteReader.h"
#include "base/ByteWriter.h"

namespace {

using namespace NANDInfo;
using fuzz::require;

using Block = std::array<std::byte, kCounterBlockSize>;
constexpr std::uint32_t kUntouched = 0xDEADBEEF;
constexpr CounterConverter* kConverters[] = {parseCounters1y,
                                             parseCounters1xSandisk,
                                             parseCounters1xHynix,
                                             parseCountersAlgoGeneric,
                                             parseCountersAlgoGenericQ8,
                                             parseOnlyAlgoGenericCounters,
                                             parseOnlyAlgoGenericCountersQ8};

NandCountersRecord converted(CounterConverter* convert, const Block& block) {
  NandCountersRecord record;
  record.fill(kUntouched);
  convert(block, record);
  return record;
}

std::uint32_t wordOf(const Block& block, std::size_t place) {
  return base::littleEndian<std::uint32_t>(CounterBlock(block).subspan(4 * place).first<4>());
}

// For each word of the record one more than the block's word that it is a copy of; 0 for a zero.
NandCountersRecord sourcesOf(CounterConverter* convert) {
  Block block;
  for (std::uint32_t word = 0; word < block.size() / 4; ++word) {
    std::memcpy(block.data() + 4 * word, base::littleEndianBytes(word + 1).data(), 4);
  }
  return converted(convert, block);
}

void checkVendor(std::string_view text) {
  const Vendor vendor = vendorOf(text);
  require(vendor.code >> 48 == 0 && vendor.code % 256 == 0, "a vendor is five bytes of six");
  const bool hexadecimal = text.find_first_not_of("0123456789abcdefABCDEF") == text.npos;
  require(!hexadecimal || vendor.complaint.empty(), "hexadecimal text is no reason to complain");
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  static const auto* const sources = new std::array{
      sourcesOf(kConverters[0]), sourcesOf(kConverters[1]), sourcesOf(kConverters[2]),
      sourcesOf(kConverters[3]), sourcesOf(kConverters[4]), sourcesOf(kConverters[5]),
      sourcesOf(kConverters[6])};
  fuzz::Input input(bytes, size);
  checkVendor(fuzz::textOf(input.bytes(input.number<std::uint8_t>() % 20)));
  const auto given = input.rest();
  Block block{};
  // What is given again and again, up to the end.
  for (std::size_t i = 0; i < block.size() && !given.empty(); ++i) {
    block[i] = given[i % given.size()];
  }
  for (std::size_t i = 0; i < sources->size(); ++i) {
    const NandCountersRecord record = converted(kConverters[i], block);
    for (std::size_t word = 0; word < record.size(); ++word) {
      const std::uint32_t source = (*sources)[i][word];
      const bool copied = source != 0 && source != kUntouched;
      require(record[word] == (copied ? wordOf(block, source - 1) : source), "words are copied");
    }
  }
  return 0;
}
