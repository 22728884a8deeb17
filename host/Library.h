// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The Linux host, for programs that load the storage library.
#pragma once

#include <memory>

#include "base/Exported.h"
#include "platform/AllServices.h"

namespace MORVEND_EXPORTED host {

// Every service over the device root that MORVEND_ROOT names (without it, that of the
// build: "/", or MORVEND_DEFAULT_ROOT); what was written is
// on disk once the last pointer is gone. The process ignores SIGPIPE from then on.
std::shared_ptr<const platform::AllServices> makeServices();

// Whether that device is an internal (development) build. Asked once in the life of the process, by
// whichever thread comes first; for a symbol look-up too, whence the plain name.
extern "C" bool PLIsInternalDevice();

}  // namespace host
