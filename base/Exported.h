// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Marks what the storage library shows to programs that load it: everything else is compiled with
// hidden visibility.
#pragma once

#define MORVEND_EXPORTED [[gnu::visibility("default")]]
