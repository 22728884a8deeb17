#include "platform/host/HostPurgeableSpace.h"

namespace platform::host {

bool HostPurgeableSpace::isPresent() { return file_.value() != nullptr; }

std::optional<Dictionary> HostPurgeableSpace::SpacereapCopyItemizedPurgeableSpaceWithInfo(
    const Dictionary&) {
  const Dictionary* answer = file_.dictionary();
  return answer != nullptr ? std::optional(*answer) : std::nullopt;
}

}  // namespace platform::host
