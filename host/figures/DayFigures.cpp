// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "host/figures/DayFigures.h"

#include <charconv>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <map>
#include <optional>
#include <string>
#include <string_view>
#include <system_error>

#include "base/Text.h"
#include "host/machine/SourceFiles.h"

namespace host::figures {

namespace {

constexpr std::size_t kMaxTotals = 10'000;  // that are remembered

// Of a reading: "<boot> <uptime>", then a line "<total> <name>" for each count.
struct Reading {
  std::string boot;
  double uptime = 0;
  std::map<std::string, std::int64_t, std::less<>> totals;
};

std::optional<Reading> parsed(std::string_view text) {
  Reading reading;
  std::string_view heading = machine::takeUntil(text, '\n');
  reading.boot = machine::takeUntil(heading, ' ');
  const auto [end, error] =
      std::from_chars(heading.data(), heading.data() + heading.size(), reading.uptime);
  if (heading.empty() || error != std::errc() || end != heading.data() + heading.size()) return {};
  while (!text.empty()) {
    std::string_view line = machine::takeUntil(text, '\n');
    const auto total = machine::countIn(machine::takeUntil(line, ' '));
    if (!total || *total > INT64_MAX || line.empty()) return std::nullopt;
    reading.totals.emplace(line, static_cast<std::int64_t>(*total));
  }
  return reading;
}

std::string textOf(const Reading& reading) {
  std::string text = reading.boot + " ";
  base::appendReal(text, reading.uptime);
  text += '\n';
  for (const auto& [name, total] : reading.totals) {
    base::appendInteger(text, total);
    text.append(" ").append(name).append("\n");
  }
  return text;
}

// The counts that tell of throughput, by the ends of their names.
constexpr struct {
  std::string_view kind, count, rate;
  double bytes;  // of one
} kThroughputs[] = {{"host.disk.", ".sectors_read", ".read_bytes_per_second", 512},
                    {"host.disk.", ".sectors_written", ".written_bytes_per_second", 512},
                    {"host.net.", ".rx_bytes", ".rx_bytes_per_second", 1},
                    {"host.net.", ".tx_bytes", ".tx_bytes_per_second", 1}};

void addThroughput(const std::string& name, std::int64_t grown, double seconds, DayFigures& day) {
  if (seconds <= 0) return;
  for (const auto& [kind, count, rate, bytes] : kThroughputs) {
    if (!name.starts_with(kind) || !name.ends_with(count)) continue;
    day.samples.emplace_back(name.substr(0, name.size() - count.size()) + std::string(rate),
                             static_cast<double>(grown) * bytes / seconds);
  }
}

}  // namespace

DayFigures dayFigures(const std::string& remembered, const MachineFigures& figures) {
  const auto before = parsed(remembered);
  const bool sameBoot = before && before->boot == figures.boot;
  Reading now{figures.boot, figures.uptime, {}};
  // A total that isn't there this time may come again.
  if (sameBoot && before->totals.size() <= kMaxTotals) now.totals = before->totals;
  const double seconds = figures.uptime - (sameBoot ? before->uptime : 0);

  DayFigures day;
  for (const auto& [name, total] : figures.counts) {
    std::int64_t& last = now.totals[name];
    const std::int64_t grown = total < last ? total : total - last;
    last = total;
    day.additions.emplace_back(name, before ? grown : 0);
    if (before) addThroughput(name, grown, seconds, day);
  }
  day.samples.insert(day.samples.end(), figures.measurements.begin(), figures.measurements.end());
  day.remembered = textOf(now);
  return day;
}

}  // namespace host::figures
