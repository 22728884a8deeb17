// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

// What a tasking changes: what its payload names, the records of it, and nothing else; the next
// one takes that back.

#include <cstdint>
#include <set>
#include <string>
#include <tuple>

#include "Input.h"
#include "daemon/Tasking.h"
#include "platform/testing/FakePlatform.h"

namespace {

using fuzz::require;
using plist::Dictionary;
using Place = std::tuple<std::string, std::string, std::string>;  // user, domain, key
using Places = std::map<Place, const plist::Value*>;              // null: nothing is to be there

constexpr std::string_view kWords[] = {"TaskingID",     "TaskingPayload",
                                       "TaskingDigest", "Domain",
                                       "User",          "Key",
                                       "Value",         "mobile",
                                       "__quenset__",   "root",
                                       "com.norba.da",  "k",
                                       "com.example",   "disabledLogs",
                                       "TaskingOS",     "com.norba.pellorand.morvend"};
constexpr char kOwnDomain[] = "com.norba.pellorand.morvend";

const Place kScheduled{"__quenset__", "com.norba.Varnhollow", "ScheduledTasking"};

bool isOwn(const Place& place) {
  static const std::set<std::string> kRecords{"TaskingID", "TaskingOS", "TaskingDigest",
                                              "TaskingPayload", "LastOSUpdate"};
  const auto& [user, domain, key] = place;
  return place == kScheduled ||
         (user == "mobile" && domain == kOwnDomain && kRecords.contains(key));
}

// What a payload names, each with what is there in the end.
Places named(const plist::Value& tasking) {
  Places places;
  const auto* dictionary = tasking.as<Dictionary>();
  const auto* items = dictionary != nullptr ? dictionary->array("TaskingPayload") : nullptr;
  if (items == nullptr || dictionary->find("TaskingID") == nullptr) return places;
  for (const plist::Value& item : *items) {
    const auto* setting = item.as<Dictionary>();
    if (setting == nullptr) continue;
    const auto *domain = setting->text("Domain"), *user = setting->text("User"),
               *key = setting->text("Key");
    if (domain == nullptr || user == nullptr || key == nullptr) continue;
    places[{*user, *domain, *key}] = setting->find("Value");
  }
  return places;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const std::uint8_t* bytes, std::size_t size) {
  fuzz::Input input(bytes, size);
  fuzz::Values values(input, kWords);
  platform::fakes::FakePlatform platform(platform::LogLevel::error);
  auto& stored = platform.preferences.values;
  platform.counters.today = 20000;
  platform.device.version = Dictionary{{"ProductBuildVersion", "A1"}};
  const plist::Value first = values.value(), second = values.value();
  while (!input.empty()) {
    stored.insert_or_assign({values.text(), values.text(), values.text()}, values.value());
  }
  for (const char* record : {"TaskingID", "TaskingPayload"}) {
    stored.erase({"mobile", kOwnDomain, record});
  }
  const auto update = [&](const plist::Value& tasking) {
    stored.insert_or_assign(kScheduled, tasking);
    platform.journal.clear();
    platform.eventra.events.clear();
    morvend::UpdateTaskingState(platform.platform);
    for (const auto& [event, fields] : platform.eventra.events) {
      require(fields.size() == 1 && fields.text("bugType") != nullptr, "events name a log type");
    }
  };
  const auto at = [&](const Place& place) {
    const auto found = stored.find(place);
    return found != stored.end() ? &found->second : nullptr;
  };

  const auto before = stored;
  update(first);
  const Places places = named(first);
  for (const auto& [place, value] : stored) {
    if (isOwn(place) || places.contains(place)) continue;
    const auto old = before.find(place);
    require(old != before.end() && old->second == value, "nothing is set that nobody names");
  }
  for (const auto& [place, value] : before) {
    require(isOwn(place) || places.contains(place) || at(place) != nullptr, "nor removed");
  }
  for (const auto& [place, value] : places) {
    if (isOwn(place)) continue;
    const plist::Value* now = at(place);
    require((now == nullptr) == (value == nullptr) && (now == nullptr || *now == *value),
            "the last setting of a key holds");
  }

  const auto* tasking = first.as<Dictionary>();
  const bool applied = tasking != nullptr && tasking->find("TaskingID") != nullptr &&
                       tasking->find("TaskingPayload") != nullptr;
  if (!applied) return 0;
  const auto once = stored;
  update(first);
  require(std::ranges::find(platform.journal, "post com.norba.da.tasking_changed") ==
              platform.journal.end(),
          "the same tasking is not applied again");
  for (const auto& [place, value] : once) {
    if (!isOwn(place)) require(at(place) != nullptr && *at(place) == value, "it changes nothing");
  }

  const auto* other = second.as<Dictionary>();
  const auto* id = other != nullptr ? other->find("TaskingID") : nullptr;
  if (id == nullptr || *id == *tasking->find("TaskingID")) return 0;
  update(second);
  const Places later = named(second);
  for (const auto& [place, value] : places) {
    require(isOwn(place) || later.contains(place) || at(place) == nullptr,
            "the next takes it back");
  }
  return 0;
}
