// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the report asks of the world outside, and nothing more. References: whoever makes it keeps
// the services alive for as long.
#pragma once

namespace platform {
class Clock;
class CountersService;
class Eventra;
class FileSystem;
class HistoryStore;
class InstalledApplications;
class Kernel;
class LocaleService;
class LogSubmission;
class PreferenceStore;
class SystemLog;
class SystemVersion;
}  // namespace platform

namespace report {

// `history` and `counters` hold what was recorded; `clock`, `kernel`, `systemVersion`,
// `applications`, `locale` and `files` say what the report adds by itself; `preferences` keep the
// version and the tasking; `submission` is where the log leaves, `eventra` where events do.
struct Services {
  platform::SystemLog& log;
  platform::Clock& clock;
  platform::FileSystem& files;
  platform::CountersService& counters;
  platform::HistoryStore& history;
  platform::PreferenceStore& preferences;
  platform::LogSubmission& submission;
  platform::Eventra& eventra;
  platform::SystemVersion& systemVersion;
  platform::Kernel& kernel;
  platform::InstalledApplications& applications;
  platform::LocaleService& locale;

  // Each service under its name, out of whatever has them: a host, a test's fakes.
  template <typename Source>
  Services(const Source& source)
      : log(source.log),
        clock(source.clock),
        files(source.files),
        counters(source.counters),
        history(source.history),
        preferences(source.preferences),
        submission(source.submission),
        eventra(source.eventra),
        systemVersion(source.systemVersion),
        kernel(source.kernel),
        applications(source.applications),
        locale(source.locale) {}
};

}  // namespace report
