// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "plist/Base64.h"

#include <array>

namespace plist {

namespace {

constexpr std::string_view kDigits =
    "ABCDEFGHIJKLMNOPQRSTUVWXYZabcdefghijklmnopqrstuvwxyz0123456789+/";

constexpr std::uint8_t kSpace = 64, kPadding = 65, kForeign = 66;

constexpr std::array<std::uint8_t, 256> kMeanings = [] {
  std::array<std::uint8_t, 256> meanings{};
  meanings.fill(kForeign);
  for (std::size_t i = 0; i < kDigits.size(); ++i) {
    meanings[static_cast<unsigned char>(kDigits[i])] = static_cast<std::uint8_t>(i);
  }
  for (const char c : {' ', '\t', '\r', '\n'}) meanings[static_cast<unsigned char>(c)] = kSpace;
  meanings['='] = kPadding;
  return meanings;
}();

}  // namespace

void appendBase64(std::string& out, std::span<const std::uint8_t> bytes) {
  out.reserve(out.size() + (bytes.size() + 2) / 3 * 4);
  for (std::size_t i = 0; i < bytes.size(); i += 3) {
    const std::size_t left = bytes.size() - i;
    const std::uint32_t group = static_cast<std::uint32_t>(bytes[i]) << 16 |
                                (left > 1 ? static_cast<std::uint32_t>(bytes[i + 1]) << 8 : 0) |
                                (left > 2 ? bytes[i + 2] : 0u);
    out += kDigits[group >> 18];
    out += kDigits[group >> 12 & 63];
    out += left > 1 ? kDigits[group >> 6 & 63] : '=';
    out += left > 2 ? kDigits[group & 63] : '=';
  }
}

std::optional<std::vector<std::uint8_t>> bytesFromBase64(std::string_view text) {
  std::vector<std::uint8_t> bytes;
  bytes.reserve(text.size() / 4 * 3);
  std::uint32_t group = 0;
  int digits = 0, padding = 0;
  for (const char c : text) {
    const std::uint8_t meaning = kMeanings[static_cast<unsigned char>(c)];
    if (meaning == kSpace) continue;
    if (meaning == kForeign) return std::nullopt;
    if (meaning == kPadding) {
      ++padding;
      continue;
    }
    if (padding > 0) return std::nullopt;
    group = group << 6 | meaning;
    if (++digits < 4) continue;
    for (const int shift : {16, 8, 0}) bytes.push_back(static_cast<std::uint8_t>(group >> shift));
    group = 0;
    digits = 0;
  }
  if (digits == 0) return padding == 0 ? std::optional(std::move(bytes)) : std::nullopt;
  const int spareBits = digits == 2 ? 4 : 2;
  if (digits + padding != 4 || digits == 1 || (group & ((1u << spareBits) - 1)) != 0) {
    return std::nullopt;
  }
  group >>= spareBits;
  if (digits == 3) bytes.push_back(static_cast<std::uint8_t>(group >> 8));
  bytes.push_back(static_cast<std::uint8_t>(group));
  return bytes;
}

}  // namespace plist
