// Digests by libmd.
#pragma once

#include "platform/Digest.h"

namespace platform::host {

class MD5Digest : public Digest {
 public:
  std::array<std::uint8_t, 16> md5(std::string_view bytes) override;
};

}  // namespace platform::host
