// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What the daemon's own steps ask of the world outside, with what the report and the storage
// library ask. References: whoever makes it keeps the services alive for as long.
#pragma once

#include "NANDInfo/Services.h"
#include "report/Services.h"

namespace platform {
class AnalyticsConfiguration;
class CountersService;
class DeviceProperties;
class EventLoop;
class Eventra;
class FaultwatchSupport;
class Kernel;
class LogSubmission;
class NamedServices;
class NetworkUsage;
class NotificationCenter;
class Outbox;
class PreferenceStore;
class PrivilegedPreferences;
class ReportingChannels;
class RunLock;
class ServitaLogs;
class SystemLog;
class SystemVersion;
}  // namespace platform

namespace morvend {

struct Services {
  platform::SystemLog& log;
  platform::CountersService& counters;
  platform::PreferenceStore& preferences;
  platform::AnalyticsConfiguration& analyticsConfiguration;
  platform::PrivilegedPreferences& privilegedPreferences;
  platform::LogSubmission& submission;
  platform::FaultwatchSupport& faultwatch;
  platform::ServitaLogs& servitaLogs;
  platform::EventLoop& eventLoop;
  platform::NamedServices& namedServices;
  platform::NotificationCenter& notifications;
  platform::Eventra& eventra;
  platform::DeviceProperties& deviceProperties;
  platform::SystemVersion& systemVersion;
  platform::Kernel& kernel;
  platform::ReportingChannels& reportingChannels;
  platform::NetworkUsage& networkUsage;
  platform::RunLock& runLock;
  platform::Outbox& outbox;
  report::Services report;
  NANDInfo::Services storage;

  // Each service under its name, out of whatever has them: a host, a test's fakes.
  template <typename Source>
  Services(const Source& source)
      : log(source.log),
        counters(source.counters),
        preferences(source.preferences),
        analyticsConfiguration(source.analyticsConfiguration),
        privilegedPreferences(source.privilegedPreferences),
        submission(source.submission),
        faultwatch(source.faultwatch),
        servitaLogs(source.servitaLogs),
        eventLoop(source.eventLoop),
        namedServices(source.namedServices),
        notifications(source.notifications),
        eventra(source.eventra),
        deviceProperties(source.deviceProperties),
        systemVersion(source.systemVersion),
        kernel(source.kernel),
        reportingChannels(source.reportingChannels),
        networkUsage(source.networkUsage),
        runLock(source.runLock),
        outbox(source.outbox),
        report(source),
        storage(source) {}
};

}  // namespace morvend
