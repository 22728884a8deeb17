#include "daemon/Entry.h"

#include <string_view>

#include "base/CivilDate.h"
#include "daemon/DailyRun.h"
#include "daemon/ServiceListener.h"

namespace morvend {

using platform::EventLoop;
using platform::LogLevel;
using platform::Platform;

namespace {

constexpr char kServiceName[] = "com.norba.pellorand.morvend";
constexpr double kIdleSeconds = 10.0;

void serve(Platform& platform, DeviceContext& context) {
  ServiceState state;
  const auto listener = platform.namedServices.listen(kServiceName);
  if (listener != nullptr) {
    listener->start([&](const plist::Dictionary* message) {
      HandleServiceMessage(platform, context, state, message);
    });
  }
  auto result = EventLoop::RunResult::handledSource;
  while (result != EventLoop::RunResult::timedOut && result != EventLoop::RunResult::toldToEnd) {
    result = platform.eventLoop.run(kIdleSeconds, true);
  }
  if (result == EventLoop::RunResult::toldToEnd) {
    platform.log.log(LogLevel::standard, "told to end, so no longer waiting for messages");
  } else if (state.AwaitingAppInfo) {
    platform.log.log(LogLevel::standard,
                     "never received requested AAI, so moving along without it");
    RunDailyTasksIfDue(platform, context, nullptr);
  }
}

void runOption(Platform& platform, DeviceContext& context, const char* argument) {
  const std::int32_t today = platform.counters.PLDaysSince1970();
  const std::string_view option = argument;
  if (option == "-d") {
    RunDailyTasksIfDue(platform, context, nullptr);
  } else if (option == "-f") {
    RunDailyTasks(platform, context, base::dayBefore(today), nullptr);
  } else if (option == "-t") {
    RunDailyTasks(platform, context, today, nullptr);
  } else {
    platform.log.log(LogLevel::standard, "Unknown arg: %s", argument);
  }
}

}  // namespace

void RunProcess(Platform& platform, DeviceContext& context, int argumentCount,
                const char* const* arguments) {
  platform.log.log(LogLevel::standard, "morvend started");
  if (argumentCount == 1) {
    serve(platform, context);
  } else if (argumentCount >= 2) {
    runOption(platform, context, arguments[1]);
  }
  platform.log.log(LogLevel::standard, "morvend ended");
}

}  // namespace morvend
