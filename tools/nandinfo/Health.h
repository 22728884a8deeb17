// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The verdict on the storage: of this machine's drives, or of a recorded device's controller.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// {"verdict", "drives": [{"name", "model", "verdict", "reasons", "figures", "acknowledged"}]}: the
// worst of the drives' verdicts, which is also the exit status; unknown without a drive. The
// reasons are sentences, the figures those that the verdict looks at. With `acknowledge` the counts
// of errors become the baseline first, as preference "AcknowledgedHealth" under the drives' own
// names; one that can't be kept is an error.
CommandResult healthVerdict(const Invocation& invocation);

}  // namespace nandinfo
