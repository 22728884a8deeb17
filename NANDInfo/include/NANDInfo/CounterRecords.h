// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// A channel's counter block in one vendor's layout, converted into the layout common to all.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <span>

#include "base/Exported.h"

namespace MORVEND_EXPORTED NANDInfo {

// One channel's raw counters: little-endian 32-bit words.
inline constexpr std::size_t kCounterBlockSize = 4096;
using CounterBlock = std::span<const std::byte, kCounterBlockSize>;

// The common layout. Its regions, by first word: 0 readStage (33), 33 initialReadStage (23), 56
// nandStageOfLife (8), 64 unused, 65 dspExceptionParameter (38), 103 readStage18NumOfErrorsBin
// (12), 115 readStage9NumOfErrorsBin (10), 125 readStage10NumOfErrorsBin (10), 135
// readStage17NumOfErrorsBin (10), 145 readStage19NumOfErrorsBin (12), 157 algoNANDAccessesBin (8),
// 165 retentionIndication (12).
using NandCountersRecord = std::array<std::uint32_t, 177>;

// Each writes the words that its layout has; the caller zeroes the record before.
void parseCounters1y(CounterBlock block, NandCountersRecord& record);
void parseCounters1xSandisk(CounterBlock block, NandCountersRecord& record);
void parseCounters1xHynix(CounterBlock block, NandCountersRecord& record);
void parseOnlyAlgoGenericCounters(CounterBlock block, NandCountersRecord& record);
void parseCountersAlgoGeneric(CounterBlock block, NandCountersRecord& record);
void parseOnlyAlgoGenericCountersQ8(CounterBlock block, NandCountersRecord& record);
void parseCountersAlgoGenericQ8(CounterBlock block, NandCountersRecord& record);

}  // namespace NANDInfo
