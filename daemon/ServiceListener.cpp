// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/ServiceListener.h"

#include <string>

#include "base/Text.h"
#include "daemon/DailyRun.h"
#include "platform/EventLoop.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::LogLevel;
using plist::Dictionary;
using plist::Number;
using plist::Value;

namespace {

constexpr std::int32_t kWaitForAppInfo = 0;
constexpr std::int32_t kRunForDay = 1;
constexpr std::int32_t kDeliverAppInfo = 2;

std::int64_t integer(const Dictionary& message, const char* key) {
  const Number* number = message.number(key);
  return number != nullptr && !number->isReal() ? number->int64Value() : 0;
}

std::int32_t lowBits(std::int64_t value) {
  return static_cast<std::int32_t>(static_cast<std::uint32_t>(value));
}

std::string text(const Dictionary& message, const char* key) {
  const std::string* found = message.text(key);
  return found != nullptr ? *found : std::string();
}

// The canonical form, 8-4-4-4-12 digits; empty when there are no 16 bytes.
std::string uuidText(const Dictionary& message, const char* key) {
  const auto* bytes = message.data(key);
  if (bytes == nullptr || bytes->size() != 16) return {};
  std::string canonical;
  for (std::size_t i = 0; i < bytes->size(); ++i) {
    if (i == 4 || i == 6 || i == 8 || i == 10) canonical += '-';
    canonical += base::format("%02x", (*bytes)[i]);
  }
  return canonical;
}

ActivatedAppInfo appInfoOf(const Dictionary& message) {
  ActivatedAppInfo apps;
  const auto* elements = message.array("app_data");
  if (elements == nullptr) return apps;
  for (const Value& element : *elements) {
    const auto* app = element.as<Dictionary>();
    if (app == nullptr) continue;
    apps.push_back(Dictionary{{"bundle", text(*app, "bundle_id")},
                              {"version", text(*app, "version")},
                              {"orloID", integer(*app, "orlo_id")},
                              {"arch", integer(*app, "arch")},
                              {"uuid", uuidText(*app, "uuid")}});
  }
  return apps;
}

void handleDelivery(const Services& services, DeviceContext& context, ServiceState& state,
                    const Dictionary& message) {
  const ActivatedAppInfo apps = appInfoOf(message);
  if (services.log.shows(LogLevel::standard)) {
    services.log.log(LogLevel::standard, "morvend got %sAAI:\n%s",
                     state.AwaitingAppInfo ? "requested" : "(unsolicited -- so ignoring) ",
                     plist::description(Value(apps)).c_str());
  }
  if (!state.AwaitingAppInfo) return;
  RunDailyTasksIfDue(services, context, &apps);
  state.AwaitingAppInfo = false;
}

}  // namespace

void HandleServiceMessage(const Services& services, DeviceContext& context, ServiceState& state,
                          const Dictionary* message) {
  if (message == nullptr) return;
  const std::int32_t operation = lowBits(integer(*message, "operation"));
  if (operation == kDeliverAppInfo) return handleDelivery(services, context, state, *message);
  if (state.firstMessageTaken) return;
  state.firstMessageTaken = true;
  if (operation == kRunForDay) {
    RunDailyTasks(services, context, lowBits(integer(*message, "value")), nullptr);
  } else if (operation == kWaitForAppInfo) {
    state.AwaitingAppInfo = true;
    services.notifications.postNotification("com.norba.pellorand.morvend.logging");
    services.log.log(LogLevel::standard,
                     "notified of logging status, waiting for activate app info");
  }
}

}  // namespace morvend
