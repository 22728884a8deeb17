#include "daemon/Tasking.h"

#include <algorithm>
#include <optional>
#include <set>
#include <string>
#include <vector>

namespace morvend {

using platform::LogLevel;
using platform::Platform;
using plist::Array;
using plist::description;
using plist::Dictionary;
using plist::Value;

namespace {

constexpr char kDomain[] = "com.norba.pellorand.morvend";
constexpr char kConfigurationDomain[] = "com.norba.Varnhollow";

std::optional<Value> record(Platform& platform, const char* key) {
  return platform.preferences.QNSPreferencesGetValue(key, kDomain);
}

void setRecord(Platform& platform, const char* key, const Value* value) {
  platform.preferences.QNSPreferencesSetValue(key, value, kDomain);
}

template <typename T>
const T* contentOf(const std::optional<Value>& value) {
  return value ? value->as<T>() : nullptr;
}

std::optional<std::string> operatingSystemBuild(Platform& platform) {
  const auto version = platform.systemVersion.systemVersionDictionary();
  const std::string* build = version ? version->text("ProductBuildVersion") : nullptr;
  return build != nullptr ? std::optional(*build) : std::nullopt;
}

void recordOSChange(Platform& platform, const std::optional<std::string>& build) {
  const std::int32_t today = platform.counters.PLDaysSince1970();
  const auto last = record(platform, "LastOSUpdate");
  const auto* lastUpdate = contentOf<Dictionary>(last);
  const Value* lastVersion = lastUpdate != nullptr ? lastUpdate->find("version") : nullptr;
  if (!build || (lastVersion != nullptr && *lastVersion == Value(*build))) return;
  platform.log.log(LogLevel::standard, "OS change since last run (%s -> %s)",
                   description(lastVersion).c_str(), build->c_str());
  const Value update(Dictionary{{"version", *build}, {"day", today}});
  setRecord(platform, "LastOSUpdate", &update);
}

// The domains that one tasking step touched, in the order in which it did.
class DomainSet {
 public:
  void add(const std::string& domain) {
    if (std::find(domains_.begin(), domains_.end(), domain) == domains_.end()) {
      domains_.push_back(domain);
    }
  }
  void synchronize(Platform& platform) const {
    for (const std::string& domain : domains_) {
      platform.preferences.QNSPreferencesSynchronize(domain);
    }
  }

 private:
  std::vector<std::string> domains_;
};

enum class Change { apply, undo };

// One setting of a payload. Undoing removes the key.
void changeSetting(Platform& platform, const Value& item, Change change, DomainSet& domainsToSync) {
  const auto* setting = item.as<Dictionary>();
  const std::string* domain = setting != nullptr ? setting->text("Domain") : nullptr;
  const std::string* user = setting != nullptr ? setting->text("User") : nullptr;
  const std::string* key = setting != nullptr ? setting->text("Key") : nullptr;
  if (domain == nullptr || user == nullptr || key == nullptr) {
    platform.log.log(LogLevel::error,
                     "Tasking: skipping an item without a text as Domain, User or Key");
    return;
  }
  const bool applies = change == Change::apply;
  const Value* value = applies ? setting->find("Value") : nullptr;
  if (*user == "mobile") {
    platform.preferences.QNSPreferencesSetValue(*key, value, *domain);
    domainsToSync.add(*domain);
  } else if (*user == "__quenset__") {
    platform.analyticsConfiguration.setPreference(*key, value, *domain, applies);
  } else if (applies) {
    platform.privilegedPreferences.setPreference(*key, *user, *domain, value);
  } else {
    platform.privilegedPreferences.deletePreference(*key, *user, *domain);
  }
}

void changeSettings(Platform& platform, const Value& payload, Change change,
                    DomainSet& domainsToSync) {
  const auto* items = payload.as<Array>();
  if (items == nullptr) {
    platform.log.log(LogLevel::error, "Tasking: the payload is not an array");
    return;
  }
  for (const Value& item : *items) changeSetting(platform, item, change, domainsToSync);
}

void applyScheduledTasking(Platform& platform, const std::optional<std::string>& build) {
  const auto scheduled =
      platform.analyticsConfiguration.getPreference("ScheduledTasking", kConfigurationDomain);
  const auto* tasking = contentOf<Dictionary>(scheduled);
  const Value* newID = tasking != nullptr ? tasking->find("TaskingID") : nullptr;
  if (newID == nullptr) return;

  const auto storedID = record(platform, "TaskingID");
  const auto storedOS = record(platform, "TaskingOS");
  const auto os = build ? std::optional<Value>(*build) : std::nullopt;
  DomainSet domainsToSync;
  if (storedID) {
    if (*storedID == *newID && os && storedOS == os) return;
    platform.log.log(LogLevel::standard, "Tasking update (%s -> %s, %s -> %s)",
                     description(storedID).c_str(), description(newID).c_str(),
                     description(storedOS).c_str(), description(os).c_str());
    if (const auto payload = record(platform, "TaskingPayload")) {
      changeSettings(platform, *payload, Change::undo, domainsToSync);
      for (const char* key : {"TaskingID", "TaskingDigest", "TaskingPayload"}) {
        setRecord(platform, key, nullptr);
      }
      domainsToSync.add(kDomain);
    }
  }
  if (const Value* payload = tasking->find("TaskingPayload")) {
    changeSettings(platform, *payload, Change::apply, domainsToSync);
    setRecord(platform, "TaskingID", newID);
    setRecord(platform, "TaskingOS", os ? &*os : nullptr);
    setRecord(platform, "TaskingDigest", tasking->find("TaskingDigest"));
    setRecord(platform, "TaskingPayload", payload);
    domainsToSync.add(kDomain);
  }
  domainsToSync.synchronize(platform);
  platform.notifications.postNotification("com.norba.da.tasking_changed");
}

void reportDisabledLogs(Platform& platform) {
  const auto blocklist = platform.analyticsConfiguration.logBlocklist();
  std::set<std::string> bugTypes(blocklist.begin(), blocklist.end());
  const auto disabled = platform.preferences.QNSPreferencesGetValue("disabledLogs", "com.norba.da");
  if (const auto* array = contentOf<Array>(disabled)) {
    bugTypes.clear();
    for (const Value& element : *array) {
      if (const auto* text = element.as<std::string>()) bugTypes.insert(*text);
    }
  }
  for (const std::string& bugType : bugTypes) {
    platform.eventra.EventraSendEventLazy("com.norba.quenset.disabledLogs", [bugType] {
      return Dictionary{{"bugType", bugType}};
    });
  }
}

}  // namespace

void UpdateTaskingState(Platform& platform) {
  const auto build = operatingSystemBuild(platform);
  recordOSChange(platform, build);
  applyScheduledTasking(platform, build);
  reportDisabledLogs(platform);
}

}  // namespace morvend
