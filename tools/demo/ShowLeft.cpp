// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/ShowLeft.h"

#include <algorithm>
#include <map>
#include <nlohmann/json.hpp>
#include <sstream>

#include "NANDInfo/NANDInfo.h"
#include "NANDInfo/Services.h"
#include "base/Text.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"
#include "tools/demo/Rules.h"
#include "tools/demo/Screen.h"
#include "tools/demo/TelemetryRules.h"

namespace demo {

using base::format;
using plist::Dictionary;
using tools::printable;
using tools::Table;
using Align = Table::Align;

namespace {

constexpr char kStructured[] = "var/spool/morvend/structured";
constexpr char kEvents[] = "var/spool/morvend/events.jsonl";
constexpr std::size_t kMaxCountersOfRule = 4;

// How many there are of something, and the least and the largest number of one.
struct Tally {
  void add(std::size_t number) {
    least = count == 0 ? number : std::min(least, number);
    most = std::max(most, number);
    ++count;
  }
  std::string range() const {
    return least == most ? format("%zu", most) : format("%zu to %zu", least, most);
  }
  std::size_t count = 0, least = 0, most = 0;
};
using Tallies = std::map<std::string, Tally>;

class LeftText {
 public:
  LeftText(Device& device, bool all) : device_(device), all_(all), rules_(device.whitelist()) {}

  std::string text() {
    addLogs();
    addCounters();
    addStructuredLogs();
    addEvents();
    addHanded();
    return text_;
  }

 private:
  void addRow(std::size_t count, const char* what, const std::string& rule) {
    if (count > 0) text_ += format("    %5zu %-14s %s\n", count, what, printable(rule).c_str());
  }

  void addLogs() {
    text_ +=
        heading(format("Logs for submission, in %s", device_.pathOf(Device::kSubmitted).c_str()));
    for (const std::string& name : device_.namesIn(Device::kSubmitted)) {
      const std::string path = std::string(Device::kSubmitted) + "/" + name;
      const std::string content = device_.bytes(path).value_or("");
      text_ += format("  %s, %zu bytes\n", printable(name).c_str(), content.size());
      if (name.ends_with(Device::kOptions)) {
        addRow(device_.propertyList(path).value_or(Dictionary()).size(), "options",
               "fixed list of the report");
      } else if (name.starts_with("log-pellorand.")) {
        addReport(device_.propertyList(path).value_or(Dictionary()));
      } else if (name.starts_with("StorageStatus.")) {
        addNANDLog(content);
      } else {
        addRecords(content);
      }
    }
  }

  void addReport(const Dictionary& report) {
    static const Dictionary kNone;
    const auto section = [&report](const char* name) -> const Dictionary& {
      const Dictionary* found = report.dictionary(name);
      return found != nullptr ? *found : kNone;
    };
    struct Share {
      std::size_t reported = 0, rounded = 0;
      std::string text(const char* entries) const {
        return "whitelist, by " + std::string(entries) + format("; %zu are rounded", rounded);
      }
    } own, byPrefix;
    std::size_t unlisted = 0;
    for (const auto& [key, value] : section("PLScalars")) {
      const auto rule = rules_.ofScalar(key);
      if (!rule) ++unlisted;
      if (!rule) continue;
      Share& share = rule->prefix ? byPrefix : own;
      ++share.reported;
      if (rule->options->bucketInterval || rule->options->significantFigures) ++share.rounded;
    }
    addRow(own.reported, "scalars", own.text("their own keys"));
    addRow(byPrefix.reported, "scalars", byPrefix.text("prefixes"));
    addRow(unlisted, "scalars", "nothing: an internal build reports all");
    addRow(section("PLDistributions").size(), "distributions",
           format("whitelist, as five statistics; %zu with a histogram",
                  section("PLDistributionsHistogram").size()));
    addRow(section("PLMetadata").size(), "metadata", "fixed list of the report");
    const auto* applications = report.array("PLActivatedAppInfo");
    addRow(applications != nullptr ? applications->size() : 0, "applications",
           "fixed list of five fields, delivered by a client");
  }

  void addNANDLog(const std::string& log) {
    const auto begin = log.rfind("]: ");
    std::istringstream entries(begin != std::string::npos ? log.substr(begin + 3) : "");
    std::map<std::string, std::size_t> counts;
    for (std::string entry; std::getline(entries, entry, ';');) {
      ++counts[nandLogRule(entry.substr(0, entry.rfind(':')))];
    }
    for (const auto& [rule, count] : counts) addRow(count, "entries", rule);
  }

  // The objects of JSON Lines, by what stands under a name, with how many fields each holds.
  static Tallies talliesOf(const std::string& text, const char* kind, const char* content) {
    Tallies tallies;
    std::istringstream lines(text);
    for (std::string line; std::getline(lines, line);) {
      const auto parsed = nlohmann::json::parse(line, nullptr, false);
      if (!parsed.is_object()) continue;
      const auto what = parsed.value(kind, nlohmann::json());
      tallies[what.is_string() ? what.get<std::string>() : what.dump()].add(
          parsed.value(content, nlohmann::json()).size());
    }
    return tallies;
  }

  void addRecords(const std::string& content) {
    for (const auto& [type, records] : talliesOf(content, "type", "data")) {
      addRow(records.count, "records", "nothing: raw, type " + type);
    }
  }

  void addCounters() {
    const std::int32_t today = device_.today();
    struct Counter {
      std::string key;
      std::int64_t value;
      std::optional<Rule> listed;
    };
    std::map<CounterRule, std::vector<Counter>> byRule;
    for (const auto& [key, value] : device_.recorded(today, today).scalars) {
      const auto rule = counterRule(key);
      if (rule) byRule[*rule].push_back({key, value, rules_.ofScalar(key)});
    }
    Table table({{"KEY (~ is com.norba)", Align::left, true},
                 {"VALUE", Align::right},
                 {"IN THE DAY'S REPORT", Align::left}},
                kIndent);
    std::size_t count = 0;
    for (auto& [rule, counters] : byRule) {
      const auto isListed = [](const Counter& counter) { return counter.listed.has_value(); };
      const auto listed = std::ranges::count_if(counters, isListed);
      std::stable_partition(counters.begin(), counters.end(), isListed);
      table.addRow(
          {rule.step + ", by " + rule.rule, "", format("%td of %zu", listed, counters.size())});
      count += counters.size();
      if (!all_ && counters.size() > kMaxCountersOfRule) counters.resize(kMaxCountersOfRule);
      for (const auto& [key, value, entry] : counters) {
        table.addRow({"  " + shortKey(key), std::to_string(value),
                      entry ? roundingText(*entry->options) : "withheld"});
      }
    }
    text_ += "\n" + heading(format("Counters that the telemetry set today: %zu", count));
    if (count > 0) text_ += table.text(screenWidth());
    if (NANDInfo::NandInfoShouldLogAllToEV(device_.services())) {
      text_ += "  Today the storage counters go to the analytics sink instead.\n";
    }
  }

  void addStructuredLogs() {
    text_ += "\n" + heading("Structured logs, submitted when their day is over");
    for (const std::string& name : device_.namesIn(kStructured)) {
      const std::string path = std::string(kStructured) + "/" + name;
      const std::string content = device_.bytes(path).value_or("");
      text_ += format("  %s, %zu bytes\n", printable(device_.pathOf(path)).c_str(), content.size());
      addRecords(content);
    }
  }

  static std::string shortEvent(const std::string& event) {
    constexpr std::string_view kStorage = "com.norba.massStorage.NANDInfo.";
    return event.starts_with(kStorage) ? "~~." + event.substr(kStorage.size()) : shortKey(event);
  }

  void addEvents() {
    text_ += "\n" + heading("Analytics events (~~ is com.norba.massStorage.NANDInfo)") + "  " +
             device_.pathOf(kEvents) + "\n";
    Table table({{"EVENT", Align::left, true},
                 {"SENT", Align::right},
                 {"FIELDS", Align::right},
                 {"LET THROUGH BY", Align::left}},
                kIndent);
    for (const auto& [event, sent] :
         talliesOf(device_.bytes(kEvents).value_or(""), "event", "payload")) {
      table.addRow({shortEvent(event), std::to_string(sent.count), sent.range(), eventRule(event)});
    }
    text_ += table.text(screenWidth());
  }

  void addHanded() {
    const NANDInfo::Services services = device_.services();
    text_ += "\n" + heading("What the storage library hands to its callers");
    Dictionary msps = NANDInfo::CopyWhitelistedNANDMSPInfo(services, true);
    const Dictionary* firstMSP = msps.dictionary("0");
    const struct {
      const char* command;
      std::optional<Dictionary> result;
      const NANDInfo::NameTable* digits;
    } kResults[] = {
        {"ftl --round", NANDInfo::CopyWhitelistedNANDFTLInfo(services, true),
         &NANDInfo::WhitelistedRawNANDFTLCounters_SigDigDict()},
        {"msp --round, each", firstMSP != nullptr ? std::optional(*firstMSP) : std::nullopt,
         &NANDInfo::WhitelistedRawNANDMSPCounters_SigDigDict()},
        {"storage --round", NANDInfo::CopyWhitelistedStorageStats(services, true),
         &NANDInfo::WhitelistedStorageStats_SigDigDict()},
        {"health servita", NANDInfo::CopyServitaNANDInfo(services), nullptr},
        {"health lab", NANDInfo::CopyInternalLabNANDInfo(services), nullptr},
        {"health ota", NANDInfo::CopyOTANANDInfo(services), nullptr},
    };
    Table table({{"NANDINFO", Align::left}, {"VALUES", Align::right}, {"RULE", Align::left}},
                kIndent);
    for (const auto& [command, result, digits] : kResults) {
      if (!result) continue;
      table.addRow({command, std::to_string(result->size()),
                    digits != nullptr ? digitsText(*result, *digits) : "fixed list of the caller"});
    }
    text_ += table.text();
  }

  // How many digits the values keep.
  static std::string digitsText(const Dictionary& result, const NANDInfo::NameTable& digits) {
    Tally kept;
    for (const auto& [key, value] : result) {
      const auto* entry = digits.find(key);
      if (entry != nullptr && value.as<plist::Number>() != nullptr) kept.add(entry->number);
    }
    return "storage whitelist, " + kept.range() + " significant digits";
  }

  Device& device_;
  const bool all_;
  Rules rules_;
  std::string text_;
};

}  // namespace

std::string showLeft(Device& device, bool all) { return LeftText(device, all).text(); }

}  // namespace demo
