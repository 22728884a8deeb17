// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// Every service of the world outside, by name: what a host has made, and what a program's main
// hands on. No room takes it: each has a struct of what it uses, which picks that out of this one.
#pragma once

namespace platform {

class AnalyticsConfiguration;
class Clock;
class CountersService;
class DeviceProperties;
class DeviceRegistry;
class DriverConnections;
class EventLoop;
class Eventra;
class FaultwatchSupport;
class FileSystem;
class HistoryStore;
class InstalledApplications;
class Kernel;
class KernelSnapshots;
class LibraryLoader;
class LocaleService;
class LogSubmission;
class NamedServices;
class NetworkUsage;
class NotificationCenter;
class Outbox;
class PreferenceStore;
class PrivilegedPreferences;
class PurgeableSpace;
class ReportingChannels;
class RunLock;
class ServitaLogs;
class StandardStreams;
class SystemLog;
class SystemVersion;

struct AllServices {
  SystemLog& log;
  StandardStreams& streams;
  Clock& clock;
  FileSystem& files;
  CountersService& counters;
  HistoryStore& history;
  PreferenceStore& preferences;
  AnalyticsConfiguration& analyticsConfiguration;
  PrivilegedPreferences& privilegedPreferences;
  LogSubmission& submission;
  FaultwatchSupport& faultwatch;
  ServitaLogs& servitaLogs;
  EventLoop& eventLoop;
  NamedServices& namedServices;
  NotificationCenter& notifications;
  Eventra& eventra;
  DeviceProperties& deviceProperties;
  SystemVersion& systemVersion;
  Kernel& kernel;
  KernelSnapshots& snapshots;
  DeviceRegistry& registry;
  DriverConnections& drivers;
  PurgeableSpace& purgeableSpace;
  ReportingChannels& reportingChannels;
  NetworkUsage& networkUsage;
  InstalledApplications& applications;
  LocaleService& locale;
  LibraryLoader& libraries;
  RunLock& runLock;
  Outbox& outbox;
};

}  // namespace platform
