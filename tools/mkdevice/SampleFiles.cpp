// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/mkdevice/SampleFiles.h"

#include "NANDInfo/Events.h"
#include "base/CivilDate.h"
#include "base/Text.h"
#include "base/Timestamp.h"
#include "plist/JSON.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/Whitelist.h"

namespace mkdevice {

using plist::Array;
using plist::Dictionary;
using plist::Value;

namespace {

Dictionary systemVersion(Random&) {
  return {{"ProductVersion", "17.4"}, {"ProductBuildVersion", "21E219"}};
}

Array applications(Random& random) {
  Array installed;
  const auto add = [&installed](const char* maker, const char* name, const char* type) {
    installed.push_back(
        Dictionary{{"Bundle", base::format("com.%s.%s", maker, name)}, {"Type", type}});
  };
  for (const char* name :
       {"camera", "maps", "messages", "music", "notes", "phone", "photos", "settings", "calendar",
        "browser", "clock", "weather", "mail", "wallet"}) {
    add("norba", name, "System");
  }
  for (const char* name : {"chessboard", "cookbook", "crossword", "departures", "dictionary",
                           "guitartuner", "ledger", "podcatcher", "runningclub", "sketchpad",
                           "tidetables", "translator", "vocabulary", "waterlevel"}) {
    if (random.fraction() < 0.7) add("example", name, "User");
  }
  return installed;
}

Dictionary locale(Random&) {
  return {{"PreferredLanguages", Array{"de-AT", "en-GB"}},
          {"Localizations", Array{"en", "de", "fr", "hu"}},
          {"CountryCode", "AT"}};
}

// Neither the histograms nor the month's counters of the storage are used.
Dictionary analytics(Random&) {
  return {
      {"UsedEvents", Array{"com.norba.tarvenn.appInstalls", "com.norba.quenset.disabledLogs",
                           NANDInfo::kEventName_massStorage_NANDInfo_FTLCounters_1,
                           NANDInfo::kEventName_massStorage_NANDInfo_MSPCounters_1,
                           NANDInfo::kEventName_massStorage_NANDInfo_StorageStats_1,
                           NANDInfo::kEventName_massStorage_NANDInfo_NORWrites,
                           NANDInfo::kEventName_massStorage_NANDInfo_SM_Daily_FTLCounters_1,
                           NANDInfo::kEventName_massStorage_NANDInfo_SM_WeeklyMA_FTLCounters_1}},
      {"Available", true}};
}

Dictionary analyticsConfiguration(Random& random) {
  // One setting for each way in which tasking changes preferences.
  const auto item = [](const char* user, const char* domain, const char* key, Value value) {
    return Dictionary{{"Domain", domain}, {"User", user}, {"Key", key}, {"Value", value}};
  };
  const Array payload{
      item("mobile", "com.norba.radio", "DetailedScans", true),
      item("__quenset__", "com.norba.Varnhollow", "UploadDelayMinutes", random.between(30, 240)),
      item("_servita", "com.norba.servita", "KeepLogs", std::int64_t{5})};
  return {{"LogBlocklist", Array{"211", "309"}},
          {"ScheduledTasking", Dictionary{{"TaskingID", "tasking-2117"},
                                          {"TaskingDigest", random.hexadecimal(32)},
                                          {"TaskingPayload", payload}}}};
}

// Two structured logs of a day that is over.
std::string structuredLogs(Random& random, std::int32_t day) {
  const auto midnight = static_cast<double>(day) * static_cast<double>(base::kSecondsPerDay);
  std::string lines;
  for (const double hour : {4.0, 16.0}) {
    std::string time;
    base::appendTimestamp(time, midnight + hour * 3600);
    const Dictionary data{{"records", random.between(40, 400)},
                          {"dropped", random.between(0, 3)},
                          {"free_percent", 20 + 0.5 * static_cast<double>(random.between(0, 60))}};
    plist::appendJSON(lines,
                      Dictionary{{"type", std::int64_t{176}}, {"time", time}, {"data", data}});
    lines += '\n';
  }
  return lines;
}

}  // namespace

std::vector<SampleFile> lastingFiles(const Sample& sample) {
  static const struct {
    const char* path;
    Value (*content)(Random&);
  } kPropertyLists[] = {
      {"device/system-version.plist",
       [](Random& random) -> Value { return systemVersion(random); }},
      {"device/applications.plist", [](Random& random) -> Value { return applications(random); }},
      {"device/locale.plist", [](Random& random) -> Value { return locale(random); }},
      {"device/analytics.plist", [](Random& random) -> Value { return analytics(random); }},
      {"var/preferences/mobile/com.norba.quenset.plist",
       [](Random&) -> Value {
         return Dictionary{{"DiagnosticLogSubmissionEnabled", true}};
       }},
      {"var/preferences/mobile/com.norba.da.plist",
       [](Random&) -> Value {
         return Dictionary{{"Experiments", false}};
       }},
      // Every sample device writes more than this, so that its storage log has a validity list.
      {"var/preferences/mobile/com.norba.NANDInfo.plist",
       [](Random&) -> Value {
         return Dictionary{{"userWAmp", 1.5}};
       }},
      {"var/preferences/__quenset__/com.norba.Varnhollow.plist",
       [](Random& random) -> Value { return analyticsConfiguration(random); }},
  };
  std::vector<SampleFile> files = {
      {"Library/Application Support/Pelloran/Whitelist_Vrn.plist", whitelist(sample.scale)}};
  for (const auto& [path, content] : kPropertyLists) {
    Random random(sample.seed, path);
    files.push_back({path, content(random)});
  }
  const std::int32_t yesterday = sample.today - 1;
  const base::CivilDate date = base::civilFromDays(yesterday);
  Random random(sample.seed, "structured", yesterday);
  files.push_back({base::format("var/spool/morvend/structured/%04d-%02d-%02d.jsonl",
                                static_cast<int>(date.year), date.month, date.day),
                   structuredLogs(random, yesterday)});
  return files;
}

}  // namespace mkdevice
