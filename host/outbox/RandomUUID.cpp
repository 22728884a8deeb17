// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/outbox/RandomUUID.h"

#include <random>

#include "base/Text.h"

namespace host {

std::string randomUUID() {
  std::random_device device;
  std::array<std::uint32_t, 4> words;
  for (std::uint32_t& word : words) word = device();
  return UUIDFrom(words);
}

std::string UUIDFrom(std::array<std::uint32_t, 4> words) {
  words[1] = (words[1] & 0xffff0fffu) | 0x4000u;      // version 4
  words[2] = (words[2] & 0x3fffffffu) | 0x80000000u;  // variant 1
  return base::format("%08x-%04x-%04x-%04x-%04x%08x", words[0], words[1] >> 16, words[1] & 0xffffu,
                      words[2] >> 16, words[2] & 0xffffu, words[3]);
}

}  // namespace host
