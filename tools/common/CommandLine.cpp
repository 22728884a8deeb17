// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/common/CommandLine.h"

#include <CLI/CLI.hpp>

#include "host/Host.h"
#include "tools/common/CompletionScript.h"

namespace tools {

std::string rootInHelp() {
  return std::string("Device root: the folder that MORVEND_ROOT names; without it, ") +
         host::kDefaultRoot;
}

void addCompletion(CLI::App& app) {
  app.add_option_function<std::string>("--completion",
                                       [&app](const std::string& shell) {
                                         throw CLI::CallForVersion(completionScript(app, shell), 0);
                                       })
      ->check(CLI::IsMember({"bash", "zsh", "fish"}))
      ->group("");
}

}  // namespace tools
