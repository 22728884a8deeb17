// The purgeable-space service.
#pragma once

#include <optional>

#include "platform/PropertyList.h"

namespace platform {

class PurgeableSpace {
 public:
  virtual ~PurgeableSpace() = default;

  // Whether this system has the service.
  virtual bool isPresent() = 0;

  // The itemized purgeable space of the volume that the query names ("SPACEREAP_VOLUME"), or none.
  virtual std::optional<Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const Dictionary& query) = 0;
};

}  // namespace platform
