// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// The process of the command mkdevice.

#include <unistd.h>

#include <CLI/CLI.hpp>
#include <charconv>
#include <iostream>
#include <span>
#include <string>
#include <system_error>
#include <vector>

#include "base/CivilDate.h"
#include "host/process/LibraryLoader.h"
#include "host/process/Surroundings.h"
#include "host/process/SystemClock.h"
#include "tools/common/CommandLine.h"
#include "tools/common/CommandLog.h"
#include "tools/common/Terminal.h"
#include "tools/mkdevice/DeviceMaker.h"
#include "tools/mkdevice/SampleController.h"

namespace {

std::vector<std::string> textsOf(std::span<const char* const> names) {
  return {names.begin(), names.end()};
}

}  // namespace

int main(int argc, char** argv) {
  host::settleIn();
  constexpr int kDone = 0, kFailed = 1, kUsage = 2;
  mkdevice::MakingOptions options;
  options.module = host::installedModule().orNone().value_or("");
  tools::CommandLog log("mkdevice");
  options.log = &log;

  CLI::App app("Makes a complete sample device root, with some weeks of counters up to yesterday.",
               "mkdevice");
  app.set_version_flag("--version", "mkdevice " MORVEND_VERSION);
  tools::addCompletion(app);
  app.add_option("DIR", options.folder, "the root's folder: empty, or not there yet")->required();
  app.add_option("--seed", options.sample.seed,
                 "the same number on the same day makes the same device; default: 1")
      ->check([](const std::string& text) {
        std::uint64_t seed = 0;
        const char* const end = text.data() + text.size();
        const auto [stop, error] = std::from_chars(text.data(), end, seed);
        return error == std::errc() && stop == end
                   ? ""
                   : "'" + text + "' is no number from 0 to 2^64 - 1";
      });
  app.add_option("--scale", options.sample.scale, "so many times the usual counters; default: 1")
      ->check(CLI::Range(1, mkdevice::kMaxScale));
  app.add_option("--days", options.days,
                 "so many days up to yesterday are played, each with its daily run; default: 0")
      ->check(CLI::Range(0, mkdevice::kMaxDays));
  app.add_option_function<std::string>(
         "--controller",
         [&](const std::string& name) {
           options.sample.controller = *mkdevice::controllerNamed(name);
         },
         "its storage controller; default: qrt3")
      ->check(CLI::IsMember(textsOf(mkdevice::kControllerNames)));
  app.add_option_function<std::string>(
         "--chip",
         [&](const std::string& name) { options.sample.chip = mkdevice::chipNamed(name); },
         "its flash chip, which decides how its telemetry is read; default: the seed's choice")
      ->check(CLI::IsMember(textsOf(mkdevice::kChipNames)));
  try {
    app.parse(argc, argv);
  } catch (const CLI::ParseError& error) {
    if (error.get_exit_code() == 0) return app.exit(error);
    std::cerr << "mkdevice: " << error.what() << " (see 'mkdevice --help')\n";
    return kUsage;
  }

  tools::Progress progress(std::cerr, ::isatty(STDERR_FILENO) == 1);
  options.sample.today = base::dayNumber(host::SystemClock().now().secondsSince1970);
  const auto made = mkdevice::makeDevice(
      options, {.progress = [&](const std::string& text) { progress.show(text); },
                .warning =
                    [&](const std::string& text) {
                      progress.clear();
                      std::cerr << "mkdevice: " << text << '\n';
                    }});
  progress.clear();
  if (made) return kDone;
  std::cerr << "mkdevice: " << made.error().text << '\n';
  return kFailed;
}
