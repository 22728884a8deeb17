// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Times in the names of files, in UTC. They have the same form, and sort as they follow each other,
// for every time: what lies before year 0 or after year 9999 is named by the first or last second.
#pragma once

#include <string>
#include <string_view>

namespace host {

// 20261122T040000Z
std::string fileTime(double secondsSince1970);

// 2026-11-22
std::string fileDay(double secondsSince1970);

// Whether a text has the form of fileDay.
bool isFileDay(std::string_view text);

}  // namespace host
