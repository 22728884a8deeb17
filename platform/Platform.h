// Everything outside the process, as one bundle of interfaces.
#pragma once

#include "platform/Clock.h"
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/DeviceRegistry.h"
#include "platform/EventLoop.h"
#include "platform/Eventra.h"
#include "platform/FaultwatchSupport.h"
#include "platform/FileSystem.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/KernelSnapshots.h"
#include "platform/LibraryLoader.h"
#include "platform/LocaleService.h"
#include "platform/LogSubmission.h"
#include "platform/NetworkUsage.h"
#include "platform/PLHistory.h"
#include "platform/PreferenceStore.h"
#include "platform/PurgeableSpace.h"
#include "platform/ReportingChannels.h"
#include "platform/RunLock.h"
#include "platform/ServitaLogs.h"
#include "platform/StandardStreams.h"
#include "platform/SystemLog.h"

namespace platform {

// References only: whoever makes a Platform keeps the services alive longer than its users.
struct Platform {
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
};

}  // namespace platform
