// Random values for round trips: every type, awkward numbers, awkward texts.
#pragma once

#include <cstdint>
#include <iterator>
#include <limits>
#include <random>
#include <string>

#include "platform/PropertyList.h"

namespace support {

class RandomValue {
 public:
  explicit RandomValue(std::uint64_t seed) : random_(seed) {}

  // Texts that every format holds.
  platform::Value value(int depth = 5) {
    switch (below(depth > 0 ? 10 : 8)) {
      case 0:
        return below(2) == 0;
      case 1:
        return static_cast<std::int32_t>(random_());
      case 2:
        return static_cast<std::int64_t>(random_() >> below(64)) * (below(2) == 0 ? 1 : -1);
      case 3:
        return random_() >> below(64);
      case 4:
        return real();
      case 5:
        return text();
      case 6:
        return platform::Date{static_cast<double>(random_() >> (18 + below(40))) - 30000000000000};
      case 7: {
        platform::Data data(below(10));
        for (auto& byte : data) byte = static_cast<std::uint8_t>(random_());
        return data;
      }
      case 8: {
        platform::Array array;
        for (std::size_t left = below(7); left > 0; --left) array.push_back(value(depth - 1));
        return array;
      }
      default: {
        platform::Dictionary dictionary;
        for (std::size_t left = below(15); left > 0; --left) {
          dictionary.set(text(), value(depth - 1));
        }
        return dictionary;
      }
    }
  }

  std::string text() {
    static constexpr const char* kPieces[] = {"a",
                                              "key.of.usual.length",
                                              "&",
                                              "<",
                                              ">",
                                              "]]>",
                                              "\"",
                                              "\\",
                                              "\r",
                                              "\n",
                                              "\r\n",
                                              "\t",
                                              " ",
                                              "\x7f",
                                              "&amp;",
                                              "&#13;",
                                              "\xC3\xA4",
                                              "\xE2\x82\xAC",
                                              "\xEF\xBF\xBD",
                                              "\xF0\x9F\x98\x80",
                                              "\xC2\x85",
                                              "<!--"};
    std::string text;
    for (std::size_t left = below(6); left > 0; --left) text += kPieces[below(std::size(kPieces))];
    return text;
  }

  // Any bytes at all.
  std::string bytes() {
    std::string bytes(below(20), '\0');
    for (char& byte : bytes) byte = static_cast<char>(random_());
    return bytes;
  }

 private:
  std::size_t below(std::size_t bound) { return random_() % bound; }

  platform::Value real() {
    using Limits = std::numeric_limits<double>;
    static constexpr double kAwkward[] = {0.0,
                                          -0.0,
                                          0.1,
                                          Limits::min(),
                                          Limits::max(),
                                          Limits::denorm_min(),
                                          1e16,
                                          0x1p63,
                                          -Limits::infinity(),
                                          1e5};
    if (below(3) == 0) return static_cast<float>(random_()) / 3.0f;
    if (below(2) == 0) return kAwkward[below(std::size(kAwkward))];
    return static_cast<double>(random_()) / 7;
  }

  std::mt19937_64 random_;
};

}  // namespace support
