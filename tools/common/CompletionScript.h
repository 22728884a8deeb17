// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a shell is told so that it completes a command line.
#pragma once

#include <string>
#include <string_view>

namespace CLI {
class App;
}

namespace tools {

// The script for `shell`, which is bash, zsh or fish. It knows the commands and the options of
// each, the values of an option that takes some words only, and which commands take a file or a
// folder.
std::string completionScript(const CLI::App& app, std::string_view shell);

}  // namespace tools
