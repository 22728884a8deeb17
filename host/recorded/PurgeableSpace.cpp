// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/recorded/PurgeableSpace.h"

#include <optional>

namespace host::recorded {

bool PurgeableSpace::isPresent() { return file_.value() != nullptr; }

std::optional<plist::Dictionary> PurgeableSpace::SpacereapCopyItemizedPurgeableSpaceWithInfo(
    const plist::Dictionary&) {
  const plist::Dictionary* answer = file_.dictionary();
  return answer != nullptr ? std::optional(*answer) : std::nullopt;
}

}  // namespace host::recorded
