// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The purgeable-space service.
#pragma once

#include <optional>

#include "plist/Value.h"

namespace platform {

class PurgeableSpace {
 public:
  virtual ~PurgeableSpace() = default;

  // Whether this system has the service.
  virtual bool isPresent() = 0;

  // The itemized purgeable space of the volume that the query names ("SPACEREAP_VOLUME"), or none.
  virtual std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary& query) = 0;
};

}  // namespace platform
