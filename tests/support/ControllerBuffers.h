// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Counter buffers put together by hand, and a look at what their parsers made of them.
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory_resource>
#include <new>
#include <string>
#include <utility>
#include <vector>

#include "NANDInfo/GenericParserContext.h"
#include "base/ByteWriter.h"

namespace support {

using Bytes = std::vector<std::byte>;
using Fields = std::vector<std::pair<std::string, std::uint64_t>>;

// Appends the low `width` bytes of a number, lowest first.
inline void put(Bytes& bytes, std::uint64_t number, unsigned width) {
  base::appendLittleEndian(bytes, number, width);
}

// The header word of an FTL record.
constexpr std::uint64_t header(std::uint32_t key, std::uint32_t count) {
  return key | std::uint64_t{count} << 32;
}

inline Bytes words(const std::vector<std::uint64_t>& all) {
  Bytes bytes;
  for (const std::uint64_t word : all) put(bytes, word, 8);
  return bytes;
}

// A record of an MSP buffer: its length is that of the values, unless another one is given.
struct MSPRecord {
  std::uint16_t tag;
  unsigned width;
  std::vector<std::uint64_t> values;
  std::uint64_t length = values.size() * width;
};

inline Bytes records(const std::vector<MSPRecord>& all) {
  Bytes bytes;
  for (const auto& [tag, width, values, length] : all) {
    put(bytes, tag, 2);
    put(bytes, length, 2);
    for (const std::uint64_t value : values) put(bytes, value, width);
  }
  return bytes;
}

// A kernel snapshot of one thread, the swap-out thread, that has written so many bytes.
inline Bytes kernelSnapshot(std::uint64_t bytesWritten) {
  constexpr std::uint32_t kBegin = 0x13, kThreadName = 0x909, kIOStatistics = 0x901;
  Bytes bytes;
  for (const auto& [type, payload] :
       {std::pair(kBegin, words({0})),
        std::pair(kThreadName, words({0x6F706177735F4D56, 0x7475})),  // VM_swapout
        std::pair(kIOStatistics, words({1, 2, 3, bytesWritten}))}) {
    put(bytes, type | std::uint64_t{payload.size()} << 32, 8);
    put(bytes, 1, 8);
    bytes.insert(bytes.end(), payload.begin(), payload.end());
  }
  return bytes;
}

inline Fields fieldsOf(const NANDInfo::GenericParserCxt& context) {
  Fields fields;
  for (std::size_t i = 0; i < context.size(); ++i) {
    fields.emplace_back(context[i].name, context[i].value);
  }
  return fields;
}

// Grants the first allocations, refuses some, and grants the rest.
class RefusingMemory : public std::pmr::memory_resource {
 public:
  explicit RefusingMemory(int granted = 0, int refused = std::numeric_limits<int>::max())
      : granted_(granted), refused_(refused) {}

 private:
  void* do_allocate(std::size_t bytes, std::size_t alignment) override {
    if (granted_ > 0) {
      --granted_;
    } else if (refused_ > 0) {
      --refused_;
      throw std::bad_alloc();
    }
    return std::pmr::new_delete_resource()->allocate(bytes, alignment);
  }
  void do_deallocate(void* memory, std::size_t bytes, std::size_t alignment) override {
    std::pmr::new_delete_resource()->deallocate(memory, bytes, alignment);
  }
  bool do_is_equal(const memory_resource& other) const noexcept override { return this == &other; }

  int granted_, refused_;
};

}  // namespace support
