// The files of a sample device that belong to its storage controller.
#pragma once

#include <optional>
#include <string_view>
#include <vector>

#include "tools/mkdevice/Sample.h"

namespace mkdevice {

// "qrt3", "embedded" or "zmc"; none for any other text.
std::optional<ControllerKind> controllerNamed(std::string_view name);

// The registry, every buffer that it names, the kernel snapshot, and the purgeable space.
std::vector<SampleFile> controllerFiles(const Sample& sample);

}  // namespace mkdevice
