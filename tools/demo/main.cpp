// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The demo's helper: delivers applications to a running daemon, and shows what was submitted.

#include <CLI/CLI.hpp>
#include <iostream>
#include <vector>

#include "host/process/Surroundings.h"
#include "tools/demo/Delivery.h"
#include "tools/demo/ShowKept.h"
#include "tools/demo/ShowLeft.h"
#include "tools/demo/ShowLog.h"

namespace {

constexpr int kDone = 0, kFailed = 1, kUsage = 2;

int failed(const std::string& why) {
  std::cerr << "morvend-demo: " << why << '\n';
  return kFailed;
}

int runDeliver() {
  const std::string error =
      demo::deliver([](std::string_view step) { std::cout << "  " << step << std::endl; });
  return error.empty() ? kDone : failed(error);
}

int runShow(const std::string& root, std::vector<std::string> logs,
            const demo::ShowOptions& options) {
  demo::Device device(root);
  if (logs.empty()) logs = device.logs();
  if (logs.empty()) return failed(root + ": no report was submitted");
  for (const std::string& path : logs) {
    const auto log = device.readLog(path);
    if (!log) return failed(log.error().text);
    if (&path != &logs.front()) std::cout << '\n';
    std::cout << demo::showLog(device, *log, options) << std::flush;
  }
  return kDone;
}

int runKept(const std::string& root) {
  demo::Device device(root);
  std::cout << demo::showKept(device) << std::flush;
  return kDone;
}

int runLeft(const std::string& root, bool all) {
  demo::Device device(root);
  std::cout << demo::showLeft(device, all) << std::flush;
  return kDone;
}

}  // namespace

int main(int argc, char** argv) {
  host::settleIn();
  std::string root;
  std::vector<std::string> logs;
  demo::ShowOptions options;

  CLI::App app("Shows what morvend does.", "morvend-demo");
  app.require_subcommand(1);
  CLI::App* deliver = app.add_subcommand("deliver", "Deliver app info to the running daemon");
  CLI::App* show = app.add_subcommand("show", "Show submitted reports");
  show->add_option("ROOT", root, "the device root")->required();
  show->add_option("LOG", logs, "the reports' files; default: all of the root's spool");
  show->add_flag("--all", options.all, "every row, not a selection");
  show->add_option("--prefix", options.prefix, "only counters whose keys begin so, and no header");
  CLI::App* kept = app.add_subcommand("kept", "Show what the daily runs left on the device");
  kept->add_option("ROOT", root, "the device root")->required();
  CLI::App* left = app.add_subcommand("left", "Show everything that left the device, and why");
  left->add_option("ROOT", root, "the device root")->required();
  left->add_flag("--all", options.all, "every counter, not a selection");
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) return app.exit(error);
    std::cerr << "morvend-demo: " << error.what() << '\n';
    return kUsage;
  }
  if (deliver->parsed()) return runDeliver();
  if (kept->parsed()) return runKept(root);
  if (left->parsed()) return runLeft(root, options.all);
  return runShow(root, std::move(logs), options);
}
