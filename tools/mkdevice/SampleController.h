// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The files of a sample device that belong to its storage controller.
#pragma once

#include <optional>
#include <string_view>
#include <vector>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

inline constexpr const char* kControllerNames[] = {"qrt3", "embedded", "zmc"};
inline constexpr const char* kChipNames[] = {"qm7", "qm8", "1x-sandisk", "1x-hynix", "1y"};

// None for a text that isn't among the names.
std::optional<ControllerKind> controllerNamed(std::string_view name);
std::optional<ChipKind> chipNamed(std::string_view name);

// The registry, every buffer that it names, the kernel snapshot, and the purgeable space.
std::vector<SampleFile> controllerFiles(const Sample& sample);

}  // namespace mkdevice
