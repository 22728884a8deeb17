// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Names that several rooms use.
#pragma once

namespace platform {

// The daemon's, on the bus and as a domain of the system's preferences.
inline constexpr char kDaemonName[] = "com.norba.pellorand.morvend";

// The domain of the counters service's preferences.
inline constexpr char kPellorandDomain[] = "com.norba.pellorand";

}  // namespace platform
