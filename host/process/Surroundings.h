// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a process needs of its surroundings before it opens the first.
#pragma once

namespace host {

// For the start of every program: standard streams that are closed are opened on /dev/null, so that
// no file that is opened later takes their place and gets what is written to them. Writing beyond a
// limit of file size is an error of the write from now on (EFBIG), not the end of the process.
void settleIn();

}  // namespace host
