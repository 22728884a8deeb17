// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The EAN service's answers about its images.
#pragma once

#include <cstdint>

#include "NANDInfo/EAN.h"
#include "NANDInfo/controller/ControllerServices.h"

namespace NANDInfo {

// The answer about an image, by its four-character code; 0 on any failure, with a line in the log.
std::uint64_t askEAN(const ControllerServices& services, EANFigure figure, std::uint32_t code);

}  // namespace NANDInfo
