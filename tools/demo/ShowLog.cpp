// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/demo/ShowLog.h"

#include <algorithm>
#include <array>
#include <cmath>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"
#include "tools/demo/Rules.h"
#include "tools/demo/Screen.h"

namespace demo {

using base::format;
using plist::Array;
using plist::Date;
using plist::Dictionary;
using plist::Value;
using tools::Table;
using Align = Table::Align;

namespace {

constexpr std::size_t kMaxOwnRows = 6, kMaxPrefixRows = 5, kMaxCollectedRows = 4;
constexpr std::size_t kMaxDistributions = 8, kMaxHistograms = 1, kMaxNames = 8;
constexpr std::size_t kAll = SIZE_MAX;

// The key; in brackets the prefix that let it through.
std::string keyText(const std::string& key, const std::optional<Rule>& rule) {
  if (!rule || !rule->prefix) return shortKey(key);
  return "[" + shortKey(*rule->prefix) + "]" + key.substr(rule->prefix->size());
}

std::string moment(const Date* date) {
  if (date == nullptr) return "?";
  const auto time = base::civilFromSeconds(date->secondsSince1970);
  return format("%04d-%02d-%02d %02d:%02d:%02d UTC", static_cast<int>(time.date.year),
                time.date.month, time.date.day, time.hour, time.minute, time.second);
}

std::string dayText(std::int32_t day) {
  const auto date = base::civilFromDays(day);
  return format("%04d-%02d-%02d", static_cast<int>(date.year), date.month, date.day);
}

std::string real(double value) {
  const double magnitude = std::abs(value);
  if (magnitude >= 1e12) return format("%.3e", value);
  return format("%.*f", magnitude < 100 ? 2 : magnitude < 1e5 ? 1 : 0, value);
}

std::string more(std::size_t count, std::size_t shown) {
  return shown == count ? "" : format("  … and %zu more (--all shows them)\n", count - shown);
}

class LogText {
 public:
  LogText(Device& device, const SubmittedLog& log, const ShowOptions& options)
      : device_(device), log_(log), options_(options), rules_(device.whitelist()) {
    const Date* start = log.content.date("PLStartDate");
    day_ = base::dayNumber(start != nullptr ? start->secondsSince1970 : 0);
  }

  std::string text() {
    if (options_.prefix.empty()) addHeader();
    recorded_ = device_.recorded(day_ - 1, day_);
    addScalars();
    addDistributions();
    addHistograms();
    return text_;
  }

 private:
  struct Scalar {
    std::string key, recorded, reported;
    std::optional<Rule> rule;
  };

  const Dictionary& section(const char* name) const {
    static const Dictionary kNone;
    const Dictionary* found = log_.content.dictionary(name);
    return found != nullptr ? *found : kNone;
  }
  bool isAskedFor(std::string_view key) const { return key.starts_with(options_.prefix); }
  std::size_t atMost(std::size_t rows) const { return options_.all ? kAll : rows; }

  std::string plain(const char* key) const { return plist::description(log_.content.find(key)); }

  std::string applications() const {
    const Array* delivered = log_.content.array("PLActivatedAppInfo");
    if (delivered == nullptr) return "none was delivered";
    std::string names;
    for (const Value& element : *delivered) {
      const auto* application = element.as<Dictionary>();
      const std::string* bundle = application != nullptr ? application->text("bundle") : nullptr;
      const std::string* version = application != nullptr ? application->text("version") : nullptr;
      if (bundle == nullptr || version == nullptr) continue;
      names += (names.empty() ? "" : ", ") + *bundle + " " + *version;
    }
    return names.empty() ? "an empty delivery" : names;
  }

  std::string systemText() const {
    if (!log_.previousVersion) return "as at the report before";
    if (*log_.previousVersion == "<unknown>") return "this is the first report of the device";
    return "changed; it was " + *log_.previousVersion + " at the report before";
  }

  std::string languageText() const {
    const Dictionary& metadata = section("PLMetadata");
    const auto text = [&metadata](const char* key) {
      return plist::description(metadata.find(key));
    };
    return text("PLUserInterfaceLanguage") + ", preferred " +
           text("PLPreferredUserInterfaceLanguage") + ", region " + text("PLUserSetRegionFormat");
  }

  void addHeader() {
    text_ += heading("Report of " + dayText(day_) + format(" (day %d)", day_));
    Table table({{}, {}}, kIndent);
    const auto add = [&table](const char* name, const std::string& value) {
      table.addRow({name, value});
    };
    add("file", log_.path);
    add("size", format("%zu bytes, an XML property list", log_.size));
    add("created", moment(log_.content.date("PLLogCreationDate")));
    const auto* tasking = log_.content.array("PLTasking");
    add("tasking", tasking == nullptr || tasking->empty()
                       ? plain("PLTaskID")
                       : plain("PLTaskID") + format(", %zu settings, digest ", tasking->size()) +
                             plain("PLTaskDigest"));
    const bool sameWhitelist =
        device_.whitelist() != nullptr &&
        plain("PLWhitelistDigest") == device_.whitelist()->configFileDigest();
    add("whitelist",
        "MD5 " + plain("PLWhitelistDigest") + (sameWhitelist ? "" : " (it has changed since)"));
    add("system", systemText());
    add("language", languageText());
    add("app info", applications());
    text_ += table.text();
  }

  // Rows of a part of the scalars, under a line of their own.
  void addRows(const char* title, const std::vector<const Scalar*>& scalars, std::size_t most) {
    if (scalars.empty()) return;
    text_ += format("\n  %s: %zu\n", title, scalars.size());
    Table table({{"KEY", Align::left, true},
                 {"RECORDED", Align::right},
                 {"REPORTED", Align::right},
                 {"ROUNDED TO", Align::left}},
                kIndent);
    const auto shown = evenlySpread(scalars.size(), atMost(most));
    for (const std::size_t i : shown) {
      const Scalar& scalar = *scalars[i];
      table.addRow({keyText(scalar.key, scalar.rule), scalar.recorded, scalar.reported,
                    scalar.rule ? roundingText(*scalar.rule->options) : "?"});
    }
    text_ += table.text(screenWidth()) + more(scalars.size(), shown.size());
  }

  void addScalars() {
    std::vector<Scalar> scalars;
    for (const auto& [key, value] : section("PLScalars")) {
      if (!isAskedFor(key)) continue;
      const auto recorded = recorded_.scalars.find(key);
      scalars.push_back(
          {key, recorded != recorded_.scalars.end() ? std::to_string(recorded->second) : "-",
           plist::description(value), rules_.ofScalar(key)});
    }
    std::vector<const Scalar*> own, byPrefix, collected;
    for (const Scalar& scalar : scalars) {
      auto& part = scalar.recorded == "-"               ? collected
                   : scalar.rule && scalar.rule->prefix ? byPrefix
                                                        : own;
      part.push_back(&scalar);
    }
    text_ += "\n" + heading("Scalars: " + std::to_string(scalars.size()) + " reported" + keyNote());
    addRows("recorded, and whitelisted by their own key", own, kMaxOwnRows);
    addRows("recorded, and whitelisted by the prefix in brackets", byPrefix,
            atMost(kMaxPrefixRows));
    addRows("collected by the report itself", collected, kMaxCollectedRows);
    addWithheld(recorded_.scalars, "PLScalars",
                [](const auto& entry) -> const std::string& { return entry.first; });
  }

  std::string keyNote() const {
    return options_.prefix.empty() ? " (~ is com.norba)" : " under " + options_.prefix + "*";
  }

  template <typename Rows, typename KeyOf>
  void addWithheld(const Rows& rows, const char* sectionName, const KeyOf& keyOf) {
    const Dictionary& reported = section(sectionName);
    std::vector<std::string> withheld, shown;
    for (const auto& row : rows) {
      const std::string& key = keyOf(row);
      if (isAskedFor(key) && reported.find(key) == nullptr) withheld.push_back(shortKey(key));
    }
    if (withheld.empty()) return;
    for (const std::size_t i : evenlySpread(withheld.size(), atMost(kMaxNames))) {
      shown.push_back(withheld[i]);
    }
    text_ += format("\n  recorded, and withheld by the whitelist: %zu\n", withheld.size());
    text_ += wrapped(shown) + more(withheld.size(), shown.size());
  }

  void addDistributions() {
    const Dictionary& distributions = section("PLDistributions");
    const Dictionary& histograms = section("PLDistributionsHistogram");
    Table table({{"KEY", Align::left, true},
                 {"N", Align::right},
                 {"MIN", Align::right},
                 {"MEAN", Align::right},
                 {"MAX", Align::right},
                 {"STD DEV", Align::right},
                 {"SHAPE", Align::left}},
                kIndent);
    std::vector<const Dictionary::Entry*> rows;
    for (const auto& entry : distributions) {
      const auto* statistics = entry.value.as<Array>();
      if (statistics != nullptr && statistics->size() == 5 && isAskedFor(entry.key)) {
        rows.push_back(&entry);
      }
    }
    if (rows.empty() && !options_.prefix.empty()) return;
    const auto shown = evenlySpread(rows.size(), atMost(kMaxDistributions));
    for (const std::size_t i : shown) {
      std::array<double, 5> statistics{};
      const Array& values = *rows[i]->value.as<Array>();
      for (std::size_t j = 0; j < values.size(); ++j) {
        const auto* number = values[j].as<plist::Number>();
        statistics[j] = number != nullptr ? number->doubleValue() : 0;
      }
      const auto [minimum, maximum, mean, squares, count] = statistics;
      const double deviation = count > 1 ? std::sqrt(squares / (count - 1)) : 0;
      const Dictionary* histogram = histograms.dictionary(rows[i]->key);
      table.addRow({keyText(rows[i]->key, rules_.ofDistribution(rows[i]->key)),
                    format("%.0f", count), real(minimum), real(mean), real(maximum),
                    real(deviation), histogram != nullptr ? skyline(countsOf(*histogram)) : ""});
    }
    text_ +=
        "\n" + heading("Distributions: " + std::to_string(rows.size()) + " reported" + keyNote());
    if (!rows.empty()) text_ += table.text(screenWidth()) + more(rows.size(), shown.size());
    addWithheld(recorded_.distributions, "PLDistributions",
                [](const std::string& key) -> const std::string& { return key; });
  }

  static std::vector<std::uint64_t> countsOf(const Dictionary& histogram) {
    std::vector<std::uint64_t> counts;
    for (const auto& [label, count] : histogram) {
      const auto* number = count.as<plist::Number>();
      counts.push_back(number != nullptr ? number->uint64Value() : 0);
    }
    return counts;
  }

  void addHistograms() {
    std::vector<const Dictionary::Entry*> histograms;
    for (const auto& entry : section("PLDistributionsHistogram")) {
      const auto* histogram = entry.value.as<Dictionary>();
      if (histogram != nullptr && !histogram->empty() && isAskedFor(entry.key)) {
        histograms.push_back(&entry);
      }
    }
    if (histograms.empty()) return;
    const auto shown = evenlySpread(histograms.size(), atMost(kMaxHistograms));
    text_ += "\n" + heading("Histograms: " + std::to_string(histograms.size()) + " reported");
    for (const std::size_t i : shown) {
      const Dictionary& histogram = *histograms[i]->value.as<Dictionary>();
      const auto counts = countsOf(histogram);
      const std::uint64_t most = std::ranges::max(counts);
      Table table({{"", Align::right}, {"", Align::right}, {"", Align::left}}, kIndent);
      std::size_t row = 0;
      for (const auto& [label, count] : histogram) {
        const double share =
            most > 0 ? static_cast<double>(counts[row]) / static_cast<double>(most) : 0;
        table.addRow({label, std::to_string(counts[row]), bar(share, screenWidth() / 2)});
        ++row;
      }
      text_ += (i > 0 ? "\n  " : "  ") + tools::printable(shortKey(histograms[i]->key)) + "\n" +
               table.text();
    }
    text_ += more(histograms.size(), shown.size());
  }

  Device& device_;
  const SubmittedLog& log_;
  const ShowOptions& options_;
  Rules rules_;
  std::int32_t day_;
  Recorded recorded_;
  std::string text_;
};

}  // namespace

std::string showLog(Device& device, const SubmittedLog& log, const ShowOptions& options) {
  return LogText(device, log, options).text();
}

}  // namespace demo
