// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/Entry.h"

#include <string_view>

#include "base/CivilDate.h"
#include "daemon/DailyRun.h"
#include "daemon/ServiceListener.h"
#include "platform/CountersService.h"
#include "platform/EventLoop.h"
#include "platform/Names.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::EventLoop;
using platform::LogLevel;

namespace {

constexpr double kIdleSeconds = 10.0;

void serve(const Services& services, DeviceContext& context) {
  ServiceState state;
  const auto listener = services.namedServices.listen(platform::kDaemonName);
  if (listener != nullptr) {
    listener->start([&](const plist::Dictionary* message) {
      HandleServiceMessage(services, context, state, message);
    });
  }
  auto result = EventLoop::RunResult::handledSource;
  while (result != EventLoop::RunResult::timedOut && result != EventLoop::RunResult::toldToEnd) {
    result = services.eventLoop.run(kIdleSeconds, true);
  }
  if (result == EventLoop::RunResult::toldToEnd) {
    services.log.log(LogLevel::standard, "told to end, so no longer waiting for messages");
  } else if (state.AwaitingAppInfo) {
    services.log.log(LogLevel::standard,
                     "never received requested AAI, so moving along without it");
    RunDailyTasksIfDue(services, context, nullptr);
  }
}

void runOption(const Services& services, DeviceContext& context, const char* argument) {
  const std::int32_t today = services.counters.PLDaysSince1970();
  const std::string_view option = argument;
  if (option == "-d") {
    RunDailyTasksIfDue(services, context, nullptr);
  } else if (option == "-f") {
    RunDailyTasks(services, context, base::dayBefore(today), nullptr);
  } else if (option == "-t") {
    RunDailyTasks(services, context, today, nullptr);
  } else {
    services.log.log(LogLevel::standard, "Unknown arg: %s", argument);
  }
}

}  // namespace

void RunProcess(const Services& services, DeviceContext& context, int argumentCount,
                const char* const* arguments) {
  services.log.log(LogLevel::standard, "morvend started");
  if (argumentCount == 1) {
    serve(services, context);
  } else if (argumentCount >= 2) {
    runOption(services, context, arguments[1]);
  }
  services.log.log(LogLevel::standard, "morvend ended");
}

}  // namespace morvend
