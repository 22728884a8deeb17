// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Writes the binary formats of the controller and the kernel. All numbers are little-endian.
#pragma once

#include <cstdint>
#include <span>
#include <string>
#include <string_view>

#include "base/ByteWriter.h"

namespace mkdevice {

class BufferWriter {
 public:
  // The low `width` bytes of a number; counters saturate before they are written.
  void number(std::uint64_t value, unsigned width) {
    base::appendLittleEndian(bytes_, value, width);
  }
  void word(std::uint64_t value) { number(value, 4); }
  void zeros(std::size_t count) { bytes_.append(count, '\0'); }
  void text(std::string_view text) { bytes_ += text; }

  // A record of the FTL statistics: key, count, that many 64-bit words.
  void ftlRecord(std::uint32_t key, std::span<const std::uint64_t> values) {
    word(key);
    word(values.size());
    for (const std::uint64_t value : values) number(value, 8);
  }

  // A record of the MSP statistics: tag, length in bytes, elements of a width.
  void mspRecord(std::uint16_t tag, unsigned width, std::span<const std::uint64_t> values) {
    number(tag, 2);
    number(values.size() * width, 2);
    for (const std::uint64_t value : values) number(value, width);
  }

  // An item of a kernel snapshot in chunked-data format: type, payload size, flags, payload.
  void chunk(std::uint32_t type, std::uint64_t flags, std::string_view payload = {}) {
    word(type);
    word(payload.size());
    number(flags, 8);
    text(payload);
  }

  const std::string& bytes() const { return bytes_; }

 private:
  std::string bytes_;
};

}  // namespace mkdevice
