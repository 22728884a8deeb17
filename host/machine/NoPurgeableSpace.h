// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The service that Linux has nothing for.
#pragma once

#include <optional>

#include "platform/PurgeableSpace.h"
#include "plist/Value.h"

namespace host::machine {

class NoPurgeableSpace final : public platform::PurgeableSpace {
 public:
  bool isPresent() override { return false; }
  std::optional<plist::Dictionary> SpacereapCopyItemizedPurgeableSpaceWithInfo(
      const plist::Dictionary&) override {
    return std::nullopt;
  }
};

}  // namespace host::machine
