// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/collect/WriteAmplification.h"

#include <cstdint>

namespace NANDInfo {

namespace {

constexpr double kUsualThreshold = 2.0;
constexpr double kThresholdsEnd = 10.0;

double singlePrecision(double value) { return static_cast<double>(static_cast<float>(value)); }

// Erased 4 KiB blocks to written ones; the product wraps.
double ratio(std::uint64_t erases, std::uint64_t blocks, std::uint64_t hostWrites) {
  return singlePrecision(static_cast<double>(erases * blocks) / static_cast<double>(hostWrites));
}

constexpr std::uint64_t in4KiB(std::uint64_t bytes) { return bytes >> 12; }

}  // namespace

WriteAmplification writeAmplificationOf(const LegacyNandInfoCxt& context) {
  std::uint64_t intermediateBlocks = 0, intermediateErases = 0;
  for (std::size_t i = 0; i < context.fields.size(); ++i) {
    const auto [name, value] = context.fields[i];
    if (name == "pagesPerVirtualBlockSlc")
      intermediateBlocks = in4KiB(value * context.bytesPerPage);
    if (name == "intermediateBandErases") intermediateErases = value;
  }
  WriteAmplification result;
  // In 32 bits, as the controller itself has the size of a virtual block.
  const std::uint32_t blockSize = context.bytesPerPage * context.pagesPerVirtualBlock;
  result.user = ratio(context.bandErases, in4KiB(blockSize), context.hostWrites);
  if (intermediateBlocks != 0 && intermediateErases != 0) {
    result.intermediate = ratio(intermediateErases, intermediateBlocks, context.hostWrites);
  }
  return result;
}

bool isHighWriteAmplification(double user, const std::optional<plist::Value>& preference) {
  const auto* number = preference ? preference->as<plist::Number>() : nullptr;
  double threshold = number != nullptr && number->isReal() ? number->doubleValue() : 0;
  if (threshold > 0 && threshold < kThresholdsEnd) {
    // What is near an end may be rounded to it.
    threshold = singlePrecision(threshold);
    if (threshold > 0 && threshold < kThresholdsEnd) return user > threshold;
  }
  return user > kUsualThreshold;
}

}  // namespace NANDInfo
