// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "end_to_end/Device.h"

#include <gtest/gtest.h>
#include <sqlite3.h>

#include <algorithm>
#include <filesystem>
#include <system_error>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "host/Host.h"
#include "host/process/SystemClock.h"
#include "platform/PLHistory.h"
#include "plist/PropertyList.h"
#include "support/ControllerLists.h"
#include "support/ControllerRoot.h"

namespace end_to_end {

using base::format;

namespace {

Dictionary setting(const char* user, const char* key) {
  return {{"Domain", "com.example"}, {"User", user}, {"Key", key}, {"Value", key}};
}

// Worn enough for the validity list to be logged: three bytes erased for one that was written.
Dictionary controller() {
  const support::Bytes statistics =
      support::words({support::header(4, 1), 1, support::header(20, 1), 3, support::header(49, 1),
                      4096, support::header(50, 1), 1, support::header(1, 1), 7});
  const plist::Data telemetry = support::data(support::telemetryList(1));
  const Dictionary buffers{
      {"13", support::data(statistics)},
      {"11", support::data(support::validityList(2, {{0, 5}, {1, 7}, {0, 6}}))},
      {"17:0", telemetry},
      {"17:1", telemetry},
      {"17:2", telemetry},
      {"15", support::data(support::defectsList(2, {{1, 0, 3, 4, 5, 6, 7, 0}}))}};
  const Dictionary characteristics{{"chip-id", "QM8"},
                                   {"manufacturer-id", "2C64A1D40500"},
                                   {"num-bus", 1},
                                   {"nand-device-desc", 9}};
  return {{"Class", "NorbaQRT3NVMeController"},
          {"Properties", Dictionary{{"Controller Characteristics", characteristics}}},
          {"Driver", Dictionary{{"Buffers", buffers}}}};
}

}  // namespace

Device::Device()
    : root_(std::make_unique<support::TemporaryFolder>()),
      today_(base::dayNumber(host::SystemClock().now().secondsSince1970)) {}

void Device::fill() {
  host::Host host({.root = root_->path()});
  for (std::int32_t day = today_ - 3; day < today_; ++day) {
    for (const char* key : {"exact", "family.a", "family.b", "secret"}) {
      EXPECT_TRUE(host.counters().set(key, 1000 * (day % 7) + 123, day));
    }
    for (int i = 0; i < 40; ++i) EXPECT_TRUE(host.counters().push("samples", i * 0.5, day, i));
    if (day == today_ - 3) host.counters().PLClientCheckpoint();
  }
  const Dictionary rounded{{"bucket_interval", 10}, {"sig_fig", 2}};
  writePropertyList(
      kWhitelist,
      Dictionary{
          {"Group",
           Dictionary{
               {"ScalarKeys",
                Dictionary{{"exact", Dictionary()},
                           {"com.norba.quenset.prnd.database.corruptions", Dictionary()}}},
               {"ScalarKeyPrefixes", Dictionary{{"family.", rounded}}},
               {"DistributionKeys",
                Dictionary{{"samples", Dictionary{{"intervals", Array{Value(5), Value(10)}}}}}}}}});
  writePropertyList("var/preferences/mobile/com.norba.quenset.plist",
                    Dictionary{{"DiagnosticLogSubmissionEnabled", true}});
  writePropertyList("var/preferences/mobile/com.norba.pellorand.plist",
                    Dictionary{{"DatabaseCorruptionCount", 2}});
  writePropertyList(
      "var/preferences/__quenset__/com.norba.Varnhollow.plist",
      Dictionary{
          {"LogBlocklist", Array{"110", "193"}},
          {"ScheduledTasking",
           Dictionary{{"TaskingID", "T1"},
                      {"TaskingDigest", "D1"},
                      {"TaskingPayload", Array{setting("mobile", "m"), setting("__quenset__", "q"),
                                               setting("guest", "g")}}}}});
  writePropertyList("device/system-version.plist",
                    Dictionary{{"ProductBuildVersion", "A1"}, {"ProductVersion", "1.0"}});
  writePropertyList("device/kernel.plist",
                    Dictionary{{"kern.bootsessionuuid", today_ % 2 == 0 ? "1" : "0"}});
  writePropertyList("device/properties.plist",
                    Dictionary{{"DiskUsage", Dictionary{{"TotalDiskCapacity", 5 << 20},
                                                        {"TotalDataAvailable", 3 << 20}}}});
  writePropertyList(
      "device/report-channels.plist",
      Array{Dictionary{{"Name", "channel"}, {"Category", 0x100}, {"Format", 1}, {"Value", 7}}});
  writePropertyList(
      "device/network-usage.plist",
      Dictionary{{"Records", Array{Dictionary{{"procName", "process"},
                                              {"since", plist::Date{today_ * 86400.0}},
                                              {"wifiInBytes", 2048}}}}});
  root_->write("device/ecc-events/1", std::string("\1\0", 2));
  writePropertyList("device/registry.plist", Dictionary{{"Children", Array{controller()}}});
  writePropertyList("device/purgeable-space.plist",
                    Dictionary{{"SPACEREAP_TOTAL_AVAILABLE", 5000}});
  const plist::Data snapshot = support::data(support::kernelSnapshot(4096));
  root_->write("device/kernel-snapshot.bin", std::string(snapshot.begin(), snapshot.end()));
  writePropertyList("device/locale.plist", Dictionary{{"PreferredLanguages", Array{"de-AT"}},
                                                      {"Localizations", Array{"en", "de"}},
                                                      {"CountryCode", "AT"}});
  root_->write("var/log/servita/a.log", "new\n");
  root_->write("var/log/servita/a.log.1", "old\n");
  root_->write("var/spool/morvend/structured/2020-01-01.jsonl", "{\"type\": 1}\n");
  std::filesystem::create_directories((*root_ / kModule).parent_path());
  std::filesystem::copy_file(FAULTWATCH_SUPPORT_MODULE, *root_ / kModule);
}

faults::Strings Device::environment(const std::string& bus) const {
  return {"MORVEND_ROOT=" + root_->path().string(),
          "DBUS_SYSTEM_BUS_ADDRESS=" + (bus.empty() ? "unix:path=/nonexistent" : bus)};
}

faults::Outcome Device::run(const std::string& program, faults::Strings arguments,
                            const faults::Fault& fault, const std::string& bus) const {
  arguments.insert(arguments.begin(), PROGRAMS "/" + program);
  return faults::run(arguments, environment(bus), fault);
}

std::size_t Device::countCalls(const std::string& program, faults::Strings arguments,
                               const std::string& kind) const {
  arguments.insert(arguments.begin(), PROGRAMS "/" + program);
  return faults::count(arguments, environment(""), kind);
}

void Device::become(const Device& other) {
  root_ = std::make_unique<support::TemporaryFolder>();
  std::filesystem::copy(
      other.root_->path(), root_->path(),
      std::filesystem::copy_options::recursive | std::filesystem::copy_options::copy_symlinks);
}

void Device::writePropertyList(const std::string& path, const Value& value) const {
  root_->write(path, *plist::writeXML(value));
}

std::optional<Value> Device::readPropertyList(const std::string& path) const {
  return plist::read(root_->read(path)).orNone();
}

std::optional<Value> Device::record(const std::string& key) const {
  const auto domain = readPropertyList("var/preferences/mobile/" + std::string(kDomain) + ".plist");
  const auto* dictionary = domain ? domain->as<Dictionary>() : nullptr;
  const Value* value = dictionary != nullptr ? dictionary->find(key) : nullptr;
  return value != nullptr ? std::optional(*value) : std::nullopt;
}

Lines Device::names(const std::string& folder) const {
  Lines names;
  std::error_code ignored;
  for (const auto& entry : std::filesystem::directory_iterator(*root_ / folder, ignored)) {
    names.push_back(entry.path().filename());
  }
  std::sort(names.begin(), names.end());
  return names;
}

std::vector<Dictionary> Device::dailyLogs() const {
  std::vector<Dictionary> logs;
  for (const std::string& name : names(kSubmitted)) {
    if (!name.starts_with("log-pellorand.193.") || name.ends_with(".options.plist")) continue;
    const auto log = readPropertyList(std::string(kSubmitted) + "/" + name);
    const auto* dictionary = log ? log->as<Dictionary>() : nullptr;
    logs.push_back(dictionary != nullptr ? *dictionary : Dictionary());
  }
  return logs;
}

Lines Device::storageLogs() const {
  Lines logs;
  for (const std::string& name : names(kSubmitted)) {
    if (!name.starts_with("StorageStatus.165.")) continue;
    logs.push_back(root_->read(std::string(kSubmitted) + "/" + name));
  }
  return logs;
}

Lines Device::structuredLogs() const {
  std::string all;
  for (const char* folder : {kSubmitted, "var/spool/morvend/structured"}) {
    for (const std::string& name : names(folder)) {
      if (name.ends_with(".jsonl")) all += root_->read(std::string(folder) + "/" + name);
    }
  }
  return linesOf(all);
}

Dictionary Device::expectedSections() const {
  const std::int64_t value = 1000 * ((today_ - 1) % 7) + 123;
  // To tens, then to two figures, which here is to hundreds but for values below a thousand.
  const std::int64_t rounded = value < 1000 ? 120 : (value + 23) / 100 * 100;
  return {
      {"PLScalars", Dictionary{{"exact", value},
                               {"family.a", rounded},
                               {"family.b", rounded},
                               {"com.norba.quenset.prnd.database.corruptions", std::int64_t{2}}}},
      {"PLDistributions", Dictionary{{"samples", Array{Value(0.0), Value(19.5), Value(9.75),
                                                       Value(1332.5), Value(40)}}}},
      {"PLDistributionsHistogram",
       Dictionary{{"samples", Dictionary{{"(-inf, 5]", 11}, {"(5, 10]", 10}, {"(10, inf)", 19}}}}},
      {"PLStartDate", plist::Date{(today_ - 1) * 86400.0}}};
}

bool Device::databaseIsSound() const {
  sqlite3* database = nullptr;
  sqlite3_open_v2((*root_ / support::kCountersDatabase).c_str(), &database, SQLITE_OPEN_READWRITE,
                  nullptr);
  const auto isOk = [](void* sound, int, char** values, char**) {
    *static_cast<bool*>(sound) = std::string_view(values[0]) == "ok";
    return 0;
  };
  bool sound = false;
  sqlite3_exec(database, "PRAGMA integrity_check", isOk, &sound, nullptr);
  sqlite3_close(database);
  return sound;
}

Lines Device::rows(std::int32_t first, std::int32_t last) const {
  host::Host host({.root = root_->path()});
  Lines rows;
  const auto history = host.services().history.initWithDefaultPath();
  auto read = history->scalarsForKeyPrefix(
      "", first, last, [&](std::string_view key, std::int32_t day, std::int64_t value, bool&) {
        rows.push_back(
            format("%d %s %lld", day, std::string(key).c_str(), static_cast<long long>(value)));
      });
  EXPECT_TRUE(read);
  read = history->distributionsForKeyPrefix(
      "", first, last, [&](std::string_view key, std::int32_t day, auto& samples, bool&) {
        std::string row = format("%d %s", day, std::string(key).c_str());
        for (auto block = samples.getNextValues(); block && !block->values.empty();
             block = samples.getNextValues()) {
          for (const double value : block->values) row += format(" %g", value);
        }
        rows.push_back(row);
      });
  EXPECT_TRUE(read);
  return rows;
}

Lines linesOf(const std::string& standardError) {
  Lines lines;
  std::size_t start = 0;
  while (start < standardError.size()) {
    const auto end = std::min(standardError.find('\n', start), standardError.size());
    std::string line = standardError.substr(start, end - start);
    if (line.size() > 3 && line[0] == '<' && line[2] == '>') line.erase(0, 3);
    lines.push_back(line);
    start = end + 1;
  }
  return lines;
}

std::string lastLine(const faults::Outcome& outcome) {
  const std::string& said = outcome.standardError;
  if (said.empty()) return {};
  const std::size_t start = said.rfind('\n', said.size() - 2) + 1;
  return said.substr(start, said.size() - 1 - start);
}

bool ended(const faults::Outcome& outcome) {
  const Lines lines = linesOf(outcome.standardError);
  return outcome.status == 0 &&
         std::find(lines.begin(), lines.end(), "morvend ended") != lines.end();
}

}  // namespace end_to_end
