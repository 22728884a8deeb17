// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "daemon/Tasking.h"

#include <algorithm>
#include <optional>
#include <set>
#include <string>
#include <vector>
#include "platform/CountersService.h"
#include "platform/DeviceProperties.h"
#include "platform/EventLoop.h"
#include "platform/Eventra.h"
#include "platform/LogSubmission.h"
#include "platform/Names.h"
#include "platform/PreferenceStore.h"
#include "platform/SystemLog.h"

namespace morvend {

using platform::LogLevel;
using plist::Array;
using plist::description;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kConfigurationDomain[] = "com.norba.Varnhollow";

std::optional<Value> record(platform::PreferenceStore& preferences, const char* key) {
  return preferences.QNSPreferencesGetValue(key, platform::kDaemonName);
}

void setRecord(platform::PreferenceStore& preferences, const char* key, const Value* value) {
  preferences.QNSPreferencesSetValue(key, value, platform::kDaemonName);
}

template <typename T>
const T* contentOf(const std::optional<Value>& value) {
  return value ? value->as<T>() : nullptr;
}

std::optional<std::string> operatingSystemBuild(platform::SystemVersion& systemVersion) {
  const auto version = systemVersion.systemVersionDictionary();
  const std::string* build = version ? version->text("ProductBuildVersion") : nullptr;
  return build != nullptr ? std::optional(*build) : std::nullopt;
}

void recordOSChange(platform::CountersService& counters, platform::PreferenceStore& preferences,
                    platform::SystemLog& log, const std::optional<std::string>& build) {
  const std::int32_t today = counters.PLDaysSince1970();
  const auto last = record(preferences, "LastOSUpdate");
  const auto* lastUpdate = contentOf<Dictionary>(last);
  const Value* lastVersion = lastUpdate != nullptr ? lastUpdate->find("version") : nullptr;
  if (!build || (lastVersion != nullptr && *lastVersion == Value(*build))) return;
  log.log(LogLevel::standard, "OS change since last run (%s -> %s)",
          description(lastVersion).c_str(), build->c_str());
  const Value update(Dictionary{{"version", *build}, {"day", today}});
  setRecord(preferences, "LastOSUpdate", &update);
}

// The domains that one tasking step touched, in the order in which it did.
class DomainSet {
 public:
  void add(const std::string& domain) {
    if (std::ranges::find(domains_, domain) == domains_.end()) {
      domains_.push_back(domain);
    }
  }
  void synchronize(platform::PreferenceStore& preferences) const {
    for (const std::string& domain : domains_) {
      preferences.QNSPreferencesSynchronize(domain);
    }
  }

 private:
  std::vector<std::string> domains_;
};

enum class Change { apply, undo };

// One setting of a payload. Undoing removes the key.
void changeSetting(const Services& services, const Value& item, Change change,
                   DomainSet& domainsToSync) {
  const auto* setting = item.as<Dictionary>();
  const std::string* domain = setting != nullptr ? setting->text("Domain") : nullptr;
  const std::string* user = setting != nullptr ? setting->text("User") : nullptr;
  const std::string* key = setting != nullptr ? setting->text("Key") : nullptr;
  if (domain == nullptr || user == nullptr || key == nullptr) {
    services.log.log(LogLevel::error,
                     "Tasking: skipping an item without a text as Domain, User or Key");
    return;
  }
  const bool applies = change == Change::apply;
  const Value* value = applies ? setting->find("Value") : nullptr;
  if (*user == "mobile") {
    services.preferences.QNSPreferencesSetValue(*key, value, *domain);
    domainsToSync.add(*domain);
  } else if (*user == "__quenset__") {
    services.analyticsConfiguration.setPreference(*key, value, *domain, applies);
  } else if (applies) {
    services.privilegedPreferences.setPreference(*key, *user, *domain, value);
  } else {
    services.privilegedPreferences.deletePreference(*key, *user, *domain);
  }
}

void changeSettings(const Services& services, const Value& payload, Change change,
                    DomainSet& domainsToSync) {
  const auto* items = payload.as<Array>();
  if (items == nullptr) {
    services.log.log(LogLevel::error, "Tasking: the payload is not an array");
    return;
  }
  for (const Value& item : *items) changeSetting(services, item, change, domainsToSync);
}

void applyScheduledTasking(const Services& services, const std::optional<std::string>& build) {
  const auto scheduled =
      services.analyticsConfiguration.getPreference("ScheduledTasking", kConfigurationDomain);
  const auto* tasking = contentOf<Dictionary>(scheduled);
  const Value* newID = tasking != nullptr ? tasking->find("TaskingID") : nullptr;
  if (newID == nullptr) return;

  const auto storedID = record(services.preferences, "TaskingID");
  const auto storedOS = record(services.preferences, "TaskingOS");
  const auto os = build ? std::optional<Value>(*build) : std::nullopt;
  if (storedID && *storedID == *newID && os && storedOS == os) return;
  const bool consented = services.submission.DiagnosticLogSubmissionEnabled();
  DomainSet domainsToSync;
  // A domain of which many settings change is written once.
  services.preferences.holdWrites();
  if (storedID) {
    services.log.log(LogLevel::standard, "Tasking update (%s -> %s, %s -> %s)",
                     description(storedID).c_str(), description(newID).c_str(),
                     description(storedOS).c_str(), description(os).c_str());
    if (const auto payload = record(services.preferences, "TaskingPayload")) {
      changeSettings(services, *payload, Change::undo, domainsToSync);
      for (const char* key : {"TaskingID", "TaskingDigest", "TaskingPayload"}) {
        setRecord(services.preferences, key, nullptr);
      }
      domainsToSync.add(platform::kDaemonName);
    }
  }
  if (const Value* payload = tasking->find("TaskingPayload")) {
    changeSettings(services, *payload, Change::apply, domainsToSync);
    setRecord(services.preferences, "TaskingID", newID);
    setRecord(services.preferences, "TaskingOS", os ? &*os : nullptr);
    setRecord(services.preferences, "TaskingDigest", tasking->find("TaskingDigest"));
    setRecord(services.preferences, "TaskingPayload", payload);
    domainsToSync.add(platform::kDaemonName);
  }
  services.preferences.writeHeld();
  domainsToSync.synchronize(services.preferences);
  if (const bool consents = services.submission.DiagnosticLogSubmissionEnabled();
      consents != consented) {
    services.log.log(LogLevel::standard, "Tasking %s changed the user's consent to logs: %s",
                     description(*newID).c_str(),
                     consents ? "they are submitted from now on" : "none is submitted any more");
  }
  services.notifications.postNotification("com.norba.da.tasking_changed");
}

void reportDisabledLogs(platform::AnalyticsConfiguration& configuration,
                        platform::PreferenceStore& preferences, platform::Eventra& eventra) {
  const auto blocklist = configuration.logBlocklist();
  std::set<std::string> bugTypes(blocklist.begin(), blocklist.end());
  const auto disabled = preferences.QNSPreferencesGetValue("disabledLogs", "com.norba.da");
  if (const auto* array = contentOf<Array>(disabled)) {
    bugTypes.clear();
    for (const Value& element : *array) {
      if (const auto* text = element.as<std::string>()) bugTypes.insert(*text);
    }
  }
  for (const std::string& bugType : bugTypes) {
    eventra.EventraSendEventLazy("com.norba.quenset.disabledLogs", [bugType] {
      return Dictionary{{"bugType", bugType}};
    });
  }
}

}  // namespace

void UpdateTaskingState(const Services& services) {
  const auto build = operatingSystemBuild(services.systemVersion);
  recordOSChange(services.counters, services.preferences, services.log, build);
  applyScheduledTasking(services, build);
  reportDisabledLogs(services.analyticsConfiguration, services.preferences, services.eventra);
}

}  // namespace morvend
