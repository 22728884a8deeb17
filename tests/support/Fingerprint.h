// A short number for a long text (FNV-1a), for the tests that compare whole tables.
#pragma once

#include <cstdint>
#include <string_view>

namespace support {

inline std::uint64_t fingerprint(std::string_view text) {
  std::uint64_t hash = 0xcbf29ce484222325;
  for (const char c : text) hash = (hash ^ static_cast<unsigned char>(c)) * 0x100000001b3;
  return hash;
}

}  // namespace support
