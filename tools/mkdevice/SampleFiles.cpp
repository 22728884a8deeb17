#include "platform/CivilDate.h"
#include "platform/Text.h"
#include "platform/host/JSON.h"
#include "platform/host/Timestamp.h"
#include "tools/mkdevice/Random.h"
#include "tools/mkdevice/Sample.h"
#include "tools/mkdevice/SampleController.h"

namespace mkdevice {

using platform::Array;
using platform::Data;
using platform::Dictionary;
using platform::Value;

namespace {

constexpr std::int64_t kGiB = std::int64_t{1} << 30;
constexpr std::int64_t kPageSize = 16384;

std::string hexadecimal(Random& random, int digits) {
  std::string text;
  while (digits-- > 0) text += "0123456789abcdef"[random.next() % 16];
  return text;
}

Dictionary properties(Random& random) {
  const std::int64_t capacity = 119 * kGiB, free = random.between(20 * kGiB, 60 * kGiB);
  return {{"InternalBuild", false},
          {"HardwareModel", "Vrn12,3"},
          {"SystemIdentifier", hexadecimal(random, 40)},
          {"InverseDeviceID", hexadecimal(random, 32)},
          {"DiskUsage", Dictionary{{"TotalDiskCapacity", capacity},
                                   {"TotalDataAvailable", free + 4 * kGiB},
                                   {"AmountDataAvailable", free}}}};
}

Dictionary systemVersion(Random&) {
  return {{"ProductVersion", "17.4"}, {"ProductBuildVersion", "21E219"}};
}

// Total, available and used bytes, the page size, and whether the swap is encrypted.
Data swapUsage(Random& random) {
  const auto total = static_cast<std::uint64_t>(random.between(1, 4) * kGiB);
  const std::uint64_t used = total / 16 * (random.next() % 16);
  Data record;
  const auto append = [&record](std::uint64_t value, int bytes) {
    for (int i = 0; i < bytes; ++i) {
      record.push_back(static_cast<std::uint8_t>(value >> (8 * i)));
    }
  };
  append(total, 8);
  append(total - used, 8);
  append(used, 8);
  append(static_cast<std::uint64_t>(kPageSize), 4);
  append(1, 4);
  return record;
}

// The kernel's counters agree with each other: parts add up, nothing is thawed that wasn't frozen.
Dictionary kernelValues(Random& random) {
  Dictionary values{{"hw.pagesize", kPageSize}, {"vm.swapusage", swapUsage(random)}};
  std::int64_t total = 0;
  for (const char* size : {"1", "2", "4", "8", "16", "32", "64", "128", "256"}) {
    const std::int64_t found = random.between(0, 3);
    total += found;
    values.set(platform::format("vm.vmtc_%s_byte", size), found);
  }
  const std::int64_t bitFlips = random.between(0, 2), undiagnosed = random.between(1, 3);
  values.set("vm.vmtc_one_bit_flip", bitFlips);
  values.set("vm.vmtc_not_found", random.between(0, 2));
  values.set("vm.vmtc_undiagnosed", undiagnosed);
  values.set("vm.vmtc_total", total + bitFlips + undiagnosed);

  const std::int64_t considered = random.between(900, 2400), frozen = random.between(120, 260);
  const std::int64_t thawed = frozen * random.between(30, 60) / 100;
  const std::int64_t refrozen = random.between(20, thawed);
  const struct {
    const char* name;
    std::int64_t value;
  } freezer[] = {
      {"freeze_count", frozen},
      {"freeze_pageouts", frozen * random.between(2000, 4000)},
      {"freeze_budget_pages_remaining", random.between(20000, 90000)},
      {"thaw_count", thawed},
      {"thaw_count_since_boot", thawed * 3},
      {"freezer_thaw_percentage", thawed * 100 / frozen},
      {"freezer_process_considered_count", considered},
      {"freezer_error_no_compressor_space_count", considered * random.between(0, 4) / 100},
      {"freezer_error_no_swap_space_count", considered * random.between(0, 6) / 100},
      {"freezer_error_below_min_pages_count", considered * random.between(10, 30) / 100},
      {"freezer_error_low_probability_of_use_count", considered * random.between(20, 40) / 100},
      {"freezer_error_other_count", considered * random.between(0, 5) / 100},
      {"freezer_below_threshold_count", random.between(100, 400)},
      {"freezer_skipped_full_count", random.between(0, 60)},
      {"freezer_refreeze_count", refrozen},
      {"freezer_bytes_refrozen", refrozen * random.between(8, 40) * kPageSize * 64},
  };
  for (const auto& [name, value] : freezer) {
    values.set(platform::format("kern.memorystatus_%s", name), value);
  }
  return values;
}

Array applications(Random& random) {
  Array installed;
  const auto add = [&installed](const char* maker, const char* name, const char* type) {
    installed.push_back(
        Dictionary{{"Bundle", platform::format("com.%s.%s", maker, name)}, {"Type", type}});
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

Dictionary analytics(Random&) {
  return {{"UsedEvents", Array{"com.norba.tarvenn.appInstalls", "com.norba.quenset.disabledLogs"}}};
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
                                          {"TaskingDigest", hexadecimal(random, 32)},
                                          {"TaskingPayload", payload}}}};
}

// Two structured logs of a day that is over.
std::string structuredLogs(Random& random, std::int32_t day) {
  const auto midnight = static_cast<double>(day) * static_cast<double>(platform::kSecondsPerDay);
  std::string lines;
  for (const double hour : {4.0, 16.0}) {
    std::string time;
    platform::host::appendTimestamp(time, midnight + hour * 3600);
    const Dictionary data{{"records", random.between(40, 400)},
                          {"dropped", random.between(0, 3)},
                          {"free_percent", 20 + 0.5 * static_cast<double>(random.between(0, 60))}};
    platform::host::appendJSON(
        lines, Dictionary{{"type", std::int64_t{176}}, {"time", time}, {"data", data}});
    lines += '\n';
  }
  return lines;
}

std::string supportLog(Random& random, std::int32_t day) {
  std::string lines;
  for (int i = 0; i < 4; ++i) {
    const double second = static_cast<double>(day) * static_cast<double>(platform::kSecondsPerDay) +
                          i * 21600 + static_cast<double>(random.between(0, 21599));
    platform::host::appendTimestamp(lines, second);
    lines += platform::format(" session %04d: %d requests answered\n", i + 1,
                              static_cast<int>(random.between(2, 60)));
  }
  return lines;
}

}  // namespace

std::vector<SampleFile> sampleFiles(const Sample& sample) {
  static const struct {
    const char* path;
    Value (*content)(Random&);
  } kPropertyLists[] = {
      {"device/properties.plist", [](Random& random) -> Value { return properties(random); }},
      {"device/system-version.plist",
       [](Random& random) -> Value { return systemVersion(random); }},
      {"device/kernel.plist", [](Random& random) -> Value { return kernelValues(random); }},
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
      {"var/preferences/__quenset__/com.norba.Varnhollow.plist",
       [](Random& random) -> Value { return analyticsConfiguration(random); }},
  };
  std::vector<SampleFile> files = {
      {"Library/Application Support/Pelloran/Whitelist_Vrn.plist", whitelist(sample.scale)}};
  for (const auto& [path, content] : kPropertyLists) {
    Random random(sample.seed, path);
    files.push_back({path, content(random)});
  }
  const auto addLog = [&](const std::string& path, std::string (*content)(Random&, std::int32_t),
                          std::int32_t day) {
    Random random(sample.seed, path);
    files.push_back({path, content(random, day)});
  };
  const std::int32_t yesterday = sample.today - 1;
  const platform::CivilDate date = platform::civilFromDays(yesterday);
  addLog(platform::format("var/spool/morvend/structured/%04d-%02d-%02d.jsonl",
                          static_cast<int>(date.year), date.month, date.day),
         structuredLogs, yesterday);
  addLog("var/log/servita/support.log", supportLog, yesterday);
  addLog("var/log/servita/support.log.1", supportLog, yesterday - 1);
  addLog("var/log/servita/uploads.log", supportLog, yesterday);
  for (SampleFile& file : controllerFiles(sample)) files.push_back(std::move(file));
  return files;
}

}  // namespace mkdevice
