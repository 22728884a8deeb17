// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "tools/pelloran/Show.h"

#include <algorithm>
#include <nlohmann/json.hpp>
#include <ostream>
#include <string>
#include <tuple>
#include <vector>

#include "base/CivilDate.h"
#include "base/Text.h"
#include "tools/common/Table.h"
#include "tools/common/TerminalText.h"

namespace pelloran {

namespace {

using platform::PLHistoryDistributionEnumerator;

struct Row {
  std::int32_t day;
  std::string key, text;
};

// The rows that can be read, with their values as text, ordered.
struct Rows {
  std::vector<Row> rows;
  base::Result<void> outcome;
};

template <typename ScalarText, typename DistributionText>
Rows rowsOf(platform::PLHistory& history, const Shown& shown, ScalarText scalarText,
            DistributionText distributionText) {
  std::vector<Row> rows;
  auto outcome = history.scalarsForKeyPrefix(
      shown.prefix, shown.firstDay, shown.lastDay,
      [&](std::string_view key, std::int32_t day, std::int64_t value, bool&) {
        rows.push_back({day, std::string(key), scalarText(value)});
      });
  if (outcome) {
    outcome = history.distributionsForKeyPrefix(
        shown.prefix, shown.firstDay, shown.lastDay,
        [&](std::string_view key, std::int32_t day, PLHistoryDistributionEnumerator& samples,
            bool&) {
          rows.push_back({day, std::string(key), distributionText(samples)});
        });
  }
  std::ranges::stable_sort(rows, {}, [](const Row& row) { return std::tie(row.day, row.key); });
  return {std::move(rows), std::move(outcome)};
}

std::string jsonText(std::string_view text) {
  return tools::printableJSON(
      nlohmann::json(text).dump(-1, ' ', false, nlohmann::json::error_handler_t::replace));
}

// Always with a fraction or an exponent; what JSON has no number for is null.
std::string jsonReal(double value) { return nlohmann::json(value).dump(); }

std::string scalarText(std::int64_t value) { return std::to_string(value); }

std::string samplesAsJson(PLHistoryDistributionEnumerator& samples) {
  std::string text = "[";
  for (auto block = samples.getNextValues(); block && !block->values.empty();
       block = samples.getNextValues()) {
    for (std::size_t i = 0; i < block->values.size(); ++i) {
      if (text.size() > 1) text += ", ";
      text.append("[").append(std::to_string(block->secondsInDayOffsets[i])).append(", ");
      text.append(jsonReal(block->values[i])).append("]");
    }
  }
  return text + "]";
}

std::string summary(PLHistoryDistributionEnumerator& samples) {
  std::uint64_t count = 0;
  double least = 0, most = 0, mean = 0;
  for (auto block = samples.getNextValues(); block && !block->values.empty();
       block = samples.getNextValues()) {
    for (const double value : block->values) {
      least = count == 0 ? value : std::min(least, value);
      most = count == 0 ? value : std::max(most, value);
      mean += (value - mean) / static_cast<double>(++count);
    }
  }
  std::string text = "count " + std::to_string(count);
  if (count == 0) return text;
  return text + base::format("  min %.10g  mean %.10g  max %.10g", least, mean, most);
}

std::string dateText(std::int32_t day) {
  const base::CivilDate date = base::civilFromDays(day);
  return base::format("%04lld-%02d-%02d", static_cast<long long>(date.year), date.month, date.day);
}

}  // namespace

base::Result<void> showTable(platform::PLHistory& history, const Shown& shown, std::ostream& out) {
  tools::Table table({{"DAY"}, {"DATE"}, {"KEY"}, {"VALUE"}});
  auto [rows, outcome] = rowsOf(history, shown, scalarText, summary);
  for (auto& [day, key, value] : rows) {
    table.addRow({std::to_string(day), dateText(day), std::move(key), std::move(value)});
  }
  if (!rows.empty()) out << table.text();
  return outcome;
}

base::Result<void> showJsonLines(platform::PLHistory& history, const Shown& shown,
                                 std::ostream& out) {
  const auto [rows, outcome] = rowsOf(
      history, shown, [](std::int64_t value) { return "\"value\": " + std::to_string(value); },
      [](PLHistoryDistributionEnumerator& samples) {
        return "\"samples\": " + samplesAsJson(samples);
      });
  for (const Row& row : rows) {
    out << "{\"day\": " << row.day << ", \"key\": " << jsonText(row.key) << ", " << row.text
        << "}\n";
  }
  return outcome;
}

}  // namespace pelloran
