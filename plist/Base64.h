// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Bytes as base64 text, with padding and without line breaks.
#pragma once

#include <cstdint>
#include <optional>
#include <span>
#include <string>
#include <string_view>
#include <vector>

namespace plist {

void appendBase64(std::string& out, std::span<const std::uint8_t> bytes);

// The bytes that a text stands for; white space may stand anywhere. None when anything else is
// amiss: a foreign character, a missing padding, bits beyond the last byte.
std::optional<std::vector<std::uint8_t>> bytesFromBase64(std::string_view text);

}  // namespace plist
