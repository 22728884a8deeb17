// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The verdict on the storage: of this machine's drives, or of a recorded device's controller.
#pragma once

#include <string>
#include <vector>

#include "NANDInfo/Services.h"
#include "NANDInfo/queries/HealthRules.h"
#include "plist/Value.h"

namespace NANDInfo {

// A drive, or what stands for one, with what a verdict is made of.
struct Patient {
  std::string name, model, identity;  // the last one is the drive's wherever it is plugged in
  Source source = Source::controller;
  HealthFigures figures = {}, acknowledged = {};
  std::string unknown = {};  // why there are no figures
  Judgement judgement = {};
};

struct StorageHealth {
  Verdict verdict = Verdict::good;  // the worst of the patients'; unknown without a drive
  std::vector<Patient> patients;
};

// The baseline of the counts of errors is the preference "AcknowledgedHealth", under the drives'
// own names. With `acknowledges` the counts become the baseline first, and the preference is set.
StorageHealth storageHealth(const Services& services, bool acknowledges = false);

// {"verdict", "drives": [{"name", "model", "verdict", "reasons", "figures", "acknowledged"}]}: the
// reasons are sentences, the figures those that the verdict looks at.
plist::Dictionary describe(const StorageHealth& health);

}  // namespace NANDInfo
