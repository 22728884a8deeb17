// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/MD5.h"

#include <md5.h>

namespace plist {

std::array<std::uint8_t, 16> md5(std::string_view bytes) {
  static_assert(MD5_DIGEST_LENGTH == 16);
  std::array<std::uint8_t, 16> digest;
  MD5_CTX context;
  MD5Init(&context);
  MD5Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
  MD5Final(digest.data(), &context);
  return digest;
}

}  // namespace plist
