// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the command lines of the commands have in common.
#pragma once

#include <string>

namespace CLI {
class App;
}

namespace tools {

// The line of a command's help that says which device it is about.
std::string rootInHelp();

// Gives a command the option --completion SHELL, which help doesn't show: it prints the script that
// teaches bash, zsh or fish to complete the command line, and ends the command as --version does.
// The script knows what `app` has when the command line is parsed.
void addCompletion(CLI::App& app);

}  // namespace tools
