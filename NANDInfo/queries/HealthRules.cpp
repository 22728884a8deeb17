// SPDX-License-Identifier: Apache-2.0
// Copyright the morvend authors

#include "NANDInfo/queries/HealthRules.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <string_view>

#include "base/Text.h"

namespace NANDInfo {

namespace {

// How a figure stands to the rule's thresholds. Bits: those that are set in both. A count: what it
// has grown by since it was acknowledged, at least.
enum class Is : std::uint8_t { bits, atLeast, atMost, count };

constexpr std::uint64_t kNone = ~std::uint64_t{0};  // no threshold, which nothing reaches
constexpr std::uint8_t kNVMe = 1, kLifeTime = 2, kController = 4;

struct Rule {
  const char* figure;
  Is is;
  std::uint64_t watch, replace;
  std::uint8_t needed;   // by the verdict on these sources
  const char* sentence;  // {} is the figure, or what the count has grown by
};

// clang-format off
constexpr Rule kRules[] = {
    {"criticalWarning", Is::bits, 0x00, 0x01, kNVMe, "the drive warns that its spare is below its threshold"},
    {"criticalWarning", Is::bits, 0x02, 0x00, 0, "the drive warns of its temperature"},
    {"criticalWarning", Is::bits, 0x00, 0x04, 0, "the drive warns that it isn't reliable any more"},
    {"criticalWarning", Is::bits, 0x00, 0x08, 0, "the drive can only be read from now on"},
    {"criticalWarning", Is::bits, 0x10, 0x00, 0, "the drive warns that its volatile memory isn't backed up"},
    {"criticalWarning", Is::bits, 0x20, 0x00, 0, "the drive warns of its persistent memory region"},
    {"percentageUsed", Is::atLeast, 90, 100, kNVMe | kLifeTime | kController, "{} % of the rated endurance is used"},
    {"availableSpare", Is::atMost, 20, 10, kNVMe | kController, "{} % of the spare is left"},
    {"endOfLife", Is::atLeast, 2, 3, 0, "the reserve is at level {}: 2 is a warning, 3 urgent"},
    {"mediaErrors", Is::count, 1, kNone, kNVMe | kController, "{} errors of the medium"},
    {"endToEndErrors", Is::count, 1, kNone, 0, "{} errors between host and medium"},
    {"dieFailures", Is::count, 1, kNone, 0, "{} failed dies"},
    {"criticalTemperatureMinutes", Is::count, 1, kNone, 0, "{} minutes above the critical temperature"},
};
// clang-format on

std::optional<std::uint64_t> named(const HealthFigures& figures, std::string_view name) {
  const auto found = figures.find(name);
  return found != figures.end() ? std::optional(found->second) : std::nullopt;
}

std::string filled(std::string sentence, std::uint64_t value) {
  const auto place = sentence.find("{}");
  if (place != std::string::npos) sentence.replace(place, 2, std::to_string(value));
  return sentence;
}

bool reaches(Is is, std::uint64_t value, std::uint64_t threshold) {
  switch (is) {
    case Is::bits:
      return (value & threshold) != 0;
    case Is::atMost:
      return value <= threshold;
    case Is::atLeast:
    case Is::count:
      return threshold != kNone && value >= threshold;
  }
  return false;
}

HealthFigures kept(const HealthFigures& figures, bool (*keeps)(const Rule&)) {
  HealthFigures result;
  for (const Rule& rule : kRules) {
    const auto value = named(figures, rule.figure);
    if (value && keeps(rule)) result.emplace(rule.figure, *value);
  }
  return result;
}

}  // namespace

const char* nameOf(Verdict verdict) {
  static constexpr const char* kNames[] = {"good", "unknown", "watch", "replace"};
  return kNames[static_cast<std::size_t>(verdict)];
}

Judgement judge(const HealthFigures& figures, Source source, const HealthFigures& acknowledged) {
  Judgement judgement;
  const auto add = [&judgement](Verdict verdict, std::string reason) {
    judgement.verdict = std::max(judgement.verdict, verdict);
    judgement.reasons.emplace_back(verdict, std::move(reason));
  };
  for (const Rule& rule : kRules) {
    const auto figure = named(figures, rule.figure);
    if (!figure) {
      if ((rule.needed & static_cast<std::uint8_t>(source)) == 0) continue;
      add(Verdict::unknown, base::format("%s isn't known", rule.figure));
      continue;
    }
    std::uint64_t value = *figure;
    std::string since;
    if (rule.is == Is::count) {
      const std::uint64_t before = named(acknowledged, rule.figure).value_or(0);
      if (before > 0 && before <= value) {
        value -= before;
        since = base::format(" more than the %s that were acknowledged",
                             std::to_string(before).c_str());
      }
    }
    const bool replace = reaches(rule.is, value, rule.replace);
    if (!replace && !reaches(rule.is, value, rule.watch)) continue;
    add(replace ? Verdict::replace : Verdict::watch, filled(rule.sentence, value) + since);
  }
  return judgement;
}

HealthFigures judged(const HealthFigures& figures) {
  return kept(figures, [](const Rule&) { return true; });
}

HealthFigures acknowledgeable(const HealthFigures& figures) {
  return kept(figures, [](const Rule& rule) { return rule.is == Is::count; });
}

}  // namespace NANDInfo
