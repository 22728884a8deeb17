// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The digest over property lists as they are read.
#pragma once

#include <array>
#include <cstdint>
#include <string_view>

namespace plist {

// MD5 (RFC 1321) of the bytes.
std::array<std::uint8_t, 16> md5(std::string_view bytes);

}  // namespace plist
