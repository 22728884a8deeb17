// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Saves what the storage controller answers, so that it can be asked again on any device root.
//
// The folder has the form of a root's device/ folder: registry.plist with the controller and the
// EAN service, a file for each buffer, and manifest.json, which comes last: who captured what and
// when, each buffer's op type, argument, size, SHA-256 and file, and what was not answered, with
// the reason. That is no failure; a folder that already holds something is.
#pragma once

#include "tools/nandinfo/Commands.h"

namespace nandinfo {

// The result is the manifest.
CommandResult capture(const Invocation& invocation);

}  // namespace nandinfo
