// Message digests.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace platform {

class Digest {
 public:
  virtual ~Digest() = default;

  // MD5 (RFC 1321) of the bytes.
  virtual std::array<std::uint8_t, 16> md5(std::string_view bytes) = 0;
};

}  // namespace platform
