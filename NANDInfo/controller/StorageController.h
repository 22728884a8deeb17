// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The storage controller: the driver that exports its counters, and what it is asked.
#pragma once

#include <cstdint>
#include <optional>

#include "NANDInfo/Controller.h"
#include "NANDInfo/DriverService.h"
#include "NANDInfo/controller/ControllerServices.h"
#include "base/Result.h"

namespace NANDInfo {

// A known driver and its service.
struct StorageController {
  nand_exporter_t* exporter;  // the empty record when no driver is there
  DriverService service;
};

// The first known driver that is present, by matching, then by walking; not opened.
StorageController findController(const ControllerServices& services);

// The first known driver that matches and can be opened, opened.
std::optional<StorageController> openController(const ControllerServices& services);

// A statistics command to an opened driver; its error's text is the library's message.
base::Result<TunnelAnswer> fetchStatistics(const StorageController& controller,
                                           const SelectorPair* selectors, std::uint32_t argument);

// The message of a command that can't be sent, or of one that failed; null when there is none.
const char* obstacle(const DriverService& service, const nand_exporter_t* exporter,
                     const SelectorPair* selectors);
const char* failureText(TunnelAnswer::Failure failure);

// Fetches the legacy statistics into the context, which `exporter`'s releaseLegacy releases: the
// driver that was found. False, with what went wrong said, when they can't be had.
bool loadLegacy(const ControllerServices& services, nand_exporter_t*& exporter,
                LegacyNandInfoCxt* context);

// Whether the controller asks for content to be deleted.
bool recommendsContentDeletion(const ControllerServices& services);

}  // namespace NANDInfo
